#include "edit/model/detail/event_search.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

namespace {

/// So many pairs are asked one by one rather than in the order of their distance.
constexpr std::ptrdiff_t kFewPairs = 64;

bool isAt(const cel& content, const IdStamp& id, int index) {
    const channel_event* event = content.getChanEventPtr(index);
    return event != nullptr && event->id == id;
}

double distance(const cel& content, int in, double time) {
    const channel_event* const out = content.getChanEventPtr(in + 1);
    const double from = content.getChanEventPtr(in)->editTime;
    return std::max({from - time, time - (out != nullptr ? out->editTime : from), 0.0});
}

} // namespace

int EventSearch::walk(const cel& content, const IdStamp& id, int hint, int& walked) {
    const int end = content.numEvents();
    // A hint past the end walks down into the events from the first place that is none.
    const int from = hint < end ? hint : (end & ~1) + hint % 2;
    for (int up = from + 2, down = from - 2; up < end || down >= 0; up += 2, down -= 2) {
        walked += 2;
        if (isAt(content, id, down)) {
            return down;
        }
        if (isAt(content, id, up)) {
            return up;
        }
    }
    return -1;
}

int EventSearch::inIndex(const cel& content, Known& known, const IdStamp& id, int hint) {
    if (known.stamps.empty()) {
        known.stamps.reserve(static_cast<size_t>(content.numEvents()));
        for (int i = 0; i < content.numEvents(); ++i) {
            known.stamps.emplace_back(content.getChanEventPtr(i)->id, i);
        }
        std::sort(known.stamps.begin(), known.stamps.end());
    }
    int found = -1;
    for (auto at = std::lower_bound(known.stamps.begin(), known.stamps.end(), std::pair(id, -1));
         at != known.stamps.end() && at->first == id; ++at) {
        const int index = at->second;
        if (index % 2 == hint % 2 && (found < 0 || std::abs(index - hint) < std::abs(found - hint))) {
            found = index;
        }
    }
    return found;
}

int EventSearch::nearest(const cel& content, const IdStamp& id, int hint) {
    const bool isIn = hint % 2 == 0; // an out point moves with its in point, or was cut off
    if (isAt(content, id, hint)) {
        m_shift = isIn ? 0 : m_shift;
        return hint;
    }
    if (m_shift % 2 == 0 && isAt(content, id, hint + m_shift)) {
        return hint + m_shift;
    }
    Known& known = m_known[&content];
    const int found = known.walked < content.numEvents() ? walk(content, id, hint, known.walked)
                                                         : inIndex(content, known, id, hint);
    if (found >= 0 && isIn) {
        m_shift = found - hint;
    }
    return found;
}

/// In the order of their distance, so that the first that fits on either side will do.
int EventSearch::walkPairs(const cel& content, double time, const std::function<bool(int)>& fits) {
    const int start = std::max(content.find_ceh(time, CE_IN_POINT).index(), 0) & ~1;
    int before = start;
    while (before >= 0 && !fits(before)) {
        before -= 2;
    }
    const double reach = before >= 0 ? distance(content, before, time) : 0;
    for (int after = start + 2; after < content.numEvents(); after += 2) {
        const double away = distance(content, after, time);
        if (before >= 0 && away >= reach) {
            break;
        }
        if (fits(after)) {
            return after;
        }
    }
    return before;
}

int EventSearch::nearestPair(const cel& content, double time, double offset,
                             const std::function<bool(int)>& fits) {
    Known& known = m_known[&content];
    if (known.walked < content.numEvents()) {
        known.walked += content.numEvents();
        return walkPairs(content, time, fits);
    }
    if (known.offsets.empty()) {
        known.offsets.reserve(static_cast<size_t>(content.numPairs()));
        for (int in = 0; in < content.numEvents(); in += 2) {
            const channel_event& event = *content.getChanEventPtr(in);
            known.offsets.emplace_back(event.editTime - event.stripTime, in);
        }
        std::sort(known.offsets.begin(), known.offsets.end());
    }
    const double within = 2 * Qx::kTimeTolerance;
    const auto from =
        std::lower_bound(known.offsets.begin(), known.offsets.end(), std::pair(offset - within, -1));
    const auto to = std::lower_bound(from, known.offsets.end(), std::pair(offset + within, -1));
    if (to - from > kFewPairs) {
        return walkPairs(content, time, fits);
    }
    int found = -1;
    for (auto at = from; at != to; ++at) {
        if (fits(at->second) &&
            (found < 0 || distance(content, at->second, time) < distance(content, found, time) ||
             (distance(content, at->second, time) == distance(content, found, time) && at->second < found))) {
            found = at->second;
        }
    }
    return found;
}
