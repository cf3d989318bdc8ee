#pragma once

#include "edit/manager/edit_manager.h"
#include "edit/manager/multiple_access_queue.h"
#include "edit/project/projdb.h"
#include "platform/base/critical_section.h"
#include "platform/services/files.h"

#include <atomic>
#include <map>
#include <memory>
#include <optional>
#include <set>

/// What the manager holds. One object for the process, never destroyed, so that a handle dropped while the
/// process ends finds it.
///
/// `lock` is the "edit manager lock". It guards everything here but `queue`, the value servers, the
/// notifier and the atomics, which guard themselves.
struct ManagerState {
    /// A cached edit with what is known of its file: another program that replaced the file since is noticed.
    struct CachedEdit : EditCacheEntry {
        std::optional<Qx::FileInfo> file; ///< as this process last read or wrote it; none when it never did
    };

    criticalSection lock;
    std::map<cookie, std::unique_ptr<CachedEdit>> cache;
    std::set<cookie> dirty;
    cookie lastOpened;
    size_t cachedAtLastOpen = 0;
    std::optional<int> cacheLimit; ///< read on the first opening
    cookie newProject;
    cookie project;
    EditPtr projectEdit;
    std::unique_ptr<projdb> records;
    bool recordsTried = false;
    int backupDepth = 10;
    std::function<void(bool)> uiDelete;
    std::function<bool()> confirmUpdate;
    std::shared_ptr<void> networkClient;

    Qx::MultipleAccessQueue<cookie> queue;
    Notifier notifier;
    ValServer<cookie> focus;
    ValServer<cookie> source;
    ValServer<cookie> record;
    ValServer<bool> mixerBypass;
    std::atomic<edit_manager*> instance{nullptr};

    using Hold = std::lock_guard<criticalSection>;

    /// The entry of an item; null if there is none. Under the lock.
    [[nodiscard]] CachedEdit* find(const cookie& item) {
        const auto place = cache.find(item);
        return place == cache.end() ? nullptr : place->second.get();
    }
    /// Puts an edit (or, with a null one, a remembered failure) in an item's place. Under the lock.
    CachedEdit& put(const cookie& item, EditPtr edit);
    /// Takes an entry out, unwritten. Under the lock.
    void removeCacheEntry(const cookie& item) { cache.erase(item); }

    /// Writes an edit that needs it. What another program put in its file's place since it was read is kept as
    /// an undo backup first. False if it could not be written; the edit is then still dirty. Under the lock.
    bool write(CachedEdit& entry);
    /// What the edit's file is at this moment is taken as known.
    static void noteFile(CachedEdit& entry);

    void tell(const NotifyMsgType& type, const String& text) { notifier.notify(NotifyMsg(type, text)); }
};

/// The state of the process.
ManagerState& managerState();

/// True for what is no item at all: the invalid cookie, or three zero words.
[[nodiscard]] bool isNoItem(const cookie& item);
