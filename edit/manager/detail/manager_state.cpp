#include "edit/manager/detail/manager_state.h"

#include "edit/manager/edit_record.h"
#include "edit/manager/revision_chain.h"
#include "platform/services/atomic_batch.h"
#include "platform/services/log.h"
#include "platform/store/tag_bag.h"

namespace {

/// Keeps a file as undo backup 1, or one that is damaged as what it is.
Qx::Status keepAside(const String& file, int depth, String& kept) {
    String why;
    RevisionChain undo(file, RevisionChain::Undo, depth);
    if (examineEditFile(file, why) != EditFileState::Damaged) {
        kept = undo.path(1);
        return undo.push();
    }
    Qx::FileMoves moves(Qx::folderOf(file));
    Qx::Status status = findCorruptName(file, kept);
    if (status) {
        status = moves.move(file, kept);
    }
    return status ? moves.finish() : status;
}

/// Keeps the file of another program aside if it is not the one this process knows.
Qx::Status keepForeignFile(const ManagerState::CachedEdit& entry, int depth) {
    const Qx::FileAnswer present = Qx::askFile(entry.path);
    if (const Qx::FileError error = present.obstacle("replace")) {
        herc_printf("edit_manager: nothing was written: %s\n", error.text().c_str());
        return error.status();
    }
    if (present.isMissing() || Qx::isSameFile(entry.file, present.info())) {
        return {};
    }
    String kept;
    const Qx::Status status = keepAside(entry.path, depth, kept);
    if (!status) {
        herc_printf("edit_manager: %s was changed by another program and could not be kept, so it was not "
                    "written: %s\n",
                    entry.path.c_str(), status.reason().c_str());
        return status;
    }
    herc_printf("edit_manager: %s was changed by another program; that version is kept as %s\n",
                entry.path.c_str(), kept.c_str());
    return {};
}

} // namespace

ManagerState& managerState() {
    static auto& state = *new ManagerState;
    return state;
}

bool isNoItem(const cookie& item) {
    return !item.is_valid() || (item.word(0) == 0 && item.word(1) == 0 && item.word(2) == 0);
}

const ManagerMessages& managerMessages() {
    static const ManagerMessages messages;
    return messages;
}

namespace {
/// Interns the message types when the library loads.
[[maybe_unused]] const ManagerMessages& internedAtLoad = managerMessages();
} // namespace

void ManagerState::put(const cookie& item, EditPtr edit, String path, const Qx::FileInfo& file,
                       std::shared_ptr<const OpenReport> failure) {
    auto entry = std::make_unique<CachedEdit>();
    entry->item = item;
    entry->edit = std::move(edit);
    entry->path = std::move(path);
    entry->failure = std::move(failure);
    entry->know(file);
    put(std::move(entry));
}

void ManagerState::put(std::unique_ptr<CachedEdit> entry) {
    // Memory is asked for before the lookup is locked, and what was in the place goes after it.
    Cache made;
    const cookie item = entry->item;
    made.emplace(item, std::move(entry));
    Cache::insert_return_type placed;
    {
        const std::lock_guard hold(lookup);
        placed = cache.insert(made.extract(made.begin()));
        if (!placed.inserted) {
            placed.position->second.swap(placed.node.mapped());
        }
    }
}

void ManagerState::putBack(std::unique_ptr<CachedEdit> entry) {
    if (entry != nullptr) {
        // Whether it is dirty its holders may be changing; a flush finds out under its section.
        addToDirtyList(entry->item);
        put(std::move(entry));
    }
}

template <typename May>
std::unique_ptr<ManagerState::CachedEdit> ManagerState::takeOut(const cookie& item, May&& may) {
    Cache::node_type taken;
    {
        const std::lock_guard hold(lookup);
        const auto place = cache.find(item);
        if (place == cache.end() || !may(place->second->edit)) {
            return nullptr;
        }
        taken = cache.extract(place);
    }
    removeFromDirtyList(item);
    return std::move(taken.mapped());
}

std::unique_ptr<ManagerState::CachedEdit> ManagerState::removeCacheEntry(const cookie& item) {
    return takeOut(item, [](const EditPtr&) { return true; });
}

std::unique_ptr<ManagerState::CachedEdit> ManagerState::removeUnreferenced(const cookie& item,
                                                                           bool onlyClean) {
    // Under `lookup` nobody can come to have an edit that nobody has, so it may be looked at.
    return takeOut(item, [onlyClean](const EditPtr& edit) {
        return !edit.valid() || (edit->refCount() == 1 && !(onlyClean && edit->isDirty(true)));
    });
}

std::unique_ptr<ManagerState::CachedEdit> ManagerState::removeHeld(const cookie& item, bool onlyClean) {
    return takeOut(item, [onlyClean](const EditPtr& edit) {
        return !(onlyClean && edit->refCount() == 2 && edit->isDirty(true));
    });
}

