#pragma once

#include "edit/manager/session.h"
#include "edit/model/edit_ptr.h"
#include "edit/project/projdb.h"
#include "platform/media/frame_rate.h"

#include <functional>
#include <optional>
#include <unordered_map>
#include <unordered_set>
#include <vector>

/// What a listing says of one item.
struct ListedEdit {
    cookie item;
    String type; ///< "edit", "shot", ...; empty for an item without a class
    String name; ///< any bytes
    Qx::FrameRate rate;
    double duration = 0; ///< seconds
    int channels = 0;
    int64_t modified = 0; ///< seconds since 1970, UTC
    String damage;        ///< why its file cannot be read; empty for a good one
};

/// What an item's file says of it to those who play it.
struct SourceFacts {
    String name;            ///< any bytes; empty for what has none
    String problem;         ///< why the file could not be read; empty if it could
    String reel;            ///< as its log says; empty for what has none
    bool dropFrame = false; ///< its timecode is counted in drop frame
};

/// The items of a session's project as they lie on the disk: found by cookie or name, listed, and read for
/// one look each. Nothing is opened in the edit manager, moved or written, but in a project record that is
/// there. An edit that the manager holds with changes is seen as it was written last.
///
/// The session's project must be the current one. Used on one thread; what was looked up once (names of
/// sources, the items of the folder) is remembered as long as the object lives.
class QM_API ProjectItems {
public:
    /// `warn`, which may be empty, hears a sentence when a backup answers for a file that is away, and when
    /// the project's record was damaged. The session must outlive the object.
    explicit ProjectItems(Session& session, std::function<void(const String&)> warn = nullptr);

    /// Reads an edit. While its file is away, as a writer leaves it for a moment (or for good, when it dies),
    /// the newest undo backup answers, with one warning for each edit. A failure names the file: `NotFound`
    /// when there is none, else what keeps it from being read, with the newest backup if there is one.
    Qx::Status read(const cookie& item, EditPtr& edit) const;
    /// Reads a file of an edit under any name: a backup, a milestone, a copy. The edit has no cookie. A
    /// failure names the file; it is `Damaged` unless the whole of it is sound.
    static Qx::Status readFile(const String& path, EditPtr& edit);
    /// The file that `read` reads.
    [[nodiscard]] static String fileOf(const cookie& item);
    /// True if the folder has a file of the item, or backups or files set aside of one. The folder is gone
    /// through once, by the first question.
    [[nodiscard]] bool isListed(const cookie& item) const;

    /// The item that a text means: the cookie of an item that the project has, else the name of one, to the
    /// letter or else in any case, else a cookie of which the project has no file (it may have milestones).
    /// `NotFound` for another text, `BadArgument` for a name that several items have, which are named; `item`
    /// is then as it was.
    Qx::Status find(const String& text, cookie& item);

    /// What there is to say of every item, in order of their cookies, by `read` where its file is away; an
    /// edit of which neither its file nor an undo backup is there counts as damaged. `others` gets the names
    /// of files with the edits' extension that are no cookie's. Where the project has a record ("Project.db")
    /// only the files that it does not tell of are read, and it learns of them; without one every file is.
    /// What comes out is the same. Fails only when the folder cannot be read.
    Qx::Status list(std::vector<ListedEdit>& edits, std::vector<String>& others);
    /// How many files the last listing had to read.
    [[nodiscard]] size_t numRead() const { return m_numRead; }

    /// What the file of a source says of it, read when it is first asked for. Valid as long as the object.
    [[nodiscard]] const SourceFacts& factsOf(const cookie& source);

private:
    using Records = std::unordered_map<cookie, projdb::Record>;

    /// The project's record; null when it has none or it cannot be used.
    [[nodiscard]] projdb* openRecords();
    [[nodiscard]] projdb::Record recordOf(const cookie& item, const Records& known, Records& fresh);
    /// Reads the newest undo backup of an edit whose file is away. True if that settles the matter: `status`
    /// is how it went. False when there is none, or the file is back.
    [[nodiscard]] bool readBackup(const cookie& item, EditPtr& edit, Qx::Status& status) const;
    [[nodiscard]] ListedEdit listedAway(const cookie& item) const;
    void warn(const String& sentence) const;

    Session& m_session;
    std::function<void(const String&)> m_warn;
    std::unordered_map<cookie, SourceFacts> m_facts;
    mutable std::optional<std::unordered_set<cookie>> m_listed; ///< once it was asked for
    mutable std::unordered_set<cookie> m_toldAway;              ///< of which a warning told
    size_t m_numRead = 0;
};
