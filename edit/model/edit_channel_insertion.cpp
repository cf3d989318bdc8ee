#include "edit/model/detail/channel_set.h"
#include "edit/model/edit.h"
#include "platform/services/log.h"

#include <cmath>

namespace {

using List = Edit::ChannelSet::List;
using Place = Edit::ChannelSet::Place;

/// The new cels are filled to the end of the edit.
constexpr double kFillToEdit = -1.0;

/// Prints why `count` more channels do not fit into a list, if they do not: for its own limit, or because an
/// index would reach `NO_CHAN`.
bool fits(List list, const Edit::ChannelSet& channels, uint64_t count, const cookie& item) {
    static constexpr struct {
        const char* what;
        uint64_t limit;
    } kLists[] = {
        {"effects", NO_CHAN}, {"video", kMaxVideoChans}, {"audio", kMaxAudioChans}, {"levels", NO_CHAN}};
    if (channels.size(list) + count <= kLists[list].limit && channels.size() + count <= NO_CHAN) {
        return true;
    }
    herc_printf("Too many %s channels for <%s>\n", kLists[list].what, cookie_string(item).c_str());
    return false;
}

} // namespace

/// Where in its list a new channel goes that is asked for at, or after, another.
size_t Edit::insertionPosition(Edit_Chan_Type type, Edit_Chan_SubType subtype, int at, bool before) const {
    const List list = ChannelSet::listFor(type, subtype);
    const size_t end = m_channels->size(list);
    if (at == NO_CHAN || !getId(at).valid()) {
        return end;
    }
    const int beforeWhich = before ? at : at + 1;
    const Place place = m_channels->find(beforeWhich);
    const bool asAsked = before ? place.list == list
                                : getChanType(beforeWhich) == type && getChanSubtype(beforeWhich) == subtype;
    return asAsked ? place.position : end;
}

bool Edit::insertChans(Edit_Chan_Type type, Edit_Chan_SubType subtype, int at, unsigned count, bool before,
                       bool notify, double time) {
    return insertChannels({type, subtype}, at, count, before, notify, time, nullptr).valid();
}

IdStamp Edit::insertChannels(ChanType type, int at, unsigned count, bool before, bool notify, double time,
                             cel* content) {
    const List list = ChannelSet::listFor(type.type, type.subtype);
    if (list == ChannelSet::kNumLists || count == 0 || !std::isfinite(time) || time > cel::kGreatestTime ||
        refusesChange() || !fits(list, *m_channels, count, m_cookie)) {
        return {};
    }
    const double fillTo = time == kFillToEdit ? get_start_or_end_time(false, false) : time;
    const Place first{list, insertionPosition(type.type, type.subtype, at, before)};
    IdStamp firstId;
    for (unsigned i = 0; i < count; ++i) {
        const IdStamp id = usableStamp(IdStamp());
        firstId = i == 0 ? id : firstId;
        const Qx::Ptr<cel> its = content != nullptr ? Qx::Ptr<cel>(content) : std::make_shared<cel>();
        m_channels->insert(list, first.position + i, its, id);
        if (fillTo > 0 && content == nullptr) {
            its->fillToTime(fillTo);
        }
    }
    const int index = m_channels->index(first);
    shuffleCueChans(index, static_cast<int>(count));
    dropDerivedValues();

    if (!notify) {
        recordUndescribed();
        return firstId;
    }
    const KeepAlive keep(*this);
    const EditModification change =
        EditModification(kChansInserted).setChan(firstId).setChans(index, static_cast<int>(count));
    recordChange(change, false);
    sendChannelMessage(getChanAddedNotifyMsgType(), type.type, at, static_cast<int>(count));
    recordChange(change, true);
    return firstId;
}

int Edit::addChan(Edit_Chan_Type type, cel* content, bool notify, Edit_Chan_SubType subtype, bool /*unused*/,
                  double time) {
    const KeepAlive keep(*this);
    const IdStamp added = insertChannels({type, subtype}, NO_CHAN, 1, false, notify, time,
                                         isGivenCel(content) ? content : nullptr);
    return getIdx(added);
}

IdStamp Edit::addLevelsChan(const IdStamp& audio, const AudLevelsCel& levels, bool notify) {
    const Place place = m_channels->find(audio);
    if (place.list != ChannelSet::Audio || !levels.valid() ||
        m_channels->audio()[place.position].getLevelsChanID().valid() || refusesChange() ||
        !fits(ChannelSet::Levels, *m_channels, 1, m_cookie)) {
        return {};
    }
    const IdStamp owner = audio;
    const IdStamp id = usableStamp(levels.id());
    const int index = getNumChans();
    m_channels->insertLevels(levels, id, place.position);
    shuffleCueChans(index, 1);
    dropDerivedValues();
    soundChanged(kLevelsChanged, owner, notify);
    return id;
}

bool Edit::isGivenCel(const cel* content) {
    return reinterpret_cast<uintptr_t>(content) > 1;
}

bool Edit::removeChan(const IdStamp& chan, bool notify) {
    const Place place = m_channels->find(chan);
    if (!place || refusesChange()) {
        return false;
    }
    const IdStamp levels =
        place.list == ChannelSet::Audio ? m_channels->audio()[place.position].getLevelsChanID() : IdStamp();
    std::vector<ChannelSet::Removed> removed;
    // The levels first: they lie behind, so both indices are those from before the removal.
    if (const Place levelsPlace = m_channels->find(levels)) {
        channelRemoved(levels, m_channels->index(levelsPlace));
        removed.push_back(m_channels->remove(levelsPlace));
    }
    channelRemoved(m_channels->id(place), m_channels->index(place));
    removed.push_back(m_channels->remove(place));
    dropDerivedValues();

    if (!notify) {
        recordUndescribed();
        return true;
    }
    const KeepAlive keep(*this);
    const ChannelSet::Removed& main = removed.back();
    const EditModification change = EditModification(kChansRemoved).setChan(main.id).setChans(main.index, 1);
    recordChange(change, false);
    for (const ChannelSet::Removed& gone : removed) {
        sendChannelMessage(getChanDeletedNotifyMsgType(), ChannelSet::typeOf(gone.list).type, gone.index, 1);
    }
    recordChange(change, true);
    return true;
}

bool Edit::removeChans(bool notify) {
    const int count = getNumChans();
    if (count == 0 || refusesChange()) {
        return false;
    }
    allChannelsRemoved();
    std::vector<ChannelSet::Removed> removed; // kept until everybody was told
    removed.reserve(static_cast<size_t>(count));
    for (int i = count - 1; i >= 0; --i) {
        removed.push_back(m_channels->remove(m_channels->find(i)));
    }
    dropDerivedValues();

    if (!notify) {
        recordUndescribed();
        return true;
    }
    const KeepAlive keep(*this);
    const EditModification change = EditModification(kChansRemoved).setChans(0, count);
    recordChange(change, false);
    sendChannelMessage(getChanDeletedNotifyMsgType(), AnyChan, 0, count);
    recordChange(change, true);
    return true;
}
