#include "edit/editing/detail/edit_plan.h"

#include "edit/project/permissions_manager.h"
#include "platform/media/frame_rate.h"

#include <algorithm>
#include <cmath>

using editing_detail::isContinuous;
using editing_detail::makePart;
using editing_detail::secondsText;
using Op = edit_operation;
using Qx::kNoTime;
using Qx::kTimeTolerance;

namespace {

/// A part of a shot as what names the shot itself: its moments by the shot's own clock, on which the part
/// begins at `start`. Levels, fades and effects are the shot's own and are not repeated.
std::shared_ptr<cel> referTo(const cookie& shot, const cel& part, double start) {
    auto made = std::make_shared<cel>();
    made->reserve(part.numPairs());
    for (int i = 0; i + 1 < part.numEvents(); i += 2) {
        const channel_event& in = *part.getChanEventPtr(i);
        const double length = part.getChanEventPtr(i + 1)->editTime - in.editTime;
        const bool black = in.strip.isBlack();
        made->appendEventPair(black ? black_cookie : shot, black ? 0 : start + in.editTime, in.editTime,
                              length);
    }
    made->simplify(Simplification::MergeThrough);
    return made;
}

} // namespace

namespace editing_detail {

std::shared_ptr<cel> makePart(const cel* source, const cel::Range& region, bool fillGaps) {
    const double length = region.length();
    std::unique_ptr<cel> cut =
        source != nullptr ? source->extract(region.start(), region.end()) : std::make_unique<cel>();
    if (cut == nullptr) {
        return nullptr;
    }
    auto part = std::make_shared<cel>();
    part->reserve(cut->numPairs() + 1);
    for (int i = 0; i < cut->numEvents(); ++i) {
        channel_event event = cut->get_event(i);
        // The ends lie exactly at those of the region, so that what is laid has exactly its length.
        event.editTime = event.editTime > length - 2 * kTimeTolerance ? length : event.editTime;
        if (fillGaps && event.kind == CE_IN_POINT) {
            part->fillToTime(event.editTime);
        }
        part->add_event(event);
    }
    if (fillGaps) {
        part->fillToTime(length);
    }
    return part;
}

AudLevelsCel levelsOf(const Edit& edit, const IdStamp& audio) {
    const AudCel events = edit.getAudCel(audio);
    return events.valid() ? edit.getLevelsCel(events.getLevelsChanID()) : AudLevelsCel();
}

IdStamp addLevels(Edit& edit, const IdStamp& audio) {
    AudLevelsCel levels = AudLevelsCel::create();
    levels.replaceClipNodes(edit.getAudCel(audio));
    levels.setChanged(true);
    return edit.addLevelsChan(audio, levels, false);
}

bool isWritable(const Edit& edit) {
    return !edit.get_read_only() && !PermissionsManager::getReadOnly(edit.get_cookie());
}

double roundTo(Qx::FrameRate rate, double time) {
    return rate.valid() ? rate.toSeconds(rate.toFrames(time)) : time;
}

String secondsText(double seconds) {
    return Qx::doubleToText(std::round(seconds * 1000) / 1000);
}

} // namespace editing_detail

/// To whole frames of the destination, unless times are to stay exact; one that is not set stays so.
double Editor::Planner::rounded(double time) const {
    return exact() || time >= kNoTime ? time : editing_detail::roundTo(m_rate, time);
}

/// A region of the source: it starts on a frame of the source and is whole frames of the destination long.
cel::Range Editor::Planner::sourceRegion(const Range& exactly) {
    if (exact() || exactly.end() >= kNoTime) {
        return exactly;
    }
    const Range own(editing_detail::roundTo(m_sourceRate, exactly.start()),
                    editing_detail::roundTo(m_sourceRate, exactly.end()));
    if (!changesRate()) {
        return own;
    }
    const double length = rounded(own.length());
    m_plan->roundedBy = std::max(m_plan->roundedBy, std::abs(length - own.length()));
    return {own.start(), own.start() + length};
}

String Editor::Planner::notice(const Plan& plan) const {
    if (plan.roundedBy <= kTimeTolerance) {
        return {};
    }
    return "the source runs at " + m_sourceRate.asString() + " frames a second and the destination at " +
           m_rate.asString() +
           ": what was laid has its cuts on whole frames of the destination, moved by up to " +
           secondsText(plan.roundedBy) + " s";
}

String Editor::Planner::nameOf(const Target& target) const {
    return target.chan.valid() ? m_destination.getEdit()->getChanDisplayName(target.chan)
                               : String("a new channel");
}

