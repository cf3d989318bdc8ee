#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"

#include <CLI/CLI.hpp>

void addProjectOption(CLI::App& command, String& project) {
    command
        .add_option_function<std::string>(
            "--project", [&project](const std::string& folder) { project = folder; },
            "The project's folder (else $QMEDIT_PROJECT, else ./quillmarch-project)")
        ->type_name("DIR")
        ->check([](const std::string& folder) {
            return folder.empty() ? std::string("the folder's name is empty") : "";
        });
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
