#pragma once

#include "platform/base/cookie.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"
#include "tools/qmedit/console.h"

#include <string>
#include <vector>

struct Command;
struct CommandGroup;
struct CommandOption;
struct EditReport;

/// What qmedit answers to the shell.
enum ExitCode : int { kDone = 0, kFailed = 1, kWrongUsage = 2 };

/// \name Each is declared, with its options and its help, in a file of its own
/// @{
Command importCommand();
Command exportCommand();
Command listCommand();
Command findCommand();
Command logCommand();
Command showCommand();
Command graphCommand();
Command headerCommand();
Command newCommand();
Command applyCommand();
Command renameCommand();
Command markerCommand();
Command transitionCommand();
Command purgeCommand();
Command diffCommand();
Command verifyCommand();
Command upgradeCommand();
Command salvageCommand();
Command historyCommand();
Command backupCommand();
Command undoCommand();
Command redoCommand();
Command recoverCommand();
Command deleteCommand();
Command flushCommand();
Command demoCommand();
Command helpCommand();
Command completionCommand();
/// @}

/// Every command, in the groups and the order of the help: the one place that a command is registered at.
const std::vector<CommandGroup>& allCommands();

/// \name Shared by the commands
/// @{
/// --project; `project` stays empty when it is not given.
CommandOption projectOption(String& project);
/// COOKIE: the edit that a command is for, as its first word.
CommandOption cookieOption(std::string& item);
/// --json, on every command that lists or shows something.
CommandOption jsonOption(bool& json, const char* help);
/// --dry-run, --strict and --yes, with what is said of each by the command.
CommandOption dryRunOption(bool& dryRun);
CommandOption strictOption(bool& strict, const char* help);
CommandOption yesOption(bool& yes);
/// Why a text cannot name a folder, an edit, or be a frame rate, or nothing.
/// @{
String checkFolder(const std::string& folder);
String checkName(const std::string& name);
String checkRate(const std::string& rate);
/// @}
/// Reports a failure and returns `kFailed`.
int failed(const Qx::Status& status);
/// Shows an edit of a project as `qmedit show` does.
struct ShowOptions {
    String project;
    String item; ///< its cookie or its name
    bool json = false;
    bool allEvents = false;
    Console::Wish console;
    std::vector<std::string> labels = {}; ///< to be shown beside the events, in their place
    std::string burnIn = {};              ///< a record timecode
};
int showEdit(const ShowOptions& options);
/// Draws an edit on standard output, without its table of events.
void drawEdit(const EditReport& report);
struct ImportOptions {
    std::vector<std::string> files; ///< "-" is standard input
    String project;
    String rate; ///< empty for the project's
    bool strict = false;
    bool skipBad = false;
    bool newShots = false;
    bool json = false;
};
/// Imports the only one of the files as `qmedit import` does and sets `item` to the edit that was made. The
/// cookie is not printed.
int importFile(const ImportOptions& options, cookie& item);
/// @}
