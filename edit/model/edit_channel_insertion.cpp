#include "edit/model/detail/channel_set.h"
#include "edit/model/edit.h"
#include "platform/services/log.h"

#include <cmath>

namespace {

using List = Edit::ChannelSet::List;
using Channel = Edit::ChannelSet::Channel;

/// The new cels are filled to the end of the edit.
constexpr double kFillToEdit = -1.0;

/// A channel that was taken out, and its index before.
struct Removed {
    std::unique_ptr<Channel> channel;
    int index = NO_CHAN;
};

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
    const Channel* const behind = m_channels->find(beforeWhich);
    const bool asAsked = before ? behind != nullptr && behind->list == list
                                : getChanType(beforeWhich) == type && getChanSubtype(beforeWhich) == subtype;
    return asAsked ? static_cast<size_t>(m_channels->position(behind)) : end;
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
    const size_t first = insertionPosition(type.type, type.subtype, at, before);
    IdStamp firstId;
    for (unsigned i = 0; i < count; ++i) {
        const IdStamp id = usableStamp(IdStamp());
        firstId = i == 0 ? id : firstId;
        const Qx::Ptr<cel> placed = content != nullptr ? Qx::Ptr<cel>(content) : std::make_shared<cel>();
        m_channels->insert(list, first + i, placed, id);
        if (fillTo > 0 && content == nullptr) {
            placed->fillToTime(fillTo);
        }
    }
    const int index = static_cast<int>(m_channels->first(list) + first);
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
    Channel* const known = m_channels->find(audio);
    if (known == nullptr || known->list != ChannelSet::Audio || !levels.valid() ||
        known->sound.getLevelsChanID().valid() || refusesChange() ||
        !fits(ChannelSet::Levels, *m_channels, 1, m_cookie)) {
        return {};
    }
    const IdStamp owner = known->id;
    const IdStamp id = usableStamp(levels.id());
    const int index = getNumChans();
    m_channels->insertLevels(levels, id, *known);
    shuffleCueChans(index, 1);
    dropDerivedValues();
    soundChanged(kLevelsChanged, owner, notify);
    return id;
}

bool Edit::isGivenCel(const cel* content) {
    return reinterpret_cast<uintptr_t>(content) > 1;
}

bool Edit::removeChan(const IdStamp& chan, bool notify) {
    const Channel* const known = m_channels->find(chan);
    if (known == nullptr || refusesChange()) {
        return false;
    }
    // The levels first: they lie behind, so both indices are those from before the removal.
    std::vector<Removed> removed; // kept until everybody was told
    if (const Channel* const levels = m_channels->find(known->sound.getLevelsChanID())) {
        removed.push_back({nullptr, m_channels->index(levels)});
        channelRemoved(levels->id, removed.back().index);
        removed.back().channel = m_channels->remove(*levels);
    }
    removed.push_back({nullptr, m_channels->index(known)});
    channelRemoved(known->id, removed.back().index);
    removed.back().channel = m_channels->remove(*known);
    dropDerivedValues();

    if (!notify) {
        recordUndescribed();
        return true;
    }
    const KeepAlive keep(*this);
    const Removed& main = removed.back();
    const EditModification change =
        EditModification(kChansRemoved).setChan(main.channel->id).setChans(main.index, 1);
    recordChange(change, false);
    for (const Removed& gone : removed) {
        sendChannelMessage(getChanDeletedNotifyMsgType(), gone.channel->type().type, gone.index, 1);
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
    std::vector<std::unique_ptr<Channel>> removed; // kept until everybody was told
    removed.reserve(static_cast<size_t>(count));
    for (int i = count - 1; i >= 0; --i) {
        removed.push_back(m_channels->remove(*m_channels->find(i)));
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
