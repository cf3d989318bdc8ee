#include "edit/editing/detail/edit_plan.h"

#include "platform/media/frame_rate.h"
#include "platform/services/log.h"

#include <array>

using editing_detail::isContinuous;
using editing_detail::kChannelKinds;
using editing_detail::secondsText;
using Op = edit_operation;
using editing_detail::roundTo;
using Qx::kNoTime;
using Qx::kTimeTolerance;
using Qx::MarkTypes::InMark;
using Qx::MarkTypes::OutMark;

namespace {

/// True for the operations that fill the destination's marked region.
bool isMarkedOperation(Op op) {
    return op == Op::ReplaceMarked || op == Op::InsertMarked || op == Op::BackReplaceMarked ||
           op == Op::BackInsertMarked;
}

/// The other eye of the first member of a stereoscopic group; the null stamp for any other channel.
IdStamp otherEye(const Edit& edit, const IdStamp& chan) {
    for (unsigned i = 0; i < edit.numGroups(); ++i) {
        const ChannelGroup* const group = edit.getTrackGroup(i);
        if (group->getType() == ChannelGroup::eStereoscopic && group->size() >= 2 &&
            group->getChans()[0] == chan) {
            return group->getChans()[1];
        }
    }
    return {};
}

} // namespace

Editor::Planner::Planner(const EditModule& source, const EditModule& destination, edit_operation op,
                         unsigned flags)
    : m_source(source), m_destination(destination), m_op(op), m_core(::getCoreEditOperation(op)),
      m_flags(flags), m_rate(destination.getEdit()->getFrameRate()), m_sourceRate(m_rate), m_span(0, 0) {
    m_source.verify();
    if (editOpRequiresSourceAndDest(op) && Editor::checkMarks(m_source)) {
        m_sourceRate = m_source.getEdit()->getFrameRate();
    }
}

bool Editor::Planner::refuse(String reason, Qx::StatusCode code) {
    m_refusal = Qx::Status::failure(code, std::move(reason));
    return false;
}

std::unique_ptr<Editor::Plan> Editor::Planner::plan() {
    m_plan = std::make_unique<Plan>();
    const bool planned =
        checkOperation() && (editOpRequiresSourceAndDest(m_op) ? planWithSource() : planWithin());
    if (!planned || !checkSteps()) {
        return nullptr;
    }
    findShifts();
    return std::move(m_plan);
}

bool Editor::Planner::checkOperation() {
    constexpr unsigned kKnownFlags =
        Editor::ExactTimes | Editor::KeepClipboard | Editor::NoBackup | Editor::NoNewChannels;
    const Edit& edit = *m_destination.getEdit();
    if ((m_flags & ~kKnownFlags) != 0) {
        return refuse("the operation has flags that do not exist");
    }
    if (editModificationOf(m_op) == kNoModification) {
        herc_printf("EditOpPerformer::doEdit() : Unhandled EditOperation\n");
        return refuse("EditOpPerformer::doEdit() : Unhandled EditOperation");
    }
    if (edit.isBad()) {
        return refuse("the edit " + edit.get_cookie_str() + " could not be read and cannot be changed",
                      Qx::StatusCode::Damaged);
    }
    if (!editing_detail::isWritable(edit)) {
        return refuse("the edit " + edit.get_cookie_str() + " is read-only", Qx::StatusCode::ReadOnly);
    }
    return true;
}

// With a source

bool Editor::Planner::planWithSource() {
    if (!Editor::checkMarks(m_source)) {
        return refuse(String(editOperationName(m_op)) + " needs a source edit");
    }
    if (!findSourceSpan() || !planPass(m_destination, false)) {
        return false;
    }
    if (Editor::stereoscopicExpansionRequired(m_source, m_destination, m_op) &&
        !planPass(m_destination, true)) {
        return false;
    }
    if (std::none_of(m_plan->targets.begin(), m_plan->targets.end(),
                     [](const Target& target) { return target.source.valid(); })) {
        return refuse("no selected channel of the source has one in the destination to go to");
    }
    return !m_plan->steps.empty() ||
           refuse(m_op == Op::FillBlack ? "nothing is black in the destination's region"
                                        : "the selected channels of the source hold nothing to lay");
}

