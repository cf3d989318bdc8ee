#pragma once

#include "platform/base/status.h"
#include "platform/services/files.h"

namespace Qx {

/// Mutual exclusion between processes, and between the threads of one, by an advisory lock on a file. The
/// lock dies with the process: one that crashes leaves nothing to clear up. While it is held the file says
/// who holds it. The file stays when the lock is released.
///
/// The lock is not recursive: a second object for the same file waits, also on the same thread. One object is
/// used on one thread at a time.
class QM_API FileLock {
public:
    /// Nothing is touched before `take`.
    explicit FileLock(String path);
    /// Releases the lock, also when memory has run out.
    ~FileLock();
    FileLock(const FileLock&) = delete;
    FileLock& operator=(const FileLock&) = delete;

    /// Takes the lock, making the file if it is missing; its folder must exist. Without `wait`, a lock that
    /// is held elsewhere is a failure of kind `Locked` that names the holder; no other failure is of that
    /// kind. A lock that this object holds is a success.
    Status take(bool wait = true);
    void release();
    [[nodiscard]] bool isHeld() const { return m_file != nullptr; }

    /// Who holds the lock of a file, or held it last, for a person: "qmedit, process 4711 on cutting-room-2".
    /// Empty when that is not known.
    [[nodiscard]] static String holder(const String& path);

private:
    void writeHolder(std::string_view text) noexcept;

    String m_path;
    std::unique_ptr<OpenFile> m_file;
};

} // namespace Qx
