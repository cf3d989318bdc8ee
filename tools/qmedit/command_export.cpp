#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/project_session.h"

#include "interchange/edl/edl_export.h"
#include "interchange/legacy_text.h"
#include "platform/services/files.h"

#include <memory>

namespace {

struct ExportArguments {
    std::string item;
    std::string file;
    String project;
    bool strict = false;
    bool crlf = false;
};

/// The extension of the file, in lower case, if it is that of a form to export to.
bool readForm(const String& file, String& form) {
    form = Qx::extensionOf(Qx::fileNameOf(file)).lower();
    if (form == ".edl" || form == ".ed2") {
        return true;
    }
    reportError("'" + file +
                "' ends with neither .edl (CMX 3600) nor .ed2 (legacy text); choose one of them");
    return false;
}

Qx::Status writeForm(const ExportArguments& arguments, const String& form, const ProjectSession& session,
                     Edit& edit, interchange::LossReport& report) {
    if (form == ".ed2") {
        return interchange::exportLegacyText(edit, arguments.strict, arguments.file, report);
    }
    interchange::EdlExportOptions options;
    options.strict = arguments.strict;
    options.crlf = arguments.crlf;
    options.source = [&session](const cookie& strip) {
        EditPtr shot;
        if (!strip.isStorable() || !session.readEdit(strip, shot)) {
            return EditPtr();
        }
        return shot;
    };
    return interchange::exportEdlFile(edit, options, arguments.file, report);
}

int runExport(const ExportArguments& arguments) {
    cookie item;
    String form;
    if (!readForm(arguments.file, form)) {
        return kWrongUsage;
    }
    ProjectSession session(arguments.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    if (const Qx::Status found = session.findItem(arguments.item, item); !found) {
        return failed(found);
    }
    EditPtr edit;
    if (const Qx::Status read = session.readEdit(item, edit); !read) {
        return failed(read);
    }
    interchange::LossReport report;
    report.setFile(item.asString());
    const interrupts::Hold hold(false);
    const Qx::Status written = writeForm(arguments, form, session, *edit, report);
    for (const String& line : report.lines()) {
        reportProgress(line);
    }
    if (!written) {
        return failed(Qx::Status::failure(arguments.file + " was not written: " + written.reason()));
    }
    return kDone;
}

} // namespace

Command exportCommand() {
    const auto arguments = std::make_shared<ExportArguments>();
    return {"export",
            "Write an edit as a cut list (.edl) or as legacy text (.ed2)",
            {cookieOption(arguments->item),
             {.name = "FILE",
              .value = &arguments->file,
              .help = "The file to write, replaced if it is there; its extension says its form",
              .required = true,
              .completes = Completes::Files},
             projectOption(arguments->project),
             strictOption(arguments->strict, "Write nothing if anything of the edit would be lost"),
             {.name = "--crlf", .value = &arguments->crlf, .help = "End the lines of an EDL with CR and LF"}},
            "Example:\n  qmedit export E0001000 reel2.edl\n\n"
            "What the form cannot hold goes to standard error, a line each.",
            [arguments] { return runExport(*arguments); }};
}
