#pragma once

#include "edit/model/cel.h"

#include <algorithm>
#include <cmath>
#include <vector>

/// What the operations on cels have in common: the rules for one event, finding a time, cutting a pair. The
/// array is that of a cel: pair k at 2k and 2k + 1, times in order.
namespace cel_detail {

using Events = EventArray::Events;

constexpr double kTolerance = Qx::kTimeTolerance;

/// False for what is not a number too.
[[nodiscard]] inline bool isUsableTime(double time) {
    return std::abs(time) <= cel::kGreatestTime;
}

[[nodiscard]] inline bool isKindOfCookie(uint32_t word) {
    constexpr uint32_t kinds = 1u << ('C' - 'A') | 1u << ('E' - 'A') | 1u << ('F' - 'A') | 1u << ('I' - 'A') |
                               1u << ('M' - 'A') | 1u << ('P' - 'A') | 1u << ('S' - 'A') | 1u << ('T' - 'A') |
                               1u << ('V' - 'A') | 1u << ('X' - 'A');
    return word - 'A' < 26 && (kinds >> (word - 'A') & 1u) != 0;
}

/// True if every field of an event is one that a cel may hold. Where it stands is another matter.
[[nodiscard]] inline bool isGoodEvent(const channel_event& event) {
    return isUsableTime(event.editTime) && std::abs(event.stripTime) <= cel::kGreatestStripTime &&
           std::abs(event.velocity) <= cel::kGreatestVelocity && std::isfinite(event.level) &&
           (event.kind == CE_IN_POINT || event.kind == CE_OUT_POINT) && event.id.valid() &&
           isKindOfCookie(event.strip.word(2)) && event.reserved == 0;
}

/// Strip time that a pair plays at an edit time.
[[nodiscard]] inline double stripAt(const channel_event& in, double time) {
    return std::clamp(in.stripTime + (time - in.editTime) * in.velocity, -cel::kGreatestStripTime,
                      cel::kGreatestStripTime);
}

/// Level of a pair at an edit time, linear between its ends and constant beyond them.
[[nodiscard]] inline float levelAt(const channel_event& in, const channel_event& out, double time) {
    if (time <= in.editTime || out.editTime <= in.editTime) {
        return in.level;
    }
    if (time >= out.editTime) {
        return out.level;
    }
    const double part = (time - in.editTime) / (out.editTime - in.editTime);
    const double from = double{in.level};
    return static_cast<float>(from + (double{out.level} - from) * part);
}

/// True if a time is not past a mark by more than the tolerance. It is the difference that is compared: that
/// of two times so close is exact, where a time with the tolerance added to it is rounded.
[[nodiscard]] inline bool isNotPast(double time, double mark) {
    return time - mark <= kTolerance;
}

/// False for what is too short, as well.
[[nodiscard]] inline bool isUsableRange(const cel::Range& range) {
    return isUsableTime(range.start()) && isUsableTime(range.end()) && !isNotPast(range.end(), range.start());
}

/// What a mark means in a cel: it lies inside pair number `pair`, beyond the tolerance from either end, or
/// before that pair and not before the end of the one ahead. `time` is the time of the cut that the mark
/// counts as one with, the nearest and of two the earlier, or else its own. This is decided here, once:
/// whatever is done with a mark is done with its `Cut`.
struct Cut {
    size_t pair = 0;
    bool inside = false;
    double time = 0;
};

[[nodiscard]] inline Cut cutAt(const EventArray& events, double time) {
    const size_t pair = events.numStartingUpTo(time);
    Cut cut{pair, false, time};
    double distance = kTolerance;
    bool found = false;
    const auto consider = [&](double at, size_t before) {
        const double far = std::abs(at - time);
        if (far < distance || (far == distance && !found)) {
            cut = {before, false, at};
            distance = far;
            found = true;
        }
    };
    if (pair > 0) {
        consider(events[2 * pair - 2].editTime, pair - 1);
        consider(events[2 * pair - 1].editTime, pair);
    }
    if (2 * pair < events.size()) {
        consider(events[2 * pair].editTime, pair);
    }
    if (!found && pair > 0 && events[2 * pair - 1].editTime > time) {
        return {pair - 1, true, time};
    }
    // Pairs of no length may begin there too.
    if (cut.pair > 0 && events[2 * cut.pair - 2].editTime == cut.time) {
        cut.pair = events.numStartingBefore(cut.time);
    }
    return cut;
}

/// A region of one cel, by its cuts.
struct Region {
    Cut from;
    Cut to;

