#include "edit/manager/detail/manager_state.h"
#include "edit/manager/revision_chain.h"
#include "edit/manager/revisions.h"
#include "edit/model/edit_keys.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/config_int.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"

namespace {

int depth() {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    return state.backupDepth;
}

RevisionChain chainOf(const cookie& item, RevisionChain::Kind kind) {
    return {item, kind, depth()};
}

/// True if the edit's file is the one that this process knows, and whole.
bool fileIsAsKnown(const ManagerState::CachedEdit& entry) {
    String why;
    return Qx::isSameFile(entry.file, Qx::askFile(entry.path).info()) &&
           examineEditFile(entry.path, why) == EditFileState::Sound;
}

/// Has the edit written by the next flush although nothing was changed, as its file is not under its name or
/// not what the edit is.
void writeAgain(ManagerState::CachedEdit& entry) {
    entry.edit->init_dirty();
    managerState().addToDirtyList(entry.item);
}

/// Makes the edit's file say what the edit is, also when nothing was changed since it went with the last
/// backup, was replaced or went bad. Under the scope of the edit.
Qx::Status writeWhole(ManagerState::CachedEdit& entry) {
    ManagerState& state = managerState();
    if (!entry.edit->isDirty(true) && !fileIsAsKnown(entry)) {
        writeAgain(entry);
    }
    const bool written = state.write(entry);
    const String text = entry.path + " could not be written";
    if (!entry.written) {
        return entry.written.retold(text + ": " + entry.written.reason());
    }
    const Qx::FileAnswer present = Qx::askFile(entry.path);
    if (const Qx::FileError error = present.obstacle("keep")) {
        return error.status();
    }
    return written && present.isRegular() ? Qx::Status() : Qx::Status::failure(text);
}

Qx::Status isReadOnly(const cookie& item) {
    return Qx::Status::failure(Qx::StatusCode::ReadOnly, item.asString() + " is read-only");
}

/// The edit left the cache meanwhile, or others could not be kept away from it.
Qx::Status isInUse(const cookie& item) {
    return Qx::Status::failure(Qx::StatusCode::Locked,
                               item.asString() + " is in use by another thread or program; try again");
}

/// A step of an edit from its present revision to the newest of one chain; the present one goes onto the
/// other.
class RevisionStep {
public:
    RevisionStep(const cookie& item, RevisionChain::Kind from)
        : m_item(item), m_from(chainOf(item, from)),
          m_to(chainOf(item, from == RevisionChain::Undo ? RevisionChain::Redo : RevisionChain::Undo)),
          m_moves(Qx::folderOf(m_from.file())),
          m_code(from == RevisionChain::Undo ? kRevisionUndo : kRevisionRedo) {}

    Qx::Status run(String* notice = nullptr);

private:
    [[nodiscard]] Qx::Status checkRevision() const;
    Qx::Status moveFiles();
    Qx::Status step();
    Qx::Status findSound(int& number);
    void moveFilesBack();
    Qx::Status remember();
    void carryOver();
    void describe();
    void report(const String& reason) const {
        herc_printf("edit_manager: no revision of %s was changed: %s\n", m_item.asString().c_str(),
                    reason.c_str());
    }
    [[nodiscard]] bool clipboardFollows(const EditPtr& edit) const {
        return !m_item.isClipboard() && config_int("undo_clipboard", 1) != 0 &&
               EditKeys::kClipboardUsed.get(edit->Opts()) != 0;
    }

