#pragma once

#include "edit/manager/detail/project_records.h"
#include "edit/manager/edit_manager.h"
#include "edit/manager/edit_manager_lock.h"
#include "edit/manager/milestone_ring.h"
#include "edit/manager/multiple_access_queue.h"
#include "platform/base/critical_section.h"
#include "platform/base/spin_lock.h"
#include "platform/services/file_moves.h"

#include <atomic>
#include <map>
#include <memory>
#include <set>

/// What the manager holds. One object for the process, never destroyed, so that a handle dropped while the
/// process ends finds it.
///
/// Locks, in the order in which they are taken:
///
///   1. the section of an edit, for which a thread waits with `SectionHold`
///   2. access to its item on `queue`
///   3. the writers' lock of the project, against other processes (`EditManagerLock`)
///   4. `lock`, the "edit manager lock": guards everything here but what is said to guard itself
///   5. `dirtyMutex`, those of `records`, and `lookup`, under which nothing else is taken
///
/// The places of the cache change under both 4 and `lookup`, so either is enough to find one. Opening what is
/// cached takes `lookup` alone: it waits for nobody who writes a file under 4.
///
/// Who changes an edit holds 1 and may call the manager; so nothing waits for a section while it holds one of
/// the others. Threads that are each inside one edit and ask for something that needs the section of the
/// other's would wait for ever: one of them is refused what it asked for. An edit to which the cache has the
/// only reference is nobody's to change, so its section is tried for, and gets it, under 4; that it is
/// nobody's still is seen when it is taken out of the cache. Under 4 the third is only tried for, but where
/// this process has it already or everything is closed. No observer is told under 2 to 5.
///
/// A project is left and another one taken in three steps: `isLeaving` is set, from when on nothing is
/// opened; what the cache holds is written and dropped; `epoch` rises, and the other project is taken, under
/// one hold of 4.
/// What was being opened meanwhile belongs to an epoch that is over and is handed to nobody.
struct ManagerState {
    /// A cached edit with what is known of its file: another program that replaced the file since is noticed.
    struct CachedEdit : EditCacheEntry {
        String path; ///< of its file; empty for an item that has none
        Qx::FileInfo
            file; ///< as this process last read, wrote or moved it; of kind Missing when there is none, of
                  ///< kind Unknown when the system could not tell: it is then no file that anybody knows
        Qx::Status written; ///< how the last attempt to write it went
        /// For a remembered failure: what the opening did.
        std::shared_ptr<const OpenReport> failure;
        bool hadFile = false; ///< it had a file since it is in the cache
        /// Takes what its file is at this moment as known.
        void know(const Qx::FileInfo& info) {
            file = info;
            hadFile = hadFile || info.kind == Qx::FileKind::Regular;
        }
        /// Its file became a backup and was not written since: nothing lies under the edit's name.
        [[nodiscard]] bool isAway() const { return hadFile && file.kind == Qx::FileKind::Missing; }
        /// What could be redone before the last backup. It goes for good when the edit is written or dropped,
        /// and comes back when the backup is taken back.
        std::unique_ptr<Qx::FileMoves> endedRedo;
        void forgetRedo() {
            if (endedRedo != nullptr) {
                endedRedo->keep();
                endedRedo.reset();
            }
        }
        CachedEdit() = default;
        CachedEdit(const CachedEdit&) = delete;
        CachedEdit& operator=(const CachedEdit&) = delete;
        ~CachedEdit() { forgetRedo(); }
        /// It is about to leave the cache: who asks for it waits for what comes in its place. Guarded by
        /// `lookup`.
        bool leaving = false;
    };

    criticalSection lock;
    SpinLock lookup;
    using Cache = std::map<cookie, std::unique_ptr<CachedEdit>>;
    Cache cache;
    cookie lastOpened; ///< guarded by `lookup`
    size_t cachedAtLastOpen = 0;
    cookie newProject;
    cookie project;     ///< the one whose edits are in the cache; invalid when there is none
    unsigned epoch = 0; ///< rises when the cache goes over from one project to another
    cookie evictFrom;   ///< where the next short search for an edit to evict goes on
    EditPtr projectEdit;
    int backupDepth = 10;
    std::function<void(bool)> uiDelete;
    std::function<bool()> confirmUpdate;

