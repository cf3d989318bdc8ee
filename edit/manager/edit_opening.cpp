#include "edit/manager/detail/manager_state.h"
#include "edit/manager/revision_chain.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/config_int.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"
#include "platform/services/timed_task.h"

#include <chrono>
#include <exception>
#include <new>
#include <thread>

namespace {

/// One opening of an item that is not in the cache, with its turn on the access queue. What it moves is moved
/// under the writers' lock of the project, which is not held while a file is read, and not needed where
/// nothing is moved.
class Opening {
public:
    Opening(const cookie& item, eEditOpenBehaviour behaviour);

    EditPtr run();
    /// The project that the item was to be opened from is left meanwhile: there is no answer for another one.
    [[nodiscard]] bool isOver() const { return m_isOver; }

private:
    /// What became of reading the file.
    enum class Outcome { Sound, Damaged, Missing, Refused };
    /// What can be said of the undo backups of a file that is missing.
    enum class Search { Restored, FileIsThere, NoneThere, NotKnown };

    [[nodiscard]] EditPtr makeNew();
    [[nodiscard]] EditPtr openFile();
    /// A fresh edit that reads the item's file. Nothing is thrown on.
    Outcome read(EditPtr& edit);
    [[nodiscard]] EditPtr create();
    Search restoreMissing();
    Search lookAgain();
    [[nodiscard]] bool replaceDamaged(int& counter);
    [[nodiscard]] bool moveAside();
    /// Puts the newest undo backup in the place of the item's file. Its number; 0 when none was restored.
    int shuffleUndoChain();
    void refuse(const String& reason);
    void tell(const String& what) const;
    [[nodiscard]] bool isOfThisProject() const;
    [[nodiscard]] EditPtr cache(EditPtr edit);
    EditPtr succeed(EditPtr edit);

