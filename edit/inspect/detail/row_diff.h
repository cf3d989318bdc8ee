#pragma once

#include "edit/inspect/moved_run.h"
#include "platform/base/num_range.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <unordered_map>
#include <vector>

enum class WhichRow { Was, Now };

/// What differs between two rows in order of time.
template <class Element>
struct RowDiff {
    std::vector<Element> removed; ///< only the first has them, at any time
    std::vector<Element> added;   ///< only the second
    std::vector<MovedRun<Element>> moved;
};

/// Compares two rows. `Rules` says, of elements by their places in the first and the second row:
///
///     begin(e), end(e)    the times of an element, in seconds
///     same(i, j)          alike and at the same time
///     alike(i, j)         alike but for the time
///     hash(row, i)        of what alike ones have in common; `row` says which row i is a place in
///     isAnchor(row, i)    false for what is too common to be known by itself, such as black
///
/// What is in its place in both is passed over. Of the rest, each that occurs once in either row is known by
/// that and brings its neighbours along, forwards and backwards, as long as they are alike and as far away;
/// then those that occur as often in one row as in the other, in their order. So a row of n elements is
/// compared in about n steps, however far its parts have moved.
template <class Element, class Rules>
class RowComparison {
public:
    RowComparison(const std::vector<Element>& was, const std::vector<Element>& now, const Rules& rules)
        : m_was(was), m_now(now), m_rules(rules) {}

    RowDiff<Element> compare() {
        passOverSame();
        m_matchOf.assign(m_left.size(), kNone);
        m_taken.assign(m_came.size(), false);
        match();
        return difference();
    }

private:
    static constexpr size_t kNone = SIZE_MAX;
    /// The places in `m_left` and `m_came` of what has one hash.
    struct Places {
        std::vector<size_t> left;
        std::vector<size_t> came;
    };

    /// Leaves in `m_left` and `m_came` what only one row has in its place.
    void passOverSame() {
        size_t i = 0;
        size_t j = 0;
        while (i < m_was.size() || j < m_now.size()) {
            const bool both = i < m_was.size() && j < m_now.size();
            if (both && m_rules.same(i, j)) {
                ++i;
                ++j;
            } else if (j == m_now.size() ||
                       (both && m_rules.begin(m_was[i]) <= m_rules.begin(m_now[j]) + Qx::kTimeTolerance)) {
                m_left.push_back(i++);
            } else {
                m_came.push_back(j++);
            }
        }
    }

    void match() {
        std::unordered_map<size_t, Places> places;
        for (size_t i = 0; i < m_left.size(); ++i) {
            if (m_rules.isAnchor(WhichRow::Was, m_left[i])) {
                places[m_rules.hash(WhichRow::Was, m_left[i])].left.push_back(i);
            }
        }
        for (size_t j = 0; j < m_came.size(); ++j) {
            if (m_rules.isAnchor(WhichRow::Now, m_came[j])) {
                places[m_rules.hash(WhichRow::Now, m_came[j])].came.push_back(j);
            }
        }
        for (const bool isUnique : {true, false}) {
            for (size_t i = 0; i < m_left.size(); ++i) {
                if (m_matchOf[i] != kNone || !m_rules.isAnchor(WhichRow::Was, m_left[i])) {
                    continue;
                }
                const Places& found = places[m_rules.hash(WhichRow::Was, m_left[i])];
                if (found.left.size() != found.came.size() || (found.left.size() == 1) != isUnique) {
                    continue;
                }
                const auto place = std::lower_bound(found.left.begin(), found.left.end(), i);
                extendFrom(i, found.came[static_cast<size_t>(place - found.left.begin())]);
            }
        }
    }

    [[nodiscard]] double distance(size_t i, size_t j) const {
        return m_rules.begin(m_now[m_came[j]]) - m_rules.begin(m_was[m_left[i]]);
    }

    [[nodiscard]] bool canMatch(size_t i, size_t j, double by) const {
        return m_matchOf[i] == kNone && !m_taken[j] && m_rules.alike(m_left[i], m_came[j]) &&
               std::abs(distance(i, j) - by) <= kNear;
    }

    void extendFrom(size_t i, size_t j) {
        const double by = distance(i, j);
        for (size_t k = 0; i + k < m_left.size() && j + k < m_came.size() && canMatch(i + k, j + k, by);
             ++k) {
            m_matchOf[i + k] = j + k;
            m_taken[j + k] = true;
        }
        if (m_matchOf[i] != j) {
            return;
        }
        for (size_t k = 1; k <= i && k <= j && canMatch(i - k, j - k, by); ++k) {
            m_matchOf[i - k] = j - k;
            m_taken[j - k] = true;
        }
    }

    [[nodiscard]] RowDiff<Element> difference() const {
        RowDiff<Element> diff;
        for (size_t i = 0; i < m_left.size();) {
            const size_t j = m_matchOf[i];
            if (j == kNone) {
                diff.removed.push_back(m_was[m_left[i++]]);
                continue;
            }
            const double by = distance(i, j);
            size_t count = 1;
            while (i + count < m_left.size() && m_matchOf[i + count] == j + count &&
                   std::abs(distance(i + count, j + count) - by) <= kNear) {
                ++count;
            }
            const size_t last = i + count - 1;
            const bool isRest = m_left[last] + 1 == m_was.size() && m_came[j + count - 1] + 1 == m_now.size();
            // Two at one time that change places have not moved.
            if (std::abs(by) > kNear) {
                diff.moved.push_back({m_was[m_left[i]], count, m_rules.begin(m_was[m_left[i]]),
                                      m_rules.end(m_was[m_left[last]]), by, isRest});
            }
            i += count;
        }
        for (size_t j = 0; j < m_came.size(); ++j) {
            if (!m_taken[j]) {
                diff.added.push_back(m_now[m_came[j]]);
            }
        }
        return diff;
    }

    static constexpr double kNear = 1e-5; ///< seconds
    const std::vector<Element>& m_was;
    const std::vector<Element>& m_now;
    const Rules& m_rules;
    std::vector<size_t> m_left;    ///< places in `m_was`
    std::vector<size_t> m_came;    ///< places in `m_now`
    std::vector<size_t> m_matchOf; ///< of each of `m_left`, the place in `m_came`
    std::vector<bool> m_taken;     ///< those of `m_came` that are matched
};

template <class Element, class Rules>
RowDiff<Element> rowDiffOf(const std::vector<Element>& was, const std::vector<Element>& now,
                           const Rules& rules) {
    return RowComparison<Element, Rules>(was, now, rules).compare();
}

/// A hash of one more value on top of those before.
inline size_t mixedHash(size_t hash, size_t value) {
    return (hash ^ value) * 0x9E3779B97F4A7C15U + (hash >> 29U);
}

/// A time for a hash: alike for times that differ by the noise of arithmetic.
inline size_t timeHash(double seconds) {
    return static_cast<size_t>(std::llround(seconds * 1000));
}