    std::mutex dirtyMutex;
    std::set<cookie> dirty; ///< guarded by `dirtyMutex`

    /// \name Guard themselves
    /// @{
    Qx::MultipleAccessQueue<cookie> queue;
    ProjectRecords records;
    Notifier notifier;
    ValServer<cookie> focus;
    ValServer<cookie> source;
    ValServer<cookie> record;
    ValServer<bool> mixerBypass;
    std::atomic<edit_manager*> instance{nullptr};
    std::atomic<bool> wasMade{false};           ///< a manager was there, so none is made unasked
    std::atomic<bool> isLeaving{false};         ///< changes under `lookup`; see above
    std::atomic<unsigned> projectGeneration{0}; ///< of the current project that `project` was taken from
    static constexpr int kLimitNotRead = -2;
    std::atomic<int> cacheLimit{kLimitNotRead}; ///< read on the first opening; -1 for none
    /// @}

    using Hold = std::lock_guard<criticalSection>;

    /// The entry of an item; null if there is none. Under the lock, or `lookup`.
    [[nodiscard]] CachedEdit* findCacheEntry(const cookie& item) {
        const auto place = cache.find(item);
        return place == cache.end() ? nullptr : place->second.get();
    }
    /// Puts an edit (or, with a null one, a remembered failure) in an item's place. Under the lock.
    void put(const cookie& item, EditPtr edit, String path, const Qx::FileInfo& file,
             std::shared_ptr<const OpenReport> failure = nullptr);
    /// Takes an entry out, unwritten, and returns it. Under the lock; the entry is to be destroyed after it.
    [[nodiscard]] std::unique_ptr<CachedEdit> removeCacheEntry(const cookie& item);
    /// The same if nobody but the cache has the edit and, with `onlyClean`, it has no changes; null
    /// otherwise. Who asks for clean ones loses no change of one that was opened, changed and let go since it
    /// was written.
    [[nodiscard]] std::unique_ptr<CachedEdit> removeUnreferenced(const cookie& item, bool onlyClean);
    /// The same for an edit to which the caller has a handle too: with `onlyClean` it stays, and the result
    /// is null, if nobody else has it and it holds changes.
    [[nodiscard]] std::unique_ptr<CachedEdit> removeHeld(const cookie& item, bool onlyClean);
    /// Puts an entry in its item's place. Under the lock.
    void put(std::unique_ptr<CachedEdit> entry);
    /// Puts an entry that was taken out in its place again; null is ignored. Under the lock ever since.
    void putBack(std::unique_ptr<CachedEdit> entry);

    /// Writes an edit if it needs it. What another program put in its file's place since it was read is kept
    /// as an undo backup first. False if it could not be written; the edit is then still dirty, and on the
    /// dirty list. Without `waits`, another process that holds the writers' lock is a failure. Under the
    /// edit's section and the lock.
    bool write(CachedEdit& entry, bool waits = true);
    /// The same for an edit that is about to leave the cache: one whose file became a backup gets it back.
    bool writeLast(CachedEdit& entry, bool waits = true);
    /// What became of an edit that nobody but the cache should have.
    enum class Unreferenced {
        Clean,      ///< it holds no changes (any more)
        Unwritten,  ///< it holds changes and is never written
        NotWritten, ///< its changes could not be written
        InUse
    };
    /// Writes such an edit for the last time. Under the lock.
    Unreferenced writeUnreferenced(CachedEdit& entry, bool waits);
    /// Begins to leave the project, or ends it. False if it has begun already.
    bool setLeaving(bool leaving) {
        const std::lock_guard hold(lookup);
        return isLeaving.exchange(leaving) != leaving;
    }
    void setLeaving(CachedEdit& entry, bool leaving) {
        const std::lock_guard hold(lookup);
        entry.leaving = leaving;
    }
    /// What the edit's file is at this moment is taken as known.
    static void noteFile(CachedEdit& entry);
    /// The same after a writing, whose outcome is known also when the system cannot tell.
    static void noteWritten(CachedEdit& entry);