    cookie m_item;
    RevisionChain m_from;
    RevisionChain m_to;
    Qx::FileMoves m_moves;
    Qx::FileInfo m_moved; ///< the file of the revision that the step leads to
    RevisionChangeType m_code;
    EditPtr m_before;
    EditPtr m_after;
    bool m_celCuesLoaded = false;
    bool m_wasClean = false;
    String m_owner;
    EditModification m_description;
    std::unique_ptr<ManagerState::CachedEdit> m_dropped;
};

Qx::Status RevisionStep::run(String* notice) {
    if (Qx::Status there = checkRevision(); !there) {
        return there;
    }
    if (PermissionsManager::getReadOnly(m_item)) {
        herc_printf("Attempt to %s read-only edit\n", m_code == kRevisionUndo ? "undo" : "redo");
        return isReadOnly(m_item);
    }
    OpenReport opened;
    m_before = edit_manager::openEdit(m_item, eOpenExisting, opened);
    if (!m_before.valid()) {
        return opened.status;
    }
    m_before->notifyImpendingRevisionChange(m_code);
    if (Qx::Status remembered = remember(); !remembered) {
        return remembered;
    }
    bool takesClipboard = m_code == kRevisionUndo && clipboardFollows(m_before);
    edit_manager::flush_changes();
    if (Qx::Status moved = moveFiles(); !moved) {
        return moved;
    }
    managerState().tell(edit_manager::invalidateCacheMsgType(), m_item);
    m_after = edit_manager::openEdit(m_item, eOpenExisting, opened);
    if (!m_after.valid()) {
        moveFilesBack();
        return opened.status;
    }
    m_moves.keep();
    m_dropped.reset();
    if (m_code == kRevisionRedo) {
        takesClipboard = clipboardFollows(m_after);
    }
    carryOver();
    // Those who watch the object that they have, and those who opened the item since.
    m_before->notifyRevisionChange(m_code);
    m_after->notifyRevisionChange(m_code);
    describe();
    const RevisionChain::Kind kind = m_code == kRevisionUndo ? RevisionChain::Undo : RevisionChain::Redo;
    if (takesClipboard && !RevisionStep(clipboard_cookie, kind).run()) {
        const String text = "the clipboard " + clipboard_cookie.asString() +
                            " went with the change and could not be taken along; it is as it was";
        herc_printf("edit_manager: %s\n", text.c_str());
        if (notice != nullptr) {
            *notice = text;
        }
    }
    return {};
}

/// An undo finds the newest backup, a redo takes backup 1 or none.
Qx::Status RevisionStep::checkRevision() const {
    int number = 0;
    if (Qx::Status status = m_from.findNewest(number); !status) {
        report(status.reason());
        return status;
    }
    if (m_code == kRevisionUndo ? number != 0 : number == 1) {
        return {};
    }
    return Qx::Status::failure(Qx::StatusCode::NotFound,
                               m_item.asString() + " has no revision to " +
                                   (m_code == kRevisionUndo ? "go back to" : "bring back"));
}

/// What is carried over from the edit before the step.
Qx::Status RevisionStep::remember() {
    const SectionHold section(m_before);
    if (!section.isHeld()) {
        return isInUse(m_item);
    }
    m_celCuesLoaded = m_before->get_cel_cues_loaded();
    m_owner = m_before->getOwner();
    m_description = ownChangeOf(std::as_const(*m_before).Opts());
    return {};
}

Qx::Status RevisionStep::moveFiles() {
    const CachedEditScope scope(m_item, m_before);
    // Another project may have become the current one since the step began.
    if (scope.entry() == nullptr || scope.entry()->path != m_from.file()) {
        return scope.isWritable() ? isInUse(m_item) : scope.obstacle();
    }
    ManagerState::CachedEdit& entry = *scope.entry();
    // Who asks for the edit from here on gets the revision that comes: a change to this one would be lost.
    managerState().setLeaving(entry, true);
    const Qx::Status written = writeWhole(entry);
    Qx::Status status = written ? step() : written;
    if (!status) {
        const bool isBack = m_moves.takeBack();
        report(status.reason());
        if (!isBack) {
            managerState().noteFile(entry);
            writeAgain(entry);
        }
        managerState().setLeaving(entry, false);
        return status;
    }
    m_moved = Qx::askFile(m_from.file()).info();
    m_dropped = managerState().removeCacheEntry(m_item);
    return {};
}

/// Moves the present revision onto one chain and the next of the other into its place. On a failure some
/// moves are made.
Qx::Status RevisionStep::step() {
    int number = 0;
    Qx::Status status = (m_code == kRevisionUndo ? m_to : m_from).closeHoles();
    if (status) {
        status = findSound(number);
    }
    if (status) {
        status = m_to.push(m_moves);
    }
    if (status) {
        status = m_from.pull(m_moves, number);
    }
    return status ? m_moves.sync() : status;
}

/// The newest revision that is sound. Those before it are damaged: they are set aside, as an opening does
/// with them, when there is a sound one.
Qx::Status RevisionStep::findSound(int& number) {
    std::vector<int> damaged;
    String why = "there is none";
    for (number = 0;;) {
        String fault;
        int next = 0;
        if (Qx::Status status = m_from.findNewest(next, number); !status || next == 0) {
            return status ? Qx::Status::failure(Qx::StatusCode::Damaged, why) : status;
        }
        number = next;
        const EditFileState state = examineEditFile(m_from.path(number), fault);
        if (state == EditFileState::Sound) {
            break;
        }
        if (state == EditFileState::Refused) {
            return Qx::Status::failure(Qx::StatusCode::Refused, fault);
        }
        why = fault;
        damaged.push_back(number);
    }
    for (const int bad : damaged) {
        String name;
        Qx::Status status = findCorruptName(m_from.file(), name);
        if (status) {
            status = m_moves.move(m_from.path(bad), name);
        }
        if (!status) {
            return status;
        }
        herc_printf("edit_manager: %s is damaged and was set aside as %s\n", m_from.path(bad).c_str(),
                    name.c_str());
    }
    return {};
}

/// The revision did not open: everything becomes as it was, unless the edit's file is another one by now.
void RevisionStep::moveFilesBack() {
    ManagerState& state = managerState();
    std::unique_ptr<ManagerState::CachedEdit> failed;
    const Qx::AccessScope<cookie> turn(state.queue, m_item);
    EditManagerLock writers(Qx::folderOf(m_from.file()));
    const bool mayWrite = takeWritersLock(writers).isOk();
    const ManagerState::Hold hold(state.lock);
    const Qx::FileAnswer present = Qx::askFile(m_from.file());
    if (!mayWrite || (!present.isMissing() && !Qx::isSameFile(present.info(), m_moved))) {
        m_moves.keep();
        herc_printf(
            "edit_manager: the revision of %s that was stepped to does not open; the one before is %s\n",
            m_item.asString().c_str(), m_to.path(1).c_str());
        return;
    }
    failed = state.removeCacheEntry(m_item);
    if (!m_moves.takeBack()) {
        writeAgain(*m_dropped);
        ManagerState::noteFile(*m_dropped);
    }
    m_dropped->leaving = false;
    state.putBack(std::move(m_dropped));
    report("the revision could not be opened");
}

/// Gives the edit what is carried over. Left out if its section cannot be had: the step is made.
void RevisionStep::carryOver() {
    const SectionHold section(m_after);
    if (!section.isHeld()) {
        return;
    }
    m_wasClean = !m_after->isDirty(true);
    m_after->set_cel_cues_loaded(m_celCuesLoaded);
    m_after->setOwner(m_owner, false);
}

/// Says of the edit which change was undone or redone. That counts as a change and reaches its file.
void RevisionStep::describe() {
    const SectionHold section(m_after);
    if (!section.isHeld()) {
        return;
    }
    const EditModification own = ownChangeOf(std::as_const(*m_after).Opts());
    const EditModification said = m_code == kRevisionUndo ? m_description.invert() : own;
    if (m_wasClean) {
        m_after->resetChangeDescription();
    }
    m_after->setChangeDescription(said, true);
    // The description is that of the step; whoever undoes this state wants to know what made it.
    if (m_wasClean) {
        EditKeys::kOwnChange.set(m_after->Opts(), own.asString());
    }
}

/// Moves the edit's file, written whole, to undo backup 1, and what could be redone out of its chain.
Qx::Status keepRevision(ManagerState::CachedEdit& entry) {
    RevisionChain undo(entry.path, RevisionChain::Undo, depth());
    RevisionChain redo(entry.path, RevisionChain::Redo, depth());
    Qx::FileMoves moves(Qx::folderOf(undo.file()));
    auto ended = std::make_unique<Qx::FileMoves>(Qx::folderOf(redo.file()));
    Qx::Status status = redo.closeHoles();
    if (status) {
        status = undo.push(moves);
    }
    if (status) {
        status = redo.park(*ended);
    }
    if (status) {
        status = moves.finish();
    }
    if (status) {
        entry.endedRedo = std::move(ended);
    }
    return status;
}

} // namespace