/// The source's region, and for the operations that fill the destination's its length.
bool Editor::Planner::findSourceSpan() {
    if (isMarkedOperation(m_op)) {
        Range region;
        if (!destinationRegion(m_destination, IdStamp(), region)) {
            return false;
        }
        m_markedLength = region.length();
        return true;
    }
    const double end = m_source.getEdit()->getEndTime();
    m_span = sourceRegion(m_source.isMarked() ? m_source.getMarkedRegion(EditModule::ExactTimes)
                                              : Range(m_source.getEdit()->getStartTime(), end));
    if (m_span.end() == kNoTime) {
        return refuse("the source needs two different marks, or one and a current time");
    }
    if (!checkSourceRegion(m_span)) {
        return false;
    }
    if (!(m_span.length() > kTimeTolerance)) {
        return refuse("the source's region is empty; mark a part that is at least one frame long");
    }
    if (m_span.start() >= end - kTimeTolerance) {
        return refuse("the source ends at " + secondsText(end) + " s, before its marked region begins");
    }
    return true;
}

/// Plans every channel, or in the second pass of a stereoscopic expansion the other eye of those that were
/// planned.
bool Editor::Planner::planPass(const EditModule& destination, bool otherEyes) {
    std::vector<Target> pairs;
    if (otherEyes) {
        for (const Target& target : m_plan->targets) {
            const IdStamp eye = otherEye(*destination.getEdit(), target.chan);
            if (eye.valid()) {
                pairs.push_back(target);
                pairs.back().chan = eye;
            }
        }
    } else {
        for (const Edit::ChanType& kind : kChannelKinds) {
            if (!pairChannels(destination, kind, pairs)) {
                return false;
            }
        }
    }
    for (const Target& target : pairs) {
        if (!addSourceSteps(target, destination)) {
            return false;
        }
    }
    return true;
}

bool Editor::Planner::pairChannels(const EditModule& destination, Edit::ChanType type,
                                   std::vector<Target>& pairs) {
    Vector<IdStamp> from;
    Vector<IdStamp> to;
    m_source.getSelectedChans(from, type);
    destination.getSelectedChans(to, type);
    const Edit& edit = *destination.getEdit();
    const unsigned present = edit.getNumChans(type.type, type.subtype);
    const bool mayAdd = to.size() == present && (m_flags & Editor::NoNewChannels) == 0;
    if (Editor::stereoscopicExpansionRequired(m_source, m_destination, m_op)) {
        // The other eyes are done in the second pass.
        std::erase_if(
            to, [&](const IdStamp& chan) { return otherEye(edit, edit.getFirstInGroup(chan)) == chan; });
    }
    size_t needed = from.size();
    while (needed > 0 && m_source.getEdit()->isEmpty(from[needed - 1])) {
        --needed;
    }
    size_t added = 0;
    for (size_t i = 0; i < std::max(from.size(), to.size()); ++i) {
        if (i >= to.size() && (!mayAdd || i >= needed)) {
            break;
        }
        const bool opensOrEnds = m_core == kCoreInsert || m_op == Op::ReplaceToEnd;
        if (i >= from.size() && !opensOrEnds) {
            break;
        }
        Target target;
        target.type = type;
        target.chan = i < to.size() ? to[i] : IdStamp();
        target.source = i < from.size() ? from[i] : IdStamp();
        added += i < to.size() ? 0 : 1;
        pairs.push_back(target);
    }
    const unsigned most = type.type == AudioChan ? kMaxAudioChans : kMaxVideoChans;
    if (isContinuous(type) && added > 0 && present + added > most) {
        return refuse(String::format("the edit %s can hold no more than %u %s channels",
                                     edit.get_cookie_str().c_str(), most,
                                     type.type == AudioChan ? "audio" : "video"));
    }
    return true;
}

/// Where what comes from a source channel goes.
bool Editor::Planner::findLay(const Target& target, const EditModule& destination, Lay& lay) {
    if (isMarkedOperation(m_op)) {
        Range own;
        if (!destinationRegion(destination, target.chan, own)) {
            return false;
        }
        const double length = m_core == kCoreInsert ? m_markedLength : own.length();
        lay.at = lay.open = own.start();
        if (target.source.valid()) {
            const bool back = editOpIsBackwards(m_op);
            const double mark = m_source.getMarkedPlace(target.source, back ? OutMark : InMark);
            const double place = exact() || mark >= kNoTime ? mark : roundTo(m_sourceRate, mark);
            const double start = back ? place - length : place;
            lay.region = Range(start, start + length);
        } else {
            lay.region = Range(0, length);
        }
    } else {
        const bool own = target.source.valid() && m_source.isMarked(target.source);
        lay.region =
            own ? sourceRegion(m_source.getMarkedRegion(target.source, EditModule::ExactTimes)) : m_span;
        const bool back = editOpIsBackwards(m_op);
        const double place = rounded(destination.getMarkedPlace(target.chan, back ? OutMark : InMark));
        lay.open = back ? place - m_span.length() : place;
        lay.at = rounded(lay.open + (lay.region.start() - m_span.start()));
        // Two roundings may add up to a frame more than the whole has.
        const double room = lay.open + m_span.length() - lay.at;
        if (lay.region.length() > room + kTimeTolerance) {
            lay.region = Range(lay.region.start(), lay.region.start() + std::max(room, 0.0));
        }
    }
    if (lay.open >= kNoTime || lay.at >= kNoTime || lay.region.end() >= kNoTime) {
        return refuse("the " + String(lay.region.end() >= kNoTime ? "source" : "destination") +
                      " has neither a mark nor a current time");
    }
    return checkSourceRegion(lay.region);
}