void ManagerState::noteFile(CachedEdit& entry) {
    entry.know(Qx::askFile(entry.path).info());
}

void ManagerState::noteWritten(CachedEdit& entry) {
    noteFile(entry);
    if (entry.file.kind == Qx::FileKind::Unknown) {
        // A file that nobody knows counts as another program's; who wrote it knows it without asking.
        entry.know(entry.edit->objectStore().fileInfo());
    }
}

bool ManagerState::writeLast(CachedEdit& entry, bool waits) {
    if (entry.isAway() && Qx::askFile(entry.path).isMissing()) {
        entry.edit->init_dirty();
    }
    return write(entry, waits);
}

bool ManagerState::write(CachedEdit& entry, bool waits) {
    if (entry.item.type() == Cookie_Type::Transient || !entry.edit->needsToBeWritten()) {
        return true;
    }
    entry.written = writeFile(entry, waits);
    return entry.written.isOk();
}

Qx::Status ManagerState::writeFile(CachedEdit& entry, bool waits) {
    Edit& edit = *entry.edit;
    // What is moved next must be the file that is written here, also inside a caller's batch.
    const Qx::AtomicBatch::Pause atOnce;
    EditManagerLock writers{Qx::folderOf(entry.path)};
    Qx::Status status = takeWritersLock(writers, waits);
    if (status) {
        status = keepForeignFile(entry, backupDepth);
    }
    if (!status) {
        addToDirtyList(entry.item);
        return status;
    }
    if (!edit.write_file(Qx::widen(entry.path))) {
        herc_printf("edit_manager: %s\n", edit.lastFileError().c_str());
        // The file may have been replaced and only not been made durable.
        noteWritten(entry);
        addToDirtyList(entry.item);
        return edit.lastFileStatus();
    }
    noteWritten(entry);
    entry.forgetRedo();
    removeFromDirtyList(entry.item);
    if (edit.get_dirty()) {
        addToDirtyList(entry.item); // changed meanwhile by one who does not hold its section
    }
    records.put(entry.item, editRecordOf(edit, &entry.file));
    return {};
}

ManagerState::Unreferenced ManagerState::writeUnreferenced(CachedEdit& entry, bool waits) {
    if (entry.edit->refCount() > 1) {
        return Unreferenced::InUse;
    }
    const std::unique_lock<criticalSection> section(entry.edit->section(), std::try_to_lock);
    if (!section.owns_lock()) {
        return Unreferenced::InUse;
    }
    if (!writeLast(entry, waits)) {
        return Unreferenced::NotWritten;
    }
    return entry.edit->isDirty(true) ? Unreferenced::Unwritten : Unreferenced::Clean;
}

void ManagerState::addToDirtyList(const cookie& item) {
    const std::lock_guard hold(dirtyMutex);
    dirty.insert(item);
}

void ManagerState::removeFromDirtyList(const cookie& item) {
    const std::lock_guard hold(dirtyMutex);
    dirty.erase(item);
}

Qx::Status takeWritersLock(EditManagerLock& writers, bool waits) {
    Qx::Status status = writers.take(waits);
    if (!status) {
        herc_printf("edit_manager: nothing was written: %s\n", status.reason().c_str());
    }
    return status;
}

namespace {

/// The folder of a cached edit's file, which may be that of a project which is being left.
String folderOfCached(const cookie& item) {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    const ManagerState::CachedEdit* const found = state.findCacheEntry(item);
    return found == nullptr || found->path.empty() ? String() : Qx::folderOf(found->path);
}

} // namespace

SectionHold::SectionHold(const EditPtr& edit)
    : m_section(edit->section()), m_isHeld(m_section.lockUnlessRing()) {
    if (!m_isHeld) {
        herc_printf("edit_manager: %s is left as it is: the thread that is changing it waits for this one\n",
                    edit->get_cookie_str().c_str());
    }
}

SectionHold::~SectionHold() {
    if (m_isHeld) {
        m_section.unlock();
    }
}

CachedEditScope::CachedEditScope(const cookie& item, const EditPtr& edit)
    : m_section(edit), m_turn(managerState().queue, item), m_writers(folderOfCached(item)),
      m_taken(m_section.isHeld()
                  ? takeWritersLock(m_writers)
                  : Qx::Status::failure(Qx::StatusCode::Locked,
                                        item.asString() + " is in use by a thread that waits for this one")),
      m_lock(managerState().lock), m_entry(nullptr) {
    ManagerState::CachedEdit* const found = managerState().findCacheEntry(item);
    if (isWritable() && found != nullptr && found->edit == edit) {
        m_entry = found;
    }
}
