#include "edit/editing/detail/edit_plan.h"
#include "edit/model/channel_group_list.h"
#include "edit/model/cue_list.h"
#include "platform/base/ole_splat.h"

#include <algorithm>
#include <cmath>
#include <set>

using editing_detail::isContinuous;
using Qx::kTimeTolerance;

namespace {

bool touch(const channel_event& out, const channel_event& in) {
    return in.editTime - out.editTime <= kTimeTolerance;
}

/// True if pair `pair` of a cel and the one after it are black and touch.
bool isBlackJoint(const cel& events, int pair) {
    const channel_event* const in = events.getChanEventPtr(2 * pair);
    const channel_event* const out = events.getChanEventPtr(2 * pair + 1);
    const channel_event* const next = events.getChanEventPtr(2 * pair + 2);
    return in != nullptr && next != nullptr && in->strip.isBlack() && next->strip.isBlack() &&
           touch(*out, *next);
}

/// The pairs of a cel within a span that was changed, with the pieces that a cut left on either side and what
/// touches those: a cue that kept them apart may have gone on with the other piece.
std::pair<int, int> pairsAround(const cel& events, const cel::Range& span) {
    const int first = std::max(events.find_ceh(span.start(), CE_IN_POINT).index(), 0) / 2;
    const int last = std::max(events.find_ceh(span.end(), CE_IN_POINT).index(), 0) / 2;
    return {std::max(first - 2, 0), std::min(last + 1, events.numPairs() - 1)};
}

} // namespace

/// Adds the channels that the plan needs, in the order in which they correspond, at the end of their lists.
void Editor::autoAddTracks() {
    Edit& edit = *m_destination.getEdit();
    for (Target& target : m_plan->targets) {
        if (!target.chan.valid()) {
            target.chan = setCel(edit, target.type, nullptr);
            if (target.chan.valid()) {
                m_added.push_back(target.chan);
            } else {
                ole_splat("Editor: a channel that was checked could not be added\n");
            }
        }
        if (target.source.valid()) {
            m_map.emplace(target.source, target.chan);
        }
    }
}

IdStamp Editor::setCel(Edit& edit, Edit::ChanType type, std::unique_ptr<cel> content) {
    const int index = edit.addChan(type.type, content.get(), false, type.subtype);
    if (index == NO_CHAN) {
        return {};
    }
    static_cast<void>(content.release()); // the edit has taken it over
    return edit.getId(index);
}

/// Adds the levels channels that the plan needs.
void Editor::autoAddLevels() {
    Edit& edit = *m_destination.getEdit();
    for (Target& target : m_plan->targets) {
        if (target.needsLevels && !target.levels.valid()) {
            target.levels = editing_detail::addLevels(edit, target.chan);
            if (target.levels.valid()) {
                m_firstLevelsAdded = m_numLevelsAdded++ == 0 ? target.levels : m_firstLevelsAdded;
            }
        }
    }
}

/// Groups what the members of a group of the source correspond to, where none of those is grouped yet.
void Editor::autoCreateTrackGroups(const EditModule& source) {
    Edit& edit = *m_destination.getEdit();
    const Edit& from = *source.getEdit();
    ChannelGroupList* const groups = from.numGroups() > 0 ? edit.retrieveGroupsList() : nullptr;
    for (unsigned i = 0; groups != nullptr && i < from.numGroups(); ++i) {
        const ChannelGroup* const group = from.getTrackGroup(i);
        Vector<IdStamp> members;
        for (const IdStamp& chan : group->getChans()) {
            const auto found = m_map.find(chan);
            if (found != m_map.end() && !groups->isMember(found->second)) {
                members.push_back(found->second);
            }
        }
        if (members.size() == group->size()) {
            groups->addGroup(members, group->getType());
        }
    }
}

/// Makes all video and audio channels as long as the longest.
void Editor::padTracksWithBlack(edit_operation op) {
    if (!editOpCanAffectTrackLength(op)) {
        return;
    }
    const Edit& edit = *m_destination.getEdit();
    double end = 0;
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const cel* const events = edit.get_edit_cel_p(i);
        if (events != nullptr && isContinuous({edit.getChanType(i), edit.getChanSubtype(i)})) {
            end = std::max(end, events->get_end_time());
        }
    }
    for (int i = 0; i < edit.getNumChans(); ++i) {
        cel* const events = edit.get_edit_cel_p(i);
        if (events != nullptr && isContinuous({edit.getChanType(i), edit.getChanSubtype(i)}) &&
            events->fillToTime(end)) {
            noteTouched(edit.getId(i), {CEHPair(events->get_end_ceh()).editRange().start(), end});
        }
    }
}

