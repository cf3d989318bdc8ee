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
using Qx::MarkTypes::InMark;
using Qx::MarkTypes::OutMark;

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
    const AudCel its = edit.getAudCel(audio);
    return its.valid() ? edit.getLevelsCel(its.getLevelsChanID()) : AudLevelsCel();
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

String secondsText(double seconds) {
    return Qx::doubleToText(std::round(seconds * 1000) / 1000);
}

} // namespace editing_detail

double Editor::Planner::rounded(double time) const {
    return m_mode == EditModule::ExactTimes || time >= kNoTime ? time : Qx::frameRound(time);
}

double Editor::Planner::inMark(const EditModule& module, const IdStamp& chan) const {
    double time = module.getMarkTime(chan, InMark);
    time = time == kNoTime ? module.getMarkTime(InMark) : time;
    return rounded(time == kNoTime ? module.curTime() : time);
}

double Editor::Planner::outMark(const EditModule& module, const IdStamp& chan) const {
    double time = module.getMarkTime(chan, OutMark);
    time = time == kNoTime ? module.getMarkTime(OutMark) : time;
    return rounded(time == kNoTime ? module.curTime() : time);
}

String Editor::Planner::nameOf(const Target& target) const {
    return target.chan.valid() ? m_destination.getEdit()->getChanDisplayName(target.chan)
                               : String("a new channel");
}

/// A channel's own marked region, else the module's. False with the refusal set if there is none.
bool Editor::Planner::destinationRegion(const EditModule& destination, const IdStamp& chan, Range& region) {
    region = destination.isMarked(chan) ? destination.getMarkedRegion(chan, m_mode)
                                        : destination.getMarkedRegion(m_mode);
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

void Editor::Planner::addBlackStep(Op core, size_t target, double at, double length) {
    const bool continuous = isContinuous(m_plan->targets[target].type);
    addStep(core, target, at, length, makePart(nullptr, Range(0, length), continuous));
}

/// A step that overwrites with a part of a channel, with the levels that are heard there.
void Editor::Planner::addCopyStep(size_t target, double at, const Edit& from, const IdStamp& chan,
                                  const Range& region) {
    Target& its = m_plan->targets[target];
    const cel* const content = from.get_edit_cel_p(from.getIdx(chan));
    std::shared_ptr<cel> part =
        content != nullptr ? makePart(content, region, isContinuous(its.type)) : nullptr;
    const bool refers = from.isShot() && from.get_cookie().isStorable() && &from != &*m_destination.getEdit();
    if (refers && part != nullptr) {
        part = referTo(from.get_cookie(), *part, region.start());
    }
    if (part == nullptr) {
        refuse("a part of the source cannot be taken from " + from.getChanDisplayName(chan) +
               ": the channel is incomplete or the region is no usable time");
        return;
    }
    addStep(kCoreReplace, target, at, region.length(), part);
    Step& step = m_plan->steps.back();
    if (its.type.type != AudioChan || !step.withLevels) {
        return;
    }
    const AudLevelsCel levels = refers ? AudLevelsCel() : editing_detail::levelsOf(from, chan);
    if (!levels.is_dummy()) {
        // A channel may be changed before its levels are laid elsewhere.
        step.levels = &from == &*m_destination.getEdit() ? levels.clone() : levels;
        step.levelsRange = region;
        its.needsLevels = its.needsLevels || (!its.levels.valid() && (m_flags & Editor::NoNewChannels) == 0);
    } else if (its.levels.valid() || its.needsLevels) {
        step.levels = AudLevelsCel::create();
        step.levels.replaceClipNodes(AudCel(part, IdStamp()));
    }
}

bool Editor::Planner::checkSteps() {
    if (!m_reason.empty()) {
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
    const cel* const its = target.chan.valid() ? edit.get_edit_cel_p(edit.getIdx(target.chan)) : nullptr;
    const String what = String(editOperationName(m_op)) + " on " + nameOf(target);
    if (step.at < 0) {
        return refuse(what + " would begin before the start of the edit, at " + secondsText(step.at) + " s");
    }
    if (!(step.length > kTimeTolerance)) {
        return refuse(what + " would have no length");
    }
    const AudLevelsCel levels = edit.getLevelsCel(target.levels);
    double last = its != nullptr ? its->get_end_time() : 0;
    if (const auto& nodes = levels.getNodeStore().nodes(); !nodes.empty()) {
        last = std::max(last, nodes.back().time);
    }
    const double grows = step.core == kCoreInsert ? step.length : 0;
    // A step that follows an insert works in the room that it made.
    if (std::max(last, step.at) + grows > cel::kGreatestTime || step.end() > cel::kGreatestTime) {
        return refuse(what + " would reach beyond the greatest time that an edit can hold");
    }
    if (its != nullptr && its->numEvents() % 2 != 0) {
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
        const cel* const its = edit.get_edit_cel_p(edit.getIdx(target.chan));
        if (step.core == kCoreReplace || its == nullptr) {
            continue;
        }
        target.movesFrom = step.core == kCoreInsert ? step.at : step.end();
        target.shift = step.core == kCoreInsert ? step.length : -step.length;
        const double end = its->get_end_time();
        target.moves = end > target.movesFrom + kTimeTolerance && !its->isEmpty(Range(target.movesFrom, end));
    }
}
