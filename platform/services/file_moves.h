#pragma once

#include "platform/base/status.h"
#include "platform/services/files.h"

#include <vector>

namespace Qx {

/// A sequence of moves of files in one folder that happens whole or not at all, as far as the system lets it:
/// unless `finish` succeeded, what was moved is moved back.
///
///     FileMoves moves(folder);
///     if (auto status = moves.move(a, b); !status) return status;
///     if (auto status = moves.sync(); !status) return status;      // b is there before a is another file
///     if (auto status = moves.move(c, a); !status) return status;
///     return moves.finish();
///
/// Every move is one rename into a name that nothing has, so that a process which dies between any two leaves
/// each file under its old or its new name. A file system that does not keep the order of names may lose a
/// file when a name is taken before its former file is known to have left: `sync` between the two prevents
/// that. One object is used on one thread.
class QM_API FileMoves {
public:
    explicit FileMoves(String folder) : m_folder(std::move(folder)) {}
    /// Takes back what was not finished.
    ~FileMoves();
    FileMoves(const FileMoves&) = delete;
    FileMoves& operator=(const FileMoves&) = delete;

    /// Moves a file to a name that nothing has. On a failure, also when it cannot be told whether the name is
    /// free, nothing is moved.
    Status move(const String& from, const String& to);
    /// Notes a file that is removed when the moves are finished. Whether it could be is not reported.
    void removeWhenFinished(String path) { m_going.push_back(std::move(path)); }
    /// Makes the moves so far durable, before those that follow. Nothing is done if they are.
    Status sync();
    /// Makes the moves durable and keeps them. On a failure they are taken back.
    Status finish();
    /// Keeps the moves as they are, durable or not, and removes what was noted.
    void keep();
    /// Moves everything back, the last first. A file that is not where it was moved to stays where it is, as
    /// does one whose former name is taken. What cannot be moved back is logged. False if anything stays.
    bool takeBack();

private:
    struct Move {
        String from;
        String to;
    };

    [[nodiscard]] bool moveBack(const Move& move) const;

    String m_folder;
    std::vector<Move> m_moves;
    std::vector<String> m_going;
    bool m_synced = true;
};

} // namespace Qx
