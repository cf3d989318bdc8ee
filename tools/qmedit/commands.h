#pragma once

#include "platform/base/cookie.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <functional>

struct EditReport;

namespace CLI {
class App;
}

/// What qmedit answers to the shell.
enum ExitCode : int { kDone = 0, kFailed = 1, kWrongUsage = 2 };

/// The work of the command that was chosen; set while the command line is read, run after it. It returns an
/// `ExitCode`.
using CommandWork = std::function<int()>;

/// \name Each declares its command, its options and its help, in a file of its own
/// @{
void addImportCommand(CLI::App& app, CommandWork& work);
void addExportCommand(CLI::App& app, CommandWork& work);
void addListCommand(CLI::App& app, CommandWork& work);
void addShowCommand(CLI::App& app, CommandWork& work);
void addApplyCommand(CLI::App& app, CommandWork& work);
void addDiffCommand(CLI::App& app, CommandWork& work);
void addHeaderCommand(CLI::App& app, CommandWork& work);
void addVerifyCommand(CLI::App& app, CommandWork& work);
void addSalvageCommand(CLI::App& app, CommandWork& work);
void addHistoryCommand(CLI::App& app, CommandWork& work);
void addBackupCommand(CLI::App& app, CommandWork& work);
void addUndoCommand(CLI::App& app, CommandWork& work);
void addRedoCommand(CLI::App& app, CommandWork& work);
void addRecoverCommand(CLI::App& app, CommandWork& work);
void addDeleteCommand(CLI::App& app, CommandWork& work);
void addFlushCommand(CLI::App& app, CommandWork& work);
void addDemoCommand(CLI::App& app, CommandWork& work);
void addCompletionCommand(CLI::App& app, CommandWork& work);
/// @}

/// \name Shared by the commands
/// @{
/// Adds --project to a command; `project` stays empty when it is not given.
void addProjectOption(CLI::App& command, String& project);
/// Reports a failure and returns `kFailed`.
int failed(const Qx::Status& status);
/// Reads a COOKIE argument. On a text that is none, reports it and returns false.
[[nodiscard]] bool readCookie(const String& text, cookie& item);
/// Shows an edit of a project as `qmedit show` does.
struct ShowOptions {
    String project;
    cookie item;
    bool json = false;
    bool allEvents = false;
};
int showEdit(const ShowOptions& options);
/// Draws an edit on standard output, without its table of events.
void drawEdit(const EditReport& report);
/// Imports a file as `qmedit import` does and sets `item` to the edit that was made. The cookie is not
/// printed.
struct ImportOptions {
    String file;
    String project;
    String rate; ///< empty for the project's
    bool strict = false;
};
int importFile(const ImportOptions& options, cookie& item);
/// @}
