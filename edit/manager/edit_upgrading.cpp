#include "edit/manager/edit_upgrading.h"
#include "platform/store/tag_bag.h"

#include "edit/manager/detail/manager_state.h"
#include "edit/manager/edit_record.h"
#include "edit/manager/revision_chain.h"
#include "edit/model/edit_keys.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/edit_filenames.h"

namespace {

/// One file that is replaced by the upgraded edit that was read out of it.
class Replacing {
public:
    Replacing(Edit& edit, const Qx::FileInfo& read)
        : m_edit(edit), m_item(edit.get_cookie()), m_read(read),
          m_undo(m_item, RevisionChain::Undo, edit_manager::backupDepth()) {}

    /// Fails with the file as it was. `dropped` gets the edit that was in the cache, to go when no lock is
    /// held.
    Qx::Status run(std::unique_ptr<ManagerState::CachedEdit>& dropped);
    [[nodiscard]] String kept() const { return m_undo.path(1); }

private:
    Qx::Status exchange();

    Edit& m_edit;
    cookie m_item;
    Qx::FileInfo m_read;
    RevisionChain m_undo;
};

Qx::Status Replacing::run(std::unique_ptr<ManagerState::CachedEdit>& dropped) {
    ManagerState& state = managerState();
    const String& file = m_undo.file();
    if (PermissionsManager::getReadOnly(m_item) || m_edit.get_read_only()) {
        return Qx::Status::failure(Qx::StatusCode::ReadOnly, m_item.asString() + " is read-only");
    }
    const Qx::AccessScope<cookie> turn(state.queue, m_item);
    EditManagerLock writers(Qx::folderOf(file));
    if (Qx::Status locked = writers.take(true); !locked) {
        return locked;
    }
    const ManagerState::Hold hold(state.lock);
    if (!Qx::isSameFile(Qx::askFile(file).info(), m_read)) {
        return Qx::Status::failure(file + " changed meanwhile; try again");
    }
    dropped = state.removeUnreferenced(m_item, true);
    if (dropped == nullptr && state.findCacheEntry(m_item) != nullptr) {
        return Qx::Status::failure(Qx::StatusCode::Locked, m_item.asString() + " is open; close it first");
    }
    Qx::Status exchanged = exchange();
    if (exchanged) {
        const Qx::FileInfo written = Qx::askFile(file).info();
        state.records.put(m_item, editRecordOf(m_edit, &written));
    }
    return exchanged;
}

/// The old file becomes a backup and the edit is written under its name. Until the file that was written is
/// seen to be sound everything can be taken back.
Qx::Status Replacing::exchange() {
    const String& file = m_undo.file();
    Qx::FileMoves moves(Qx::folderOf(file));
    Qx::Status status = m_undo.push(moves);
    if (status) {
        status = moves.sync();
    }
    if (!status) {
        return status;
    }
    m_edit.init_dirty();
    if (!m_edit.write_file()) {
        status = m_edit.lastFileStatus();
        if (Qx::askFile(file).isRegular()) { // written, but not known to be on the disk
            static_cast<void>(Qx::fileSystem().remove(file).code);
        }
        return status;
    }
    if (String why; examineEditFile(file, why) != EditFileState::Sound) {
        static_cast<void>(Qx::fileSystem().remove(file).code);
        return Qx::Status::failure("what was written of " + m_item.asString() + " does not read: " + why);
    }
    moves.keep();
    return {};
}

/// What of the file stays in it unread.
void noteUnread(Edit& edit, EditUpgrade& upgrade) {
    for (const String& name : edit.objectStore().names()) {
        if (name.ends_with(EditKeys::kUnread)) {
            upgrade.notDone.push_back("its object " + name + " does not read");
        }
    }
}

} // namespace

UpgradedEdit upgradeEdit(const cookie& item, bool dryRun) {
    UpgradedEdit result;
    result.item = item;
    const String file = getFilenameForCookie(item);
    if (file.empty()) {
        result.status =
            Qx::Status::failure(Qx::StatusCode::BadArgument, item.asString() + " is no item of the project");
        return result;
    }
    const Qx::FileInfo read = Qx::askFile(file).info();
    const EditPtr edit(new Edit);
    if (edit->read_file(item, eOpenExisting) != Edit::kReadOk) {
        result.status = edit->lastFileStatus();
        return result;
    }
    if (edit->lastUpgrade() == nullptr) {
        result.outcome = UpgradedEdit::Current;
        return result;
    }
    result.upgrade = *edit->lastUpgrade();
    noteUnread(*edit, result.upgrade);
    if (!result.upgrade.notDone.empty()) {
        result.outcome = UpgradedEdit::NotWhole;
        return result;
    }
    if (dryRun) {
        result.outcome = UpgradedEdit::WouldUpgrade;
        return result;
    }
    std::unique_ptr<ManagerState::CachedEdit> dropped;
    Replacing replacing(*edit, read);
    result.status = replacing.run(dropped);
    if (result.status) {
        result.outcome = UpgradedEdit::Upgraded;
        result.kept = replacing.kept();
    }
    return result;
}

Qx::Status itemsToUpgrade(std::vector<cookie>& items) {
    std::set<cookie> listed;
    Qx::Status status = listItems(listed);
    items.clear();
    for (const cookie& item : listed) {
        if (!Qx::askFile(getFilenameForCookie(item)).isMissing()) {
            items.push_back(item);
        }
    }
    return status;
}