    cookie m_item;
    eEditOpenBehaviour m_behaviour;
    unsigned m_epoch;
    unsigned m_generation;
    String m_file;
    RevisionChain m_undo;
    RevisionChain m_redo;
    EditManagerLock m_writers;
    Qx::FileInfo m_read;    ///< the file as it was before it was read last
    bool m_refused = false; ///< there may be a sound file or backup, but it could not be had here
    bool m_isOver = false;
};

int depthAndEpoch(unsigned& epoch, unsigned& generation) {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    epoch = state.epoch;
    generation = state.projectGeneration.load();
    return state.backupDepth;
}

Opening::Opening(const cookie& item, eEditOpenBehaviour behaviour)
    : m_item(item), m_behaviour(behaviour), m_file(getFilenameForCookie(item)),
      m_undo(m_file, RevisionChain::Undo, depthAndEpoch(m_epoch, m_generation)),
      m_redo(m_file, RevisionChain::Redo, m_undo.depth()), m_writers(Qx::folderOf(m_file)) {}

void Opening::tell(const String& what) const {
    herc_printf("edit_manager::open( %s ) : %s\n", cookie_string(m_item).c_str(), what.c_str());
}

void Opening::refuse(const String& reason) {
    m_refused = true;
    tell(reason);
}

/// Under the lock: the file that was named when this began is that of the project whose edits are cached.
bool Opening::isOfThisProject() const {
    const ManagerState& state = managerState();
    return state.instance.load() != nullptr && !state.isLeaving && state.epoch == m_epoch &&
           Qx::currentProjectGeneration() == m_generation;
}

EditPtr Opening::run() {
    ManagerState& state = managerState();
    static Qx::TimedTask::Counter& counter = Qx::TimedTask::named("editman").section("open");
    const Qx::TimedTask::Section timed(counter);
    const Qx::AccessScope<cookie> turn(state.queue, m_item);
    {
        const ManagerState::Hold hold(state.lock);
        m_isOver = !isOfThisProject();
        const ManagerState::CachedEdit* const found = state.findCacheEntry(m_item);
        if (m_isOver) {
            return {};
        }
        if (found != nullptr && (found->edit.valid() || m_behaviour != eOpenNew)) {
            if (found->edit.valid() && found->edit->get_cookie() != m_item) {
                herc_printf("edit_manager::open: handles do not match\n");
            }
            return found->edit;
        }
    }
    herc_printf(5, "edit_manager::open(%s)\n", cookie_string(m_item).c_str());

    EditPtr edit;
    if (m_file.empty()) {
        tell("no file can be named after it; set a project folder");
    } else if (m_behaviour == eOpenNew) {
        edit = makeNew();
    } else if (m_behaviour == eOpenExisting || m_behaviour == eOpenOrCreate) {
        edit = openFile();
    }
    m_writers.release();
    return edit.valid() ? succeed(std::move(edit)) : cache({});
}

EditPtr Opening::makeNew() {
    EditPtr edit(new Edit);
    try {
        edit->read_file(m_item, eOpenNew);
    } catch (const std::exception&) {
        // The fresh edit is handed out as it is.
    }
    // Nothing was read: a file that is there is kept as a backup when the edit is written over it.
    m_read = {};
    return edit;
}

/// The edit of the file, else of the newest backup that reads; with `eOpenOrCreate` a fresh one when there is
/// neither for certain.
EditPtr Opening::openFile() {
    // Other processes back the edit up, restore and write it meanwhile: then its file is looked at again.
    constexpr int kMostTurns = 100;
    int counter = 0;
    for (int turn = 0; turn < kMostTurns; ++turn) {
        EditPtr edit;
        switch (read(edit)) {
        case Outcome::Sound:
            return edit;
        case Outcome::Refused:
            return {};
        case Outcome::Damaged:
            if (!replaceDamaged(counter)) {
                return m_refused || m_behaviour != eOpenOrCreate ? EditPtr() : create();
            }
            break;
        case Outcome::Missing:
            switch (restoreMissing()) {
            case Search::NotKnown:
                m_refused = true;
                return {};
            case Search::NoneThere:
                return m_behaviour == eOpenOrCreate ? create() : EditPtr();
            case Search::Restored:
            case Search::FileIsThere:
                break;
            }
            break;
        }
    }
    refuse("its files are being moved all the time; try again");
    return {};
}

Opening::Outcome Opening::read(EditPtr& edit) {
    const Qx::FileAnswer present = Qx::askFile(m_file);
    if (const Qx::FileError error = present.obstacle("open")) {
        refuse(error.text());
        return Outcome::Refused;
    }
    m_read = present.info();
    if (present.isMissing()) {
        return Outcome::Missing;
    }
    try {
        edit = EditPtr(new Edit);
        if (edit->readFile(Qx::widen(m_file), eOpenExisting) == Edit::kReadOk) {
            return Outcome::Sound;
        }
        const TagBag::OpenResult result = edit->objectStore().lastOpenResult();
        if (result == TagBag::Missing) {
            return Outcome::Missing;
        }
        tell(edit->lastFileError());
        // What the system refuses (no permission, too many open files), and what a later version of this
        // program wrote, is not damaged: it stays where it is.
        m_refused = result == TagBag::NotOpened || result == TagBag::Newer;
    } catch (const std::bad_alloc&) {
        refuse("there is not enough memory to read it");
    } catch (const std::exception& error) {
        tell(String("reading failed: ") + error.what());
    }
    edit.invalidate();
    return m_refused ? Outcome::Refused : Outcome::Damaged;
}

/// A fresh edit in the place of one of which nothing is left.
EditPtr Opening::create() {
    for (const RevisionChain* const chain : {&m_undo, &m_redo}) {
        bool found = false;
        const Qx::Status status = chain->exists(found);
        if (!status || found) {
            // Its file may not be there, but it is: the first write of a fresh one would be the end of it.
            refuse(status
                       ? "no edit was made, as there are backups of one; recover it from them, or delete them"
                       : status.reason());
            return {};
        }
    }
    try {
        EditPtr edit(new Edit);
        if (edit->readFile(Qx::widen(m_file), eOpenOrCreate) == Edit::kReadOk) {
            return edit;
        }
        refuse(edit->lastFileError());
    } catch (const std::exception& error) {
        refuse(String("no edit could be made: ") + error.what());
    }
    return {};
}

int Opening::shuffleUndoChain() {
    int restored = 0;
    if (const Qx::Status status = m_undo.restoreNewest(restored); !status) {
        refuse(status.reason());
    }
    return restored;
}

/// Looks for what a missing file left, first without keeping others away: a sequence may play very many shots
/// that are not there.
Opening::Search Opening::restoreMissing() {
    bool hasBackups = false;
    if (const Qx::Status status = m_undo.exists(hasBackups); !status) {
        refuse(status.reason());
        return Search::NotKnown;
    }
    // Nothing is moved where no backup is, so nobody is waited for; but the file may have been on its way
    // between the two names.
    bool isBusy = false;
    const Qx::Status taken = m_writers.take(hasBackups, &isBusy);
    if (!taken && hasBackups) {
        refuse("nothing was looked for: " + taken.reason());
        return Search::NotKnown;
    }
    Search found = lookAgain();
    m_writers.release();
    if (found != Search::NoneThere || !isBusy) {
        return found;
    }
    if (m_behaviour != eOpenOrCreate) {
        return Search::NotKnown; // others may be moving it: nothing is remembered
    }
    // A move takes an instant; what is not seen again and again is not there.
    constexpr int kLooks = 3;
    for (int look = 0; look < kLooks && found == Search::NoneThere; ++look) {
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
        found = lookAgain();
    }
    return found;
}

/// The same while others are kept away, as far as that is possible.
Opening::Search Opening::lookAgain() {
    const Qx::FileAnswer present = Qx::askFile(m_file);
    if (const Qx::FileError error = present.obstacle("open")) {
        refuse(error.text());
        return Search::NotKnown;
    }
    if (present.isRegular()) {
        return Search::FileIsThere;
    }
    bool hasBackups = false;
    if (const Qx::Status status = m_undo.exists(hasBackups); !status) {
        refuse(status.reason());
        return Search::NotKnown;
    }
    if (!hasBackups) {
        return Search::NoneThere;
    }
    if (!m_writers.isHeld()) {
        return Search::FileIsThere; // or was a moment ago: to be looked at again from the start
    }
    const int restored = shuffleUndoChain();
    herc_printf("edit_manager::open( %s ) - missing, trying backup %d \n", cookie_string(m_item).c_str(),
                restored);
    return restored != 0 ? Search::Restored : Search::NotKnown;
}

/// Puts the next backup in the place of the file that was read last and is damaged, and counts it. True too
/// when another file is there meanwhile. False when there is none, or with `m_refused` when nothing could be
/// moved.
bool Opening::replaceDamaged(int& counter) {
    if (!moveAside()) {
        return !m_refused;
    }
    bool hasBackups = counter != 0;
    if (!hasBackups) {
        if (const Qx::Status status = m_undo.exists(hasBackups); !status) {
            refuse(status.reason());
            return false;
        }
    }
    if (!hasBackups) {
        m_writers.release();
        return false;
    }
    ++counter;
    herc_printf("edit_manager::open( %s ) - edit::read_file() failed, trying backup %d\n",
                cookie_string(m_item).c_str(), counter);
    const int restored = shuffleUndoChain();
    m_writers.release();
    if (restored == 0 && !m_refused) {
        LogBoth("edit_manager::open( %s ) - No usable backups found\n", cookie_string(m_item).c_str());
    }
    return restored != 0;
}

/// Moves the file that was read last to a name for what does not read; none that is there is replaced. The
/// writers' lock is held afterwards. False, and it is not, if another file is there meanwhile, or with
/// `m_refused` if it could not be moved.
bool Opening::moveAside() {
    if (!takeWritersLock(m_writers)) {
        m_refused = true;
        return false;
    }
    if (Qx::isSameFile(m_read, Qx::askFile(m_file).info())) {
        String name;
        Qx::FileMoves moves(Qx::folderOf(m_file));
        Qx::Status status = findCorruptName(m_file, name);
        if (status) {
            status = moves.move(m_file, name);
        }
        // Before another file takes the name.
        if (status && (status = moves.finish())) {
            return true;
        }
        refuse(status.reason());
    }
    m_writers.release();
    return false;
}

/// Makes the edit, or with a null one the failure, the item's, and returns it. A failure that says nothing of
/// the file, or leaves backups of it, is not remembered.
EditPtr Opening::cache(EditPtr edit) {
    ManagerState& state = managerState();
    const String owner = edit.valid() ? edit->getOwner() : String();
    const bool isEdit = edit.valid() && edit->isEdit();
    const ManagerState::Hold hold(state.lock);
    m_isOver = !isOfThisProject();
    if (m_isOver) {
        return {};
    }
    if (edit.valid() || !m_refused) {
        state.put(m_item, edit, m_file, edit.valid() ? m_read : Qx::FileInfo());
    }
    if (edit.valid()) {
        state.cachedAtLastOpen = state.cache.size();
        PermissionsManager::noteOwner(m_item, owner, !isEdit);
    }
    return edit;
}

EditPtr Opening::succeed(EditPtr edit) {
    // The time of last access is a convenience: a file system that refuses it does no harm, nor does a file
    // that is not there yet.
    static_cast<void>(Qx::fileSystem().touch(m_file, true).code);
    if (edit->get_cookie() != m_item) {
        herc_printf("edit_manager::open: funny, handles do not match\n");
    }
    // Before others can find it, so that no change of theirs is taken for clean.
    edit->set_dirty(false);
    return cache(std::move(edit));
}

/// Keeps the cache within its limit, if it has one, without waiting for anybody.
void limitCache() {
    ManagerState& state = managerState();
    int limit = state.cacheLimit.load(std::memory_order_relaxed);
    if (limit == ManagerState::kLimitNotRead) {
        limit = std::max(config_int("edit_cache_size", -1), -1);
        state.cacheLimit = limit;
    }
    if (limit != -1) {
        evictOne(limit);
    }
}

/// Answers from the cache. False if it does not know the item.
bool findCached(const cookie& item, eEditOpenBehaviour behaviour, EditPtr& edit) {
    ManagerState& state = managerState();
    const std::lock_guard hold(state.lookup);
    state.lastOpened = item;
    if (state.isLeaving.load(std::memory_order_relaxed)) {
        return true;
    }
    const ManagerState::CachedEdit* const found = state.findCacheEntry(item);
    const bool counts = found != nullptr && !found->leaving && (found->edit.valid() || behaviour != eOpenNew);
    if (counts) {
        edit = found->edit;
    }
    return counts;
}

} // namespace

