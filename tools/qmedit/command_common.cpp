#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"

const std::vector<Command>& allCommands() {
    static const std::vector<Command> commands{
        importCommand(),    exportCommand(),  listCommand(),    findCommand(),   logCommand(),
        showCommand(),      headerCommand(),  applyCommand(),   diffCommand(),   verifyCommand(),
        upgradeCommand(),   salvageCommand(), historyCommand(), backupCommand(), undoCommand(),
        redoCommand(),      recoverCommand(), deleteCommand(),  flushCommand(),  demoCommand(),
        completionCommand()};
    return commands;
}

String checkFolder(const std::string& folder) {
    return folder.empty() ? "the folder's name is empty" : "";
}

CommandOption projectOption(String& project) {
    return {.name = "--project",
            .value = &project,
            .help = "The project's folder (else $QMEDIT_PROJECT, else ./quillmarch-project)",
            .form = "DIR",
            .check = checkFolder};
}

CommandOption cookieOption(std::string& item) {
    return {
        .name = "COOKIE", .value = &item, .help = "The edit, as 'qmedit list' names it", .required = true};
}

CommandOption jsonOption(bool& json, const char* help) {
    return {.name = "--json", .value = &json, .help = help};
}

int failed(const Qx::Status& status) {
    reportError(status.reason());
    return kFailed;
}

bool readCookie(const String& text, cookie& item) {
    item = cookie(text, true);
    if (item.isStorable()) {
        return true;
    }
    reportError("'" + text +
                "' is no cookie; a cookie is a letter and seven digits or letters, such as E0001000 "
                "('qmedit list' shows those of the project)");
    return false;
}
