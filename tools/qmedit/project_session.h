#pragma once

#include "edit/inspect/edit_report.h"
#include "edit/manager/session.h"
#include "edit/model/edit.h"
#include "edit/project/projdb.h"
#include "platform/base/status.h"
#include "tools/qmedit/interrupts.h"

#include <memory>
#include <optional>
#include <unordered_map>
#include <unordered_set>
#include <vector>

/// What a listing says of one edit file.
struct ListedEdit {
    cookie item;
    String type; ///< "edit", "shot", ...; empty for an item without a class
    String name; ///< any bytes
    Qx::FrameRate rate;
    double duration = 0; ///< seconds
    int channels = 0;
    int64_t modified = 0; ///< seconds since 1970, UTC
    String damage;        ///< why the file cannot be read; empty for a good one
};

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

    /// Reads an edit. While its file is away, as a writer leaves it for a moment (or for good, when it dies),
    /// the newest undo backup answers, with one warning for each edit; nothing is moved. A failure names the
    /// file and says what to do.
    Qx::Status readEdit(const cookie& item, EditPtr& edit) const;
    /// Reads a file of an edit under any name: a backup, a milestone, a copy. A failure names the file.
    static Qx::Status readRevision(const String& path, EditPtr& edit);
    /// The file that `readEdit` reads.
    [[nodiscard]] static String fileOf(const cookie& item);
    /// What there is to say of every edit file, in order of their cookies, by `readEdit` where it is away; an
    /// edit of which neither its file nor an undo backup is there counts as damaged. `others` gets the names
    /// of files with the edits' extension that are no cookie's. Where the project has a record ("Project.db")
    /// only the files that it does not tell of are read, and it learns of them; without one every file is.
    /// What comes out is the same. Fails only when the folder cannot be read.
    Qx::Status list(std::vector<ListedEdit>& edits, std::vector<String>& others);
    /// How many files the last listing had to read.
    [[nodiscard]] size_t numRead() const { return m_numRead; }
    /// Looks names up in the project's files, each file read once a session.
    [[nodiscard]] SourceNamer sourceNamer();

private:
    /// What the file of a source says of it.
    struct Known {
        String name;
        String problem;
        String reel;
        bool dropFrame = false;
    };

    using Records = std::unordered_map<cookie, projdb::Record>;

    void useUnwritten(Qx::FrameRate rate);
    /// The project's record; null when it has none or it cannot be used.
    [[nodiscard]] projdb* openRecords();
    [[nodiscard]] projdb::Record recordOf(const cookie& item, const Records& known, Records& fresh);
    [[nodiscard]] Known look(const cookie& item) const;
    [[nodiscard]] bool isListed(const cookie& item) const;
    /// Removes what killed programs left, once, under the writers' lock.
    void cleanUp();
    /// Reads the newest undo backup of an edit whose file is away. True if that settles the matter: `status`
    /// is how it went. False when there is none, or the file is back.
    [[nodiscard]] bool readBackup(const cookie& item, EditPtr& edit, Qx::Status& status) const;
    [[nodiscard]] ListedEdit listedAway(const cookie& item) const;

    Qx::FrameRate m_rateOfFresh;
    std::unordered_map<cookie, Known> m_known;
    mutable std::optional<std::unordered_set<cookie>> m_listed; ///< when an item was first missing
    mutable std::unordered_set<cookie> m_toldAway;              ///< of which a warning told
    size_t m_numRead = 0;
    bool m_isClean = false;
    std::optional<interrupts::Hold> m_uninterrupted; ///< goes last: from the lock until all is closed
    Session m_session; ///< goes first: what it writes at its end is written locked
};
