#include "edit/editing/detail/edit_plan.h"

#include <algorithm>

using editing_detail::kChannelKinds;
using editing_detail::secondsText;
using Op = edit_operation;
using Qx::kTimeTolerance;

namespace {

Vector<IdStamp> selectedOf(const EditModule& module, const Edit::ChanType& kind) {
    Vector<IdStamp> chans;
    module.getSelectedChans(chans, kind);
    return chans;
}

} // namespace

double Editor::Planner::endOf(const IdStamp& chan) const {
    const Edit& edit = *m_destination.getEdit();
    const cel* const events = edit.get_edit_cel_p(edit.getIdx(chan));
    return events != nullptr ? events->get_end_time() : 0;
}

bool Editor::Planner::planWithin() {
    return editOpIsInterTrack(m_op) ? planInterTrack() : planRemoveOrLift();
}

bool Editor::Planner::planRemoveOrLift() {
    for (const Edit::ChanType& kind : kChannelKinds) {
        for (const IdStamp& chan : selectedOf(m_destination, kind)) {
            Range region;
            if (!destinationRegion(m_destination, chan, region)) {
                return false;
            }
            const double end = endOf(chan);
            if (region.start() >= end - kTimeTolerance) {
                continue; // nothing lies there
            }
            Target target;
            target.type = kind;
            target.chan = chan;
            const size_t index = addTarget(target);
            if (m_core == kCoreRemove) {
                addStep(kCoreRemove, index, region.start(), region.length());
            } else {
                addBlackStep(kCoreReplace, index, region.start(),
                             std::min(region.end(), end) - region.start());
            }
        }
    }
    return !m_plan->steps.empty() || refuse("nothing lies in the marked region of the selected channels");
}

bool Editor::Planner::planInterTrack() {
    const char* const needed = m_op == Op::SwapTracks
                                   ? "needs exactly two selected channels of a kind to change places"
                                   : "needs at least two selected channels of a kind";
    bool anyKind = false;
    for (const Edit::ChanType& kind : kChannelKinds) {
        const Vector<IdStamp> chans = selectedOf(m_destination, kind);
        if (chans.size() < 2) {
            continue;
        }
        if (m_op == Op::SwapTracks && chans.size() > 2) {
            return refuse(String(editOperationName(m_op)) + " " + needed);
        }
        anyKind = true;
        if (!(m_op == Op::SwapTracks ? addSwap(chans) : addCopies(chans))) {
            return false;
        }
    }
    if (!anyKind) {
        return refuse(String(editOperationName(m_op)) + " " + needed);
    }
    return !m_plan->steps.empty() || refuse("nothing lies in the marked region of the selected channels");
}

/// A step that lays a region of one channel at the same times of another, as far as that reaches: no channel
/// becomes longer. False with the refusal set if something would be left out so.
bool Editor::Planner::addFittingStep(const IdStamp& from, const IdStamp& to, const Range& region) {
    Edit& edit = *m_destination.getEdit();
    const cel* const content = edit.get_edit_cel_p(edit.getIdx(from));
    const double reach = std::clamp(endOf(to), region.start(), region.end());
    Target target;
    target.type = edit.getChanTypeAndSubType(to);
    target.chan = to;
    target.source = from;
    if (content != nullptr && region.end() - reach > kTimeTolerance &&
        !content->isEmpty(Range(reach, region.end()))) {
        return refuse(nameOf(target) + " ends at " + secondsText(endOf(to)) + " s, and " +
                      String(editOperationName(m_op)) +
                      " makes no channel longer; mark no more than that, "
                      "deselect the channel or fill it first");
    }
    if (reach - region.start() > kTimeTolerance) {
        addCopyStep(addTarget(target), region.start(), edit, from, Range(region.start(), reach));
    }
    return m_refusal.isOk();
}

bool Editor::Planner::addSwap(const Vector<IdStamp>& chans) {
    Range region;
    return destinationRegion(m_destination, IdStamp(), region) &&
           addFittingStep(chans[0], chans[1], region) && addFittingStep(chans[1], chans[0], region);
}

bool Editor::Planner::addCopies(const Vector<IdStamp>& chans) {
    Range region;
    if (!destinationRegion(m_destination, chans[0], region)) {
        return false;
    }
    for (size_t i = 1; i < chans.size(); ++i) {
        if (!addFittingStep(chans[0], chans[i], region)) {
            return false;
        }
    }
    const double length = std::min(region.end(), endOf(chans[0])) - region.start();
    if (m_op == Op::MoveTrack && length > kTimeTolerance) {
        Target first;
        first.type = m_destination.getEdit()->getChanTypeAndSubType(chans[0]);
        first.chan = chans[0];
        addBlackStep(kCoreReplace, addTarget(first), region.start(), length);
    }
    return m_refusal.isOk();
}
