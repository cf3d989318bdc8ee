#include "edit/manager/detail/manager_state.h"
#include "edit/manager/revision_chain.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/config_int.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"
#include "platform/services/timed_task.h"
#include "platform/store/tag_bag.h"

#include <cerrno>
#include <chrono>
#include <exception>
#include <new>
#include <thread>

namespace {

/// One opening of an item that is not in the cache, with its turn on the access queue. What it moves is moved
/// under the writers' lock of the project, which is not held while a file is read, and not needed where
/// nothing is moved.
class EditOpener {
public:
    EditOpener(const cookie& item, eEditOpenBehaviour behaviour);

    EditPtr run();
    /// What was done; complete after `run`.
    [[nodiscard]] const OpenReport& report() const { return m_report; }
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
    /// Takes notice of why the file does not open, or what keeps it from being replaced, and logs it.
    void complain(const Qx::Status& why);
    void refuse(const Qx::Status& why);
    void foundMissing();
    [[nodiscard]] bool isOfThisProject() const;
    [[nodiscard]] EditPtr cache(EditPtr edit);
    EditPtr succeed(EditPtr edit);
    [[nodiscard]] EditPtr fromCache(const ManagerState::CachedEdit& entry);
    EditPtr cancelled();

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
    OpenReport m_report;
    Qx::Status m_fault;         ///< of the file that was read last
    std::vector<int> m_backups; ///< the numbers of the undo backups before any was moved
    size_t m_numRestored = 0;
};

int depthAndEpoch(unsigned& epoch, unsigned& generation) {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    epoch = state.epoch;
    generation = state.projectGeneration.load();
    return state.backupDepth;
}

EditOpener::EditOpener(const cookie& item, eEditOpenBehaviour behaviour)
    : m_item(item), m_behaviour(behaviour), m_file(getFilenameForCookie(item)),
      m_undo(m_file, RevisionChain::Undo, depthAndEpoch(m_epoch, m_generation)),
      m_redo(m_file, RevisionChain::Redo, m_undo.depth()), m_writers(Qx::folderOf(m_file)) {}

void EditOpener::complain(const Qx::Status& why) {
    m_fault = why;
    if (m_report.status) {
        m_report.status = why;
    }
    herc_printf("edit_manager::open( %s ) : %s\n", cookie_string(m_item).c_str(), why.reason().c_str());
}

void EditOpener::refuse(const Qx::Status& why) {
    m_refused = true;
    if (!m_report.status) {
        m_report.recovery = why;
    }
    complain(why);
}

void EditOpener::foundMissing() {
    m_report.wasMissing = true;
    if (m_report.status) {
        m_report.status = Qx::Status::failure(Qx::StatusCode::NotFound, m_file + " does not exist");
    }
}

EditPtr EditOpener::fromCache(const ManagerState::CachedEdit& entry) {
    if (entry.failure != nullptr) {
        m_report = *entry.failure;
    } else {
        m_report.source = OpenReport::Source::Cache;
    }
    return entry.edit;
}

Qx::Status isBeingLeft() {
    return Qx::Status::failure(Qx::StatusCode::Cancelled,
                               "the project is being left, or the edits were closed; open a project first");
}

EditPtr EditOpener::cancelled() {
    m_report = {};
    m_report.status = isBeingLeft();
    return {};
}

/// Under the lock: the file that was named when this began is that of the project whose edits are cached.
bool EditOpener::isOfThisProject() const {
    const ManagerState& state = managerState();
    return state.instance.load() != nullptr && !state.isLeaving && state.epoch == m_epoch &&
           Qx::currentProjectGeneration() == m_generation;
}

EditPtr EditOpener::run() {
    ManagerState& state = managerState();
    static Qx::TimedTask::Counter& counter = Qx::TimedTask::named("editman").section("open");
    const Qx::TimedTask::Section timed(counter);
    const Qx::AccessScope<cookie> turn(state.queue, m_item);
    {
        const ManagerState::Hold hold(state.lock);
        m_isOver = !isOfThisProject();
        const ManagerState::CachedEdit* const found = state.findCacheEntry(m_item);
        if (m_isOver) {
            return cancelled();
        }
        if (found != nullptr && (found->edit.valid() || m_behaviour != eOpenNew)) {
            if (found->edit.valid() && found->edit->get_cookie() != m_item) {
                herc_printf("edit_manager::open: handles do not match\n");
            }
            return fromCache(*found);
        }
    }
    herc_printf(5, "edit_manager::open(%s)\n", cookie_string(m_item).c_str());

    EditPtr edit;
    if (m_file.empty()) {
        complain(Qx::Status::failure(Qx::StatusCode::BadArgument,
                                     "no file can be named after it; set a project folder"));
    } else if (m_behaviour == eOpenNew) {
        edit = makeNew();
    } else if (m_behaviour == eOpenExisting || m_behaviour == eOpenOrCreate) {
        edit = openFile();
    }
    m_writers.release();
    if (edit.valid()) {
        return succeed(std::move(edit));
    }
    if (m_report.status) {
        m_report.status =
            Qx::Status::failure(Qx::StatusCode::BadArgument, "there is no such way to open an edit");
    }
    return cache({});
}

EditPtr EditOpener::makeNew() {
    EditPtr edit(new Edit);
    try {
        edit->read_file(m_item, eOpenNew);
    } catch (const std::exception&) {
        // The fresh edit is handed out as it is.
    }
    // Nothing was read: a file that is there is kept as a backup when the edit is written over it.
    m_read = {};
    m_report.source = OpenReport::Source::Fresh;
    return edit;
}

/// The edit of the file, else of the newest backup that reads; with `eOpenOrCreate` a fresh one when there is
/// neither for certain.
EditPtr EditOpener::openFile() {
    // Other processes back the edit up, restore and write it meanwhile: then its file is looked at again.
    constexpr int kMostTurns = 100;
    int counter = 0;
    for (int turn = 0; turn < kMostTurns; ++turn) {
        EditPtr edit;
        switch (read(edit)) {
        case Outcome::Sound:
            m_report.source = m_report.backup != 0 ? OpenReport::Source::Backup : OpenReport::Source::File;
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
                foundMissing();
                return m_behaviour == eOpenOrCreate ? create() : EditPtr();
            case Search::Restored:
                foundMissing();
                break;
            case Search::FileIsThere:
                break;
            }
            break;
        }
    }
    refuse(Qx::Status::failure(Qx::StatusCode::Locked, "its files are being moved all the time; try again"));
    return {};
}

