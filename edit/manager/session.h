#pragma once

#include "edit/manager/edit_manager.h"
#include "edit/manager/edit_manager_lock.h"
#include "edit/project/project_details.h"
#include "platform/base/status.h"

#include <chrono>
#include <memory>
#include <vector>

/// How a project is opened.
struct SessionOptions {
    /// `eOpenExisting` only opens, `eOpenOrCreate` makes a project where there is none, and `eOpenNew` fails
    /// where there is one.
    eEditOpenBehaviour behaviour = eOpenOrCreate;
    /// The current user, UTF-8; empty for the one who is current already, at first that of the process.
    String user;
    /// Settings of a project that is made. Without a name it gets that of its folder.
    ProjectDetails forNew;
};

/// A program's way to the edits of a project:
///
///     Session session("projects");
///     if (Qx::Status opened = session.open(); !opened) return tell(opened);
///     EditPtr edit = edit_manager::openEdit(cookie("E0001000"), eOpenExisting);
///     ...
///     if (Qx::Status closed = session.close(); !closed) return tell(closed);
///
/// While it is open its project is the current one of the process, there is an edit manager, and what was
/// subscribed with `listen` is heard. It owns the manager if it made it, the subscriptions and, when taken,
/// the writers' lock. It leaves to others: opening, changing and undoing edits (`edit_manager`, `Editor`).
///
/// One session is open at a time in a process, as there is one current project. A session is used on one
/// thread; the manager behind it on any. Nothing here throws but when memory runs out.
class QM_API Session {
public:
    /// Finds the project that a folder means: the folder of a project itself, which is named by the project's
    /// cookie and has settings in it, or a folder of projects, of which P0001000 is taken if it is there,
    /// else the only one, else P0001000. Nothing is made or changed.
    explicit Session(const String& folder);
    /// Closes what is open. Changes that cannot be written are lost and the log says so; `close` before it
    /// answers instead.
    ~Session();
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

    /// The folder of projects.
    [[nodiscard]] const String& root() const { return m_root; }
    [[nodiscard]] const cookie& project() const { return m_project; }
    /// The project's own folder, with the edit files.
    [[nodiscard]] String folder() const;
    /// True if the project's folder is there.
    [[nodiscard]] bool exists() const;

    /// Opens the project, or makes it, and starts the edit manager if there is none. `NotFound` when there is
    /// no project to open, `BadArgument` when there is one where a new one was asked for or a setting is out
    /// of range, `Damaged` when its settings do not read, else what the system said; no project was made
    /// then, and the one that was current before still is.
    Qx::Status open(const SessionOptions& options = {});
    [[nodiscard]] bool isOpen() const { return m_isOpen; }

    /// Hears messages of the manager (`edit_manager::invalidateCacheMsgType` and its like) until the session
    /// is closed.
    void listen(NotifyMsgType type, Notifier::Listener listener);
    /// Hears every change of an edit, on the thread that makes it, until the session is closed. An undo or
    /// redo puts another object in the edit's place, so a listener that is to hear of what comes after it
    /// follows the edit with another call.
    void follow(const EditPtr& edit, ValServer<EditModification>::Listener listener);

    /// Writes every changed edit and closes the project. When something could not be written the session
    /// stays open with the changes in memory, so that it can be closed again when there is room; the failure
    /// names the edits and is of the kind of the first one's, and `unwritten` gets them all. Succeeds when
    /// nothing is open.
    Qx::Status close(Vector<UnwrittenEdit>& unwritten);
    Qx::Status close();
    /// Closes the project whatever cannot be written: `lost` gets those edits.
    void closeAnyway(Vector<UnwrittenEdit>& lost);

    /// \name The steps of opening
    /// For a program that looks before it makes anything, or works without a manager. `open` takes them all.
    /// @{
    /// Makes the project that is there the current one, with its settings, or with the usual ones where it
    /// has none. Nothing is written. `NotFound` when it is not there; other failures say what is wrong with
    /// its settings, and another project may be current still.
    Qx::Status useExisting();
    /// Makes the project the current one with these settings, whether it is there or not. Nothing is read or
    /// written.
    void useUnwritten(const ProjectDetails& settings);
    /// Makes what is missing of the project on the disk, and it the current one.
    Qx::Status make(const ProjectDetails& forNew);
    /// Starts the edit manager if there is none.
    void manage();
    /// Takes the project's writers' lock until the session is closed, for a program that opens, changes and
    /// writes as one step. `Locked` when another process still holds it after the time of waiting.
    Qx::Status lockForWriting(std::chrono::milliseconds patience = {});
    /// @}

private:
    void letGo();

    String m_root;
    cookie m_project;
    Qx::Status m_found; ///< why the system could not tell which project the folder means
    bool m_isOpen = false;
    std::unique_ptr<EditManagerLock> m_writers;
    edit_manager* m_manager = nullptr; ///< the one that was made here
    std::vector<Qx::Ptr<Qx::Guard>> m_listening;
};
