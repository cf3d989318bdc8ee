#pragma once

#include "edit/model/cel.h"

#include <functional>
#include <map>
#include <utility>
#include <vector>

/// Finds events again whose indices shifted, for many cues at a time, while the cels do not change.
///
/// It looks first where an event was, then where it would be if it moved as the one found before it did. What
/// is not there is looked for by walking, and once the walks over a cel came to its length, in an index of
/// it. So one search costs a walk, n of them no more than n log n. Holds pointers to the cels; owns none.
class EventSearch {
public:
    /// The index of the event with a stamp that is nearest to `hint` among those of the same end of a pair
    /// (an in point has an even index); -1 if there is none.
    [[nodiscard]] int nearest(const cel& content, const IdStamp& id, int hint);

    /// The in point, nearest to a time, of a pair for which `fits(in)` is true; -1 if there is none. Only
    /// pairs are asked whose edit time is by `offset`, within twice the tolerance, later than their strip
    /// time.
    [[nodiscard]] int nearestPair(const cel& content, double time, double offset,
                                  const std::function<bool(int)>& fits);

    /// Where to begin to look for the piece, of what was pair `in`, that plays a moment: behind the pair, or
    /// at the piece that was noted for a moment before.
    [[nodiscard]] int firstPiece(const cel& content, int in, double moment) const {
        return m_cel == &content && m_in == in && moment >= m_moment ? m_piece : in + 2;
    }
    void notePiece(const cel& content, int in, double moment, int piece) {
        m_cel = &content;
        m_in = in;
        m_moment = moment;
        m_piece = piece;
    }

private:
    /// What was learned of one cel.
    struct Known {
        int walked = 0; ///< events
        std::vector<std::pair<IdStamp, int>> stamps;
        std::vector<std::pair<double, int>> offsets; ///< of pairs
    };
    [[nodiscard]] static int walk(const cel& content, const IdStamp& id, int hint, int& walked);
    [[nodiscard]] static int walkPairs(const cel& content, double time, const std::function<bool(int)>& fits);
    [[nodiscard]] static int inIndex(const cel& content, Known& known, const IdStamp& id, int hint);

    std::map<const cel*, Known> m_known;
    int m_shift = 0;
    const cel* m_cel = nullptr;
    int m_in = -1;
    double m_moment = 0;
    int m_piece = -1;
};
