#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <memory>

/// Keeps other processes from writing the edit files of a project.
///
/// The manager holds it for each of its own sequences of writing, renaming and deleting. A program that
/// opens, changes and writes as one step (a command-line tool) holds it around all three:
///
///     EditManagerLock lock;
///     if (Qx::Status status = lock.take(); !status) return status;   // "... is locked by ..."
///
/// It is the file "Edits.lock" of the project's folder and dies with the process. Within a process it is
/// counted, not exclusive: any number of objects on any threads share it (threads are kept apart by the
/// manager's own lock), and the manager's operations pass. One object is used on one thread at a time.
class QM_API EditManagerLock {
public:
    /// For the current project, or for the project in a folder. Nothing is touched before `take`.
    EditManagerLock();
    explicit EditManagerLock(String projectFolder);
    ~EditManagerLock();
    EditManagerLock(const EditManagerLock&) = delete;
    EditManagerLock& operator=(const EditManagerLock&) = delete;

    /// Takes the lock. Without `wait`, one that another process holds is a failure of kind `Locked` that
    /// names the holder; no other failure is of that kind. Waiting for longer than a moment is told on the
    /// log. Fails too when the folder is not there or cannot be written. Without a project folder there is
    /// nothing to lock, which is a success. Taking what this object holds is a success.
    Qx::Status take(bool wait = false);
    void release();
    [[nodiscard]] bool isHeld() const { return m_isHeld; }

    static constexpr const char* kFileName = "Edits.lock";

private:
    Qx::Status tryToTake();

    String m_folder;
    bool m_isHeld = false;
};
