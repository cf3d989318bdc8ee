#pragma once

#include "platform/base/status.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/project_session.h"

#include <functional>
#include <optional>

/// What the commands on one edit are given.
struct EditArguments {
    std::string item;
    String project;
};

/// Opens an edit through the edit manager, under the writers' lock. Where its file was missing or unreadable
/// the manager takes a backup in its place, which is reported and makes `wasRestored` true. A failure is
/// reported and leaves `edit` null.
[[nodiscard]] bool openManaged(const cookie& item, EditPtr& edit, bool& wasRestored);

/// After a write that failed: lets go of the changes, and brings the file of an edit that lies as its newest
/// undo backup back under its name, under the writers' lock. Says in one clause where the edit is.
[[nodiscard]] String putFileBack(const cookie& item, EditPtr& edit);

/// A number of backups for people, also one that the system could not tell.
[[nodiscard]] String countText(std::optional<size_t> count);

/// One edit of a project that a command changes through the edit manager, under the project's writers' lock
/// from before it is opened until the object goes. What the user must know is told on standard error.
class ManagedEdit {
public:
    explicit ManagedEdit(const EditArguments& arguments);

    /// Opens the project, takes the lock and finds the item; it must not be marked read-only, and
    /// must have a file or a backup unless it `mayBeGone`. An `ExitCode`; what is wrong is reported.
    int prepare(bool mayBeGone = false);
    /// Opens the edit, by `openManaged`.
    bool open(EditPtr& edit);
    [[nodiscard]] bool wasRestored() const { return m_wasRestored; }

    [[nodiscard]] const cookie& item() const { return m_item; }
    [[nodiscard]] ProjectSession& session() { return m_session; }
    /// Keeps the edit's state as undo backup 1, changes the edit and writes it. `apply`, which may be empty,
    /// cannot fail; it describes what it does. A failure names `what` was not done and says where the edit
    /// is.
    Qx::Status change(EditPtr& edit, const String& what, const std::function<void(Edit&)>& apply);
    /// How many undo and redo backups there are.
    [[nodiscard]] std::optional<size_t> numUndo() const;
    [[nodiscard]] std::optional<size_t> numRedo() const;

private:
    const EditArguments& m_arguments;
    ProjectSession m_session;
    cookie m_item;
    bool m_wasRestored = false;
};

/// "; 3 to undo", and how many redo backups went of the `numRedo` that there were: the end of the line that a
/// change is told with.
[[nodiscard]] String undoText(const ManagedEdit& managed, std::optional<size_t> numRedo);

/// Steps an edit one revision back, or with `redo` forward, and prints what happened. An `ExitCode`.
int stepRevision(const EditArguments& arguments, bool redo);
