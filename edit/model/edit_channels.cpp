#include "edit/model/detail/channel_set.h"
#include "edit/model/edit.h"

#include <algorithm>
#include <cmath>

namespace {

using List = Edit::ChannelSet::List;
using Channel = Edit::ChannelSet::Channel;

/// True if a filter value lets a value pass: the wildcard, the same, or a bit in common.
template <typename Bits>
bool passes(Bits filter, Bits wildcard, Bits value) {
    return filter == wildcard || filter == value ||
           (static_cast<uint32_t>(filter) & static_cast<uint32_t>(value)) != 0;
}

/// The name by which a channel is shown that has none of its own.
String standardName(const Edit::ChannelSet& channels, const Channel& channel) {
    const char* letters = "";
    switch (channel.list) {
    case Edit::ChannelSet::Effects:
        letters = "FX";
        break;
    case Edit::ChannelSet::Video:
        letters = "V";
        break;
    case Edit::ChannelSet::Audio:
        letters = "A";
        break;
    case Edit::ChannelSet::Levels:
        letters = "L";
        break;
    case Edit::ChannelSet::kNumLists:
        return {};
    }
    return String::format("%s%d", letters, channels.position(&channel) + 1);
}

Edit::ChanType typeOf(const Channel* channel) {
    return channel != nullptr ? channel->type() : Edit::ChanType();
}

/// A name is a line of text: files write it on one.
bool isGoodName(const String& name) {
    return Qx::isUtf8(name) && std::none_of(name.begin(), name.end(), [](char c) {
               return static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
           });
}

} // namespace

int Edit::getNumChans() const {
    return static_cast<int>(m_channels->size());
}

uint16_t Edit::getNumChans(Edit_Chan_Type type) const {
    return getNumChans(type, Edit_Chan_SubType::ANY);
}

uint16_t Edit::getNumChans(Edit_Chan_Type type, Edit_Chan_SubType subtype) const {
    uint16_t count = 0;
    for (int i = getFirstChan(type, subtype); i != NO_CHAN; getNextChan(i, type, subtype)) {
        ++count;
    }
    return count;
}

IdStamp Edit::getId(int index) const {
    const Channel* const known = m_channels->find(index);
    return known != nullptr ? known->id : IdStamp();
}

int Edit::getIdx(const IdStamp& chan) const {
    return m_channels->index(m_channels->find(chan));
}

int Edit::getIndexWithinType(const IdStamp& chan) const {
    return m_channels->position(m_channels->find(chan));
}

int Edit::getIndexWithinType(int index) const {
    return m_channels->position(m_channels->find(index));
}

Edit_Chan_Type Edit::getChanType(int index) const {
    return typeOf(m_channels->find(index)).type;
}

Edit_Chan_SubType Edit::getChanSubtype(int index) const {
    return typeOf(m_channels->find(index)).subtype;
}

Edit_Chan_Type Edit::getChanType(const IdStamp& chan) const {
    return getChanTypeAndSubType(chan).type;
}

Edit_Chan_SubType Edit::getChanSubtype(const IdStamp& chan) const {
    return getChanTypeAndSubType(chan).subtype;
}

Edit::ChanType Edit::getChanTypeAndSubType(const IdStamp& chan) const {
    return typeOf(m_channels->find(chan));
}

bool Edit::chanValid(int index, Edit_Chan_Type type) const {
    const Channel* const known = m_channels->find(index);
    switch (type) {
    case AnyChan:
        return known != nullptr;
    case VideoChan:
    case AudioChan:
        return typeOf(known).type == type && known->content != nullptr;
    default:
        return false;
    }
}

bool Edit::chanValid(const IdStamp& chan, Edit_Chan_Type type) const {
    return chanValid(getIdx(chan), type);
}

int Edit::getFirstChan(Edit_Chan_Type type, Edit_Chan_SubType subtype) const {
    int index = kBeforeFirstChan;
    return getNextChan(index, type, subtype);
}

int Edit::getNextChan(int& index, Edit_Chan_Type type, Edit_Chan_SubType subtype) const {
    const int count = getNumChans();
    int next = index >= kBeforeFirstChan && index < count ? index + 1 : count;
    for (; next < count; ++next) {
        const ChanType chan = m_channels->find(next)->type();
        if (passes(type, AnyChan, chan.type) && passes(subtype, Edit_Chan_SubType::ANY, chan.subtype)) {
            return index = next;
        }
    }
    return index = NO_CHAN;
}

void Edit::getChans(Vector<int>& chans, Edit_Chan_Type type, Edit_Chan_SubType subtype) const {
    for (int i = getFirstChan(type, subtype); i != NO_CHAN; getNextChan(i, type, subtype)) {
        chans.push_back(i);
    }
}

