#include "edit/model/transition.h"

#include "edit/model/detail/cel_events.h"
#include "platform/effects/fx_graph_node_base.h"

#include <array>

using namespace cel_detail;

namespace {

using Pair = std::array<channel_event, 2>;

Pair pairOf(const cel& channel, int pair) {
    return {channel.get_event(2 * pair), channel.get_event(2 * pair + 1)};
}

bool isShown(const channel_event& in) {
    return in.strip == effect_graph_cookie;
}

/// Moves the out point of a pair, which plays on or stops before; its level and fade stay as they are.
void endAt(Pair& pair, double time) {
    pair[1].editTime = time;
    pair[1].stripTime = stripAt(pair[0], time);
}

void beginAt(Pair& pair, double time) {
    pair[0].stripTime = stripAt(pair[0], time);
    pair[0].editTime = time;
}

/// The pair beside a transition whose material it shows, or fresh black where there is none.
Pair sideOf(const cel& channel, int pair, double time, bool before) {
    if (pair >= 0 && pair < channel.numPairs()) {
        const Pair its = pairOf(channel, pair);
        const double end = before ? its[1].editTime : its[0].editTime;
        if (std::abs(end - time) <= kTolerance && !isShown(its[0])) {
            return its;
        }
    }
    const FreshPair black(black_cookie, 0, time, time);
    return {black.in, black.out};
}

void append(Events& events, const Pair& pair) {
    events.insert(events.end(), pair.begin(), pair.end());
}

/// How long a clip that plays on to `time`, beyond an end of its own, would have nothing to play.
double missingAt(const channel_event& in, double time, double needed,
                 const Transitions::MaterialExtent& extentOf, bool& known) {
    if (in.strip.isBlack() || in.velocity == 0) {
        return 0;
    }
    const std::optional<cel::Range> extent = extentOf(in.strip);
    known = extent.has_value();
    if (!known) {
        return 0;
    }
    const double strip = in.stripTime + (time - in.editTime) * in.velocity;
    const double beyond = std::max({strip - extent->end(), extent->start() - strip, 0.0});
    const double missing = beyond / std::abs(in.velocity);
    return missing <= kTolerance ? 0 : std::min(missing, needed);
}

} // namespace

bool Transitions::isTransition(TagBag& objects, const channel_event& in, bool missingToo) {
    if (!isShown(in) || in.id.getMagicType() == IdStampMagic::Channel) {
        return false;
    }
    const Tag<FXGraphNodeBase> node(objects, in.id);
    if (!node.valid()) {
        return missingToo;
    }
    const auto isNeighbour = [&](unsigned input, const IdStamp& reserved) {
        const IdStamp track = node->getInputTrackId(input);
        return track == reserved || (!track.valid() && !node->hasExplicitInputs());
    };
    return node->getNumTrackInputs() >= 2 && isNeighbour(0, previousInputId) && isNeighbour(1, nextInputId);
}

bool Transitions::lay(cel& channel, double cut, double from, double to, const IdStamp& id) {
    if (!isUsableTime(from) || !isUsableTime(to) || isNotPast(to, from) || !isNotPast(from, cut) ||
        !isNotPast(cut, to) || !id.valid() || channel.numEvents() % 2 != 0) {
        return false;
    }
    const int last = channel.find_ceh(cut, CE_IN_POINT).index() / 2;
    const channel_event* const latest = channel.getChanEventPtr(2 * last);
    const bool comesIn = latest != nullptr && channel.find_ceh(cut, CE_IN_POINT).valid() != 0 &&
                         isNotPast(cut, latest->editTime);
    const int next = comesIn ? last : last + (channel.find_ceh(cut, CE_IN_POINT).valid() != 0 ? 1 : 0);
    const channel_event* const before = channel.getChanEventPtr(2 * next - 1);
    const bool goesOut = before != nullptr && std::abs(before->editTime - cut) <= kTolerance;
    if (!comesIn && !goesOut) {
        return false;
    }
    const FreshPair fresh(effect_graph_cookie, 0, from, to);
    Pair shown{fresh.in, fresh.out};
    shown[0].id = id;
    Events events;
    if (goesOut) {
        Pair out = pairOf(channel, next - 1);
        if (isShown(out[0]) || !isNotPast(out[0].editTime, from)) {
            return false;
        }
        endAt(out, std::max(from, out[0].editTime));
        append(events, out);
    }
    append(events, shown);
    if (comesIn) {
        Pair in = pairOf(channel, next);
        if (isShown(in[0]) || !isNotPast(to, in[1].editTime)) {
            return false;
        }
        beginAt(in, std::min(to, in[1].editTime));
        append(events, in);
    }
    const bool intoGap = (!goesOut && !isNotPast(cut, from)) || (!comesIn && !isNotPast(to, cut));
    return !intoGap &&
           channel.replacePairs(next - (goesOut ? 1 : 0), (goesOut ? 1 : 0) + (comesIn ? 1 : 0), events);
}

bool Transitions::resolve(cel& channel, int pair, double at) {
    if (pair < 0 || pair >= channel.numPairs() || channel.numEvents() % 2 != 0) {
        return false;
    }
    const Pair its = pairOf(channel, pair);
    const double from = its[0].editTime;
    const double to = its[1].editTime;
    if (!isNotPast(from, at) || !isNotPast(at, to)) {
        return false;
    }
    at = std::clamp(at, from, to);
    Pair out = sideOf(channel, pair - 1, from, true);
    Pair in = sideOf(channel, pair + 1, to, false);
    const bool outIsThere = pair > 0 && out[0].id == channel.getChanEventPtr(2 * pair - 2)->id;
    const bool inIsThere =
        pair + 1 < channel.numPairs() && in[0].id == channel.getChanEventPtr(2 * pair + 2)->id;
    endAt(out, at);
    beginAt(in, at);
    Events events;
    if (outIsThere || !isNotPast(at, from)) {
        append(events, out);
    }
    if (inIsThere || !isNotPast(to, at)) {
        append(events, in);
    }
    const int before = outIsThere ? 1 : 0;
    return channel.replacePairs(pair - before, 1 + before + (inIsThere ? 1 : 0), events);
}

Transitions::Handles Transitions::handlesOf(const cel& channel, int pair, const MaterialExtent& extentOf) {
    Handles handles;
    const channel_event* const its = channel.getChanEventPtr(2 * pair);
    const channel_event* const out = channel.getChanEventPtr(2 * pair - 2);
    const channel_event* const in = channel.getChanEventPtr(2 * pair + 2);
    const double length = its[1].editTime - its[0].editTime;
    if (out != nullptr && its[0].editTime - out[1].editTime <= kTolerance) {
        handles.needed[0] = length;
        handles.missing[0] = missingAt(*out, its[1].editTime, length, extentOf, handles.known[0]);
    }
    if (in != nullptr && in->editTime - its[1].editTime <= kTolerance) {
        handles.needed[1] = length;
        handles.missing[1] = missingAt(*in, its[0].editTime, length, extentOf, handles.known[1]);
    }
    return handles;
}
