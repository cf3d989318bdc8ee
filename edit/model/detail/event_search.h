#pragma once

#include "edit/model/cel.h"

/// Finds an event again whose index shifted.
namespace EventSearch {

/// The index of the event with a stamp that is nearest to `hint` among those of the same end of a pair (an in
/// point has an even index); -1 if there is none. `shift` is where else to look first.
[[nodiscard]] inline int nearest(const cel& its, const IdStamp& id, int hint, int shift) {
    const auto isAt = [&](int index) {
        const channel_event* event = its.getChanEventPtr(index);
        return event != nullptr && event->id == id;
    };
    if (isAt(hint)) {
        return hint;
    }
    if (shift % 2 == 0 && isAt(hint + shift)) {
        return hint + shift;
    }
    const int end = its.numEvents();
    // A hint past the end walks down into the events from the first place that is none.
    const int from = hint < end ? hint : (end & ~1) + hint % 2;
    for (int up = from + 2, down = from - 2; up < end || down >= 0; up += 2, down -= 2) {
        if (isAt(down)) {
            return down;
        }
        if (isAt(up)) {
            return up;
        }
    }
    return -1;
}

} // namespace EventSearch
