#include "edit/manager/detail/manager_state.h"
#include "edit/manager/revision_chain.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/config_int.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"

namespace {

constexpr const char* kClipboardUsed = "CLIPBOARD_USED";

int depth() {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    return state.backupDepth;
}

RevisionChain chainOf(const cookie& item, RevisionChain::Kind kind) {
    return {item, kind, depth()};
}

/// Makes the edit's file say what the edit is, also when it went with the last backup and nothing was changed
/// since. Under the scope of the edit.
bool writeWhole(ManagerState::CachedEdit& entry) {
    const Qx::FileAnswer present = Qx::askFile(entry.path);
    if (const Qx::FileError error = present.obstacle("replace")) {
        herc_printf("edit_manager: nothing was written: %s\n", error.text().c_str());
        return false;
    }
    if (present.isMissing()) {
        entry.edit->init_dirty();
    }
    return managerState().write(entry) && Qx::askFile(entry.path).isRegular();
}

/// The number of the newest backup of a chain; 0 also when that could not be told (logged).
int newestOf(const RevisionChain& chain) {
    int newest = 0;
    if (const Qx::Status status = chain.findNewest(newest); !status) {
        herc_printf("edit_manager: no revision was looked for: %s\n", status.reason().c_str());
    }
    return newest;
}

/// A step of an edit from its present revision to the newest of one chain; the present one goes onto the
/// other.
class RevisionStep {
public:
    RevisionStep(const cookie& item, RevisionChain::Kind from)
        : m_item(item), m_from(chainOf(item, from)),
          m_to(chainOf(item, from == RevisionChain::Undo ? RevisionChain::Redo : RevisionChain::Undo)),
          m_code(from == RevisionChain::Undo ? kRevisionUndo : kRevisionRedo) {}

    bool run();

private:
    [[nodiscard]] bool moveFiles();
    void remember();
    void putBack();
    [[nodiscard]] bool clipboardFollows(const EditPtr& edit) const {
        return !m_item.isClipboard() && config_int("undo_clipboard", 1) != 0 &&
               edit->Opts().getInt(kClipboardUsed) != 0;
    }

    cookie m_item;
    RevisionChain m_from;
    RevisionChain m_to;
    RevisionChangeType m_code;
    EditPtr m_before;
    EditPtr m_after;
    bool m_celCuesLoaded = false;
    String m_owner;
    EditModification m_description;
    std::unique_ptr<ManagerState::CachedEdit> m_dropped;
};

bool RevisionStep::run() {
    if (newestOf(m_from) == 0) {
        return false;
    }
    if (PermissionsManager::getReadOnly(m_item)) {
        herc_printf("Attempt to %s read-only edit\n", m_code == kRevisionUndo ? "undo" : "redo");
        return false;
    }
    m_before = edit_manager::openEdit(m_item, eOpenExisting);
    if (!m_before.valid()) {
        return false;
    }
    m_before->notifyImpendingRevisionChange(m_code);
    remember();
    bool takesClipboard = m_code == kRevisionUndo && clipboardFollows(m_before);
    edit_manager::flush_changes();
    managerState().tell(edit_manager::invalidateCacheMsgType(), m_item);
    if (!moveFiles()) {
        return false;
    }
    m_dropped.reset();
    m_after = edit_manager::openEdit(m_item, eOpenExisting);
    if (!m_after.valid()) {
        return false;
    }
    if (m_code == kRevisionRedo) {
        takesClipboard = clipboardFollows(m_after);
    }
    putBack();
    // Those who watch the object that they have, and those who opened the item since.
    m_before->notifyRevisionChange(m_code);
    m_after->notifyRevisionChange(m_code);
    m_after->getChangeDescriptionServer().setValue(m_description);
    if (takesClipboard) {
        RevisionStep(clipboard_cookie, m_code == kRevisionUndo ? RevisionChain::Undo : RevisionChain::Redo)
            .run();
    }
    return true;
}

/// What is carried over from the edit before the step.
void RevisionStep::remember() {
    ManagerState& state = managerState();
    const ManagerState::Hold section(m_before->section());
    m_celCuesLoaded = m_before->get_cel_cues_loaded();
    m_owner = m_before->getOwner();
    m_description = m_before->getChangeDescription();
    const ManagerState::Hold hold(state.lock);
    const ManagerState::CachedEdit* const entry = state.findCacheEntry(m_item);
    // The description in the header of a revision that was brought back is that of bringing it back.
    if (entry != nullptr && entry->ownDescription && !m_before->isDirty(true)) {
        m_description = *entry->ownDescription;
    }
}

bool RevisionStep::moveFiles() {
    const CachedEditScope scope(m_item, m_before);
    if (scope.entry() == nullptr) {
        return false;
    }
    ManagerState::CachedEdit& entry = *scope.entry();
    // Who asks for the edit from here on gets the revision that comes: a change to this one would be lost.
    managerState().setLeaving(entry, true);
    if (!writeWhole(entry) || newestOf(m_from) == 0) {
        managerState().setLeaving(entry, false);
        return false;
    }
    Qx::Status status = m_to.push();
    int restored = 0;
    if (status && (status = m_from.restoreNewest(restored)) && restored == 0) {
        status = Qx::Status::failure("the backup is gone");
    }
    if (!status && Qx::askFile(entry.path).isMissing()) {
        // The present revision comes back.
        static_cast<void>(m_to.restoreNewest(restored).isOk());
    }
    if (!status) {
        herc_printf("edit_manager: no revision of %s was changed: %s\n", m_item.asString().c_str(),
                    status.reason().c_str());
        managerState().noteFile(entry);
        managerState().setLeaving(entry, false);
        return false;
    }
    static_cast<void>(m_from.makeDurable());
    m_dropped = managerState().removeCacheEntry(m_item);
    return true;
}

/// Gives the edit of the restored revision what is carried over. It stays clean, as its file says the same.
void RevisionStep::putBack() {
    ManagerState& state = managerState();
    const ManagerState::Hold section(m_after->section());
    const bool wasClean = !m_after->isDirty(true);
    const EditModification own = m_after->getChangeDescription();
    m_description = m_code == kRevisionUndo ? m_description.invert() : own;
    const bool suppressed = m_after->isNetworkNotificationSuppressed();
    m_after->setNetworkNotificationSuppressed(true);
    m_after->set_cel_cues_loaded(m_celCuesLoaded);
    m_after->setOwner(m_owner, false);
    m_after->setChangeDescription(m_description, false);
    m_after->setNetworkNotificationSuppressed(suppressed);
    if (!wasClean) {
        return;
    }
    m_after->set_dirty(false);
    state.removeFromDirtyList(m_item);
    const ManagerState::Hold hold(state.lock);
    ManagerState::CachedEdit* const entry = state.findCacheEntry(m_item);
    if (entry != nullptr && entry->edit == m_after) {
        entry->ownDescription = own;
    }
}

} // namespace

