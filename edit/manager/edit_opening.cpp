#include "edit/manager/detail/manager_state.h"
#include "edit/manager/revision_chain.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/config_int.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"
#include "platform/services/timed_task.h"

#include <exception>

/// One opening of an item that is not in the cache, with its turn on the access queue.
class edit_manager::Opening {
public:
    Opening(const cookie& item, eEditOpenBehaviour behaviour)
        : m_item(item), m_behaviour(behaviour), m_file(getFilenameForCookie(item)),
          m_undo(m_file, RevisionChain::Undo, managerState().backupDepth) {}

    EditPtr run();

private:
    /// A fresh edit that reads the item's file; null when it does not read. Nothing is thrown on.
    [[nodiscard]] EditPtr read(eEditOpenBehaviour behaviour);
    [[nodiscard]] EditPtr readExisting();
    [[nodiscard]] EditPtr readBackups();
    bool setAside();
    [[nodiscard]] bool restoreMissing();
    EditPtr succeed(EditPtr edit);

    cookie m_item;
    eEditOpenBehaviour m_behaviour;
    String m_file;
    RevisionChain m_undo;
    bool m_refused = false; ///< the file may be sound, but the system did not let it be read
};

EditPtr edit_manager::Opening::run() {
    ManagerState& state = managerState();
    const Qx::TimedTask::Section timed(Qx::TimedTask::named("editman"), "open");
    const Qx::AccessScope<cookie> turn(state.queue, m_item);
    {
        const ManagerState::Hold hold(state.lock);
        const ManagerState::CachedEdit* found = state.find(m_item);
        if (found != nullptr && (found->edit.valid() || m_behaviour != eOpenNew)) {
            if (found->edit.valid() && found->edit->get_cookie() != m_item) {
                herc_printf("edit_manager::open: handles do not match\n");
            }
            return found->edit;
        }
    }
    herc_printf(5, "edit_manager::open(%s)\n", cookie_string(m_item).c_str());

    EditPtr edit;
    if (m_behaviour == eOpenNew) {
        edit = new Edit;
        try {
            edit->read_file(m_item, eOpenNew);
        } catch (const std::exception&) {
            // The fresh edit is handed out as it is.
        }
        return succeed(std::move(edit));
    }
    if (m_behaviour == eOpenExisting || m_behaviour == eOpenOrCreate) {
        if (Qx::fileExists(m_file) || restoreMissing()) {
            edit = readExisting();
        }
    }
    if (!edit.valid() && m_behaviour == eOpenOrCreate && !m_refused) {
        edit = read(eOpenOrCreate);
    }
    if (edit.valid()) {
        return succeed(std::move(edit));
    }
    const ManagerState::Hold hold(state.lock);
    state.put(m_item, EditPtr());
    return {};
}

EditPtr edit_manager::Opening::read(eEditOpenBehaviour behaviour) {
    EditPtr edit(new Edit);
    m_refused = false;
    try {
        if (edit->read_file(m_item, behaviour) == Edit::kReadOk) {
            return edit;
        }
        m_refused = edit->objectStore().lastOpenResult() == TagBag::NotOpened;
        herc_printf("edit_manager::open( %s ) : %s\n", cookie_string(m_item).c_str(), edit->lastFileError().c_str());
    } catch (const std::exception& error) {
        herc_printf("edit_manager::open( %s ) : reading failed: %s\n", cookie_string(m_item).c_str(), error.what());
    }
    return {};
}

bool edit_manager::Opening::restoreMissing() {
    if (!m_undo.exists()) {
        return false;
    }
    const int restored = m_undo.restoreNewest();
    herc_printf("edit_manager::open( %s ) - missing, trying backup %d \n", cookie_string(m_item).c_str(), restored);
    return restored != 0;
}

EditPtr edit_manager::Opening::readExisting() {
    if (EditPtr edit = read(m_behaviour); edit.valid()) {
        return edit;
    }
    // A file that the system refuses (no permission, too many open files) may be sound: it stays where it is.
    if (m_refused || !setAside()) {
        return {};
    }
    return readBackups();
}

/// Moves the item's file to its ".CORRUPT" name. False if it could not be moved.
bool edit_manager::Opening::setAside() {
    if (const Qx::FileError error = Qx::fileSystem().rename(m_file, m_file + ".CORRUPT")) {
        herc_printf("edit_manager::open( %s ) : %s\n", cookie_string(m_item).c_str(), error.text().c_str());
        return false;
    }
    return true;
}

EditPtr edit_manager::Opening::readBackups() {
    if (!m_undo.exists()) {
        return {};
    }
    for (int counter = 1;; ++counter) {
        herc_printf("edit_manager::open( %s ) - edit::read_file() failed, trying backup %d\n",
                    cookie_string(m_item).c_str(), counter);
        const int restored = m_undo.restoreNewest();
        if (restored == 0) {
            break;
        }
        if (EditPtr edit = read(m_behaviour); edit.valid()) {
            return edit;
        }
        // A backup that does not read either is kept beside the first: the next one takes its place.
        if (m_refused ||
            Qx::fileSystem().rename(m_file, m_file + String::format(".CORRUPT.%d", counter))) {
            break;
        }
    }
    LogBoth("edit_manager::open( %s ) - No usable backups found\n", cookie_string(m_item).c_str());
    return {};
}

EditPtr edit_manager::Opening::succeed(EditPtr edit) {
    ManagerState& state = managerState();
    if (Qx::fileExists(m_file)) {
        // The time of last access is a convenience: a file system that refuses it does no harm.
        static_cast<void>(Qx::fileSystem().touch(m_file, true).code);
    }
    {
        const ManagerState::Hold hold(state.lock);
        state.put(m_item, edit);
        state.cachedAtLastOpen = state.cache.size();
        if (const String owner = edit->getOwner(); !owner.empty()) {
            PermissionsManager::noteOwner(m_item, owner, !edit->isEdit());
        }
    }
    if (edit->get_cookie() != m_item) {
        herc_printf("edit_manager::open: funny, handles do not match\n");
    }
    edit->set_dirty(false);
    return edit;
}

EditPtr edit_manager::openEdit(const cookie& item, eEditOpenBehaviour behaviour) {
    ManagerState& state = managerState();
    if (item.isBlack() || isNoItem(item) || state.instance.load() == nullptr) {
        return {};
    }
    {
        const ManagerState::Hold hold(state.lock);
        if (!state.cacheLimit) {
            state.cacheLimit = config_int("edit_cache_size", -1);
        }
        if (*state.cacheLimit != -1) {
            limitEditCache(*state.cacheLimit);
        }
        state.lastOpened = item;
        check_current_project(behaviour);
        const ManagerState::CachedEdit* found = state.find(item);
        if (found != nullptr && (found->edit.valid() || behaviour != eOpenNew)) {
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
    const ManagerState::Hold hold(state.lock);
    const ManagerState::CachedEdit* found = state.find(item);
    return found != nullptr && found->edit.valid();
}

size_t edit_manager::numCached() {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    return state.cache.size();
}
