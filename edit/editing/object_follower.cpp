#include "edit/editing/detail/object_follower.h"

#include "edit/model/transition.h"
#include "platform/effects/fx_graph_node_base.h"

#include <algorithm>
#include <cmath>
#include <optional>

using editing_detail::isContinuous;
using EventObjects::Bound;
using Qx::kTimeTolerance;
using Range = cel::Range;

namespace {

bool isBefore(double a, double b) {
    return b - a > kTimeTolerance;
}

/// A transition in a channel, with what is on either side of it.
struct Place {
    double from;
    double to;
    const channel_event* out; ///< the in event of the clip that goes out; null where black is
    const channel_event* in;  ///< that of the clip that comes in

    Place(const cel& content, int pair)
        : from(content.getChanEventPtr(2 * pair)->editTime),
          to(content.getChanEventPtr(2 * pair + 1)->editTime), out(content.getChanEventPtr(2 * pair - 2)),
          in(content.getChanEventPtr(2 * pair + 2)) {
        if (out != nullptr && (isBefore(out[1].editTime, from) || out->strip.isBlack())) {
            out = nullptr;
        }
        if (in != nullptr && (isBefore(to, in->editTime) || in->strip.isBlack())) {
            in = nullptr;
        }
    }
    [[nodiscard]] double middleWithin(const Range& region) const {
        return std::clamp((from + to) / 2, std::max(region.start(), from), std::min(region.end(), to));
    }
};

/// Where a transition has to be taken out that would lose a clip: nothing when it stays, or goes as a whole.
std::optional<double> cutForReplace(const Place& place, const Range& region, bool materialOnly) {
    const bool left = isBefore(place.from, region.start()) && !isBefore(place.to, region.start());
    const bool right = !isBefore(region.end(), place.from) && isBefore(region.end(), place.to);
    if (left && right) {
        return place.middleWithin(region);
    }
    if (!left && !right) {
        // One within the region goes with its clips, unless those stay with other material.
        const bool within = !isBefore(place.from, region.start()) && !isBefore(region.end(), place.to);
        return materialOnly && within ? std::optional(place.middleWithin(region)) : std::nullopt;
    }
    return left ? std::min(region.start(), place.to) : std::max(region.end(), place.from);
}

std::optional<double> cutForInsert(const Place& place, double at) {
    return !isBefore(at, place.from) && !isBefore(place.to, at)
               ? std::optional(std::clamp(at, place.from, place.to))
               : std::nullopt;
}

/// A clip that a removal trims at the transition is still its clip.
std::optional<double> cutForRemove(const Place& place, const Range& region) {
    const bool inGoes = place.in == nullptr || !isBefore(region.end(), place.in[1].editTime);
    const bool outGoes = place.out == nullptr || !isBefore(place.out->editTime, region.start());
    const bool left = isBefore(place.from, region.start()) &&
                      (isBefore(region.start(), place.to) || (inGoes && !isBefore(place.to, region.start())));
    const bool right = isBefore(region.end(), place.to) && (isBefore(place.from, region.end()) ||
                                                            (outGoes && !isBefore(region.end(), place.from)));
    if (left && right) {
        return place.middleWithin(region);
    }
    return left ? std::optional(std::min(region.start(), place.to))
                : (right ? std::optional(std::max(region.end(), place.from)) : std::nullopt);
}

/// The pairs that reach into a region or touch it: the first, and behind the last.
std::pair<int, int> pairsTouching(const cel& content, const Range& region) {
    int first = std::max(content.find_ceh(region.start(), CE_IN_POINT).index() / 2, 0);
    while (first > 0 && !isBefore(content.getChanEventPtr(2 * first - 1)->editTime, region.start())) {
        --first;
    }
    int last = first;
    while (last < content.numPairs() &&
           !isBefore(region.end(), content.getChanEventPtr(2 * last)->editTime)) {
        ++last;
    }
    return {first, last};
}

Range oldSpan(const edit_operation core, const Range& region) {
    return core == kCoreInsert ? Range(region.start(), region.start()) : region;
}

Range newSpan(const edit_operation core, const Range& region) {
    return core == kCoreRemove ? Range(region.start(), region.start()) : region;
}

/// Where what a step moved lay before it.
std::function<Range(const Range&)> placesBefore(edit_operation core, const Range& region) {
    const double shift = core == kCoreInsert ? -region.length() : (core == kCoreRemove ? region.length() : 0);
    if (shift == 0) {
        return {};
    }
    const double joint = core == kCoreInsert ? region.end() : region.start();
    return [shift, joint](const Range& now) {
        return isBefore(now.start(), joint) ? now : Range(now.start() + shift, now.end() + shift);
    };
}

} // namespace