Qx::Status noMemory(const String& what) {
    return Qx::Status::failure(Qx::StatusCode::Refused, what, ENOMEM);
}

EditOpener::Outcome EditOpener::read(EditPtr& edit) {
    const Qx::FileAnswer present = Qx::askFile(m_file);
    if (const Qx::FileError error = present.obstacle("open")) {
        refuse(error.status());
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
        complain(edit->lastFileStatus());
        // What the system refuses (no permission, too many open files), and what a later version of this
        // program wrote, is not damaged: it stays where it is.
        m_refused = result == TagBag::NotOpened || edit->lastFileStatus().code() == Qx::StatusCode::Newer;
    } catch (const std::bad_alloc&) {
        refuse(noMemory("there is not enough memory to read it"));
    } catch (const std::exception& error) {
        complain(Qx::Status::failure(Qx::StatusCode::Damaged, String("reading failed: ") + error.what()));
    }
    edit.invalidate();
    return m_refused ? Outcome::Refused : Outcome::Damaged;
}

/// A fresh edit in the place of one of which nothing is left.
EditPtr EditOpener::create() {
    for (const RevisionChain* const chain : {&m_undo, &m_redo}) {
        bool found = false;
        const Qx::Status status = chain->exists(found);
        if (!status || found) {
            // Its file may not be there, but it is: the first write of a fresh one would be the end of it.
            refuse(!status
                       ? status
                       : Qx::Status::failure(
                             Qx::StatusCode::Refused,
                             "no edit was made, as there are backups of one; recover it from them, or delete "
                             "them"));
            return {};
        }
    }
    try {
        EditPtr edit(new Edit);
        if (edit->readFile(Qx::widen(m_file), eOpenOrCreate) == Edit::kReadOk) {
            m_report.source = OpenReport::Source::Fresh;
            return edit;
        }
        refuse(edit->lastFileStatus());
    } catch (const std::exception& error) {
        refuse(noMemory(String("no edit could be made: ") + error.what()));
    }
    return {};
}