/// A channel's own marked region, else the module's. False with the refusal set if there is none.
bool Editor::Planner::destinationRegion(const EditModule& destination, const IdStamp& chan, Range& region) {
    region = destination.isMarked(chan) ? destination.getMarkedRegion(chan, EditModule::ExactTimes)
                                        : destination.getMarkedRegion(EditModule::ExactTimes);
    region = Range(rounded(region.start()), rounded(region.end()));
    if (region.start() == kNoTime) {
        return refuse("the destination has no marked region; set an in and an out mark");
    }
    if (region.end() == kNoTime) {
        return refuse("the destination needs two different marks, or one and a current time");
    }
    if (!(region.length() > kTimeTolerance)) {
        return refuse("the destination's marked region is empty; it must be at least one frame long");
    }
    return true;
}

size_t Editor::Planner::addTarget(Target target) {
    const Edit& edit = *m_destination.getEdit();
    if (target.type.type == AudioChan && target.chan.valid()) {
        target.levels = edit.getAudCel(target.chan).getLevelsChanID();
    }
    m_plan->targets.push_back(target);
    return m_plan->targets.size() - 1;
}

void Editor::Planner::addStep(Op core, size_t target, double at, double length,
                              std::shared_ptr<const cel> part) {
    Step step;
    step.core = core;
    step.target = target;
    step.at = at;
    step.length = length;
    step.part = std::move(part);
    step.levelsRange = Range(0, length);
    step.withLevels = m_op != Op::ReplaceMaterial;
    m_plan->steps.push_back(std::move(step));
}

/// True for a channel that keeps its gaps and may not change in length, if what is laid up to `to` lies at
/// its end: what is empty there has to be black.
bool Editor::Planner::mustHoldEnd(const Target& target, double to) const {
    return !editOpCanAffectTrackLength(m_op) && to >= endOf(target.chan) - kTimeTolerance;
}

void Editor::Planner::addBlackStep(Op core, size_t target, double at, double length) {
    const Target& events = m_plan->targets[target];
    const bool black = isContinuous(events.type) || mustHoldEnd(events, at + length);
    addStep(core, target, at, length, makePart(nullptr, Range(0, length), black));
}

/// A part as `makePart` gives it, with its cuts on frames of the destination. It lies `lead` seconds behind a
/// frame of the destination; a lead is content of the source too.
std::shared_ptr<cel> Editor::Planner::takePart(const cel* content, const Range& region, bool fillGaps,
                                               double lead) {
    if (content == nullptr || !changesRate()) {
        return content != nullptr ? makePart(content, region, fillGaps) : nullptr;
    }
    const std::shared_ptr<cel> whole = makePart(content, {region.start() - lead, region.end()}, fillGaps);
    const std::shared_ptr<cel> part = whole != nullptr ? onFrames(whole) : nullptr;
    return part == nullptr || lead <= kTimeTolerance
               ? part
               : makePart(part.get(), {lead, lead + region.length()}, fillGaps);
}

std::shared_ptr<cel> Editor::Planner::onFrames(const std::shared_ptr<cel>& part) {
    for (int i = 0; i < part->numEvents(); ++i) {
        const double time = part->getChanEventPtr(i)->editTime;
        m_plan->roundedBy = std::max(m_plan->roundedBy, std::abs(rounded(time) - time));
    }
    part->set_resolution(m_rate.frameDuration());
    return part->quantise();
}

/// A step that overwrites with a part of a channel, with the levels that are heard there. The step lies
/// `lead` seconds behind a frame of the destination.
void Editor::Planner::addCopyStep(size_t target, double at, Edit& from, const IdStamp& chan,
                                  const Range& region, double lead) {
    Target& events = m_plan->targets[target];
    const cel* const content = from.get_edit_cel_p(from.getIdx(chan));
    const bool refers = from.isShot() && from.get_cookie().isStorable() && &from != &*m_destination.getEdit();
    editing_detail::WholeEnds ends;
    if (content != nullptr && isContinuous(events.type) && !refers) {
        ends = editing_detail::wholeEnds(*content, region, from.objectStore(), m_op == Op::ReplaceMaterial);
    }
    std::shared_ptr<cel> part = takePart(ends.channel != nullptr ? ends.channel.get() : content, region,
                                         isContinuous(events.type), lead);
    if (refers && part != nullptr) {
        part = referTo(from.get_cookie(), *part, region.start());
    }
    if (part != nullptr && mustHoldEnd(events, at + region.length())) {
        part->fillToTime(region.length());
    }
    if (part == nullptr) {
        refuse("a part of the source cannot be taken from " + from.getChanDisplayName(chan) +
               ": the channel is incomplete or the region is no usable time");
        return;
    }
    addStep(kCoreReplace, target, at, region.length(), part);
    Step& step = m_plan->steps.back();
    if (!refers && content != nullptr) {
        takeObjects(step, from, *content, region);
        step.blackBefore = ends.blackBefore;
        step.blackAfter = ends.blackAfter;
    }
    if (events.type.type != AudioChan || !step.withLevels) {
        return;
    }
    const AudLevelsCel levels = refers ? AudLevelsCel() : editing_detail::levelsOf(from, chan);
    if (!levels.is_dummy()) {
        // A channel may be changed before its levels are laid elsewhere.
        step.levels = &from == &*m_destination.getEdit() ? levels.clone() : levels;
        step.levelsRange = region;
        events.needsLevels =
            events.needsLevels || (!events.levels.valid() && (m_flags & Editor::NoNewChannels) == 0);
    } else if (events.levels.valid() || events.needsLevels) {
        step.levels = AudLevelsCel::create();
        step.levels.replaceClipNodes(AudCel(part, IdStamp()));
    }
}

