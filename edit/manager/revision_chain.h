#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"
#include "platform/services/file_moves.h"

#include <vector>

/// The numbered revisions of one edit beside its file: undo backups ".U1" (newest) to ".UD" and redo backups
/// ".R1" to ".RD", where D is the depth.
///
/// The room moves and deletes whole files and knows nothing of edits in memory. Every step is one rename into
/// a name that nothing has, or one deletion, so that a crash between any two loses no revision: a hole that
/// it leaves is passed over. What one operation moved is moved back when it cannot be finished. The edit's
/// own name and backup 1 are exchanged only after the folder was synced, so that no order of names on the
/// disk leaves the edit without a file; within a rotation the order is left to the file system.
///
/// What is no regular file, and what the system cannot tell of, is not "no backup": the operation refuses.
/// A number that is there is looked for up to 64 numbers behind the last one found, so that a great depth
/// costs nothing. Holding the manager's lock, and keeping other processes away, is the caller's business.
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
    /// Tells whether any backup is there: in the depth, or right behind it where a deeper chain was kept
    /// before. Asks for names only, whatever the folder holds. A failure when that could not be told.
    Qx::Status exists(bool& found) const;
    /// The numbers that are there, newest first, also beyond the depth. Lists the folder, which takes the
    /// longer the more edits are in it: who asks for many chains of one folder lists it once and hands in its
    /// names, in order of their bytes.
    [[nodiscard]] std::vector<int> numbers() const;
    /// The same; fails, leaving `found`, when the folder cannot be listed.
    Qx::Status numbers(std::vector<int>& found) const;
    [[nodiscard]] std::vector<int> numbers(const std::vector<String>& names) const;
    /// The number of the newest backup in the depth, or of the newest behind `after`; 0 if there is none. A
    /// failure, and 0, when that could not be told, or something else than a file lies at the name of one.
    Qx::Status findNewest(int& number, int after = 0) const;

    /// Pushes the edit file: moves each k to k + 1, the oldest first, then the edit file to backup 1. The
    /// backup D of a full chain is deleted when the moves are finished; in `moves` it waits as the first free
    /// number beyond the depth.
    Qx::Status push(Qx::FileMoves& moves);
    Qx::Status push();
    /// Moves backup n to the edit file's name, which nothing has, and closes the gap: for k beyond n, backup
    /// k moves to k - n.
    Qx::Status pull(Qx::FileMoves& moves, int number);
    /// The same for the newest, durably. `restored` is its number, or 0 when there is none. A failure, with
    /// nothing changed, when that could not be told or it could not be moved, because there is an edit file
    /// for instance. A gap that cannot be closed stays.
    Qx::Status restoreNewest(int& restored);
    /// Moves every backup of the depth out of the chain, to temporary names that go when the moves are
    /// finished.
    Qx::Status park(Qx::FileMoves& moves) const;
    /// Closes the holes that an interrupted operation left, so that the backups are 1, 2, 3, ...
    Qx::Status closeHoles();
    /// Deletes backup `keep` + 1, `keep` + 2, ... up to the depth and stops at the first that is not there or
    /// cannot be deleted, which is a failure. The deletions are made durable.
    Qx::Status deleteTail(int keep);

private:
    Qx::Status findFrom(int first, std::vector<int>& numbers, size_t limit) const;
    Qx::Status shift(Qx::FileMoves& moves, const std::vector<int>& numbers, int by) const;
    Qx::Status rotate(Qx::FileMoves& moves) const;
    Qx::Status syncFolder() const;

    String m_file;
    Kind m_kind;
    int m_depth;
};

/// What checking a file tells.
enum class EditFileState {
    Sound,   ///< every checksum in it holds
    Damaged, ///< it was read and is no whole edit file
    Refused  ///< it may be sound, but is not there, cannot be read here or was written by a later version
};
/// Reads an edit file, or a numbered revision of one, whole and checks it. `why` says what is wrong with one
/// that is not sound.
QM_API EditFileState examineEditFile(const String& path, String& why);

/// A name beside an edit file for one that does not read and is set aside, ".CORRUPT", else ".CORRUPT.1",
/// ".CORRUPT.2", ...: the first that nothing has.
QM_API Qx::Status findCorruptName(const String& file, String& name);

/// The undo chain's extension for a number, such as "U1", and the redo chain's. A negative number gives the
/// pattern for all.
[[nodiscard]] QM_API String getUndoExtension(int number);
[[nodiscard]] QM_API String getRedoExtension(int number);
