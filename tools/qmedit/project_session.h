#pragma once

#include "edit/inspect/edit_report.h"
#include "edit/manager/project_items.h"
#include "edit/manager/session.h"
#include "platform/base/status.h"
#include "tools/qmedit/interrupts.h"

#include <optional>
#include <vector>

/// The project that a command works on: a folder, given by --project, else by $QMEDIT_PROJECT, else
/// ./quillmarch-project, with the project's own folder (named by its cookie, P0001000) in it. The project's
/// own folder may be given too. While a session is open, its project is the library's current one. Nothing is
/// made or changed on the disk but by `create` and `lockForWriting`, and by `list` in a record that is there.
class ProjectSession {
public:
    /// The folder that a command works on, from the text of its --project option.
    explicit ProjectSession(const String& option);

    [[nodiscard]] const String& root() const { return m_session.root(); }
    /// The folder with the edit files.
    [[nodiscard]] String folder() const { return m_session.folder(); }
    /// True if the project is there.
    [[nodiscard]] bool exists() const { return m_session.exists(); }

    /// Opens the project that is there. Settings that cannot be read draw a warning and the usual ones are
    /// taken, so that the edits can be looked at. A failure says that there is no project and what makes one.
    Qx::Status openExisting();
    /// Makes a project current so that edits can be prepared for it: the one that is there, else one of the
    /// given rate (25 for an invalid one) of which nothing is on the disk yet.
    Qx::Status prepare(Qx::FrameRate rateOfFresh);
    /// After `prepare`: makes what is missing on the disk, and removes what killed programs left there.
    Qx::Status create();

    /// Makes the edit manager, for the commands that work through it. It lives as long as the session.
    void manage() { m_session.manage(); }
    /// Takes the project's writers' lock for the rest of the session: a command that opens, changes and
    /// writes takes it before it opens. Another process that holds it is waited for `kLockPatience` seconds;
    /// a failure then names it.
    Qx::Status lockForWriting();
    static constexpr int kLockPatience = 2;

    /// \name The project's items
    /// As `ProjectItems` has them; failures say what to do, and warnings go to standard error.
    /// @{
    /// The item that a COOKIE argument means: its cookie, or its name.
    Qx::Status findItem(const String& text, cookie& item);
    Qx::Status readEdit(const cookie& item, EditPtr& edit) const;
    static Qx::Status readRevision(const String& path, EditPtr& edit);
    [[nodiscard]] static String fileOf(const cookie& item) { return ProjectItems::fileOf(item); }
    Qx::Status list(std::vector<ListedEdit>& edits, std::vector<String>& others);
    [[nodiscard]] size_t numRead() const { return m_items.numRead(); }
    /// Looks names up in the project's files, each file read once a session.
    [[nodiscard]] SourceNamer sourceNamer();
    /// @}

private:
    void useUnwritten(Qx::FrameRate rate);
    /// Removes what killed programs left, once, under the writers' lock.
    void cleanUp();

    Qx::FrameRate m_rateOfFresh;
    bool m_isClean = false;
    std::optional<interrupts::Hold> m_uninterrupted; ///< goes last: from the lock until all is closed
    Session m_session;                               ///< what it writes at its end is written locked
    ProjectItems m_items;
};
