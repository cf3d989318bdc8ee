#pragma once

#include "platform/base/cookie.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <string>
#include <vector>

struct Command;
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
Command headerCommand();
Command applyCommand();
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
Command completionCommand();
/// @}

/// Every command, in the order of the help.
const std::vector<Command>& allCommands();

/// \name Shared by the commands
/// @{
/// --project; `project` stays empty when it is not given.
CommandOption projectOption(String& project);
/// The edit that a command is for, as its first word.
CommandOption cookieOption(std::string& item);
CommandOption jsonOption(bool& json, const char* help);
/// Why a text cannot name a folder, or nothing.
String checkFolder(const std::string& folder);
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
    std::vector<std::string> labels = {}; ///< to be shown beside the events, in their place
    std::string burnIn = {};              ///< a record timecode
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
