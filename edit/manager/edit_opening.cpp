#include "edit/manager/detail/manager_state.h"
#include "edit/manager/revision_chain.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/config_int.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"
#include "platform/services/timed_task.h"

#include <exception>
#include <new>

namespace {

/// One opening of an item that is not in the cache, with its turn on the access queue. What it moves is moved
/// under the writers' lock of the project, which is not held while a file is read.
class Opening {
public:
    Opening(const cookie& item, eEditOpenBehaviour behaviour)
        : m_item(item), m_behaviour(behaviour), m_file(getFilenameForCookie(item)),
          m_undo(m_file, RevisionChain::Undo, managerState().backupDepth), m_writers(Qx::folderOf(m_file)) {}

    EditPtr run();

private:
    [[nodiscard]] EditPtr makeNew();
    /// A fresh edit that reads the item's file; null when it does not read. Nothing is thrown on.
    [[nodiscard]] EditPtr read(eEditOpenBehaviour behaviour);
    [[nodiscard]] EditPtr readExisting();
    [[nodiscard]] EditPtr readBackups();
    [[nodiscard]] bool moveAside();
    /// True if the edit's file is there. What is there and no file, or cannot be asked about, is refused.
    [[nodiscard]] bool isThere();
    [[nodiscard]] bool restoreMissing();
    int restoreNewest();
    void refuse(const String& reason);
    EditPtr succeed(EditPtr edit);

