#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"
#include "platform/services/files.h"

#include <vector>

/// The numbered revisions of one edit beside its file: undo backups ".U1" (newest) to ".UD" and redo backups
/// ".R1" to ".RD", where D is the depth.
///
/// The room moves and deletes whole files and knows nothing of edits in memory. Every step is one rename or
/// one deletion, in an order in which a crash between any two loses no revision: a name is vacated before
/// another file takes it, and a hole that a crash leaves is passed over and closed by what comes next.
/// Holding the manager's lock, and keeping other processes away, is the caller's business.
class QM_API RevisionChain {
public:
    enum Kind { Undo, Redo };

    /// The chain of an item's file in the current project. The depth is at least 1.
    RevisionChain(const cookie& item, Kind kind, int depth);
    /// The chain beside a file of any place; `file` is the edit file's path.
    RevisionChain(const String& file, Kind kind, int depth);

    /// The text after an edit file's name for backup `number`, without its dot: "U3", "R1"; a negative number
    /// gives the pattern "U*", "R*".
    [[nodiscard]] static String extension(Kind kind, int number);
    /// The path of backup `number`.
    [[nodiscard]] String path(int number) const;
    /// The edit file that the chain belongs to.
    [[nodiscard]] const String& file() const { return m_file; }
    [[nodiscard]] int depth() const { return m_depth; }

    /// What lies at the name of backup `number`.
    [[nodiscard]] Qx::FileAnswer ask(int number) const;
    /// Tells whether any backup is there, in the depth or beyond it. The folder is listed only when the depth
    /// holds none. A failure when that could not be told.
    Qx::Status exists(bool& found) const;
    /// The numbers that are there, newest first. Lists the folder, which takes the longer the more edits are
    /// in it: who asks for many chains of one folder lists it once and hands in its names, in order of their
    /// bytes.
    [[nodiscard]] std::vector<int> numbers() const;
    [[nodiscard]] std::vector<int> numbers(const std::vector<String>& names) const;
    /// The names in the chain's folder, in order of their bytes; none when it cannot be listed.
    [[nodiscard]] std::vector<String> namesInFolder() const;
    /// The number of the newest backup in the depth; 0 if there is none. A failure, and 0, when that could
    /// not be told, or something else than a file lies at the name of one.
    Qx::Status findNewest(int& number) const;

    /// Makes room for a backup 1: moves each k to k + 1, from the oldest down, after deleting the oldest of a
    /// full chain. What lies behind a hole in the chain stays where it is: the hole takes up the move, and
    /// nothing is deleted while there is one. With depth 1 nothing is done, as the edit file replaces backup
    /// 1. On a failure the moves made so far stay: every revision is still there, some one place further on.
    /// A name of which nobody can tell whether it is vacant is a failure, with nothing moved.
    Qx::Status rotate();
    /// Rotates, then moves the edit file to backup 1.
    Qx::Status push();
    /// Moves the newest backup that is there over the edit file's name and closes the gap: for k beyond it,
    /// backup k moves to k - n. `restored` is its number n, or 0 when there is none. A failure when it could
    /// not be told which is the newest or that could not be moved, with nothing changed.
    Qx::Status restoreNewest(int& restored);
    /// Deletes the backups from `keep` + 1 to the depth, the oldest first, so that what a crash leaves is a
    /// chain still; stops at the first that cannot be deleted or asked about. True if none is left there.
    bool deleteTail(int keep);
    /// Makes the names durable. The moves above are not, each by itself: whoever makes them calls this last.
    Qx::Status makeDurable() const;

private:
    [[nodiscard]] Qx::Status move(int from, int to) const;
    /// The first number from `from` on at whose name a file is (with `there`) or none is, else depth + 1.
    Qx::Status findFirst(bool there, int from, int& number) const;

    String m_file;
    Kind m_kind;
    int m_depth;
};

/// The undo chain's extension for a number, such as "U1", and the redo chain's. A negative number gives the
/// pattern for all.
[[nodiscard]] QM_API String getUndoExtension(int number);
[[nodiscard]] QM_API String getRedoExtension(int number);