Qx::Status edit_manager::backup_edit(const cookie& item) {
    if (PermissionsManager::getReadOnly(item)) {
        herc_printf("Attempt to backup read-only edit\n");
        return isReadOnly(item);
    }
    OpenReport opened;
    const EditPtr edit = openEdit(item, eOpenExisting, opened);
    if (!edit.valid()) {
        return opened.status;
    }
    edit->notifyImpendingRevisionChange(kRevisionBackup);
    {
        const CachedEditScope scope(item, edit);
        if (scope.entry() == nullptr) {
            return scope.isWritable() ? isInUse(item) : scope.obstacle();
        }
        if (Qx::Status written = writeWhole(*scope.entry()); !written) {
            return written;
        }
        Qx::Status kept = keepRevision(*scope.entry());
        managerState().noteFile(*scope.entry());
        if (!kept) {
            herc_printf("edit_manager::backup_edit( %s ) : %s\n", cookie_string(item).c_str(),
                        kept.reason().c_str());
            return kept;
        }
        if (EditKeys::kClipboardUsed.get(edit->Opts()) != 0) {
            EditKeys::kClipboardUsed.set(edit->Opts(), 0);
        }
        edit->resetChangeDescription();
    }
    storeRecords();
    return {};
}

bool edit_manager::takeBackBackup(const cookie& item) {
    EditPtr edit;
    {
        const ManagerState::Hold hold(managerState().lock);
        const ManagerState::CachedEdit* const found = managerState().findCacheEntry(item);
        edit = found == nullptr ? EditPtr() : found->edit;
    }
    if (!edit.valid()) {
        return false;
    }
    managerState().tell(invalidateCacheMsgType(), item);
    std::unique_ptr<ManagerState::CachedEdit> dropped;
    const CachedEditScope scope(item, edit);
    if (scope.entry() == nullptr || scope.entry()->endedRedo == nullptr || !scope.entry()->isAway()) {
        return false;
    }
    int restored = 0;
    RevisionChain undo(scope.entry()->path, RevisionChain::Undo, depth());
    if (const Qx::Status status = undo.restoreNewest(restored); !status || restored != 1) {
        herc_printf("edit_manager: the last backup of %s stays: %s\n", item.asString().c_str(),
                    status.reason().c_str());
        return false;
    }
    dropped = managerState().removeCacheEntry(item);
    static_cast<void>(dropped->endedRedo->takeBack());
    return true;
}

bool edit_manager::undoExists(const cookie& item) {
    bool found = false;
    return !chainOf(item, RevisionChain::Undo).exists(found) || found;
}

bool edit_manager::redoExists(const cookie& item) {
    return !chainOf(item, RevisionChain::Redo).ask(1).isMissing();
}

Qx::Status edit_manager::undoRequest(const cookie& item, String* notice) {
    return RevisionStep(item, RevisionChain::Undo).run(notice);
}

Qx::Status edit_manager::redoRequest(const cookie& item, String* notice) {
    return RevisionStep(item, RevisionChain::Redo).run(notice);
}

namespace {

void deleteTail(const cookie& item, RevisionChain::Kind kind, int keep) {
    RevisionChain chain = chainOf(item, kind);
    EditManagerLock writers;
    if (!getFilenameForCookie(item).empty() && takeWritersLock(writers)) {
        const ManagerState::Hold hold(managerState().lock);
        if (const Qx::Status status = chain.deleteTail(keep); !status) {
            herc_printf("edit_manager: backups of %s are left: %s\n", item.asString().c_str(),
                        status.reason().c_str());
        }
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
