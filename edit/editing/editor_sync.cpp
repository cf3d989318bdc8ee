#include "edit/editing/detail/edit_plan.h"

#include <algorithm>
#include <cmath>

using Qx::kTimeTolerance;

/// Records by how much further than the picture each channel moved. True if one is out of sync that was less
/// so before.
bool Editor::recordInterTrackSyncLosses() {
    Edit& edit = *m_destination.getEdit();
    // What stays, of the channels that take no part, from here on is no longer in step with what moves.
    const double place = m_plan->at;
    if (std::none_of(m_plan->targets.begin(), m_plan->targets.end(),
                     [](const Target& target) { return target.shift != 0; })) {
        return false;
    }
    struct Movement {
        IdStamp chan;
        double shift;
    };
    std::vector<Movement> movements;
    size_t reference = SIZE_MAX;
    bool pictureFound = false;
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const cel* const content = edit.get_edit_cel_p(i);
        if (content == nullptr) {
            continue;
        }
        const IdStamp chan = edit.getId(i);
        double shift = 0;
        bool moves = false;
        bool planned = false;
        for (const Target& target : m_plan->targets) {
            if (target.chan == chan && target.movesFrom != Qx::kNoTime) {
                shift = target.shift;
                moves = target.moves;
                planned = true;
            }
        }
        const double end = content->get_end_time();
        moves = planned ? moves : end > place + kTimeTolerance && !content->isEmpty({place, end});
        if (!moves) {
            continue;
        }
        const bool picture = editing_detail::isContinuous({edit.getChanType(i), edit.getChanSubtype(i)}) &&
                             edit.getChanType(i) == VideoChan;
        if (reference == SIZE_MAX || (picture && !pictureFound)) {
            reference = movements.size();
            pictureFound = picture;
        }
        movements.push_back({chan, shift});
    }
    bool lost = false;
    for (const Movement& movement : movements) {
        const double further = movement.shift - movements[reference].shift;
        if (std::abs(further) > kTimeTolerance) {
            const double loss = edit.getSyncLoss(movement.chan) + further;
            edit.setSyncLoss(movement.chan, std::abs(loss) > kTimeTolerance ? loss : 0, false);
            lost = lost || std::abs(loss) > kTimeTolerance;
        }
    }
    return lost;
}
