#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/revision_text.h"
#include "tools/qmedit/spare_room.h"

#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <memory>

namespace {

/// How much larger than its file an edit may be written at most when nothing but its header changes.
constexpr uint64_t kHeaderGrowth = 65536;

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
    const String file = getFilenameForCookie(item);
    SpareRoom room;
    if (const Qx::Status taken = room.take(file, Qx::askFile(file).info().size + kHeaderGrowth); !taken) {
        return failed(
            Qx::Status::failure("no backup of " + item.asString() + " was made: " + taken.reason()));
    }
    if (!edit_manager::backup_edit(item)) {
        const String cause = edit->lastFileError();
        return failed(Qx::Status::failure(
            "no backup of " + item.asString() + " was made" + (cause.empty() ? "" : ": " + cause) + "; " +
            putFileBack(item, edit) +
            "; see whether the project can be written and has room (QMEDIT_LOG=1 tells more)"));
    }
    room.giveBack();
    // The backup was the edit's file: it is written again, so that other programs find the edit.
    edit->init_dirty();
    if (!edit_manager::flush_edit(item)) {
        const String cause = edit->lastFileError();
        return failed(Qx::Status::failure("no backup of " + item.asString() + " was made, as " + file +
                                          " could not be written: " + cause + "; " +
                                          putFileBack(item, edit)));
    }
    writeOut(item.asString() + ": kept as undo backup 1" +
             (change.empty() ? String() : " (last change: " + change + ")") + "; " +
             countText(managed.numUndo()) + " to undo" +
             (numRedo == size_t{0} ? String() : "; " + countText(numRedo) + " redo backups went") + "\n");
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