EditPtr edit_manager::openEdit(const cookie& item, eEditOpenBehaviour behaviour) {
    ManagerState& state = managerState();
    if (item.isBlack() || isNoItem(item) || managerForOpening() == nullptr) {
        return {};
    }
    // Another project may become the current one on the way.
    constexpr int kMostProjects = 3;
    for (int attempt = 0; attempt < kMostProjects && state.instance.load() != nullptr; ++attempt) {
        if (state.projectGeneration.load() != Qx::currentProjectGeneration()) {
            static_cast<void>(check_current_project(behaviour));
        }
        limitCache();
        EditPtr edit;
        if (findCached(item, behaviour, edit)) {
            return edit;
        }
        Opening opening(item, behaviour);
        edit = opening.run();
        if (!opening.isOver()) {
            return edit;
        }
    }
    return {};
}

EditPtr edit_manager::open(const cookie& item, eEditOpenBehaviour behaviour) {
    return openEdit(item, behaviour);
}

bool edit_manager::get_present(const cookie& item) {
    ManagerState& state = managerState();
    const std::lock_guard hold(state.lookup);
    const ManagerState::CachedEdit* const found = state.findCacheEntry(item);
    return found != nullptr && found->edit.valid();
}

size_t edit_manager::numCached() {
    ManagerState& state = managerState();
    const std::lock_guard hold(state.lookup);
    return state.cache.size();
}