    cookie m_item;
    eEditOpenBehaviour m_behaviour;
    String m_file;
    RevisionChain m_undo;
    EditManagerLock m_writers;
    Qx::FileInfo m_read;    ///< the file as it was before it was read last
    bool m_refused = false; ///< the file may be sound, but could not be read here
};

EditPtr Opening::run() {
    ManagerState& state = managerState();
    static Qx::TimedTask::Counter& counter = Qx::TimedTask::named("editman").section("open");
    const Qx::TimedTask::Section timed(counter);
    const Qx::AccessScope<cookie> turn(state.queue, m_item);
    {
        const ManagerState::Hold hold(state.lock);
        const ManagerState::CachedEdit* const found = state.findCacheEntry(m_item);
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
        herc_printf("edit_manager::open( %s ) : no file can be named after it; set a project folder\n",
                    cookie_string(m_item).c_str());
    } else if (m_behaviour == eOpenNew) {
        edit = makeNew();
    } else if (m_behaviour == eOpenExisting || m_behaviour == eOpenOrCreate) {
        if (isThere() || restoreMissing()) {
            edit = readExisting();
        }
        if (!edit.valid() && m_behaviour == eOpenOrCreate && !m_refused) {
            edit = read(eOpenOrCreate);
        }
    }
    if (edit.valid()) {
        return succeed(std::move(edit));
    }
    const ManagerState::Hold hold(state.lock);
    state.put(m_item, EditPtr(), m_file, {});
    return {};
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

EditPtr Opening::read(eEditOpenBehaviour behaviour) {
    m_refused = false;
    m_read = Qx::askFile(m_file).info();
    try {
        EditPtr edit(new Edit);
        if (edit->readFile(Qx::widen(m_file), behaviour) == Edit::kReadOk) {
            return edit;
        }
        // What the system refuses (no permission, too many open files), and what a later version of this
        // program wrote, is not damaged: it stays where it is.
        const TagBag::OpenResult result = edit->objectStore().lastOpenResult();
        m_refused = result == TagBag::NotOpened || result == TagBag::Newer;
        herc_printf("edit_manager::open( %s ) : %s\n", cookie_string(m_item).c_str(),
                    edit->lastFileError().c_str());
    } catch (const std::bad_alloc&) {
        m_refused = true;
        herc_printf("edit_manager::open( %s ) : there is not enough memory to read it\n",
                    cookie_string(m_item).c_str());
    } catch (const std::exception& error) {
        herc_printf("edit_manager::open( %s ) : reading failed: %s\n", cookie_string(m_item).c_str(),
                    error.what());
    }
    return {};
}

int Opening::restoreNewest() {
    int restored = 0;
    if (const Qx::Status status = m_undo.restoreNewest(restored); !status) {
        refuse(status.reason());
    }
    return restored;
}

void Opening::refuse(const String& reason) {
    m_refused = true;
    herc_printf("edit_manager::open( %s ) : %s\n", cookie_string(m_item).c_str(), reason.c_str());
}

bool Opening::isThere() {
    const Qx::FileAnswer present = Qx::askFile(m_file);
    if (const Qx::FileError error = present.obstacle("open")) {
        refuse(error.text());
    }
    return present.isRegular();
}

bool Opening::restoreMissing() {
    bool hasBackups = false;
    if (const Qx::Status status = m_undo.exists(hasBackups); !status) {
        refuse(status.reason());
    }
    if (m_refused || !hasBackups) {
        return false;
    }
    if (!takeWritersLock(m_writers)) {
        m_refused = true;
        return false;
    }
    // Another process may have put the file back meanwhile.
    if (!isThere() && !m_refused) {
        const int restored = restoreNewest();
        herc_printf("edit_manager::open( %s ) - missing, trying backup %d \n", cookie_string(m_item).c_str(),
                    restored);
    }
    m_writers.release();
    return !m_refused && isThere();
}

EditPtr Opening::readExisting() {
    // A file that another process puts in the place of one that does not read is read in its turn.
    for (int attempt = 0; attempt < 3; ++attempt) {
        if (EditPtr edit = read(m_behaviour); edit.valid()) {
            return edit;
        }
        if (m_refused) {
            return {};
        }
        if (moveAside()) {
            return readBackups();
        }
        if (Qx::isSameFile(m_read, Qx::askFile(m_file).info())) {
            return {};
        }
    }
    return {};
}

/// Moves the file that was read last to a name for what does not read; none that is there is replaced. False
/// if it could not be moved or is another file. The writers' lock is held afterwards if it was moved.
bool Opening::moveAside() {
    if (!takeWritersLock(m_writers)) {
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
        herc_printf("edit_manager::open( %s ) : %s\n", cookie_string(m_item).c_str(),
                    status.reason().c_str());
    }
    m_writers.release();
    return false;
}

EditPtr Opening::readBackups() {
    bool hasBackups = false;
    if (const Qx::Status status = m_undo.exists(hasBackups); !status) {
        refuse(status.reason());
    }
    for (int counter = 1; hasBackups; ++counter) {
        herc_printf("edit_manager::open( %s ) - edit::read_file() failed, trying backup %d\n",
                    cookie_string(m_item).c_str(), counter);
        const int restored = restoreNewest();
        m_writers.release();
        if (restored == 0) {
            break;
        }
        if (EditPtr edit = read(m_behaviour); edit.valid()) {
            return edit;
        }
        if (m_refused || !moveAside()) {
            break;
        }
    }
    m_writers.release();
    if (hasBackups) {
        LogBoth("edit_manager::open( %s ) - No usable backups found\n", cookie_string(m_item).c_str());
    }
    return {};
}

EditPtr Opening::succeed(EditPtr edit) {
    ManagerState& state = managerState();
    // The time of last access is a convenience: a file system that refuses it does no harm, nor does a file
    // that is not there yet.
    static_cast<void>(Qx::fileSystem().touch(m_file, true).code);
    if (edit->get_cookie() != m_item) {
        herc_printf("edit_manager::open: funny, handles do not match\n");
    }
    // Before others can find it, so that no change of theirs is taken for clean.
    edit->set_dirty(false);
    const String owner = edit->getOwner();
    const bool isEdit = edit->isEdit();
    {
        const ManagerState::Hold hold(state.lock);
        state.put(m_item, edit, m_file, m_read);
        state.cachedAtLastOpen = state.cache.size();
    }
    PermissionsManager::noteOwner(m_item, owner, !isEdit);
    return edit;
}

} // namespace

EditPtr edit_manager::openEdit(const cookie& item, eEditOpenBehaviour behaviour) {
    ManagerState& state = managerState();
    if (item.isBlack() || isNoItem(item) || state.instance.load() == nullptr) {
        return {};
    }
    if (state.projectGeneration.load() != Qx::currentProjectGeneration()) {
        static_cast<void>(check_current_project(behaviour));
    }
    int limit = state.cacheLimit.load(std::memory_order_relaxed);
    if (limit != -1) {
        if (limit == ManagerState::kLimitNotRead) {
            limit = std::max(config_int("edit_cache_size", -1), -1);
            state.cacheLimit = limit;
        }
        limitEditCache(limit);
    }
    {
        const std::lock_guard hold(state.lookup);
        state.lastOpened = item;
        const ManagerState::CachedEdit* const found = state.findCacheEntry(item);
        if (found != nullptr && !found->leaving && (found->edit.valid() || behaviour != eOpenNew)) {
            return found->edit;
        }
    }
    return Opening(item, behaviour).run();
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
