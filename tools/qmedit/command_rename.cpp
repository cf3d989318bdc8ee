#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/managed_edit.h"

#include "edit/model/edit.h"

#include <memory>

namespace {

struct RenameArguments : EditArguments {
    std::string name;
};

int runRename(const RenameArguments& arguments) {
    ManagedEdit managed(arguments);
    if (const int code = managed.prepare(); code != kDone) {
        return code;
    }
    EditPtr edit;
    if (!managed.open(edit)) {
        return kFailed;
    }
    const String cookie = managed.item().asString();
    const String before = edit->getName();
    if (before == arguments.name) {
        reportProgress(cookie + " has that name already");
        return kDone;
    }
    const std::optional<size_t> numRedo = managed.numRedo();
    if (const Qx::Status changed = managed.change(edit, cookie + " was not renamed",
                                                  [&](Edit& renamed) { renamed.setName(arguments.name); });
        !changed) {
        return failed(changed);
    }
    const Console console = Console::forStandardOutput();
    writeOut(cookie + ": renamed from '" + console.safe(before) + "' to '" + console.safe(arguments.name) +
             "'" + undoText(managed, numRedo) + "\n");
    return kDone;
}

} // namespace

Command renameCommand() {
    const auto arguments = std::make_shared<RenameArguments>();
    return {"rename",
            "Give an edit or a shot another name",
            {cookieOption(arguments->item),
             {.name = "NAME",
              .value = &arguments->name,
              .help = "The name",
              .required = true,
              .check = checkName},
             projectOption(arguments->project)},
            "Example:\n  qmedit rename E0001000 'Reel 2, fine cut'\n\n"
            "'qmedit undo' gives it its name back.",
            [arguments] { return runRename(*arguments); }};
}
