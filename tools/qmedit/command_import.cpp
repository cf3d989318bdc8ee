#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/import_source.h"
#include "tools/qmedit/project_session.h"

#include "interchange/edl_import.h"

#include <CLI/CLI.hpp>

#include <memory>

namespace {

constexpr const char* kRates = "23.976, 24, 25, 29.97, 30, 47.952, 48, 50, 59.94 or 60";

/// Tells what the import met; returns the number of losses.
size_t reportLosses(const interchange::LossReport& report) {
    for (const String& line : report.lines())
        reportProgress(line);
    return report.losses().size();
}

String checkRate(const std::string& rate) {
    if (Qx::FrameRate::fromString(rate).valid())
        return {};
    return "'" + rate + "' is no frame rate; give one of " + kRates;
}

} // namespace

int importFile(const ImportOptions& options, cookie& item) {
    String file;
    if (const Qx::Status checked = checkImportSource(options.file, file); !checked)
        return failed(checked);
    ProjectSession session(options.project);
    const Qx::FrameRate rate = Qx::FrameRate::fromString(options.rate);
    if (const Qx::Status prepared = session.prepare(rate); !prepared)
        return failed(prepared);

    interchange::ImportOptions importing;
    importing.rate = rate.valid() ? rate : Qx::projectFrameRate();
    importing.strict = options.strict;
    interchange::Import import;
    if (const Qx::Status read = interchange::importEdl(file, importing, import); !read)
        return failed(read);
    const size_t losses = reportLosses(import.report);
    if (options.strict && losses > 0)
        return failed(Qx::Status::failure(
            options.file + String::format(": %zu loss%s", losses, losses == 1 ? "" : "es") +
            ", so nothing was imported; without --strict the edit is made all the same"));
    if (const Qx::Status created = session.create(); !created)
        return failed(created);
    if (const Qx::Status saved = interchange::saveImport(import); !saved)
        return failed(saved);
    item = import.sequence->get_cookie();
    return kDone;
}

void addImportCommand(CLI::App& app, CommandWork& work) {
    struct Arguments {
        std::string file;
        std::string rate;
        ImportOptions options;
    };
    const auto arguments = std::make_shared<Arguments>();
    CLI::App* command =
        app.add_subcommand("import", "Make an edit of another tool's cut list (CMX 3600 EDL)");
    command->add_option("FILE", arguments->file, "The list: an EDL")->required()->type_name("");
    addProjectOption(*command, arguments->options.project);
    command
        ->add_option("--rate", arguments->rate,
                     "Frames a second, which an EDL does not state (else the project's; 25 in a fresh one)")
        ->type_name("FPS")
        ->check(checkRate);
    command->add_flag("--strict", arguments->options.strict,
                      "Import nothing if anything of the list would be lost");
    command->footer("Example:\n  qmedit import reel2.edl --rate 24 --project ~/feature\n\n"
                    "The last line on standard output is the new edit's cookie; what was lost or odd goes to "
                    "standard error.");
    command->callback([arguments, &work] {
        work = [arguments] {
            arguments->options.file = arguments->file;
            arguments->options.rate = arguments->rate;
            cookie item;
            const int code = importFile(arguments->options, item);
            if (code == kDone)
                writeOut(item.asString() + "\n");
            return code;
        };
    });
}
