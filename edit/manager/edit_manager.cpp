#include "edit/manager/edit_manager.h"

#include "edit/manager/detail/manager_state.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/config_int.h"
#include "platform/services/crash_flag.h"
#include "platform/services/log.h"
#include "platform/services/network.h"

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <mutex>
#include <unistd.h>

namespace {

/// The process that made the manager.
std::atomic<pid_t>& maker() {
    static std::atomic<pid_t> process{0};
    return process;
}

void hear(const Qx::Network::Message& message) {
    switch (message.kind) {
    case Qx::Network::EditWritten:
        edit_manager::reloadRequest(message.item, true);
        break;
    case Qx::Network::EditDeleted:
        edit_manager::handleNetDelete(message.item);
        break;
    default:
        break;
    }
}

/// Called when the process ends: what a program left open is written. Not in a process that was split off
/// from the one that opened it.
void closeAtExit() {
    if (edit_manager::theEditManager() != nullptr && ::getpid() == maker().load()) {
        edit_exit();
    }
}

/// Makes the manager for a program that never did; not again after it was shut down.
EditRegistry* makeFirstManager() {
    ManagerState& state = managerState();
    static std::mutex making;
    const std::lock_guard hold(making);
    if (!state.wasMade) {
        new edit_manager;
    }
    return state.instance.load();
}

/// From when on the first opening makes one.
[[maybe_unused]] const bool isOffered = (EditRegistry::setMaker(makeFirstManager), true);

/// A step of the shut-down. Nothing that fails in it keeps the next one from its turn.
template <typename Step>
void shutDown(Step&& step) noexcept {
    try {
        step();
    } catch (const std::exception&) {
        std::fputs("edit_manager: a step of shutting down failed; there may not be enough memory\n", stderr);
    }
}

} // namespace

edit_manager* managerForOpening() {
    ManagerState& state = managerState();
    if (state.instance.load() == nullptr && !state.wasMade) {
        static_cast<void>(makeFirstManager());
    }
    return state.instance.load();
}

edit_manager::edit_manager() {
    ManagerState& state = managerState();
    Qx::Network::setNetworkMode(false);
    delete state.instance.load();
    static const bool isHooked = std::atexit(closeAtExit) == 0;
    static_cast<void>(isHooked);
    maker() = ::getpid();
    {
        const ManagerState::Hold hold(state.lock);
        ++state.epoch;
        state.newProject = cookie("P0001000");
        state.backupDepth = std::max(config_int("backup_depth", 10), 1);
        state.cacheLimit = ManagerState::kLimitNotRead;
        state.cachedAtLastOpen = 0;
        state.projectGeneration = 0;
        state.instance = this;
        state.wasMade = true;
        const std::lock_guard holdLookup(state.lookup);
        state.lastOpened = invalid_cookie;
        state.isLeaving = false;
    }
    EditRegistry::install(this);
    static_cast<void>(check_current_project(eOpenOrCreate));
    if (PermissionsManager::hasRight(PermissionsManager::NetworkRight)) {
        m_service = Qx::Network::service();
        if (m_service) {
            m_listening = m_service->listen(hear);
        }
    }
}

edit_manager::~edit_manager() {
    ManagerState& state = managerState();
    shutDown([] { herc_printf("edit_manager::~edit_manager: closing down edit manager\n"); });
    m_listening.reset();
    std::function<void(bool)> uiDelete;
    std::function<bool()> confirmUpdate;
    {
        const ManagerState::Hold hold(state.lock);
        uiDelete.swap(state.uiDelete);
        confirmUpdate.swap(state.confirmUpdate);
    }
    if (get_crash_flag() != 0) {
        shutDown([] { flush_changes(); });
    }
    shutDown([&] {
        if (state.records.isOpen() && confirmUpdate && confirmUpdate() && !update_projdb()) {
            herc_printf("edit_manager::~edit_manager: projdb update interrupted\n");
        }
    });
    if (uiDelete) {
        shutDown([&] { uiDelete(true); });
    }
    // From here on nothing opens any more, and what is being opened is handed to nobody.
    state.instance = nullptr;
    state.setLeaving(true);
    shutDown([] { close_all_edits(); });
    shutDown([&] { state.records.close(); });
    EditRegistry::install(nullptr);
    const ManagerState::Hold hold(state.lock);
    ++state.epoch;
    state.project = invalid_cookie;
    state.projectGeneration = 0;
    state.setLeaving(false);
    const std::lock_guard holdDirty(state.dirtyMutex);
    state.dirty.clear();
}

