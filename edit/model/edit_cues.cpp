#include "edit/model/cel.h"
#include "edit/model/channel_group_list.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "edit/model/event_objects.h"
#include "platform/store/tag_bag.h"

#include <unordered_set>

namespace {

bool isCelCue(const cue_point& cue) {
    return cue.attached() && !cue.hasFlags(CueFlag::kKept);
}

} // namespace

void Edit::cuesChanged() {
    setChangeDescription(kCuesChanged, true);
}

bool Edit::delete_all_cel_cues() {
    if (m_cues.delete_cues_if([](size_t, const cue_point& cue) { return isCelCue(cue); }) == 0) {
        return false;
    }
    cuesChanged();
    return true;
}

bool Edit::cel_cues_off() {
    set_cel_cues_loaded(false);
    return delete_all_cel_cues();
}

bool Edit::deleteCues(int chan) {
    if (m_cues.get_num_cue_points(0) == 0 || refusesChange() || m_cues.delete_matching_cues(0, chan) == 0) {
        return false;
    }
    cuesChanged();
    return true;
}

bool Edit::deleteCue(size_t index) {
    if (m_cues.get_cue_point(index, 0) == nullptr || refusesChange() || !m_cues.delete_cue_point(index)) {
        return false;
    }
    cuesChanged();
    return true;
}

bool Edit::updateCues() {
    if (m_cues.update_edit_time() == 0) {
        return false;
    }
    cuesChanged();
    return true;
}

void Edit::convertCues() {
    Vector<cel*> cels;
    const int count = getNumChans();
    cels.reserve(static_cast<size_t>(count));
    for (int i = 0; i < count; ++i) {
        cels.push_back(get_edit_cel_p(i));
    }
    m_cues.convert(cels);
}

void Edit::shuffleCueChans(int firstChan, int count) {
    m_cues.shuffleChans(firstChan, count);
}

void Edit::storeCues() {
    auto kept = std::make_unique<cue_list>();
    for (size_t i = 0; const cue_point* const cue = m_cues.get_cue_point(i, 0); ++i) {
        if (cue->hasFlags(CueFlag::kKept)) {
            kept->add_cue_point(*cue);
        }
    }
    kept->dropCels(); // they may go before the stored cues do
    m_store.storeObject(EditKeys::kCues, std::move(kept));
}

bool Edit::retrieveCues() {
    if (!m_store.contains(EditKeys::kCues)) {
        m_cues.delete_all_cues();
        return true;
    }
    const auto* stored = dynamic_cast<const cue_list*>(m_store.openObject(EditKeys::kCues));
    if (stored == nullptr) {
        return false;
    }
    m_cues = *stored;
    if (!m_initialising && !m_loading) {
        convertCues(); // else the channels are still to come
    }
    return true;
}

void Edit::celReplaced(const cel* from, cel* to) {
    m_cues.rebindCel(from, to);
}

void Edit::channelRemoved(const IdStamp& chan, int index) {
    // While the edit is read, the store holds the groups of what is being read already.
    if (!m_loading) {
        EventObjects::dropChannel(*this, chan);
        for (ChannelGroupList* list : {retrieveGroupsList(), retrieveDefaultGroupsList()}) {
            if (list != nullptr) {
                list->removeMember(chan);
            }
        }
    }
    if (const cel* content = get_edit_cel_p(index); content != nullptr && getId(index) == chan) {
        m_cues.dropCel(content);
    }
    if (index >= 0 && index != NO_CHAN) {
        m_cues.delete_matching_cues(0, index);
        m_cues.shuffleChans(index + 1, -1);
    }
}

void Edit::allChannelsRemoved() {
    const int count = getNumChans();
    std::unordered_set<const cel*> cels;
    Vector<IdStamp> chans;
    for (int i = 0; i < count; ++i) {
        chans.push_back(getId(i));
        cels.insert(get_edit_cel_p(i));
    }
    if (!m_loading) {
        EventObjects::dropChannel(*this, IdStamp());
        for (ChannelGroupList* list : {retrieveGroupsList(), retrieveDefaultGroupsList()}) {
            for (size_t i = 0; list != nullptr && list->size() > 0 && i < chans.size(); ++i) {
                list->removeMember(chans[i]);
            }
        }
    }
    m_cues.delete_cues_if(
        [count](size_t, const cue_point& cue) { return cue.channel() >= 0 && cue.channel() < count; });
    m_cues.dropCels([&](const cel* gone) { return cels.contains(gone); });
    m_cues.shuffleChans(count, -count);
}

void Edit::channelRenamed(const IdStamp& from, const IdStamp& to) {
    // Who renames many while the edit is read tells of all of them at once.
    if (!m_loading) {
        EventObjects::renameChannels(*this, {{from, to}});
    }
    for (ChannelGroupList* list : {retrieveGroupsList(), retrieveDefaultGroupsList()}) {
        if (list != nullptr) {
            list->replaceMember(from, to);
        }
    }
    const String origin = m_header.getString(String(EditKeys::kTrackOrigin) + from.asString());
    if (!origin.empty()) {
        m_header.remove(String(EditKeys::kTrackOrigin) + from.asString());
        m_header.setString(String(EditKeys::kTrackOrigin) + to.asString(), origin);
    }
}
