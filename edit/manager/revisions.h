#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/services/files.h"

#include <vector>

class EditModification;
class configb;

/// One file that holds a state of an edit: its own, a backup, a milestone, or one that was set aside.
struct Revision {
    enum Kind { Itself, Undo, Redo, Milestone, Corrupt };

    Kind kind = Itself;
    String which; ///< as people name it: "edit", "U1", "R1", "M3", "CORRUPT", "CORRUPT.2"
    String path;
    String name;       ///< the edit's, any bytes
    int64_t time = 0;  ///< of the last change, seconds since 1970: the edit's own where it can be read
    Qx::FileInfo file; ///< what lay at `path` when it was checked; of kind Unknown where that is not known
    int64_t modifications = 0;
    String change; ///< what the last change was, of another state than the edit's own the one that made it;
                   ///< empty where that is not told
    String damage; ///< why it cannot be taken; empty for a sound one
    bool refused =
        false; ///< `damage` may not be the file's: it cannot be read here, or is of a later version

    [[nodiscard]] bool isSound() const { return damage.empty(); }
};

/// The states of one edit.
struct QM_API RevisionList {
    /// Those that redo brings back, the furthest first, the edit itself (unless its file is missing), its
    /// undo backups, then the milestones and the files set aside, each newest first.
    std::vector<Revision> revisions;
    /// A sentence for each thing that the system could not tell: there may be more states than these.
    std::vector<String> unanswered;

    /// The edit itself; null when its file is missing.
    [[nodiscard]] const Revision* itself() const;
    /// The state that a recovery takes by itself: of the sound undo backups, milestones and files set aside
    /// the one that was changed last, of those that redo brings back only when there is no other. Null when
    /// none is sound.
    [[nodiscard]] const Revision* newestSound() const;
};

/// Looks for every state of an item of the current project that is on the disk. Each file is checked whole
/// and opened by nobody; nothing is changed. Who wants the list to stay true holds the writers' lock
/// (`EditManagerLock`).
[[nodiscard]] QM_API RevisionList revisionsOf(const cookie& item);

/// The change that made the state of an edit, by its header: its description, but where an undo or redo led
/// back to the state the one that made it first. Of type `kNotDescribed` where that is not told.
[[nodiscard]] QM_API EditModification ownChangeOf(const configb& header);

/// What `Revision::change` says of a description: a word such as "insert"; empty for none.
[[nodiscard]] QM_API String changeText(const EditModification& change);
