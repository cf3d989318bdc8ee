#include "edit/manager/detail/manager_state.h"
#include "edit/manager/milestone_ring.h"
#include "edit/model/edit_keys.h"
#include "platform/media/frame_rate.h"
#include "platform/services/atomic_batch.h"
#include "platform/services/current_project.h"
#include "platform/services/log.h"

#include <algorithm>
#include <new>
#include <span>

namespace {

/// Writes the edit with its milestone: the header tells of the milestone before the copy is made.
bool writeWithMilestone(ManagerState::CachedEdit& entry, const MilestoneRing& milestones) {
    ManagerState& state = managerState();
    Edit& edit = *entry.edit;
    const int64_t before = EditKeys::kMilestone.get(edit.Opts());
    EditKeys::kMilestone.set(edit.Opts(), static_cast<int64_t>(edit.getModificationCount()));
    if (!state.write(entry)) {
        EditKeys::kMilestone.set(edit.Opts(), before);
        return false;
    }
    if (const Qx::Status status = milestones.makeMilestoneBackup(entry.edit, entry.path); !status) {
        herc_printf("edit_manager::flush_changes: no milestone of %s was made: %s\n",
                    entry.item.asString().c_str(), status.reason().c_str());
        EditKeys::kMilestone.set(edit.Opts(), before);
    }
    return state.write(entry);
}

EditPtr cachedEdit(const cookie& item) {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    const ManagerState::CachedEdit* const found = state.findCacheEntry(item);
    return found == nullptr ? EditPtr() : found->edit;
}

/// Does something for one edit; false when memory runs out over it, which is not to keep others from their
/// turn.
template <typename Work>
bool inMemory(Work&& work) {
    try {
        return work();
    } catch (const std::bad_alloc&) {
        return false;
    }
}

Vector<cookie> dirtyItems() {
    ManagerState& state = managerState();
    const std::lock_guard hold(state.dirtyMutex);
    return {state.dirty.begin(), state.dirty.end()};
}

/// So many edits share one sync of their folder.
constexpr size_t kTogether = 32;

/// Writes edits and then makes their names durable. One by one, not as an `AtomicBatch`: that would wait for
/// all that the file system has not written yet, media too, and nobody else may touch the edits meanwhile.
bool writeTogether(std::span<const cookie> items, const MilestoneRing& milestones) {
    ManagerState& state = managerState();
    bool allWritten = true;
    Qx::FolderSyncs names;
    Vector<EditPtr> written;
    for (const cookie& item : items) {
        const EditPtr edit = cachedEdit(item);
        if (!edit.valid()) {
            state.removeFromDirtyList(item);
        } else if (!inMemory([&] { return writeCached(item, edit, &milestones); })) {
            allWritten = false;
        } else {
            written.push_back(edit);
        }
    }
    if (const Qx::FileError error = names.commit()) {
        allWritten = false;
        herc_printf("edit_manager::flush_changes: %s\n", error.text().c_str());
        for (const EditPtr& edit : written) {
            const SectionHold section(edit);
            edit->init_dirty();
            const ManagerState::Hold hold(state.lock);
            state.addToDirtyList(edit->get_cookie());
            if (ManagerState::CachedEdit* const entry = state.findCacheEntry(edit->get_cookie())) {
                entry->written = error.status();
            }
        }
    }
    return allWritten;
}

} // namespace

bool writeCached(const cookie& item, const EditPtr& edit, const MilestoneRing* milestones, bool isLast) {
    ManagerState& state = managerState();
    const CachedEditScope scope(item, edit);
    if (!scope.isWritable() || scope.entry() == nullptr) {
        return scope.isWritable();
    }
    ManagerState::CachedEdit& entry = *scope.entry();
    if (isLast) {
        return state.writeLast(entry);
    }
    if (!edit->needsToBeWritten()) {
        state.removeFromDirtyList(item);
        return true;
    }
    return milestones != nullptr && milestones->isMilestoneBackupRequired(edit)
               ? writeWithMilestone(entry, *milestones)
               : state.write(entry);
}

bool edit_manager::flush_edit(const cookie& item) {
    const EditPtr edit = openEdit(item, eOpenExisting);
    if (!edit.valid()) {
        return false;
    }
    const bool written = writeCached(item, edit, nullptr);
    storeRecords();
    return written;
}

bool edit_manager::flush_changes() {
    ManagerState& state = managerState();
    state.notifier.notify(NotifyMsg(flushChangesMsgType(), String()));
    // The number of the next cookie is stored whenever one is handed out (`CookieAllocator`'s
    // `update_cookie_number`): there is nothing to advance.
    const MilestoneRing milestones;
    bool allWritten = true;
    {
        // Taken once for all; an edit that cannot be written without it says so itself.
        EditManagerLock writers;
        Vector<cookie> items = dirtyItems();
        const bool withClipboard = std::erase(items, clipboard_cookie) != 0;
        if (!items.empty() || withClipboard) {
            static_cast<void>(writers.take(true).isOk());
        }
        for (size_t from = 0; from < items.size(); from += kTogether) {
            const size_t count = std::min(kTogether, items.size() - from);
            allWritten = writeTogether({items.data() + from, count}, milestones) && allWritten;
        }
        // It holds what was taken out of the others, so it changes on the disk when they have.
        if (withClipboard && allWritten) {
            allWritten = writeTogether({&clipboard_cookie, 1}, milestones);
        }
        const cookie project = get_current_project_cookie();
        if (const EditPtr edit = cachedEdit(project); edit.valid()) {
            allWritten = inMemory([&] { return writeCached(project, edit, nullptr); }) && allWritten;
        }
    }
    storeRecords();
    const Qx::CurrentProject project = Qx::currentProject();
    setProjDBValue("PROJECT_NAME", project.name);
    setProjDBValue("PROJECT_RATE", Qx::FrameRate(project.frameRateCode).asString());
    return allWritten;
}