namespace editing_detail {

WholeEnds wholeEnds(const cel& source, const cel::Range& region, TagBag& objects, bool materialOnly) {
    WholeEnds ends;
    const auto [first, last] = pairsTouching(source, region);
    for (int pair = last - 1; pair >= first; --pair) {
        if (!Transitions::isTransition(objects, *source.getChanEventPtr(2 * pair))) {
            continue;
        }
        const Place place(source, pair);
        if (isBefore(place.to, region.start())) {
            continue;
        }
        const bool atStart = !isBefore(region.start(), place.from) && isBefore(region.start(), place.to);
        const bool atEnd = !isBefore(place.to, region.end()) && isBefore(place.from, region.end());
        double at = place.middleWithin(region);
        if (!materialOnly) {
            const bool fromBlack = atStart && place.out == nullptr && !isBefore(place.from, region.start());
            const bool toBlack = atEnd && place.in == nullptr && !isBefore(region.end(), place.to);
            ends.blackBefore = ends.blackBefore || fromBlack;
            ends.blackAfter = ends.blackAfter || toBlack;
            if ((!atStart || fromBlack) && (!atEnd || toBlack)) {
                continue;
            }
            if (atStart != atEnd) {
                at = atStart ? std::max(region.start(), place.from) : std::min(region.end(), place.to);
            }
        }
        ends.channel = ends.channel != nullptr ? std::move(ends.channel) : source.copy();
        static_cast<void>(Transitions::resolve(*ends.channel, pair, at));
    }
    return ends;
}

} // namespace editing_detail

Editor::ObjectFollower::ObjectFollower(Edit& edit, const Plan& plan, edit_operation op,
                                       const SrcToDestChanMap* channels)
    : m_edit(edit), m_plan(plan), m_op(op), m_channels(channels) {}

void Editor::ObjectFollower::beforeStep(cel& content, const Step& step) {
    TagBag& objects = m_edit.objectStore();
    const Range region(step.at, step.end());
    const Range span = oldSpan(step.core, region);
    if (isContinuous(m_plan.targets[step.target].type)) {
        const auto [first, last] = pairsTouching(content, span);
        for (int pair = last - 1; pair >= first; --pair) {
            if (!Transitions::isTransition(objects, *content.getChanEventPtr(2 * pair))) {
                continue;
            }
            const Place place(content, pair);
            const std::optional<double> at =
                step.core == kCoreInsert ? cutForInsert(place, step.at)
                : step.core == kCoreRemove
                    ? cutForRemove(place, region)
                    : cutForReplace(place, region, m_op == edit_operation::ReplaceMaterial);
            if (at.has_value()) {
                takeOut(content, step, pair, *at);
            }
        }
    }
    m_before.clear();
    EventObjects::listBound(content, objects, span, m_before);
}

void Editor::ObjectFollower::takeOut(cel& content, const Step& step, int pair, double at) {
    const Place place(content, pair);
    const Range span(place.from, place.to);
    std::vector<Bound> bound;
    EventObjects::listBound(content, m_edit.objectStore(), span, bound);
    if (!Transitions::resolve(content, pair, at)) {
        return;
    }
    EventObjects::follow(m_edit.objectStore(), bound, {content, span}, m_lost);
    m_takenOut.push_back("the transition at " + editing_detail::secondsText(place.from) + " s on " +
                         m_edit.getChanDisplayName(m_plan.targets[step.target].chan));
}

void Editor::ObjectFollower::afterStep(cel& content, const Step& step, const cel::IdMap& copied,
                                       const cel::Splits& splits) {
    const Range region(step.at, step.end());
    const Range span = newSpan(step.core, region);
    TagBag& objects = m_edit.objectStore();
    EventObjects::follow(objects, m_before, {content, span, &splits, placesBefore(step.core, region)},
                         m_lost);
    if (step.objects != nullptr) {
        std::vector<Bound> laid = step.bound;
        for (Bound& event : laid) {
            event.range = {event.range.start() + step.at, event.range.end() + step.at};
        }
        EventObjects::bindCopies(*step.objects, laid, objects, {content, span, &splits}, copied,
                                 m_channels != nullptr ? *m_channels : StampMap());
        for (const Bound& event : laid) {
            const auto made = copied.find(event.id);
            if (made == copied.end()) {
                continue;
            }
            m_copied.insert(event.id);
            if (m_channels != nullptr) {
                static_cast<void>(EventObjects::unwireMissing(m_edit, made->second));
            }
        }
    }
    if (step.part != nullptr && m_channels != nullptr) {
        retargetAliases(content, span);
    }
    if (m_op == edit_operation::ReplaceMaterial && !isContinuous(m_plan.targets[step.target].type)) {
        keepEffects(content, step);
    }
    settleBlackSides(content, step);
}