/// The channel was changed within the span: its pairs there, and those that touch them, are looked at when
/// all is done.
void Editor::noteTouched(const IdStamp& chan, const cel::Range& span) {
    m_touched.try_emplace(chan, span).first->second.widen(span);
}

/// Merges black with black where the operation made them touch, but for black to which something is bound.
/// The whole of a channel is walked only when there is something to merge.
void Editor::simplifyBlack() {
    Edit& edit = *m_destination.getEdit();
    std::set<IdStamp> cued; // worked out when first needed
    bool cuesRead = false;
    const auto mayMerge = [&](const channel_event* pair, const channel_event* next) {
        const cue_list& cues = edit.get_cues();
        for (size_t i = 0; !cuesRead && i < cues.get_num_cue_points(0); ++i) {
            const cue_point& cue = *cues.get_cue_point(i, 0);
            if (cue.attached() && cue.event().valid() != 0) {
                cued.insert(cue.event().get_channel_event().id);
            }
        }
        cuesRead = true;
        // The events at the cut go; an effect would be seen for longer or not at all.
        const TagBag& objects = edit.objectStore();
        return !cued.contains(pair[1].id) && !cued.contains(next[0].id) &&
               !objects.contains(pair[0].id.asString()) && !objects.contains(next[0].id.asString());
    };
    for (const auto& [chan, span] : m_touched) {
        cel* const events = celOf(chan);
        if (events == nullptr) {
            continue;
        }
        const auto [first, last] = pairsAround(*events, span);
        bool found = false;
        for (int pair = first; pair <= last && !found; ++pair) {
            found = isBlackJoint(*events, pair);
        }
        if (found) {
            events->simplify(Simplification::MergeBlack, mayMerge);
        }
    }
}

/// Checks the pairs about the place of the operation: in order, matched, without overlap.
void Editor::verifyTracks() {
    for (const auto& [chan, span] : m_touched) {
        const cel* const events = celOf(chan);
        if (events == nullptr) {
            continue;
        }
        const auto [first, last] = pairsAround(*events, span);
        for (int pair = first; pair <= last; ++pair) {
            const channel_event& in = *events->getChanEventPtr(2 * pair);
            const channel_event& out = *events->getChanEventPtr(2 * pair + 1);
            const channel_event* const next = events->getChanEventPtr(2 * pair + 2);
            if (in.kind != CE_IN_POINT || out.kind != CE_OUT_POINT || out.editTime < in.editTime ||
                (next != nullptr && next->editTime < out.editTime)) {
                ole_splat("Editor: the events of channel %s at %g s are not consistent\n",
                          m_destination.getEdit()->getChanDisplayName(chan).c_str(), in.editTime);
            }
        }
    }
}

bool Editor::stereoscopicExpansionRequired(const EditModule& source, const EditModule& destination,
                                           edit_operation op) {
    if (!editOpRequiresSourceAndDest(op)) {
        return false;
    }
    const auto inStereo = [](const Edit& edit, const IdStamp& chan) -> const ChannelGroup* {
        for (unsigned i = 0; i < edit.numGroups(); ++i) {
            const ChannelGroup* const group = edit.getTrackGroup(i);
            if (group->getType() == ChannelGroup::eStereoscopic && group->isMember(chan)) {
                return group;
            }
        }
        return nullptr;
    };
    Vector<IdStamp> chans;
    source.getSelectedChans(chans, {VideoChan, Edit_Chan_SubType::NONE});
    for (const IdStamp& chan : chans) {
        if (inStereo(*source.getEdit(), chan) != nullptr) {
            return false; // it brings both eyes itself
        }
    }
    const bool picture = !chans.empty();
    chans.clear();
    destination.getSelectedChans(chans, {VideoChan, Edit_Chan_SubType::NONE});
    return picture && std::any_of(chans.begin(), chans.end(), [&](const IdStamp& chan) {
               const ChannelGroup* const group = inStereo(*destination.getEdit(), chan);
               return group != nullptr &&
                      std::all_of(group->getChans().begin(), group->getChans().end(),
                                  [&](const IdStamp& eye) { return destination.isSelected(eye); });
           });
}