void edit_manager::addToDirtyList(const cookie& item) {
    managerState().addToDirtyList(item);
}

size_t edit_manager::numDirty() {
    ManagerState& state = managerState();
    const std::lock_guard hold(state.dirtyMutex);
    return state.dirty.size();
}

Vector<UnwrittenEdit> edit_manager::unwrittenEdits() {
    ManagerState& state = managerState();
    Vector<UnwrittenEdit> unwritten;
    const Vector<cookie> items = dirtyItems();
    const ManagerState::Hold hold(state.lock);
    for (const cookie& item : items) {
        const ManagerState::CachedEdit* const entry = state.findCacheEntry(item);
        if (entry != nullptr && entry->edit.valid()) {
            unwritten.push_back({item, entry->written});
        }
    }
    return unwritten;
}

namespace {

void reportLost(const cookie& item, const Qx::Status& why, Vector<UnwrittenEdit>& lost) {
    lost.push_back({item, why});
    LogBoth("edit_manager::close_all_edits(): edit %s was closed with changes that could not be written\n",
            cookie_string(item).c_str());
}

/// Writes and drops an edit that nobody else holds, or forgets one that could not be opened. False if
/// somebody holds it.
bool closeUnreferenced(const cookie& item, ManagerState::CachedEdit& entry, Vector<UnwrittenEdit>& lost) {
    ManagerState& state = managerState();
    while (entry.edit.valid()) {
        const ManagerState::Unreferenced outcome = state.writeUnreferenced(entry, true);
        if (outcome == ManagerState::Unreferenced::InUse) {
            return false;
        }
        const bool clean = outcome == ManagerState::Unreferenced::Clean;
        if (const auto closed = state.removeUnreferenced(item, clean); closed != nullptr) {
            if (outcome == ManagerState::Unreferenced::NotWritten) {
                reportLost(item, closed->written, lost);
            }
            return true;
        }
        // It was opened meanwhile: in use, or changed and let go again.
    }
    return state.removeCacheEntry(item) != nullptr;
}

/// The folder of the edits in the cache; empty when it has none.
String folderOfCache() {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    for (const auto& [item, entry] : state.cache) {
        if (!entry->path.empty()) {
            return Qx::folderOf(entry->path);
        }
    }
    return {};
}

/// Closes all that nobody else holds. Appends the items that others hold.
void closeUnreferenced(Vector<cookie>& held, Vector<UnwrittenEdit>& lost) {
    ManagerState& state = managerState();
    EditManagerLock writers(folderOfCache());
    static_cast<void>(writers.take(true).isOk()); // waited for before the lock is held
    const ManagerState::Hold hold(state.lock);
    held.reserve(state.cache.size());
    for (auto place = state.cache.begin(); place != state.cache.end();) {
        const cookie item = place->first;
        ManagerState::CachedEdit& entry = *place++->second;
        if (!inMemory([&] { return closeUnreferenced(item, entry, lost); })) {
            held.push_back(item);
        }
    }
}

/// Writes an edit that others hold and drops it.
void closeHeld(const cookie& item, const EditPtr& edit, Vector<UnwrittenEdit>& lost) {
    ManagerState& state = managerState();
    std::unique_ptr<ManagerState::CachedEdit> dropped;
    bool written = true;
    Qx::Status why;
    // Who held it may have changed it and let it go since it was written.
    constexpr int kTries = 3;
    for (int tries = 1; dropped == nullptr; ++tries) {
        written = inMemory([&] { return writeCached(item, edit, nullptr, true); });
        const ManagerState::Hold hold(state.lock);
        const ManagerState::CachedEdit* const found = state.findCacheEntry(item);
        if (found == nullptr || found->edit != edit) {
            break;
        }
        why = found->written;
        dropped = state.removeHeld(item, written && tries < kTries);
    }
    if (!written) {
        reportLost(item, why, lost);
    }
}

} // namespace

void edit_manager::close_all_edits() {
    Vector<UnwrittenEdit> lost;
    closeAllEdits(lost);
}

void closeAllEdits(Vector<UnwrittenEdit>& lost) {
    ManagerState& state = managerState();
    EditPtr projectEdit; // opened again when it is asked for
    {
        const ManagerState::Hold hold(state.lock);
        std::swap(projectEdit, state.projectEdit);
    }
    projectEdit.invalidate();
    Vector<cookie> held;
    closeUnreferenced(held, lost);
    for (const cookie& item : held) {
        const EditPtr edit = cachedEdit(item);
        if (!edit.valid()) {
            continue;
        }
        // With the reference that is asked with, in the place of the one here.
        if (const int references = edit->refCount(); references > 2) {
            herc_printf("edit_manager::close_all_edits(): edit %s has %d references\n",
                        cookie_string(item).c_str(), references);
        }
        closeHeld(item, edit, lost);
    }
    storeRecords();
}