    void addToDirtyList(const cookie& item);
    void removeFromDirtyList(const cookie& item);

    void tell(const NotifyMsgType& type, const cookie& item) {
        notifier.notify(NotifyMsg(type, item.asString()));
    }

private:
    /// `write`, with the outcome for the entry to keep.
    [[nodiscard]] Qx::Status writeFile(CachedEdit& entry, bool waits);
    /// Takes an entry out if `may` allows it, which is asked under `lookup`.
    template <typename May>
    std::unique_ptr<CachedEdit> takeOut(const cookie& item, May&& may);
};

/// The state of the process.
ManagerState& managerState();

/// Holds the section of an edit. Not waited for in a ring of threads that are inside edits: it is refused
/// then (logged).
class SectionHold {
public:
    explicit SectionHold(const EditPtr& edit);
    ~SectionHold();
    SectionHold(const SectionHold&) = delete;
    SectionHold& operator=(const SectionHold&) = delete;
    [[nodiscard]] bool isHeld() const { return m_isHeld; }

private:
    criticalSection& m_section;
    bool m_isHeld;
};

/// Holds what a sequence of moves of one cached edit's files needs, locks 1 to 4 in order, and makes sure
/// that the edit is still the item's.
class CachedEditScope {
public:
    CachedEditScope(const cookie& item, const EditPtr& edit);
    /// Null when the edit left the cache meanwhile, or other processes or threads could not be kept away
    /// (logged).
    [[nodiscard]] ManagerState::CachedEdit* entry() const { return m_entry; }
    /// False in the second case.
    [[nodiscard]] bool isWritable() const { return m_taken.isOk(); }
    /// What kept them from being kept away.
    [[nodiscard]] const Qx::Status& obstacle() const { return m_taken; }

private:
    SectionHold m_section;
    Qx::AccessScope<cookie> m_turn;
    EditManagerLock m_writers;
    Qx::Status m_taken;
    ManagerState::Hold m_lock;
    ManagerState::CachedEdit* m_entry;
};

/// True for what is no item at all: the invalid cookie, or three zero words.
[[nodiscard]] bool isNoItem(const cookie& item);
/// Does what `limitEditCache` does as far as it can be done without waiting, looking at a few edits only; the
/// next call goes on where this one ends.
void evictOne(int limit);
/// The manager, made if there was never one; null if there is none (any more).
[[nodiscard]] edit_manager* managerForOpening();
/// Takes the writers' lock of the project that a file belongs to, waiting for other processes or not; a
/// failure is logged.
Qx::Status takeWritersLock(EditManagerLock& writers, bool waits = true);
/// The message types of the manager.
struct ManagerMessages {
    NotifyMsgType projectChanged{"editmanProjectChanged"};
    NotifyMsgType projectExit{"editmanExitProject"};
    NotifyMsgType flushChanges{"editmanFlushChanges"};
    NotifyMsgType invalidateCache{"editmanInvalidateCache"};
    NotifyMsgType editDeleted{"editDeleted"};
};
const ManagerMessages& managerMessages();
/// Writes a cached edit if it needs it and is in the cache still; with a ring, a milestone is made where one
/// is due. With `isLast` it is about to leave the cache. False if it could not be written.
bool writeCached(const cookie& item, const EditPtr& edit, const MilestoneRing* milestones,
                 bool isLast = false);
/// `edit_manager::close_all_edits`; `lost` gets the edits that could not be written.
void closeAllEdits(Vector<UnwrittenEdit>& lost);
/// Brings the records up to date with the edits in memory that changed, and with what was gathered. Not under
/// the manager's lock.
void storeRecords();
/// The record of an item as its edit in memory, else its file, says it; without a file, what is recorded.
/// False if there is none. Not under the manager's lock.
[[nodiscard]] bool currentRecord(const cookie& item, projdb::Record& record);
/// The items of the current project: those with a file, and those of which only backups are there at the
/// moment.
Qx::Status listItems(std::set<cookie>& items);
