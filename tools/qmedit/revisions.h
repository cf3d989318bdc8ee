#pragma once

#include "platform/base/cookie.h"
#include "platform/base/qx_string.h"

#include <vector>

class Console;
class EditModification;

/// The end of the name that a recovery copies to, beside the edit.
inline constexpr const char* kRecoveryCopy = ".RECOVERY";

/// One file that holds a state of an edit: its own, a backup, a milestone, or one that was set aside.
struct Revision {
    enum Kind { Itself, Undo, Redo, Milestone, Corrupt };

    Kind kind = Itself;
    String which; ///< as people name it: "edit", "U1", "R1", "M3", "CORRUPT", "CORRUPT.2"
    String path;
    String name;      ///< the edit's, any bytes
    int64_t time = 0; ///< of the last change, seconds since 1970: the edit's own where it can be read
    uint64_t size = 0;
    int64_t modifications = 0;
    String change;        ///< what the last change was; empty where that is not told
    String damage;        ///< why it cannot be taken; empty for a sound one
    bool refused = false; ///< `damage` is not the file's: it may not be read, or is of a later version

    [[nodiscard]] bool isSound() const { return damage.empty(); }
};

/// Every state of an item that is on the disk, each file checked whole and opened by nobody: those that redo
/// brings back, the furthest first, the edit itself (unless its file is missing), its undo backups, then the
/// milestones and the files set aside, each newest first. Needs an edit manager.
[[nodiscard]] std::vector<Revision> revisionsOf(const cookie& item);

/// The state of an edit that a recovery takes by itself: of the sound undo backups, milestones and files set
/// aside the one that was changed last, of those that redo brings back only when there is no other. Null when
/// none is sound.
[[nodiscard]] const Revision* newestSound(const std::vector<Revision>& revisions);

/// What `Revision::change` says of a description: a word such as "insert"; empty for none.
[[nodiscard]] String changeText(const EditModification& change);

/// The states as a table, a line each, as `qmedit history` shows them.
[[nodiscard]] String revisionTable(const std::vector<Revision>& revisions, const Console& console);

/// "2026-11-21 13:04" of local time; "-" for a time that has no date.
[[nodiscard]] String localTimeText(int64_t seconds);