bool edit_manager::backup_edit(const cookie& item) {
    if (PermissionsManager::getReadOnly(item)) {
        herc_printf("Attempt to backup read-only edit\n");
        return false;
    }
    const EditPtr edit = openEdit(item, eOpenExisting);
    if (!edit.valid()) {
        return false;
    }
    edit->notifyImpendingRevisionChange(kRevisionBackup);
    RevisionChain undo = chainOf(item, RevisionChain::Undo);
    RevisionChain redo = chainOf(item, RevisionChain::Redo);
    {
        const CachedEditScope scope(item, edit);
        if (scope.entry() == nullptr || !writeWhole(*scope.entry()) || !redo.deleteTail(0)) {
            return false;
        }
        const Qx::Status kept = undo.push();
        managerState().noteFile(*scope.entry());
        if (!kept) {
            herc_printf("edit_manager::backup_edit( %s ) : %s\n", cookie_string(item).c_str(),
                        kept.reason().c_str());
            return false;
        }
        static_cast<void>(undo.makeDurable());
        if (edit->Opts().getInt(kClipboardUsed) != 0) {
            edit->Opts().setInt(kClipboardUsed, 0);
        }
        edit->resetChangeDescription();
    }
    storeRecords();
    return true;
}

bool edit_manager::undoExists(const cookie& item) {
    bool found = false;
    return chainOf(item, RevisionChain::Undo).exists(found) && found;
}

bool edit_manager::redoExists(const cookie& item) {
    // Backup 1, but for a chain that a crash has left with a hole.
    return newestOf(chainOf(item, RevisionChain::Redo)) != 0;
}

bool edit_manager::undoRequest(const cookie& item) {
    return RevisionStep(item, RevisionChain::Undo).run();
}

bool edit_manager::redoRequest(const cookie& item) {
    return RevisionStep(item, RevisionChain::Redo).run();
}

namespace {

void deleteTail(const cookie& item, RevisionChain::Kind kind, int keep) {
    RevisionChain chain = chainOf(item, kind);
    EditManagerLock writers;
    if (!getFilenameForCookie(item).empty() && takeWritersLock(writers)) {
        const ManagerState::Hold hold(managerState().lock);
        chain.deleteTail(keep);
    }
}

} // namespace

void edit_manager::delete_redo_edits(const cookie& item, int keep) {
    deleteTail(item, RevisionChain::Redo, keep);
}

void edit_manager::delete_backup_edits(const cookie& item, int keep) {
    deleteTail(item, RevisionChain::Undo, keep);
}

int edit_manager::backupDepth() {
    return depth();
}