    Region(const EventArray& events, double start, double end)
        : from(cutAt(events, start)), to(cutAt(events, end)) {}
    [[nodiscard]] double length() const { return to.time - from.time; }
    /// True if both marks mean one time.
    [[nodiscard]] bool empty() const { return isNotPast(to.time, from.time); }
    /// Number of pairs that reach into it.
    [[nodiscard]] size_t numPairs() const { return to.pair + (to.inside ? 1 : 0) - from.pair; }
    /// True if a pair reaches out of it on either side, so that cutting the region out leaves two pieces.
    [[nodiscard]] bool splitsOnePair() const { return from.inside && to.inside && from.pair == to.pair; }
};

/// Lays times, given in order, so that each lies at the one before it or beyond the tolerance from it, and at
/// the end of the span or beyond the tolerance from that: what the events of a cel keep to.
class TimeLayer {
public:
    explicit TimeLayer(double from = -Qx::kNoTime, double to = Qx::kNoTime) : m_last(from), m_end(to) {}
    double lay(double time) {
        if (isNotPast(m_end, time)) {
            m_last = m_end;
        } else if (!isNotPast(time, m_last)) {
            m_last = time;
        }
        return m_last;
    }

private:
    double m_last;
    double m_end;
};

/// Appends a pair whose ends have been laid, unless it had a length and has none any more.
inline void appendLaid(Events& events, const channel_event& in, const channel_event& out, bool hadLength) {
    if (!hadLength || in.editTime < out.editTime) {
        events.push_back(in);
        events.push_back(out);
    }
}

/// Puts `block` in the place of the events [first, last) and moves all that follow by `shift`. `joint` is
/// where what followed at once comes to lie: what comes to lie there but for rounding lies there exactly, and
/// what rounding brings too close is settled.
void spliceShifted(EventArray& events, size_t first, size_t last, std::span<const channel_event> block,
                   double shift, double joint);

/// The in point that the right piece of a pair cut at `time` gets, and the out point of the left one. They
/// keep the stamps of the pair's own and have no fade.
[[nodiscard]] inline channel_event cutIn(const channel_event& in, const channel_event& out, double time) {
    channel_event event = in;
    event.editTime = time;
    event.stripTime = stripAt(in, time);
    event.level = levelAt(in, out, time);
    event.rampQFrames = 0;
    event.rampCurve = 0;
    return event;
}

[[nodiscard]] inline channel_event cutOut(const channel_event& in, const channel_event& out, double time) {
    channel_event event = out;
    event.editTime = time;
    event.stripTime = stripAt(in, time);
    event.velocity = in.velocity;
    event.level = levelAt(in, out, time);
    event.rampQFrames = 0;
    event.rampCurve = 0;
    return event;
}

/// A pair of fresh stamps that plays `strip` at velocity 1.
struct FreshPair {
    channel_event in;
    channel_event out;
    FreshPair(const cookie& strip, double stripTime, double from, double to)
        : in(from, stripTime, strip, 1.0f, CE_IN_POINT, channel_event::newId(), 0),
          out(to, stripTime + (to - from), strip, 1.0f, CE_OUT_POINT, channel_event::newId(), 0) {}
};

/// Appends the part of `source` in a region, its times moved so that the region's start lies at `from` and
/// its end at `to`. Pieces keep the stamps of their pairs; one for which no room is left is left out.
void appendPart(Events& part, const EventArray& source, const Region& region, double from, double to);

/// Checks every event and the order of all; a time within the tolerance of the one ahead of it, after it or
/// before, becomes equal to it. One pass.
[[nodiscard]] bool checkAndSettle(Events& events);
/// True if every event is one that a cel may hold, in and out points are paired and in order, and each time
/// is that of the event ahead or beyond the tolerance from it.
[[nodiscard]] bool isGood(std::span<const channel_event> events);

/// Length of a fade in seconds at the current project's rate.
[[nodiscard]] double secondsOfFade(const channel_event& event);

} // namespace cel_detail
