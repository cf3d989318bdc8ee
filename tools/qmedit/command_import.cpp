#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/import_source.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/project_session.h"

#include "interchange/edl/edl_import.h"
#include "interchange/legacy_text.h"
#include "platform/services/files.h"

#include <memory>

namespace {

/// Tells what the import met; returns the number of losses.
size_t reportLosses(const interchange::LossReport& report) {
    for (const String& line : report.lines()) {
        reportProgress(line);
    }
    return report.losses().size();
}

bool isLegacyText(const String& file) {
    return String::equalNoCase(Qx::extensionOf(Qx::fileNameOf(file)), ".ed2");
}

Qx::Status readSource(const String& file, const ImportOptions& options, interchange::Import& import) {
    if (isLegacyText(file)) {
        if (!options.rate.empty()) {
            return Qx::Status::failure(file + ": legacy text states its frame rate; leave out --rate");
        }
        return interchange::importLegacyText(file, import);
    }
    const Qx::FrameRate rate = Qx::FrameRate::fromString(options.rate);
    interchange::ImportOptions importing;
    importing.rate = rate.valid() ? rate : Qx::projectFrameRate();
    importing.strict = options.strict;
    return interchange::importEdl(file, importing, import);
}

} // namespace

int importFile(const ImportOptions& options, cookie& item) {
    String file;
    if (const Qx::Status checked = checkImportSource(options.file, file); !checked) {
        return failed(checked);
    }
    ProjectSession session(options.project);
    if (const Qx::Status prepared = session.prepare(Qx::FrameRate::fromString(options.rate)); !prepared) {
        return failed(prepared);
    }

    interchange::Import import;
    if (const Qx::Status read = readSource(file, options, import); !read) {
        return failed(read);
    }
    const size_t losses = reportLosses(import.report);
    if (options.strict && losses > 0) {
        return failed(Qx::Status::failure(
            options.file + String::format(": %zu loss%s", losses, losses == 1 ? "" : "es") +
            ", so nothing was imported; without --strict the edit is made all the same"));
    }
    // A fresh project takes the rate of the edit, which a legacy text states.
    if (const Qx::Status prepared = session.prepare(import.sequence->getFrameRate()); !prepared) {
        return failed(prepared);
    }
    const interrupts::Hold hold(true);
    if (const Qx::Status created = session.create(); !created) {
        return failed(created);
    }
    if (const Qx::Status saved = interchange::saveImport(import, interrupts::noted); !saved) {
        return failed(saved);
    }
    item = import.sequence->get_cookie();
    return kDone;
}

Command importCommand() {
    const auto options = std::make_shared<ImportOptions>();
    return {"import",
            "Make an edit of a cut list (CMX 3600 EDL) or of legacy text (.ed2)",
            {{.name = "FILE",
              .value = &options->file,
              .help = "The list: an EDL, or a legacy text by its extension .ed2",
              .required = true,
              .completes = Completes::Files},
             projectOption(options->project),
             {.name = "--rate",
              .value = &options->rate,
              .help = "Frames a second, which an EDL does not state (else the project's; 25 in a fresh one)",
              .form = "FPS",
              .check = checkRate,
              .completes = Completes::Rates},
             strictOption(options->strict, "Import nothing if anything of the list would be lost")},
            "Example:\n  qmedit import reel2.edl --rate 24 --project ~/feature\n\n"
            "The last line on standard output is the new edit's cookie; what was lost or odd goes to "
            "standard error.",
            [options] {
                cookie item;
                const int code = importFile(*options, item);
                if (code == kDone) {
                    writeOut(item.asString() + "\n");
                }
                return code;
            }};
}
