#include "edit/editing/detail/cue_follower.h"

using Op = edit_operation;

Editor::CueFollower::CueFollower(Edit& edit, const Plan& plan, edit_operation op)
    : m_edit(edit), m_changesChannel(op == Op::SwapTracks || op == Op::MoveTrack) {
    cue_list& cues = edit.get_cues();
    const size_t count = cues.get_num_cue_points(0);
    m_hadEvent.resize(count);
    for (size_t i = 0; i < count; ++i) {
        const cue_point& cue = *cues.get_cue_point(i, 0);
        m_hadEvent[i] = cue.attached() && cue.event().valid() != 0;
        if (!m_hadEvent[i] || !m_changesChannel) {
            continue;
        }
        for (const Step& step : plan.steps) {
            const cel* const its = edit.get_edit_cel_p(edit.getIdx(plan.targets[step.target].chan));
            if (cue.event().get_its_cel() == its &&
                Qx::timeIsConsideredToBeInRegion(cue.editTime(), {step.at, step.end()})) {
                m_moved.push_back({i, cue.event().get_channel_event().id});
            }
        }
    }
}

void Editor::CueFollower::noteCopies(const IdStamp& chan, const cel::IdMap& copied) {
    if (m_moved.empty()) {
        return;
    }
    for (const auto& [old, made] : copied) {
        m_copies.try_emplace(old, Copy{chan, made});
    }
}

void Editor::CueFollower::follow() {
    cue_list& cues = m_edit.get_cues();
    for (const Moved& moved : m_moved) {
        const auto copy = m_copies.find(moved.event);
        cue_point* const cue = cues.get_cue_point(moved.cue, 0);
        if (copy == m_copies.end() || cue == nullptr) {
            continue;
        }
        const int index = m_edit.getIdx(copy->second.chan);
        const cel* const its = m_edit.get_edit_cel_p(index);
        const ce_handle event = its != nullptr ? its->findId(copy->second.event) : ce_handle();
        if (event.valid() != 0) {
            cue->setEvent(event);
            cue->setChannel(cue->channel() == kAnyCueChan ? kAnyCueChan : index);
        }
    }
    cues.update_edit_time();
    for (size_t i = m_hadEvent.size(); i-- > 0;) {
        const cue_point* const cue = cues.get_cue_point(i, 0);
        if (m_hadEvent[i] && cue != nullptr && cue->event().valid() == 0) {
            cues.delete_cue_point(i);
        }
    }
}
