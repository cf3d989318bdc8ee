#include "edit/editing/detail/cue_follower.h"
#include "edit/model/cue_list.h"

#include <algorithm>
#include <map>
#include <utility>

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
            const cel* const content = edit.get_edit_cel_p(edit.getIdx(plan.targets[step.target].chan));
            if (cue.event().get_its_cel() == content &&
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
    moveToCopies();
    cues.update_edit_time();
    cues.delete_cues_if([this](size_t i, const cue_point& cue) {
        return i < m_hadEvent.size() && m_hadEvent[i] && cue.event().valid() == 0;
    });
}

/// The cues whose moment went to another channel: to the copies of their events there.
void Editor::CueFollower::moveToCopies() {
    std::map<IdStamp, std::vector<std::pair<IdStamp, size_t>>> wanted; // events and cues of each channel
    for (const Moved& moved : m_moved) {
        if (const auto copy = m_copies.find(moved.event); copy != m_copies.end()) {
            wanted[copy->second.chan].emplace_back(copy->second.event, moved.cue);
        }
    }
    for (auto& [chan, events] : wanted) {
        const int index = m_edit.getIdx(chan);
        const cel* const content = m_edit.get_edit_cel_p(index);
        std::sort(events.begin(), events.end());
        for (int i = 0; content != nullptr && i < content->numEvents(); ++i) {
            const IdStamp& event = content->getChanEventPtr(i)->id;
            for (auto at = std::lower_bound(events.begin(), events.end(), std::pair(event, size_t{0}));
                 at != events.end() && at->first == event; ++at) {
                cue_point* const cue = m_edit.get_cues().get_cue_point(at->second, 0);
                if (cue != nullptr) {
                    cue->setEvent(ce_handle(content, i));
                    cue->setChannel(cue->channel() == kAnyCueChan ? kAnyCueChan : index);
                }
            }
        }
    }
}