void Edit::getChans(Vector<IdStamp>& chans, Edit_Chan_Type type, Edit_Chan_SubType subtype) const {
    for (int i = getFirstChan(type, subtype); i != NO_CHAN; getNextChan(i, type, subtype)) {
        chans.push_back(getId(i));
    }
}

cel* Edit::getCel(const IdStamp& chan) const {
    const Channel* const known = m_channels->find(chan);
    return known != nullptr ? known->cached : nullptr;
}

cel* Edit::get_edit_cel_p(int index) const {
    const Channel* const known = m_channels->find(index);
    return known != nullptr ? known->content.get() : nullptr;
}

bool Edit::sameType(const IdStamp& a, const IdStamp& b) const {
    return m_channels->contains(a) && m_channels->contains(b) && getChanType(a) == getChanType(b);
}

bool Edit::isEmpty(int index) const {
    const Channel* const known = m_channels->find(index);
    if (known == nullptr) {
        return true;
    }
    return known->content != nullptr ? known->content->isEmpty() : known->levels.is_dummy();
}

bool Edit::isEmpty(const IdStamp& chan) const {
    return isEmpty(getIdx(chan));
}

bool Edit::isEmpty() const {
    return !m_channels->any([](const Channel& channel) {
        return channel.content != nullptr ? !channel.content->isEmpty() : !channel.levels.is_dummy();
    });
}

Qx::Ptr<cel> Edit::contentOf(const IdStamp& chan) const {
    const Channel* const known = m_channels->find(chan);
    return known != nullptr ? known->content : nullptr;
}

VidCel Edit::getVidCel(const IdStamp& chan) const {
    const Channel* const known = m_channels->find(chan);
    return known != nullptr && known->list == ChannelSet::Video ? VidCel(known->content, known->id)
                                                                : VidCel::createInvalid();
}

VFXCel Edit::getVFXCel(const IdStamp& chan) const {
    const Channel* const known = m_channels->find(chan);
    return known != nullptr && known->list == ChannelSet::Effects ? VFXCel(known->content, known->id)
                                                                  : VFXCel::createInvalid();
}

AudCel Edit::getAudCel(const IdStamp& chan) const {
    const Channel* const known = m_channels->find(chan);
    return known != nullptr && known->list == ChannelSet::Audio ? known->sound : AudCel::createInvalid();
}

AudLevelsCel Edit::getLevelsCel(const IdStamp& chan) const {
    const Channel* const known = m_channels->find(chan);
    return known != nullptr && known->list == ChannelSet::Levels ? known->levels
                                                                 : AudLevelsCel::createInvalid();
}

bool Edit::setAudCel(const AudCel& audio, bool notify) {
    Channel* const known = m_channels->find(audio.id());
    if (known == nullptr || known->list != ChannelSet::Audio || known->content != audio.sharedCel()) {
        return false;
    }
    const IdStamp& levels = audio.getLevelsChanID();
    if (levels.valid()) {
        const Channel* const owner = m_channels->audioOf(levels);
        if (!getLevelsCel(levels).valid() || (owner != nullptr && owner != known)) {
            return false;
        }
    }
    const AudCel& present = known->sound;
    const bool fades = present.getXFadesEnabled() != audio.getXFadesEnabled();
    const bool sound = present.getSoundOutputEnabled() != audio.getSoundOutputEnabled() ||
                       present.getLevelsChanID() != levels;
    if (!fades && !sound) {
        return true;
    }
    if (refusesChange()) {
        return false;
    }
    known->sound = audio;
    soundChanged(sound ? kLevelsChanged : kFadesChanged, audio.id(), notify);
    return true;
}

void Edit::verifyAudioNodes() {
    m_channels->forEach([this](const Channel& channel) {
        if (channel.list == ChannelSet::Audio) {
            getLevelsCel(channel.sound.getLevelsChanID()).checkNodesRevision(channel.sound);
        }
    });
}

String Edit::getChanName(const IdStamp& chan) const {
    const Channel* const known = m_channels->find(chan);
    return known != nullptr ? known->name : String();
}

bool Edit::setChanName(const IdStamp& chan, const String& name) {
    Channel* const known = m_channels->find(chan);
    if (known == nullptr || !isGoodName(name) || (known->name != name && refusesChange())) {
        return false;
    }
    if (known->name != name) {
        known->name = name;
        recordChange(EditModification(kChanNameChanged).setChan(chan), true);
    }
    return true;
}

String Edit::getChanDisplayName(const IdStamp& chan) const {
    const Channel* const known = m_channels->find(chan);
    if (known == nullptr) {
        return {};
    }
    return known->name.empty() ? standardName(*m_channels, *known) : known->name;
}