edit_manager* edit_manager::theEditManager() {
    return managerState().instance.load();
}

void edit_manager::theEditManager(edit_manager* manager) {
    edit_manager* const present = theEditManager();
    if (present == manager) {
        return;
    }
    delete present;
    managerState().instance = manager;
    EditRegistry::install(manager);
}

void edit_exit() {
    ManagerState& state = managerState();
    edit_manager* const manager = edit_manager::theEditManager();
    if (get_crash_flag() != 0) {
        size_t numCached = 0;
        cookie last;
        {
            const ManagerState::Hold hold(state.lock);
            numCached = state.cachedAtLastOpen;
            const std::lock_guard holdLookup(state.lookup);
            last = state.lastOpened;
        }
        LogBoth("edit_manager : Num cached edits  - %d\n", static_cast<int>(numCached));
        if (last.is_valid()) {
            LogBoth("edit_manager : Last opened edit  - %s\n", cookie_string(last).c_str());
        }
    }
    herc_printf("edit_exit: closing down edit manager\n");
    delete manager;
    herc_printf("edit_exit: closed down edit manager\n");
}

void edit_manager::setUiDeleteFn(std::function<void(bool)> callback) {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    state.uiDelete.swap(callback);
}

void edit_manager::setConfirmUpdateFn(std::function<bool()> callback) {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    state.confirmUpdate.swap(callback);
}

ValServer<cookie>& edit_manager::getFocusEditServer() {
    return managerState().focus;
}
cookie edit_manager::getFocusEditCookie() {
    return getFocusEditServer().getValue();
}
void edit_manager::setFocusEditCookie(const cookie& item) {
    getFocusEditServer().setValue(item);
}
ValServer<cookie>& edit_manager::getSourceEditServer() {
    return managerState().source;
}
cookie edit_manager::getSourceEditCookie() {
    return getSourceEditServer().getValue();
}
void edit_manager::setSourceEditCookie(const cookie& item) {
    getSourceEditServer().setValue(item);
}
ValServer<cookie>& edit_manager::getRecordEditServer() {
    return managerState().record;
}
cookie edit_manager::getRecordEditCookie() {
    return getRecordEditServer().getValue();
}
void edit_manager::setRecordEditCookie(const cookie& item) {
    getRecordEditServer().setValue(item);
}
ValServer<bool>& edit_manager::getMixerBypassServer() {
    return managerState().mixerBypass;
}
void edit_manager::setMixerBypass(bool bypass) {
    getMixerBypassServer().setValue(bypass);
}

NotifyMsgType edit_manager::projChangedMsgType() {
    return managerMessages().projectChanged;
}
NotifyMsgType edit_manager::projExitMsgType() {
    return managerMessages().projectExit;
}
NotifyMsgType edit_manager::flushChangesMsgType() {
    return managerMessages().flushChanges;
}
NotifyMsgType edit_manager::invalidateCacheMsgType() {
    return managerMessages().invalidateCache;
}
NotifyMsgType edit_manager::editDeletedMsgType() {
    return managerMessages().editDeleted;
}

Qx::Ptr<Qx::Guard> edit_manager::registerNotification(NotifyMsgType type, Notifier::Listener listener) {
    return managerState().notifier.addListener(type, std::move(listener));
}
