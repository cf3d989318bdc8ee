#pragma once

#include "edit/model/edit.h"
#include "platform/base/status.h"
#include "tools/qmedit/edit_report.h"

#include <unordered_map>
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
/// made or changed on the disk but by `create`.
class ProjectSession {
public:
    /// The folder that a command works on, from the text of its --project option.
    explicit ProjectSession(const String& option);

    [[nodiscard]] const String& root() const { return m_root; }
    /// The folder with the edit files.
    [[nodiscard]] String folder() const;
    /// True if the project is there.
    [[nodiscard]] bool exists() const;

    /// Opens the project that is there. Settings that cannot be read draw a warning and the usual ones are
    /// taken, so that the edits can be looked at. A failure says that there is no project and what makes one.
    Qx::Status openExisting();
    /// Makes a project current so that edits can be prepared for it: the one that is there, else one of the
    /// given rate (25 for an invalid one) of which nothing is on the disk yet.
    Qx::Status prepare(Qx::FrameRate rateOfFresh);
    /// After `prepare`: makes what is missing on the disk.
    Qx::Status create();

    /// Reads an edit. A failure names the file and says what to do.
    Qx::Status readEdit(const cookie& item, EditPtr& edit) const;
    /// What there is to say of every edit file, in order of their cookies. `others` gets the names of files
    /// with the edits' extension that are no cookie's. Fails only when the folder cannot be read.
    Qx::Status list(std::vector<ListedEdit>& edits, std::vector<String>& others) const;
    /// Looks names up in the project's files, each file read once a session.
    [[nodiscard]] SourceNamer sourceNamer();

private:
    /// What the file of a source says of it.
    struct Known {
        String name;
        String problem;
        bool dropFrame = false;
    };

    void makeCurrentUnwritten(Qx::FrameRate rate) const;
    [[nodiscard]] ListedEdit listed(const cookie& item) const;
    [[nodiscard]] Known look(const cookie& item) const;

    String m_root;
    cookie m_project;
    Qx::FrameRate m_rateOfFresh;
    std::unordered_map<cookie, Known> m_known;
};
