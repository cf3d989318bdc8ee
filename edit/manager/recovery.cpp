#include "edit/manager/recovery.h"

#include "edit/manager/detail/manager_state.h"
#include "edit/manager/revision_chain.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/edit_filenames.h"

namespace {

Qx::FileError moveFile(const String& from, const String& to) {
    return Qx::retryInterrupted([&] { return Qx::fileSystem().rename(from, to); });
}

/// One recovery, with other processes and threads kept away.
class EditRecovery {
public:
    EditRecovery(const cookie& item, const Revision& taken, const Revision* present)
        : m_undo(item, RevisionChain::Undo, edit_manager::backupDepth()), m_taken(taken), m_present(present) {
    }

    /// Why it cannot be done.
    [[nodiscard]] Qx::Status objection() const;
    Qx::Status run(String& kept);

private:
    Qx::Status keepPresent(String& kept);
    void putPresentBack(const String& kept);

    RevisionChain m_undo;
    const Revision& m_taken;
    const Revision* m_present; ///< null when the edit has no file
};

Qx::Status EditRecovery::objection() const {
    const String& file = m_undo.file();
    if (m_taken.kind == Revision::Itself || !m_taken.isSound()) {
        return Qx::Status::failure(m_taken.path + " cannot be taken" +
                                   (m_taken.isSound() ? ": it is the edit itself" : ": " + m_taken.damage));
    }
    if (m_present != nullptr && m_present->refused) {
        return Qx::Status::failure(m_present->path +
                                   " may be sound, but cannot be read here: " + m_present->damage);
    }
    const Qx::FileAnswer present = Qx::askFile(file);
    if (present.isUnknown()) {
        return present.obstacle().status();
    }
    const Qx::FileInfo known = m_present != nullptr ? m_present->file : Qx::FileInfo();
    if (!Qx::isSameFile(present.info(), known) ||
        !Qx::isSameFile(Qx::askFile(m_taken.path).info(), m_taken.file)) {
        return Qx::Status::failure("the files of " + file + " changed meanwhile; try again");
    }
    return {};
}

Qx::Status EditRecovery::keepPresent(String& kept) {
    if (m_present == nullptr) {
        return {};
    }
    if (m_present->isSound()) {
        Qx::Status status = m_undo.push();
        kept = m_undo.path(1);
        return status;
    }
    Qx::Status status = findCorruptName(m_undo.file(), kept);
    return status ? moveFile(m_undo.file(), kept).status() : status;
}

/// A failure is told of by the caller, who looks where the file is.
void EditRecovery::putPresentBack(const String& kept) {
    if (kept.empty() || !Qx::askFile(m_undo.file()).isMissing()) {
        return;
    }
    if (m_present->isSound()) {
        int restored = 0;
        static_cast<void>(m_undo.restoreNewest(restored).isOk());
    } else {
        static_cast<void>(moveFile(kept, m_undo.file()).code);
    }
}

Qx::Status EditRecovery::run(String& kept) {
    const String& file = m_undo.file();
    // Copied first: keeping the present state may move the one that is taken to another name.
    const String copy = file + kRecoveryCopy;
    if (Qx::Status copied = Qx::copyFile(m_taken.path, copy).status(); !copied) {
        return copied;
    }
    Qx::Status status = keepPresent(kept);
    if (status) {
        status = moveFile(copy, file).status();
    }
    if (!status) {
        putPresentBack(kept);
        static_cast<void>(Qx::fileSystem().remove(copy).code);
        return status;
    }
    return Qx::retryInterrupted([&] { return Qx::fileSystem().syncFolder(Qx::folderOf(file)); }).status();
}

/// `dropped` gets the edit that was in the cache, to go when no lock is held.
Qx::Status recover(const cookie& item, const RevisionList& list, const Revision& taken, String& kept,
                   std::unique_ptr<ManagerState::CachedEdit>& dropped) {
    ManagerState& state = managerState();
    const String file = getFilenameForCookie(item);
    if (file.empty()) {
        return Qx::Status::failure(item.asString() + " is no item of the project");
    }
    if (PermissionsManager::getReadOnly(item)) {
        return Qx::Status::failure(item.asString() + " is read-only");
    }
    const Qx::AccessScope<cookie> turn(state.queue, item);
    EditManagerLock writers(Qx::folderOf(file));
    if (Qx::Status locked = writers.take(true); !locked) {
        return locked;
    }
    const ManagerState::Hold hold(state.lock);
    EditRecovery recovery(item, taken, list.itself());
    if (Qx::Status objection = recovery.objection(); !objection) {
        return objection;
    }
    // Nobody may open it from here on: who asks for it waits for the end of this.
    dropped = state.removeUnreferenced(item, true);
    if (dropped == nullptr && state.findCacheEntry(item) != nullptr) {
        return Qx::Status::failure(item.asString() + " is open; close it first");
    }
    return recovery.run(kept);
}

} // namespace

Qx::Status recoverEdit(const cookie& item, const RevisionList& list, const Revision& taken, String& kept) {
    std::unique_ptr<ManagerState::CachedEdit> dropped;
    kept.clear();
    Qx::Status status = recover(item, list, taken, kept, dropped);
    if (dropped != nullptr) {
        managerState().tell(edit_manager::invalidateCacheMsgType(), item);
    }
    return status;
}