IdStamp Edit::getChanWithName(const String& name) const {
    for (int i = 0; i < getNumChans(); ++i) {
        const IdStamp chan = getId(i);
        if (getChanDisplayName(chan) == name) {
            return chan;
        }
    }
    return {};
}

String Edit::getMaterialInfo(const IdStamp& chan) const {
    const Channel* const known = m_channels->find(chan);
    return known != nullptr ? known->materialInfo : String();
}

bool Edit::setMaterialInfo(const IdStamp& chan, const String& text) {
    Channel* const known = m_channels->find(chan);
    if (known == nullptr || (known->materialInfo != text && refusesChange())) {
        return false;
    }
    if (known->materialInfo != text) {
        known->materialInfo = text;
        recordUndescribed();
    }
    return true;
}

bool Edit::set_edit_cel_p(int index, cel* content, bool notify) {
    Channel* const known = m_channels->find(index);
    if (!isGivenCel(content) || known == nullptr || known->content == nullptr) {
        return false;
    }
    if (content == known->content.get()) {
        return true;
    }
    if (refusesChange()) {
        return false;
    }
    celReplaced(known->content.get(), content);
    ChannelSet::setContent(*known, Qx::Ptr<cel>(content));
    const IdStamp chan = known->id;
    if (known->list == ChannelSet::Audio) {
        soundChanged(kEventsChanged, chan, notify);
    } else {
        recordChangeOf(kEventsChanged, chan, notify);
    }
    return true;
}

bool Edit::cacheCelForTrack(const IdStamp& chan, cel* content) {
    Channel* const known = m_channels->find(chan);
    if (known == nullptr || known->list == ChannelSet::Levels) {
        return false;
    }
    known->cached = isGivenCel(content) ? content : known->content.get();
    return true;
}

bool Edit::setChannelID(const IdStamp& chan, const IdStamp& newId) {
    const IdStamp old = chan;
    Channel* const known = m_channels->find(chan);
    if (known == nullptr || !newId.valid()) {
        return false;
    }
    if (chan == newId) {
        return true;
    }
    if (m_channels->contains(newId) || refusesChange()) {
        return false;
    }
    const IdStamp wanted = newId;
    m_channels->rename(*known, wanted);
    channelRenamed(old, wanted);
    recordUndescribed();
    return true;
}

IdStamp Edit::setupEditChannel(ChanType type, Qx::Ptr<cel> content) {
    const List list = ChannelSet::listFor(type.type, type.subtype);
    if (list == ChannelSet::kNumLists || !content || getNumChans() >= NO_CHAN) {
        return {};
    }
    const IdStamp id = usableStamp(content->editChannelId());
    const String name = content->editChannelName();
    const String materialInfo = content->editChannelMaterialInfo();
    Channel& added = m_channels->insert(list, m_channels->size(list), std::move(content), id);
    // The name kept with a cel is the one shown: the standard one says that the channel has none of its own.
    added.name = name == standardName(*m_channels, added) || !isGoodName(name) ? String() : name;
    added.materialInfo = materialInfo;
    dropDerivedValues();
    return id;
}

IdStamp Edit::usableStamp(const IdStamp& wanted) const {
    return wanted.valid() && !m_channels->contains(wanted) ? wanted : IdStamp::fresh(IdStampMagic::Channel);
}

double Edit::get_start_or_end_time(bool start, bool withLevels) const {
    bool any = false;
    NumRange<double> extent;
    const auto widen = [&](const NumRange<double>& range) {
        if (any) {
            extent.widen(range);
        } else {
            extent = range;
            any = true;
        }
    };
    m_channels->forEach([&](const Channel& channel) {
        if (channel.list == ChannelSet::Levels) {
            if (withLevels && !channel.levels.is_dummy()) {
                widen(channel.levels.getExtents());
            }
        } else if (channel.content->numEvents() > 0) {
            widen({channel.content->get_start_time(), channel.content->get_end_time()});
        }
    });
    return start ? extent.start() : extent.end();
}

double Edit::getSyncLoss(const IdStamp& chan) const {
    const Channel* const known = m_channels->find(chan);
    return known != nullptr ? known->syncLoss : 0;
}

bool Edit::setSyncLoss(const IdStamp& chan, double seconds, bool notify) {
    Channel* const known = m_channels->find(chan);
    if (known == nullptr || !std::isfinite(seconds) || (known->syncLoss != seconds && refusesChange())) {
        return false;
    }
    if (known->syncLoss != seconds) {
        known->syncLoss = seconds;
        recordChangeOf(kSyncChanged, chan, notify);
    }
    return true;
}
