#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/project_session.h"

#include "interchange/edl/edl_export.h"
#include "interchange/legacy_text.h"
#include "platform/services/files.h"

#include <memory>

namespace {

struct ExportArguments {
    std::string item;
    std::vector<std::string> words; ///< the file; with `into` more edits
    std::string into;
    String project;
    bool strict = false;
    bool crlf = false;
    bool json = false;
};

/// One edit and where it goes; "-" is standard output.
struct Exported {
    std::string text; ///< cookie or name, as given
    cookie item;
    String file;
    interchange::LossReport report;
    Qx::Status status;
};

/// The extension of the file, in lower case, if it is that of a form to export to.
bool readForm(const String& file, String& form) {
    if (file == "-") {
        form = ".edl";
        return true;
    }
    form = Qx::extensionOf(Qx::fileNameOf(file)).lower();
    if (form == ".edl" || form == ".ed2") {
        return true;
    }
    reportError("'" + file +
                "' ends with neither .edl (CMX 3600) nor .ed2 (legacy text); choose one of them");
    return false;
}

/// What the words of the command line mean. What is wrong with them is reported.
bool readWords(const ExportArguments& arguments, std::vector<Exported>& all) {
    const bool isFolder = !arguments.into.empty();
    if (!isFolder && arguments.words.size() != 1) {
        reportError(
            "export takes one edit and its file, or with --into any number of edits; see qmedit export "
            "--help");
        return false;
    }
    std::vector<std::string> items = {arguments.item};
    if (isFolder) {
        items.insert(items.end(), arguments.words.begin(), arguments.words.end());
    }
    for (const std::string& text : items) {
        Exported& one = all.emplace_back();
        one.text = text;
        one.file = isFolder ? String() : String(arguments.words[0]);
    }
    if (arguments.json && all.front().file == "-") {
        reportError("standard output takes the list or JSON, not both; name a file");
        return false;
    }
    return true;
}

Qx::Status exportOne(const ExportArguments& arguments, const String& form, const ProjectSession& session,
                     Exported& one) {
    EditPtr edit;
    if (Qx::Status read = session.readEdit(one.item, edit); !read) {
        return read;
    }
    const interrupts::Hold hold(false);
    if (form == ".ed2") {
        return interchange::exportLegacyText(*edit, arguments.strict, one.file, one.report);
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
    if (one.file != "-") {
        return interchange::exportEdlFile(*edit, options, one.file, one.report);
    }
    String text;
    Qx::Status made = interchange::exportEdl(*edit, options, text, one.report);
    if (made) {
        writeOut(text);
    }
    return made;
}

/// One object an edit, on a line of its own.
String exportedJson(const std::vector<Exported>& all) {
    String out = "[";
    for (const Exported& one : all) {
        out += (out.size() > 1 ? ",\n  " : "\n  ") + reportJson({{"cookie", one.item.asString()},
                                                                 {"file", one.status ? one.file : String()},
                                                                 {"problem", one.status.reason()}},
                                                                {}, one.report);
    }
    return out + "\n]\n";
}

int runExport(const ExportArguments& arguments) {
    std::vector<Exported> all;
    if (!readWords(arguments, all)) {
        return kWrongUsage;
    }
    ProjectSession session(arguments.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    for (Exported& one : all) {
        if (const Qx::Status found = session.findItem(one.text, one.item); !found) {
            return failed(found);
        }
        one.report.setFile(one.item.asString());
        if (!arguments.into.empty()) {
            one.file = Qx::joinPath(arguments.into, one.item.asString() + ".edl");
        }
    }
    String form;
    if (!readForm(all.front().file, form)) {
        return kWrongUsage;
    }
    int code = kDone;
    for (Exported& one : all) {
        one.status = exportOne(arguments, form, session, one);
        for (const String& line : arguments.json ? std::vector<String>() : one.report.lines()) {
            reportProgress(line);
        }
        if (!one.status) {
            const String where = one.file == "-" ? String("the list") : one.file;
            code = failed(Qx::Status::failure(where + " was not written: " + one.status.reason()));
        }
    }
    if (arguments.json) {
        writeOut(exportedJson(all));
    }
    return code;
}

} // namespace

Command exportCommand() {
    const auto arguments = std::make_shared<ExportArguments>();
    return {
        "export",
        "Write edits as cut lists (.edl) or as legacy text (.ed2)",
        {cookieOption(arguments->item),
         {.name = "FILE",
          .value = &arguments->words,
          .help =
              "The file to write, replaced if it is there: its extension says its form, and '-' is an EDL "
              "on standard output. With --into more edits",
          .completes = Completes::Files},
         projectOption(arguments->project),
         {.name = "--into",
          .value = &arguments->into,
          .help = "Write an EDL for each edit into this folder, named by its cookie",
          .form = "DIR",
          .check = checkFolder},
         strictOption(arguments->strict, "Write nothing of an edit of which anything would be lost"),
         {.name = "--crlf", .value = &arguments->crlf, .help = "End the lines of an EDL with CR and LF"},
         jsonOption(arguments->json, "Write JSON: an array of what became of each edit")},
        "Example:\n  qmedit export E0001000 reel2.edl\n\n"
        "What the form cannot hold goes to standard error, a line each.",
        [arguments] { return runExport(*arguments); }};
}