bool Editor::Planner::checkSourceRegion(const Range& region) {
    if (!(region.start() > -kTimeTolerance)) {
        return refuse("the source's region begins before its start, at " + secondsText(region.start()) +
                      " s");
    }
    return region.end() <= cel::kGreatestTime ||
           refuse("the source's region ends beyond the greatest time that an edit can hold");
}

bool Editor::Planner::addSourceSteps(Target target, const EditModule& destination) {
    Lay lay;
    if (!findLay(target, destination, lay)) {
        return false;
    }
    Edit& edit = *m_source.getEdit();
    const size_t index = addTarget(target);
    if (m_core == kCoreInsert) {
        addInsert(index, lay);
    } else if (m_op == Op::FillBlack) {
        addFillBlack(index, lay);
    } else if (target.source.valid() && lay.region.length() > kTimeTolerance) {
        addCopyStep(index, lay.at, edit, target.source, lay.region);
    }
    if (m_op == Op::ReplaceToEnd && target.chan.valid()) {
        const cel* const events =
            m_destination.getEdit()->get_edit_cel_p(m_destination.getEdit()->getIdx(target.chan));
        const double end = lay.open + m_span.length();
        if (events != nullptr && events->get_end_time() > end + kTimeTolerance) {
            addStep(kCoreRemove, index, end, events->get_end_time() - end);
        }
    }
    return m_refusal.isOk();
}

/// A channel opens by the one length that every channel does; what a channel's own marks leave out is black.
void Editor::Planner::addInsert(size_t target, const Lay& lay) {
    const double length = isMarkedOperation(m_op) ? m_markedLength : m_span.length();
    const IdStamp source = m_plan->targets[target].source;
    const bool whole = lay.at == lay.open && lay.region.length() == length;
    const Range all = source.valid() && whole ? lay.region : Range(0, length);
    if (!source.valid() || !whole) {
        addBlackStep(kCoreInsert, target, lay.open, length);
    }
    if (source.valid()) {
        addCopyStep(target, lay.at, *m_source.getEdit(), source, whole ? all : lay.region);
        if (whole && !m_plan->steps.empty()) {
            m_plan->steps.back().core = kCoreInsert;
            m_plan->steps.back().length = length;
        }
    }
}

/// One step for each part of the region where the destination has nothing or black.
void Editor::Planner::addFillBlack(size_t target, const Lay& lay) {
    const Target& events = m_plan->targets[target];
    const Edit& edit = *m_destination.getEdit();
    const cel* const content = events.chan.valid() ? edit.get_edit_cel_p(edit.getIdx(events.chan)) : nullptr;
    double to = lay.at + lay.region.length();
    if (m_destination.isMarked(InMark) && m_destination.isMarked(OutMark)) {
        const double out = m_destination.getMarkedPlace(events.chan, OutMark);
        to = out > m_destination.getMarkedPlace(events.chan, InMark) ? std::min(to, rounded(out)) : to;
    }
    const auto fill = [&](double from, double end) {
        if (events.source.valid() && end - from > kTimeTolerance) {
            const double lead = from - lay.at;
            const double start = lay.region.start() + lead;
            addCopyStep(target, from, *m_source.getEdit(), events.source, Range(start, start + (end - from)),
                        lead);
        }
    };
    double now = lay.at;
    const ce_handle first = content != nullptr ? content->find_ceh(lay.at, CE_IN_POINT) : ce_handle();
    for (int i = std::max(first.index(), 0); content != nullptr && i + 1 < content->numEvents(); i += 2) {
        const channel_event& in = *content->getChanEventPtr(i);
        const channel_event& out = *content->getChanEventPtr(i + 1);
        if (in.editTime >= to) {
            break;
        }
        if (!in.strip.isBlack() && out.editTime > now) {
            fill(now, in.editTime);
            now = std::max(now, out.editTime);
        }
    }
    fill(now, to);
}
