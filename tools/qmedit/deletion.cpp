#include "tools/qmedit/deletion.h"

#include "edit/manager/milestone_ring.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"
#include "tools/qmedit/console.h"

namespace {

/// Copies the state that an item has to a milestone. One that is damaged or gone has none to keep; one that the
/// system does not let read may have.
Qx::Status keepMilestone(const ProjectSession& session, const cookie& item) {
    EditPtr edit;
    if (const Qx::Status read = session.readEdit(item, edit); !read) {
        return read.systemError() != 0 ? read : Qx::Status();
    }
    return MilestoneRing().makeMilestoneBackup(edit, ProjectSession::fileOf(item));
}

} // namespace

Qx::Status deleteKeeping(ProjectSession& session, const cookie& item, bool anyway) {
    if (Qx::Status kept = keepMilestone(session, item); !kept) {
        if (!anyway) {
            return kept.retold(item.asString() + " was not deleted, as no milestone of it could be made: " +
                               kept.reason() + "; 'qmedit delete --force' deletes it all the same");
        }
        reportWarning("no milestone of " + item.asString() + " could be made: " + kept.reason());
    }
    const size_t count = edit_manager::getEditFiles(item).size();
    if (edit_manager::delete_edit_file_and_backups(item, false)) {
        return {};
    }
    const size_t left = edit_manager::getEditFiles(item).size();
    return Qx::Status::failure(
        left == count
            ? item.asString() + " could not be deleted and is as it was; see whether the project can "
                                "be written (QMEDIT_LOG=1 tells more)"
            : String::format("%zu of %zu files of ", left, count) + item.asString() +
                  " could not be deleted; see whether they can be written, and delete it again");
}
