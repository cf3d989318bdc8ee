#include "edit/manager/edit_manager_lock.h"

#include "platform/services/current_project.h"
#include "platform/services/file_lock.h"

#include <map>
#include <mutex>

namespace {

struct HeldLock {
    explicit HeldLock(const String& folder) : file(Qx::joinPath(folder, EditManagerLock::kFileName)) {}

    Qx::FileLock file;
    unsigned count = 0;
};

/// The locks that this process holds, by project folder. The mutex is held while another process is waited
/// for: whoever else asks has to wait for it all the same.
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
    if (m_isHeld || m_folder.empty()) {
        return {};
    }
    HeldLocks& locks = heldLocks();
    const std::lock_guard hold(locks.mutex);
    const auto place = locks.byFolder.try_emplace(m_folder, m_folder).first;
    if (place->second.count == 0) {
        if (Qx::Status status = place->second.file.take(wait); !status) {
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
