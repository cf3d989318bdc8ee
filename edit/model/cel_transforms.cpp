#include "edit/model/cel.h"

#include "edit/model/detail/cel_events.h"
#include "platform/media/frame_rate.h"

using namespace cel_detail;

namespace {

double onGrid(double time, double quantum) {
    return quantum > 0 ? std::round(time / quantum) * quantum : Qx::frameRound(time);
}

/// Rounds the edit times in place; pairs that become nothing go, unless they were nothing before.
void quantiseEvents(Events& events, double quantum) {
    size_t kept = 0;
    for (size_t i = 0; i + 1 < events.size(); i += 2) {
        channel_event in = events[i];
        channel_event out = events[i + 1];
        const bool hadLength = out.editTime - in.editTime > kTolerance;
        const double from = onGrid(in.editTime, quantum);
        const double to = onGrid(out.editTime, quantum);
        if (hadLength && to - from <= kTolerance) {
            continue;
        }
        const double start = stripAt(in, from);
        const double end = stripAt(in, to);
        if (from != in.editTime) {
            in.stripTime = start;
        }
        if (to != out.editTime) {
            out.stripTime = end;
        }
        in.editTime = from;
        out.editTime = to;
        events[kept++] = in;
        events[kept++] = out;
    }
    events.resize(kept);
}

/// Exchanges the ends of a pair in time; each stamp and kind stays with its end.
void turnRound(channel_event& in, channel_event& out) {
    std::swap(in, out);
    std::swap(in.id, out.id);
    in.kind = CE_IN_POINT;
    out.kind = CE_OUT_POINT;
}

/// The mapping of `rescale`.
struct Mapping {
    double editIn;
    double editOut;
    double stripIn;
    double velocity;
    double levelIn;
    double levelOut;

    void apply(channel_event& event) const {
        const double time = editIn + (event.editTime - stripIn) / velocity;
        event.editTime = std::clamp(time, editIn, editOut);
        event.velocity *= velocity;
        scaleLevel(event);
    }
    void scaleLevel(channel_event& event) const {
        const double part = (event.editTime - editIn) / (editOut - editIn);
        event.level = static_cast<float>(double{event.level} * (levelIn + (levelOut - levelIn) * part));
    }
};

/// A freeze: the pair that plays at one moment, all over the span.
void freeze(Events& to, const EventArray& from, const Mapping& map) {
    const Cut cut = cutAt(from, map.stripIn);
    const size_t first = 2 * cut.pair;
    if (first >= from.size() || from[first].editTime > map.stripIn + kTolerance) {
        return;
    }
    channel_event in = cutIn(from[first], from[first + 1], map.stripIn);
    channel_event out = cutOut(from[first], from[first + 1], map.stripIn);
    in.editTime = map.editIn;
    out.editTime = map.editOut;
    in.velocity = out.velocity = 0;
    map.scaleLevel(in);
    map.scaleLevel(out);
    to.push_back(in);
    to.push_back(out);
}

bool isStill(const channel_event& out, const channel_event& next) {
    return out.rampQFrames == 0 && next.rampQFrames == 0;
}

/// True if nothing is seen or heard of the cut between two pairs.
bool playsThrough(const channel_event& in, const channel_event& out, const channel_event& next,
                  const channel_event& nextOut) {
    return in.strip == next.strip && in.velocity == next.velocity && in.code == next.code &&
           isStill(out, next) && std::abs(stripAt(in, next.editTime) - next.stripTime) <= kTolerance &&
           in.level == out.level && in.level == next.level && in.level == nextOut.level;
}

/// Extent of a pair with half the overlap and, if asked for, its fades on either side.
cel::Range reachOf(const channel_event& in, const channel_event& out, double overlap, SoftCuts softCuts) {
    const bool soft = softCuts == SoftCuts::Keep;
    return {in.editTime - overlap / 2 - (soft ? secondsOfFade(in) : 0),
            out.editTime + overlap / 2 + (soft ? secondsOfFade(out) : 0)};
}

} // namespace

double cel_detail::secondsOfFade(const channel_event& event) {
    return event.rampQFrames * Qx::projectFrameRate().frameDuration() / 4;
}

std::unique_ptr<cel> cel::add_black_to_ends(int seconds, char ends) const {
    const bool start = ends == 'S' || ends == 'B';
    const bool end = ends == 'E' || ends == 'B';
    const double added = seconds;
    if (seconds < 0 || (!start && !end) || m_events.size() % 2 != 0 ||
        !isUsableTime(get_end_time() + 2 * added)) {
        return nullptr;
    }
    auto padded = copy();
    if (seconds == 0) {
        return padded;
    }
    if (start) {
        const double from = get_start_time();
        const FreshPair black(black_cookie, 0, from, from + added);
        const channel_event both[] = {black.in, black.out};
        padded->m_events.splice(0, 0, both, added);
    }
    if (end) {
        const double from = padded->get_end_time();
        const FreshPair black(black_cookie, 0, from, from + added);
        padded->m_events.append(black.in);
        padded->m_events.append(black.out);
    }
    padded->changedNow();
    return padded;
}

std::unique_ptr<cel> cel::quantise() const {
    auto rounded = copy();
    quantiseEvents(EventArray::Rewriting(rounded->m_events).events(), m_resolution);
    rounded->changedNow();
    return rounded;
}

