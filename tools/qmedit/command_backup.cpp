#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/revision_text.h"

#include <memory>

namespace {

int runBackup(const EditArguments& arguments) {
    ManagedEdit managed(arguments);
    if (const int code = managed.prepare(); code != kDone) {
        return code;
    }
    EditPtr edit;
    if (!managed.open(edit)) {
        return kFailed;
    }
    const cookie& item = managed.item();
    const std::optional<size_t> numRedo = managed.numRedo();
    const String change = changeText(edit->getChangeDescription());
    if (const Qx::Status kept = managed.change(edit, "no backup of " + item.asString() + " was made", {});
        !kept) {
        return failed(kept);
    }
    writeOut(item.asString() + ": kept as undo backup 1" +
             (change.empty() ? String() : " (last change: " + change + ")") + undoText(managed, numRedo) +
             "\n");
    return kDone;
}

} // namespace

Command backupCommand() {
    const auto arguments = std::make_shared<EditArguments>();
    return {"backup",
            "Keep the present state of an edit as an undo backup",
            {cookieOption(arguments->item), projectOption(arguments->project)},
            "Example:\n  qmedit backup E0001000\n\n"
            "'qmedit undo' goes back to it. What could be redone goes; beyond the depth (10) the "
            "oldest backup goes.",
            [arguments] { return runBackup(*arguments); }};
}
