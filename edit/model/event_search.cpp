#include "edit/model/detail/event_search.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

namespace {

/// So many pairs are asked one by one rather than in the order of their distance.
constexpr std::ptrdiff_t kFewPairs = 64;

bool isAt(const cel& its, const IdStamp& id, int index) {
    const channel_event* event = its.getChanEventPtr(index);
    return event != nullptr && event->id == id;
}

double distance(const cel& its, int in, double time) {
    const channel_event* const out = its.getChanEventPtr(in + 1);
    const double from = its.getChanEventPtr(in)->editTime;
    return std::max({from - time, time - (out != nullptr ? out->editTime : from), 0.0});
}

} // namespace

int EventSearch::walk(const cel& its, const IdStamp& id, int hint, int& walked) {
    const int end = its.numEvents();
    // A hint past the end walks down into the events from the first place that is none.
    const int from = hint < end ? hint : (end & ~1) + hint % 2;
    for (int up = from + 2, down = from - 2; up < end || down >= 0; up += 2, down -= 2) {
        walked += 2;
        if (isAt(its, id, down)) {
            return down;
        }
        if (isAt(its, id, up)) {
            return up;
        }
    }
    return -1;
}

int EventSearch::inIndex(const cel& its, Known& known, const IdStamp& id, int hint) {
    if (known.stamps.empty()) {
        known.stamps.reserve(static_cast<size_t>(its.numEvents()));
        for (int i = 0; i < its.numEvents(); ++i) {
            known.stamps.emplace_back(its.getChanEventPtr(i)->id, i);
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

int EventSearch::nearest(const cel& its, const IdStamp& id, int hint) {
    const bool isIn = hint % 2 == 0; // an out point moves with its in point, or was cut off
    if (isAt(its, id, hint)) {
        m_shift = isIn ? 0 : m_shift;
        return hint;
    }
    if (m_shift % 2 == 0 && isAt(its, id, hint + m_shift)) {
        return hint + m_shift;
    }
    Known& known = m_known[&its];
    const int found =
        known.walked < its.numEvents() ? walk(its, id, hint, known.walked) : inIndex(its, known, id, hint);
    if (found >= 0 && isIn) {
        m_shift = found - hint;
    }
    return found;
}

/// In the order of their distance, so that the first that fits on either side will do.
int EventSearch::walkPairs(const cel& its, double time, const std::function<bool(int)>& fits) {
    const int start = std::max(its.find_ceh(time, CE_IN_POINT).index(), 0) & ~1;
    int before = start;
    while (before >= 0 && !fits(before)) {
        before -= 2;
    }
    const double reach = before >= 0 ? distance(its, before, time) : 0;
    for (int after = start + 2; after < its.numEvents(); after += 2) {
        const double away = distance(its, after, time);
        if (before >= 0 && away >= reach) {
            break;
        }
        if (fits(after)) {
            return after;
        }
    }
    return before;
}

int EventSearch::nearestPair(const cel& its, double time, double offset,
                             const std::function<bool(int)>& fits) {
    Known& known = m_known[&its];
    if (known.walked < its.numEvents()) {
        known.walked += its.numEvents();
        return walkPairs(its, time, fits);
    }
    if (known.offsets.empty()) {
        known.offsets.reserve(static_cast<size_t>(its.numPairs()));
        for (int in = 0; in < its.numEvents(); in += 2) {
            const channel_event& event = *its.getChanEventPtr(in);
            known.offsets.emplace_back(event.editTime - event.stripTime, in);
        }
        std::sort(known.offsets.begin(), known.offsets.end());
    }
    const double within = 2 * Qx::kTimeTolerance;
    const auto from =
        std::lower_bound(known.offsets.begin(), known.offsets.end(), std::pair(offset - within, -1));
    const auto to = std::lower_bound(from, known.offsets.end(), std::pair(offset + within, -1));
    if (to - from > kFewPairs) {
        return walkPairs(its, time, fits);
    }
    int found = -1;
    for (auto at = from; at != to; ++at) {
        if (fits(at->second) &&
            (found < 0 || distance(its, at->second, time) < distance(its, found, time) ||
             (distance(its, at->second, time) == distance(its, found, time) && at->second < found))) {
            found = at->second;
        }
    }
    return found;
}
