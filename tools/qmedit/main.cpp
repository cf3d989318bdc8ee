#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"

#include <CLI/CLI.hpp>

#include <sstream>

namespace {

constexpr const char* kFooter =
    "Edits go to the project given by --project DIR, else by $QMEDIT_PROJECT, else to ./quillmarch-project.\n"
    "Exit codes: 0 done, 1 failed, 2 wrong usage. 'qmedit COMMAND --help' shows an example of each command.";

/// The command that a wrong command line was for, for the advice on help.
String commandOf(const CLI::App& app) {
    const auto chosen = app.get_subcommands();
    return chosen.empty() ? "qmedit" : "qmedit " + chosen.front()->get_name();
}

int reportUsage(const CLI::App& app, const CLI::ParseError& error) {
    if (error.get_exit_code() == 0) {
        std::ostringstream text;
        app.exit(error, text, text);
        writeOut(text.str());
        return finishOutput() ? kDone : kFailed;
    }
    reportError(String(error.what()) + "; see " + commandOf(app) + " --help");
    return kWrongUsage;
}

int runCommandLine(int count, char** arguments) {
    CLI::App app("Edits of the Quillmarch editor on the command line: import, look, check, undo.", "qmedit");
    app.set_version_flag("--version", "qmedit " QMEDIT_VERSION, "Print the version and exit");
    app.set_help_flag("-h,--help", "Print this help and exit");
    app.footer(kFooter);
    app.require_subcommand(0, 1);
    app.get_formatter()->column_width(28);
    app.get_formatter()->label("SUBCOMMAND", "COMMAND");
    app.get_formatter()->label("Subcommands", "Commands");
    app.get_formatter()->label("REQUIRED", "");

    CommandWork work;
    addImportCommand(app, work);
    addExportCommand(app, work);
    addListCommand(app, work);
    addShowCommand(app, work);
    addHeaderCommand(app, work);
    addApplyCommand(app, work);
    addDiffCommand(app, work);
    addVerifyCommand(app, work);
    addSalvageCommand(app, work);
    addHistoryCommand(app, work);
    addBackupCommand(app, work);
    addUndoCommand(app, work);
    addRedoCommand(app, work);
    addRecoverCommand(app, work);
    addDeleteCommand(app, work);
    addFlushCommand(app, work);
    addDemoCommand(app, work);
    addCompletionCommand(app, work);

    try {
        app.parse(count, arguments);
    } catch (const CLI::ParseError& error) {
        return reportUsage(app, error);
    }
    if (!work) {
        reportError("name a command; see qmedit --help");
        return kWrongUsage;
    }
    const int code = work();
    return finishOutput() ? code : static_cast<int>(kFailed);
}

} // namespace

int main(int count, char** arguments) {
    try {
        routeLibraryLog();
        return runCommandLine(count, arguments);
    } catch (const std::bad_alloc&) {
        reportError("not enough memory");
    } catch (const std::exception& error) {
        reportError(String("unexpected failure: ") + error.what());
    }
    return kFailed;
}
