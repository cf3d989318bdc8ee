#include "edit/editing/detail/edit_plan.h"

#include <cmath>

using Op = edit_operation;
using Qx::kTimeTolerance;

namespace {

constexpr Edit::ChanType kKinds[] = {{VideoChan, Edit_Chan_SubType::ALIAS},
                                     {VideoChan, Edit_Chan_SubType::NONE},
                                     {AudioChan, Edit_Chan_SubType::NONE}};

Vector<IdStamp> selectedOf(const EditModule& module, const Edit::ChanType& kind) {
    Vector<IdStamp> chans;
    module.getSelectedChans(chans, kind);
    return chans;
}

double endOf(const Edit& edit, const IdStamp& chan) {
    const cel* const its = edit.get_edit_cel_p(edit.getIdx(chan));
    return its != nullptr ? its->get_end_time() : 0;
}

} // namespace

bool Editor::Planner::planWithin() {
    return editOpIsInterTrack(m_op) ? planInterTrack() : planRemoveOrLift();
}

bool Editor::Planner::planRemoveOrLift() {
    const Edit& edit = *m_destination.getEdit();
    for (const Edit::ChanType& kind : kKinds) {
        for (const IdStamp& chan : selectedOf(m_destination, kind)) {
            Range region;
            if (!destinationRegion(m_destination, chan, region)) {
                return false;
            }
            const double end = endOf(edit, chan);
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
    for (const Edit::ChanType& kind : kKinds) {
        const Vector<IdStamp> chans = selectedOf(m_destination, kind);
        if (chans.size() < 2) {
            continue;
        }
        if (m_op == Op::SwapTracks && chans.size() > 2) {
            return refuse(String(editOperationName(m_op)) + " " + needed);
        }
        if (!(m_op == Op::SwapTracks ? addSwap(chans) : addCopies(chans))) {
            return false;
        }
    }
    if (m_plan->targets.empty()) {
        return refuse(String(editOperationName(m_op)) + " " + needed);
    }
    return !m_plan->steps.empty() || refuse("nothing lies in the marked region of the selected channels");
}

bool Editor::Planner::addSwap(const Vector<IdStamp>& chans) {
    const Edit& edit = *m_destination.getEdit();
    Range regions[2];
    for (size_t i = 0; i < 2; ++i) {
        if (!destinationRegion(m_destination, chans[i], regions[i])) {
            return false;
        }
    }
    if (std::abs(regions[0].length() - regions[1].length()) > kTimeTolerance) {
        return refuse("the marked regions that shall change places differ in length");
    }
    // Beyond the end of both there is nothing to change, and no channel grows beyond the edit.
    const double edge = edit.getEndTime();
    const double length =
        std::min({regions[0].length(), edge - regions[0].start(), edge - regions[1].start()});
    if (!(length > kTimeTolerance)) {
        return refuse("nothing lies in the marked region of the selected channels");
    }
    for (size_t i = 0; i < 2; ++i) {
        Target target;
        target.type = edit.getChanTypeAndSubType(chans[i]);
        target.chan = chans[i];
        target.source = chans[1 - i];
        const double from = regions[1 - i].start();
        addCopyStep(addTarget(target), regions[i].start(), edit, target.source, Range(from, from + length));
    }
    return m_reason.empty();
}

bool Editor::Planner::addCopies(const Vector<IdStamp>& chans) {
    const Edit& edit = *m_destination.getEdit();
    Range region;
    if (!destinationRegion(m_destination, chans[0], region)) {
        return false;
    }
    const double length = std::min(region.end(), edit.getEndTime()) - region.start();
    if (!(length > kTimeTolerance)) {
        return refuse("nothing lies in the marked region of the selected channels");
    }
    Target target;
    target.type = edit.getChanTypeAndSubType(chans[0]);
    for (size_t i = 1; i < chans.size(); ++i) {
        target.chan = chans[i];
        target.source = chans[0];
        addCopyStep(addTarget(target), region.start(), edit, chans[0],
                    Range(region.start(), region.start() + length));
    }
    const double own = std::min(length, endOf(edit, chans[0]) - region.start());
    if (m_op == Op::MoveTrack && own > kTimeTolerance) {
        target.chan = chans[0];
        target.source = IdStamp();
        addBlackStep(kCoreReplace, addTarget(target), region.start(), own);
    }
    return m_reason.empty();
}