int EditOpener::shuffleUndoChain() {
    if (m_numRestored == 0) {
        m_backups = m_undo.numbers();
    }
    int restored = 0;
    if (const Qx::Status status = m_undo.restoreNewest(restored); !status) {
        refuse(status);
    }
    if (restored != 0) {
        // Those behind it have moved up: it is the next of those that there were.
        m_report.backup = m_numRestored < m_backups.size() ? m_backups[m_numRestored] : restored;
        ++m_numRestored;
    }
    return restored;
}

/// Looks for what a missing file left, first without keeping others away: a sequence may play very many shots
/// that are not there.
EditOpener::Search EditOpener::restoreMissing() {
    bool hasBackups = false;
    if (const Qx::Status status = m_undo.exists(hasBackups); !status) {
        refuse(status);
        return Search::NotKnown;
    }
    // Nothing is moved where no backup is, so nobody is waited for; but the file may have been on its way
    // between the two names.
    const Qx::Status taken = m_writers.take(hasBackups);
    const bool isBusy = taken.code() == Qx::StatusCode::Locked;
    if (!taken && hasBackups) {
        refuse(taken.retold("nothing was looked for: " + taken.reason()));
        return Search::NotKnown;
    }
    Search found = lookAgain();
    m_writers.release();
    if (found != Search::NoneThere || !isBusy) {
        return found;
    }
    if (m_behaviour != eOpenOrCreate) {
        m_report.status = taken; // others may be moving it: nothing is remembered
        return Search::NotKnown;
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
EditOpener::Search EditOpener::lookAgain() {
    const Qx::FileAnswer present = Qx::askFile(m_file);
    if (const Qx::FileError error = present.obstacle("open")) {
        refuse(error.status());
        return Search::NotKnown;
    }
    if (present.isRegular()) {
        return Search::FileIsThere;
    }
    bool hasBackups = false;
    if (const Qx::Status status = m_undo.exists(hasBackups); !status) {
        refuse(status);
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
bool EditOpener::replaceDamaged(int& counter) {
    if (!moveAside()) {
        return !m_refused;
    }
    bool hasBackups = counter != 0;
    if (!hasBackups) {
        if (const Qx::Status status = m_undo.exists(hasBackups); !status) {
            refuse(status);
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
bool EditOpener::moveAside() {
    if (Qx::Status taken = takeWritersLock(m_writers); !taken) {
        m_refused = true;
        m_report.recovery = std::move(taken);
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
            m_report.setAside.push_back({name, m_fault});
            return true;
        }
        refuse(status);
    }
    m_writers.release();
    return false;
}

/// Makes the edit, or with a null one the failure, the item's, and returns it. A failure that says nothing of
/// the file, or leaves backups of it, is not remembered.
EditPtr EditOpener::cache(EditPtr edit) {
    ManagerState& state = managerState();
    const String owner = edit.valid() ? edit->getOwner() : String();
    const bool isEdit = edit.valid() && edit->isEdit();
    const ManagerState::Hold hold(state.lock);
    m_isOver = !isOfThisProject();
    if (m_isOver) {
        return cancelled();
    }
    if (edit.valid() || !m_refused) {
        state.put(m_item, edit, m_file, edit.valid() ? m_read : Qx::FileInfo(),
                  edit.valid() ? nullptr : std::make_shared<const OpenReport>(m_report));
    }
    if (edit.valid()) {
        state.cachedAtLastOpen = state.cache.size();
        PermissionsManager::noteOwner(m_item, owner, !isEdit);
    }
    return edit;
}

EditPtr EditOpener::succeed(EditPtr edit) {
    // The time of last access is a convenience: a file system that refuses it does no harm, nor does a file
    // that is not there yet.
    static_cast<void>(Qx::fileSystem().touch(m_file, true).code);
    if (edit->get_cookie() != m_item) {
        herc_printf("edit_manager::open: funny, handles do not match\n");
    }
    // Before others can find it, so that no change of theirs is taken for clean.
    edit->set_dirty(false);
    m_report.status = {};
    m_report.recovery = {};
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

/// What the cache says of an item.
struct CacheAnswer {
    EditPtr edit;
    std::shared_ptr<const OpenReport> failure;
    bool isLeaving = false;
};

/// Answers from the cache. False if it does not know the item.
bool findCached(const cookie& item, eEditOpenBehaviour behaviour, CacheAnswer& answer) {
    ManagerState& state = managerState();
    const std::lock_guard hold(state.lookup);
    state.lastOpened = item;
    if (state.isLeaving.load(std::memory_order_relaxed)) {
        answer.isLeaving = true;
        return true;
    }
    const ManagerState::CachedEdit* const found = state.findCacheEntry(item);
    const bool counts = found != nullptr && !found->leaving && (found->edit.valid() || behaviour != eOpenNew);
    if (counts) {
        answer.edit = found->edit;
        if (!answer.edit.valid()) {
            answer.failure = found->failure;
        }
    }
    return counts;
}

/// What the cache answered, as a report.
void reportCached(const CacheAnswer& answer, OpenReport& report) {
    if (answer.isLeaving) {
        report.status = isBeingLeft();
    } else if (answer.failure != nullptr) {
        report = *answer.failure;
    } else {
        report.source = OpenReport::Source::Cache;
    }
}

/// Opens an edit. `report`, which may be null, is a fresh one.
EditPtr openReported(const cookie& item, eEditOpenBehaviour behaviour, OpenReport* report) {
    ManagerState& state = managerState();
    // Another project may become the current one on the way.
    constexpr int kMostProjects = 3;
    for (int attempt = 0; attempt < kMostProjects && state.instance.load() != nullptr; ++attempt) {
        if (state.projectGeneration.load() != Qx::currentProjectGeneration()) {
            static_cast<void>(edit_manager::check_current_project(behaviour));
        }
        limitCache();
        CacheAnswer cached;
        if (findCached(item, behaviour, cached)) {
            if (report != nullptr) {
                reportCached(cached, *report);
            }
            return std::move(cached.edit);
        }
        EditOpener opener(item, behaviour);
        EditPtr edit = opener.run();
        if (!opener.isOver()) {
            if (report != nullptr) {
                *report = opener.report();
            }
            return edit;
        }
    }
    if (report != nullptr) {
        report->status = isBeingLeft();
    }
    return {};
}

/// True for an item of which there can be an edit.
bool canBeOpened(const cookie& item) {
    return !item.isBlack() && !isNoItem(item) && managerForOpening() != nullptr;
}

} // namespace

EditPtr edit_manager::openEdit(const cookie& item, eEditOpenBehaviour behaviour) {
    return canBeOpened(item) ? openReported(item, behaviour, nullptr) : EditPtr();
}

EditPtr edit_manager::openEdit(const cookie& item, eEditOpenBehaviour behaviour, OpenReport& report) {
    report = {};
    if (canBeOpened(item)) {
        return openReported(item, behaviour, &report);
    }
    report.status = item.isBlack() || isNoItem(item)
                        ? Qx::Status::failure(Qx::StatusCode::BadArgument,
                                              item.asString() + " names nothing that can be opened")
                        : isBeingLeft();
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