std::unique_ptr<cel> cel::rescale(double editIn, double editOut, double stripIn, double stripOut,
                                  double levelIn, double levelOut, int quantiseResult) const {
    const bool usable = isUsableTime(editIn) && isUsableTime(editOut) && isUsableTime(stripIn) &&
                        isUsableTime(stripOut) && std::isfinite(levelIn) && std::isfinite(levelOut) &&
                        editOut - editIn > kTolerance && m_events.size() % 2 == 0;
    if (!usable) {
        return nullptr;
    }
    auto scaled = std::make_unique<cel>(*this);
    Events events;
    const Mapping map{editIn, editOut, stripIn, (stripOut - stripIn) / (editOut - editIn), levelIn, levelOut};
    if (std::abs(stripOut - stripIn) <= kTolerance) {
        freeze(events, m_events, map);
    } else {
        const Cut first = cutAt(m_events, std::min(stripIn, stripOut));
        const Cut last = cutAt(m_events, std::max(stripIn, stripOut));
        events.reserve(2 * (last.pair + 1 - first.pair));
        appendPart(events, m_events, first, last, first.time, last.time);
        if (map.velocity < 0) {
            std::reverse(events.begin(), events.end());
        }
        for (size_t i = 0; i < events.size(); i += 2) {
            if (map.velocity < 0) {
                std::swap(events[i], events[i + 1]);
                turnRound(events[i], events[i + 1]);
            }
            map.apply(events[i]);
            map.apply(events[i + 1]);
        }
    }
    if (quantiseResult != 0) {
        quantiseEvents(events, m_resolution);
    }
    if (!isGood(events)) {
        return nullptr;
    }
    scaled->m_events.assign(std::move(events));
    scaled->changedNow();
    return scaled;
}

int cel::chequerboard(cel** parts, int& numParts, int maxParts, double overlap, int flags,
                      SoftCuts softCuts) const {
    numParts = 0;
    if (parts == nullptr || maxParts < 1 || !(overlap >= 0) || !isUsableTime(overlap) ||
        m_events.size() % 2 != 0) {
        return 0;
    }
    const bool widen = (flags & ChequerWiden) != 0;
    std::vector<std::unique_ptr<cel>> made;
    std::vector<double> reached;
    for (size_t i = 0; i < m_events.size(); i += 2) {
        channel_event in = m_events[i];
        channel_event out = m_events[i + 1];
        if (in.strip.isBlack()) {
            continue;
        }
        const Range reach = reachOf(in, out, overlap, softCuts);
        size_t part = 0;
        while (part < made.size() && reached[part] > reach.start() + kTolerance) {
            ++part;
        }
        if (part == static_cast<size_t>(maxParts)) {
            return 0;
        }
        if (part == made.size()) {
            made.push_back(std::make_unique<cel>());
            made.back()->m_resolution = m_resolution;
            reached.push_back(-kGreatestTime);
        }
        EventArray& events = made[part]->m_events;
        if (widen) {
            const double least = events.empty() ? std::max(-kGreatestTime, std::min(0.0, in.editTime))
                                                : events.back().editTime;
            const double from = std::max(reach.start(), least);
            const double to = std::min(reach.end(), kGreatestTime);
            out.stripTime = stripAt(in, to);
            in.stripTime = stripAt(in, from);
            in.editTime = from;
            out.editTime = to;
        }
        if ((flags & ChequerFill) != 0) {
            made[part]->fillToTime(in.editTime);
        }
        events.append(in);
        events.append(out);
        reached[part] = reach.end();
    }
    for (auto& part : made) {
        if ((flags & ChequerFill) != 0) {
            part->fillToTime(get_end_time());
        }
        part->changedNow();
        parts[numParts++] = part.release();
    }
    return numParts;
}

bool cel::fillToTime(double time) {
    const double end = get_end_time();
    if (!isUsableTime(time) || time <= end + kTolerance || m_events.size() % 2 != 0) {
        return false;
    }
    const FreshPair black(black_cookie, 0, end, time);
    m_events.append(black.in);
    m_events.append(black.out);
    changedNow();
    return true;
}

bool cel::simplify(Simplification::Type type, const MayMerge& mayMerge) {
    if (m_events.size() % 2 != 0) {
        return false;
    }
    const auto merge = [&](const channel_event* pair, const channel_event* next) {
        const bool black =
            (type & Simplification::MergeBlack) != 0 && pair->strip.isBlack() && next->strip.isBlack();
        const bool through =
            (type & Simplification::MergeThrough) != 0 && playsThrough(pair[0], pair[1], next[0], next[1]);
        return next->editTime - pair[1].editTime <= kTolerance && (black || through) &&
               (!mayMerge || mayMerge(pair, next));
    };
    // Nothing is touched up to the first pair that goes, and nothing at all without one.
    size_t first = 2;
    while (first < m_events.size() && !merge(m_events.data() + first - 2, m_events.data() + first)) {
        first += 2;
    }
    if (first >= m_events.size()) {
        return false;
    }
    EventArray::Rewriting rewriting(m_events);
    Events& events = rewriting.events();
    size_t last = first - 2;
    for (size_t i = first; i < events.size(); i += 2) {
        channel_event* const pair = &events[last];
        if (merge(pair, &events[i])) {
            const double stripTime = stripAt(pair[0], events[i + 1].editTime);
            pair[1] = events[i + 1];
            pair[1].stripTime = stripTime;
            pair[1].velocity = pair[0].velocity;
        } else {
            last += 2;
            events[last] = events[i];
            events[last + 1] = events[i + 1];
        }
    }
    events.resize(last + 2);
    changedNow();
    return true;
}
