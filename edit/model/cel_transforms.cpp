#include "edit/model/cel.h"

#include "edit/model/detail/cel_events.h"
#include "platform/media/frame_rate.h"

using namespace cel_detail;

namespace {

/// The nearest time on the grid of a quantum, or of the project's frames for 0. A grid that is finer than
/// what times are told apart by leaves them where they are.
double onGrid(double time, double quantum) {
    if (quantum == 0) {
        return Qx::frameRound(time);
    }
    return quantum > kTolerance ? std::round(time / quantum) * quantum : time;
}

/// Rounds the edit times; pairs that become nothing go, unless they were nothing before. False, with the
/// events as they were, if a time is rounded to one that no event may have.
bool quantiseEvents(Events& events, double quantum) {
    Events rounded;
    rounded.reserve(events.size());
    TimeLayer layer;
    for (size_t i = 0; i < events.size(); i += 2) {
        channel_event in = events[i];
        channel_event out = events[i + 1];
        const bool hadLength = in.editTime < out.editTime;
        const double from = layer.lay(onGrid(in.editTime, quantum));
        const double to = layer.lay(onGrid(out.editTime, quantum));
        if (!isUsableTime(from) || !isUsableTime(to)) {
            return false;
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
        appendLaid(rounded, in, out, hadLength);
    }
    events.swap(rounded);
    return true;
}

/// Exchanges the ends of a pair in time; each stamp and kind stays with its end.
void turnRound(channel_event& in, channel_event& out) {
    std::swap(in, out);
    std::swap(in.id, out.id);
    in.kind = CE_IN_POINT;
    out.kind = CE_OUT_POINT;
}

/// The mapping of `rescale`. Strip times are those of the cuts that the marks mean.
struct Mapping {
    double editIn;
    double editOut;
    double stripIn;
    double stripOut;
    double levelIn;
    double levelOut;

    [[nodiscard]] double velocity() const { return (stripOut - stripIn) / (editOut - editIn); }
    void apply(channel_event& event, TimeLayer& layer) const {
        const double time = editIn + (event.editTime - stripIn) / velocity();
        event.editTime = layer.lay(std::clamp(time, editIn, editOut));
        event.velocity *= velocity();
        scaleLevel(event);
    }
    void scaleLevel(channel_event& event) const {
        const double part = (event.editTime - editIn) / (editOut - editIn);
        event.level = static_cast<float>(double{event.level} * (levelIn + (levelOut - levelIn) * part));
    }
};

/// A freeze: the pair that plays at one moment, all over the span.
void freeze(Events& to, const EventArray& from, const Mapping& map) {
    const size_t pairs = from.numStartingUpTo(map.stripIn);
    if (pairs == 0 || from[2 * pairs - 1].editTime <= map.stripIn) {
        return;
    }
    channel_event in = cutIn(from[2 * pairs - 2], from[2 * pairs - 1], map.stripIn);
    channel_event out = cutOut(from[2 * pairs - 2], from[2 * pairs - 1], map.stripIn);
    in.editTime = map.editIn;
    out.editTime = map.editOut;
    in.velocity = out.velocity = 0;
    map.scaleLevel(in);
    map.scaleLevel(out);
    to.push_back(in);
    to.push_back(out);
}

/// The part of a cel between two cuts, mapped: backwards if the first is the later.
void mapPart(Events& to, const EventArray& from, const Region& region, const Mapping& map) {
    const bool backwards = map.velocity() < 0;
    Events events;
    events.reserve(2 * region.numPairs());
    appendPart(events, from, region, region.from.time, region.to.time);
    if (backwards) {
        std::reverse(events.begin(), events.end());
    }
    to.reserve(events.size());
    TimeLayer layer(map.editIn, map.editOut);
    for (size_t i = 0; i < events.size(); i += 2) {
        channel_event& in = events[i];
        channel_event& out = events[i + 1];
        const bool hadLength = in.editTime != out.editTime;
        if (backwards) {
            std::swap(in, out);
            turnRound(in, out);
        }
        map.apply(in, layer);
        map.apply(out, layer);
        appendLaid(to, in, out, hadLength);
    }
}

bool isStill(const channel_event& out, const channel_event& next) {
    return out.rampQFrames == 0 && next.rampQFrames == 0;
}

/// True if nothing is seen or heard of the cut between two pairs.
bool playsThrough(const channel_event& in, const channel_event& out, const channel_event& next,
                  const channel_event& nextOut) {
    const auto isMaterial = [](const channel_event& event) {
        return event.id.getMagicType() == IdStampMagic::Material;
    };
    return isMaterial(in) && isMaterial(next) && in.strip == next.strip && in.velocity == next.velocity &&
           in.code == next.code && isStill(out, next) &&
           std::abs(stripAt(in, next.editTime) - next.stripTime) <= kTolerance && in.level == out.level &&
           in.level == next.level && in.level == nextOut.level;
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
        spliceShifted(padded->m_events, 0, 0, both, added, from + added);
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
    if (m_events.size() % 2 != 0 ||
        !quantiseEvents(EventArray::Rewrite(rounded->m_events).events(), m_resolution)) {
        return nullptr;
    }
    rounded->changedNow();
    return rounded;
}

std::unique_ptr<cel> cel::rescale(double editIn, double editOut, double stripIn, double stripOut,
                                  double levelIn, double levelOut, int quantiseResult) const {
    const bool usable = isUsableTime(editIn) && isUsableTime(editOut) && isUsableTime(stripIn) &&
                        isUsableTime(stripOut) && std::isfinite(levelIn) && std::isfinite(levelOut) &&
                        !isNotPast(editOut, editIn) && m_events.size() % 2 == 0;
    if (!usable) {
        return nullptr;
    }
    auto scaled = std::make_unique<cel>(*this);
    Events events;
    const Region region(m_events, std::min(stripIn, stripOut), std::max(stripIn, stripOut));
    const bool backwards = stripOut < stripIn;
    const Mapping map{editIn,
                      editOut,
                      backwards ? region.to.time : region.from.time,
                      backwards ? region.from.time : region.to.time,
                      levelIn,
                      levelOut};
    if (region.empty()) {
        freeze(events, m_events, map);
    } else {
        mapPart(events, m_events, region, map);
    }
    if (quantiseResult != 0 && !quantiseEvents(events, m_resolution)) {
        return nullptr;
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
        // Behind the end of a part, which may lie past the start by the tolerance, something must be left.
        const bool hasLength = !isNotPast(out.editTime, in.editTime);
        const auto isFree = [&](double end) {
            return isNotPast(end, reach.start()) && !(hasLength && isNotPast(reach.end(), end));
        };
        size_t part = 0;
        while (part < made.size() && !isFree(reached[part])) {
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
            TimeLayer layer(events.empty() ? -Qx::kNoTime : least);
            const double from = layer.lay(std::max(reach.start(), least));
            const double to = layer.lay(std::min(reach.end(), kGreatestTime));
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
    if (!isUsableTime(time) || isNotPast(time, end) || m_events.size() % 2 != 0) {
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
        return isNotPast(next->editTime, pair[1].editTime) && (black || through) &&
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
    EventArray::Rewrite rewrite(m_events);
    Events& events = rewrite.events();
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
