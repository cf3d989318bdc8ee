#include "edit/manager/detail/manager_state.h"
#include "platform/services/log.h"

#include <algorithm>

void edit_manager::limitEditCache(int limit) {
    ManagerState& state = managerState();
    std::unique_ptr<ManagerState::CachedEdit> evicted; // destroyed when the lock is released
    const ManagerState::Hold hold(state.lock);
    if (limit == -1 || state.cache.size() < static_cast<size_t>(std::max(limit, 0))) {
        return;
    }
    for (const auto& [item, entry] : state.cache) {
        // An edit that is never written and holds changes stays, and one that was opened meanwhile.
        if (entry->edit.valid() && state.writeUnreferenced(*entry) == ManagerState::Unreferenced::Clean) {
            evicted = state.removeUnreferenced(item, true);
            if (evicted != nullptr) {
                return;
            }
        }
    }
}

bool edit_manager::invalidateCache(const cookie& item) {
    ManagerState& state = managerState();
    {
        const ManagerState::Hold hold(state.lock);
        if (state.findCacheEntry(item) == nullptr) {
            return false;
        }
    }
    state.tell(invalidateCacheMsgType(), item);
    std::unique_ptr<ManagerState::CachedEdit> dropped;
    const ManagerState::Hold hold(state.lock);
    dropped = state.removeCacheEntry(item);
    return dropped != nullptr;
}

void edit_manager::reloadRequest(const cookie& item, bool reopen) {
    ManagerState& state = managerState();
    EditPtr held;
    {
        const ManagerState::Hold hold(state.lock);
        if (const ManagerState::CachedEdit* const found = state.findCacheEntry(item)) {
            held = found->edit;
        }
    }
    if (!held.valid()) {
        invalidateCache(item); // a remembered failure
        return;
    }
    state.tell(invalidateCacheMsgType(), item);
    std::unique_ptr<ManagerState::CachedEdit> dropped;
    {
        const ManagerState::Hold section(held->section());
        if (held->isDirty(true)) {
            herc_printf("edit_manager::reloadRequest( %s ) : it was changed here too; what its file holds is "
                        "kept as a backup when it is written\n",
                        cookie_string(item).c_str());
            return;
        }
        const ManagerState::Hold hold(state.lock);
        const ManagerState::CachedEdit* const found = state.findCacheEntry(item);
        if (found != nullptr && found->edit == held) {
            dropped = state.removeCacheEntry(item);
        }
    }
    if (reopen) {
        static_cast<void>(openEdit(item, eOpenExisting).valid());
    }
}

void edit_manager::limitUsage() {
    size_t before = 0;
    do {
        before = numCached();
        limitEditCache(0);
    } while (numCached() < before);
}

void edit_manager::purge() {
    limitEditCache(0);
}

void edit_manager::reportUsage() {
    herc_printf("edit_manager\n\n");
    herc_printf("   %d edits open\n", static_cast<int>(numCached()));
}
