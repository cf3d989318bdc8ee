#include "edit/manager/edit_manager_lock.h"

#include "platform/services/current_project.h"
#include "platform/services/file_lock.h"
#include "platform/services/log.h"

#include <algorithm>
#include <chrono>
#include <map>
#include <mutex>
#include <thread>

namespace {

struct HeldLock {
    explicit HeldLock(const String& folder) : file(Qx::joinPath(folder, EditManagerLock::kFileName)) {}

    Qx::FileLock file;
    unsigned count = 0;
};

/// The locks that this process holds, by project folder. Nothing is waited for under the mutex: a thread that
/// holds other locks of the manager passes as soon as another thread of this process has the lock.
struct HeldLocks {
    std::mutex mutex;
    std::map<String, HeldLock> byFolder;
};

HeldLocks& heldLocks() {
    static auto& locks = *new HeldLocks;
    return locks;
}

} // namespace

EditManagerLock::EditManagerLock() : EditManagerLock(Qx::currentProject().folder()) {}

EditManagerLock::EditManagerLock(String projectFolder) : m_folder(std::move(projectFolder)) {}

EditManagerLock::~EditManagerLock() {
    release();
}

Qx::Status EditManagerLock::take(bool wait) {
    using Clock = std::chrono::steady_clock;
    constexpr std::chrono::milliseconds kLongestPause{16};
    constexpr std::chrono::seconds kPatience{1};
    const Clock::time_point start = Clock::now();
    std::chrono::milliseconds pause{1};
    bool isTold = false;
    Qx::Status status = tryToTake();
    while (wait && status.code() == Qx::StatusCode::Locked) {
        if (!isTold && Clock::now() - start >= kPatience) {
            isTold = true;
            herc_printf("edit_manager: waiting to write: %s\n", status.reason().c_str());
        }
        std::this_thread::sleep_for(pause);
        pause = std::min(pause * 2, kLongestPause);
        status = tryToTake();
    }
    return status;
}

Qx::Status EditManagerLock::tryToTake() {
    if (m_isHeld || m_folder.empty()) {
        return {};
    }
    HeldLocks& locks = heldLocks();
    const std::lock_guard hold(locks.mutex);
    const auto place = locks.byFolder.try_emplace(m_folder, m_folder).first;
    if (place->second.count == 0) {
        if (Qx::Status status = place->second.file.take(false); !status) {
            locks.byFolder.erase(place);
            return status;
        }
    }
    ++place->second.count;
    m_isHeld = true;
    return {};
}

void EditManagerLock::release() {
    if (!m_isHeld) {
        return;
    }
    m_isHeld = false;
    HeldLocks& locks = heldLocks();
    const std::lock_guard hold(locks.mutex);
    const auto place = locks.byFolder.find(m_folder);
    if (--place->second.count == 0) {
        locks.byFolder.erase(place);
    }
}
