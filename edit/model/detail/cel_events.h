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

/// Where a time falls: inside pair number `pair`, beyond the tolerance from either end, or before it and
/// after the one before. `time` is the time of the edge that it counts as one with, if there is such.
struct Cut {
    size_t pair = 0;
    bool inside = false;
    double time = 0;
};

[[nodiscard]] inline Cut cutAt(const EventArray& events, double time) {
    const size_t pair = events.numStartingBefore(time - kTolerance);
    const double before = pair > 0 ? events[2 * pair - 1].editTime : -Qx::kNoTime;
    if (before > time + kTolerance) {
        return {pair - 1, true, time};
    }
    if (2 * pair < events.size() && events[2 * pair].editTime <= time + kTolerance) {
        return {pair, false, events[2 * pair].editTime};
    }
    return {pair, false, before >= time - kTolerance ? before : time};
}

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

/// Appends the part of `source` between two cuts, its times moved so that the first cut lies at `from` and
/// the second at `to`. Pieces keep the stamps of their pairs.
void appendPart(Events& part, const EventArray& source, const Cut& first, const Cut& last, double from,
                double to);

/// Checks every event and the order of all; a time that lies before the one ahead of it by no more than the
/// tolerance becomes equal to it. One pass.
[[nodiscard]] bool checkAndSettle(Events& events);
[[nodiscard]] bool isGood(std::span<const channel_event> events);

/// Length of a fade in seconds at the current project's rate.
[[nodiscard]] double secondsOfFade(const channel_event& event);

} // namespace cel_detail
