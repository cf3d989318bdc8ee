#include "edit/manager/detail/manager_state.h"
#include "platform/services/log.h"

#include <algorithm>
#include <cstdint>
#include <mutex>

namespace {

bool isWithin(int limit) {
    return limit == -1 || managerState().cache.size() < static_cast<size_t>(std::max(limit, 0));
}

/// Writes and takes out the first edit that nobody holds among at most `most`, from where the last short
/// search ended when not all are looked at. Under the lock; another process is not waited for.
std::unique_ptr<ManagerState::CachedEdit> evictAmong(size_t most) {
    ManagerState& state = managerState();
    const bool looksAtAll = state.cache.size() <= most;
    auto place = looksAtAll ? state.cache.begin() : state.cache.lower_bound(state.evictFrom);
    for (size_t count = std::min(most, state.cache.size()); count > 0; --count) {
        if (place == state.cache.end()) {
            place = state.cache.begin();
        }
        const cookie item = place->first;
        ManagerState::CachedEdit& entry = *place++->second;
        // An edit that is never written and holds changes stays, and one that was opened meanwhile.
        if (entry.edit.valid() &&
            state.writeUnreferenced(entry, false) == ManagerState::Unreferenced::Clean) {
            if (auto evicted = state.removeUnreferenced(item, true)) {
                state.evictFrom = item;
                return evicted;
            }
        }
    }
    state.evictFrom = place == state.cache.end() ? cookie() : place->first;
    return nullptr;
}

} // namespace

void edit_manager::limitEditCache(int limit) {
    std::unique_ptr<ManagerState::CachedEdit> evicted; // destroyed when the lock is released
    const ManagerState::Hold hold(managerState().lock);
    if (!isWithin(limit)) {
        evicted = evictAmong(SIZE_MAX);
    }
}

void evictOne(int limit) {
    constexpr size_t kMost = 16;
    std::unique_ptr<ManagerState::CachedEdit> evicted;
    const std::unique_lock<criticalSection> hold(managerState().lock, std::try_to_lock);
    if (hold.owns_lock() && !isWithin(limit)) {
        evicted = evictAmong(kMost);
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
        const SectionHold section(held);
        if (!section.isHeld()) {
            return;
        }
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