/// Copies what is bound to the events of a step's part. It is the plan's own: what the operation does to the
/// source meanwhile changes nothing of it.
void Editor::Planner::takeObjects(Step& step, Edit& from, const cel& content, const Range& region) {
    TagBag& objects = from.objectStore();
    std::vector<EventObjects::Bound> bound;
    EventObjects::listBound(content, objects, region, bound);
    for (EventObjects::Bound& event : bound) {
        const Range range(event.range.start() - region.start(), event.range.end() - region.start());
        event.range = changesRate() ? Range(rounded(range.start()), rounded(range.end())) : range;
        if (step.objects == nullptr) {
            step.objects = std::make_shared<TagBag>();
        }
        if (EventObjects::copy(objects, event.id, *step.objects, event.id)) {
            step.bound.push_back(event);
        }
    }
}

bool Editor::Planner::checkSteps() {
    if (!m_refusal) {
        return false;
    }
    Plan& plan = *m_plan;
    double end = 0;
    double laidEnd = 0;
    plan.at = cel::kGreatestTime;
    for (Step& step : plan.steps) {
        step.at = std::abs(step.at) <= kTimeTolerance ? 0 : step.at;
        if (!checkStep(step)) {
            return false;
        }
        plan.at = std::min(plan.at, step.at);
        end = std::max(end, step.end());
        laidEnd = step.core == kCoreRemove ? laidEnd : std::max(laidEnd, step.end());
    }
    plan.length = end - plan.at;
    if (m_core == kCoreRemove || editOpIsBackwards(m_op)) {
        plan.current = plan.at;
    } else {
        plan.current =
            editOpRequiresSourceAndDest(m_op) ? std::max(laidEnd, plan.at) : m_destination.curTime();
    }
    return true;
}

/// Everything for which a cel or its levels would refuse the step.
bool Editor::Planner::checkStep(const Step& step) {
    const Target& target = m_plan->targets[step.target];
    const Edit& edit = *m_destination.getEdit();
    const cel* const events = target.chan.valid() ? edit.get_edit_cel_p(edit.getIdx(target.chan)) : nullptr;
    const String what = String(editOperationName(m_op)) + " on " + nameOf(target);
    if (step.at < 0) {
        return refuse(what + " would begin before the start of the edit, at " + secondsText(step.at) + " s");
    }
    if (!(step.length > kTimeTolerance)) {
        return refuse(what + " would have no length");
    }
    const AudLevelsCel levels = edit.getLevelsCel(target.levels);
    double last = events != nullptr ? events->get_end_time() : 0;
    if (const auto& nodes = levels.getNodeStore().nodes(); !nodes.empty()) {
        last = std::max(last, nodes.back().time);
    }
    const double grows = step.core == kCoreInsert ? step.length : 0;
    // A step that follows an insert works in the room that it made.
    if (std::max(last, step.at) + grows > cel::kGreatestTime || step.end() > cel::kGreatestTime) {
        return refuse(what + " would reach beyond the greatest time that an edit can hold");
    }
    if (events != nullptr && events->numEvents() % 2 != 0) {
        return refuse(what + ": the channel's last event is incomplete");
    }
    if (step.core != kCoreRemove && step.part == nullptr) {
        return refuse(what + ": there is nothing to lay");
    }
    return true;
}

/// For the operations that move what follows: what moves, and by how much.
void Editor::Planner::findShifts() {
    if (!editOpAffectsTrackSync(m_op)) {
        return;
    }
    const Edit& edit = *m_destination.getEdit();
    for (const Step& step : m_plan->steps) {
        Target& target = m_plan->targets[step.target];
        const cel* const events = edit.get_edit_cel_p(edit.getIdx(target.chan));
        if (step.core == kCoreReplace || events == nullptr) {
            continue;
        }
        target.movesFrom = step.core == kCoreInsert ? step.at : step.end();
        target.shift = step.core == kCoreInsert ? step.length : -step.length;
        const double end = events->get_end_time();
        target.moves =
            end > target.movesFrom + kTimeTolerance && !events->isEmpty(Range(target.movesFrom, end));
    }
}
