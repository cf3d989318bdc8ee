#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/completion.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/safe_text.h"

#include "platform/media/frame_rate.h"

const std::vector<CommandGroup>& allCommands() {
    static const std::vector<CommandGroup> groups{
        {"Look",
         {listCommand(), showCommand(), graphCommand(), findCommand(), headerCommand(), diffCommand(),
          historyCommand()}},
        {"Change",
         {newCommand(), applyCommand(), renameCommand(), markerCommand(), transitionCommand(), logCommand(),
          deleteCommand()}},
        {"Go back", {backupCommand(), undoCommand(), redoCommand()}},
        {"Repair", {verifyCommand(), upgradeCommand(), recoverCommand(), salvageCommand()}},
        {"Project", {purgeCommand(), flushCommand()}},
        {"Other tools", {importCommand(), exportCommand()}},
        {"Help", {helpCommand(), demoCommand(), completionCommand()}},
    };
    return groups;
}

String checkFolder(const std::string& folder) {
    return folder.empty() ? "the folder's name is empty" : "";
}

String checkName(const std::string& name) {
    constexpr size_t kLongest = 255;
    if (name.empty() || name.size() > kLongest) {
        return String::format("a name has 1 to %zu bytes", kLongest);
    }
    return Qx::isUtf8(name) && safe_text::escaped(name) == name
               ? String()
               : String("a name is UTF-8 without control characters");
}

String checkRate(const std::string& rate) {
    if (Qx::FrameRate::fromString(rate).valid()) {
        return {};
    }
    String rates;
    for (const char* const known : kFrameRates) {
        rates += (rates.empty() ? "" : ", ") + String(known);
    }
    return "'" + rate + "' is no frame rate; give one of " + rates;
}

CommandOption projectOption(String& project) {
    return {.name = "--project",
            .value = &project,
            .help = "The project's folder (else $QMEDIT_PROJECT, else ./quillmarch-project)",
            .form = "DIR",
            .check = checkFolder,
            .completes = Completes::Folders};
}

CommandOption cookieOption(std::string& item) {
    return {.name = "COOKIE",
            .value = &item,
            .help = "The edit: its cookie or its name, as 'qmedit list' has them",
            .required = true,
            .completes = Completes::Items};
}

CommandOption jsonOption(bool& json, const char* help) {
    return {.name = "--json", .value = &json, .help = help};
}

CommandOption dryRunOption(bool& dryRun) {
    return {.name = "--dry-run", .value = &dryRun, .help = "Show what would come of it and change nothing"};
}

CommandOption strictOption(bool& strict, const char* help) {
    return {.name = "--strict", .value = &strict, .help = help};
}

CommandOption yesOption(bool& yes) {
    return {.name = "--yes", .value = &yes, .help = "Do not ask first (only a terminal is asked)"};
}

int failed(const Qx::Status& status) {
    reportError(status.reason());
    return kFailed;
}
