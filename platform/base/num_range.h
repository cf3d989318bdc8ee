#pragma once

#include <algorithm>
#include <type_traits>
#include <utility>

/// Range policies. An ordered range keeps its start at or before its end.
struct Ordered {};
struct Unordered {};

/// A span between two numbers. With the `Ordered` policy the ends are put in order on construction.
template <typename T, typename Policy = Ordered>
class NumRange {
public:
    constexpr NumRange() = default;
    constexpr NumRange(T a, T b) : m_start(a), m_end(b) {
        if constexpr (std::is_same_v<Policy, Ordered>) {
            if (m_end < m_start) {
                std::swap(m_start, m_end);
            }
        }
    }

    [[nodiscard]] constexpr T start() const { return m_start; }
    [[nodiscard]] constexpr T end() const { return m_end; }
    [[nodiscard]] constexpr T length() const { return m_end - m_start; }
    [[nodiscard]] constexpr bool empty() const { return !(m_start < m_end); }
    constexpr bool operator==(const NumRange&) const = default;

    /// Grows the range so that it holds `other` too.
    constexpr void widen(const NumRange& other) {
        m_start = std::min(m_start, other.m_start);
        m_end = std::max(m_end, other.m_end);
    }

private:
    T m_start{};
    T m_end{};
};

namespace Qx {

/// Two times closer than this, in seconds, count as one.
inline constexpr double kTimeTolerance = 1e-6;
/// A time or mark that is not set.
inline constexpr double kNoTime = 1e99;
/// Asks a strip-time accessor for the strip time at the event itself.
inline constexpr double kStripTimeAtEvent = 2e81;
/// "No time" in the accessors of an event pair.
inline constexpr double kNoPairTime = -1.0;

/// True if `t` lies in the half-open region: the start belongs to it, the end does not, both with the
/// tolerance of `kTimeTolerance`.
[[nodiscard]] constexpr bool timeIsConsideredToBeInRegion(double t, const NumRange<double, Ordered>& region) {
    return region.start() - t <= kTimeTolerance && region.end() - t > kTimeTolerance;
}

} // namespace Qx