/// An effect has no material: one that only the material of was to change is shown still, and an event that
/// had none has that of the source.
void Editor::ObjectFollower::keepEffects(cel& content, const Step& step) {
    TagBag& objects = m_edit.objectStore();
    const auto [first, last] = pairsTouching(content, {step.at, step.end()});
    for (int pair = first; pair < last; ++pair) {
        channel_event in = content.get_event(2 * pair);
        channel_event out = content.get_event(2 * pair + 1);
        if (in.id.getMagicType() == IdStampMagic::Channel) {
            continue;
        }
        if (Tag<FXGraphNodeBase>(objects, in.id).valid()) {
            in.strip = out.strip = effect_graph_cookie;
            static_cast<void>(content.setEvent(2 * pair, in) && content.setEvent(2 * pair + 1, out));
            continue;
        }
        for (const Bound& event : step.bound) {
            const Range whole(event.range.start() + step.at, event.range.end() + step.at);
            if (in.strip == effect_graph_cookie && !isBefore(in.editTime, whole.start()) &&
                !isBefore(whole.end(), out.editTime) &&
                EventObjects::copy(*step.objects, event.id, objects, in.id,
                                   m_channels != nullptr ? *m_channels : StampMap())) {
                EventObjects::keepPart(objects, in.id, whole, {in.editTime, out.editTime});
                static_cast<void>(m_channels != nullptr && EventObjects::unwireMissing(m_edit, in.id) > 0);
                break;
            }
        }
    }
}

/// Events that show a channel of the source show the one that corresponds, or are black.
void Editor::ObjectFollower::retargetAliases(cel& content, const cel::Range& span) const {
    const auto [first, last] = pairsTouching(content, span);
    for (int pair = first; pair < last; ++pair) {
        channel_event in = content.get_event(2 * pair);
        if (in.id.getMagicType() != IdStampMagic::Channel || isBefore(in.editTime, span.start()) ||
            !isBefore(in.editTime, span.end())) {
            continue;
        }
        channel_event out = content.get_event(2 * pair + 1);
        const auto known = m_channels->find(in.id);
        if (known != m_channels->end()) {
            in.id = known->second;
        } else if (!m_edit.chanValid(in.id)) {
            in.id = channel_event::newId();
            in.strip = out.strip = black_cookie;
        }
        static_cast<void>(content.setEvent(2 * pair, in) && content.setEvent(2 * pair + 1, out));
    }
}

/// A transition from or to black that was laid keeps its black, whatever lies beside it here: a pair of no
/// length.
void Editor::ObjectFollower::settleBlackSides(cel& content, const Step& step) const {
    const auto insertBlack = [&](double time, bool before) {
        const auto [first, last] = pairsTouching(content, {time, time});
        for (int pair = first; pair < last; ++pair) {
            const channel_event* const events = content.getChanEventPtr(2 * pair);
            const double end = events[before ? 0 : 1].editTime;
            if (std::abs(end - time) <= kTimeTolerance && events->strip == effect_graph_cookie) {
                static_cast<void>(content.insertEventPair(before ? pair : pair + 1, black_cookie, 0, end, 0));
                return;
            }
        }
    };
    if (step.blackAfter) {
        insertBlack(step.end(), false);
    }
    if (step.blackBefore) {
        insertBlack(step.at, true);
    }
}

void Editor::ObjectFollower::finish() {
    const bool moves = m_op == edit_operation::SwapTracks || m_op == edit_operation::MoveTrack;
    for (const Bound& event : m_lost) {
        if (moves && m_copied.contains(event.id)) {
            EventObjects::remove(m_edit, event.id);
        } else {
            static_cast<void>(EventObjects::orphan(m_edit, event));
        }
    }
}

String Editor::ObjectFollower::notice() const {
    String text;
    for (const String& its : m_takenOut) {
        text += (text.empty() ? "" : ", ") + its;
    }
    return text.empty() ? text : text + (m_takenOut.size() == 1 ? " was" : " were") + " taken out";
}
