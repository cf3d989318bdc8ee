#include "edit/model/detail/channel_set.h"
#include "edit/model/edit.h"

#include <algorithm>
#include <cmath>

namespace {

using List = Edit::ChannelSet::List;
using Place = Edit::ChannelSet::Place;

/// True if a filter value lets a value pass: the wildcard, the same, or a bit in common.
template <typename Bits>
bool passes(Bits filter, Bits wildcard, Bits value) {
    return filter == wildcard || filter == value ||
           (static_cast<uint32_t>(filter) & static_cast<uint32_t>(value)) != 0;
}

/// The name by which a channel is shown that has none of its own.
String standardName(const Place& place) {
    const char* letters = "";
    switch (place.list) {
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
    return String::format("%s%zu", letters, place.position + 1);
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
    return m_channels->id(m_channels->find(index));
}

int Edit::getIdx(const IdStamp& chan) const {
    return m_channels->index(m_channels->find(chan));
}

int Edit::getIndexWithinType(const IdStamp& chan) const {
    const Place place = m_channels->find(chan);
    return place ? static_cast<int>(place.position) : NO_CHAN;
}

int Edit::getIndexWithinType(int index) const {
    const Place place = m_channels->find(index);
    return place ? static_cast<int>(place.position) : NO_CHAN;
}

Edit_Chan_Type Edit::getChanType(int index) const {
    return ChannelSet::typeOf(m_channels->find(index).list).type;
}

Edit_Chan_SubType Edit::getChanSubtype(int index) const {
    return ChannelSet::typeOf(m_channels->find(index).list).subtype;
}

Edit_Chan_Type Edit::getChanType(const IdStamp& chan) const {
    return getChanTypeAndSubType(chan).type;
}

Edit_Chan_SubType Edit::getChanSubtype(const IdStamp& chan) const {
    return getChanTypeAndSubType(chan).subtype;
}

Edit::ChanType Edit::getChanTypeAndSubType(const IdStamp& chan) const {
    const ChannelSet::Entry* const known = m_channels->entry(chan);
    return known != nullptr ? ChannelSet::typeOf(known->list) : ChanType();
}

bool Edit::chanValid(int index, Edit_Chan_Type type) const {
    const Place place = m_channels->find(index);
    switch (type) {
    case AnyChan:
        return static_cast<bool>(place);
    case VideoChan:
    case AudioChan:
        return ChannelSet::typeOf(place.list).type == type && m_channels->content(place) != nullptr;
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
        const ChanType chan = ChannelSet::typeOf(m_channels->find(next).list);
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
    const ChannelSet::Entry* const known = m_channels->entry(chan);
    return known != nullptr ? known->cached : nullptr;
}

cel* Edit::get_edit_cel_p(int index) const {
    return m_channels->content(m_channels->find(index));
}

bool Edit::sameType(const IdStamp& a, const IdStamp& b) const {
    return m_channels->contains(a) && m_channels->contains(b) && getChanType(a) == getChanType(b);
}

bool Edit::isEmpty(int index) const {
    const Place place = m_channels->find(index);
    if (place.list == ChannelSet::Levels) {
        return m_channels->levels()[place.position].is_dummy();
    }
    const cel* const content = m_channels->content(place);
    return content == nullptr || content->isEmpty();
}

bool Edit::isEmpty(const IdStamp& chan) const {
    return isEmpty(getIdx(chan));
}

bool Edit::isEmpty() const {
    for (int i = 0; i < getNumChans(); ++i) {
        if (!isEmpty(i)) {
            return false;
        }
    }
    return true;
}

VidCel Edit::getVidCel(const IdStamp& chan) const {
    const Place place = m_channels->find(chan);
    return place.list == ChannelSet::Video ? m_channels->video()[place.position] : VidCel::createInvalid();
}

VFXCel Edit::getVFXCel(const IdStamp& chan) const {
    const Place place = m_channels->find(chan);
    return place.list == ChannelSet::Effects ? m_channels->effects()[place.position]
                                             : VFXCel::createInvalid();
}

AudCel Edit::getAudCel(const IdStamp& chan) const {
    const Place place = m_channels->find(chan);
    return place.list == ChannelSet::Audio ? m_channels->audio()[place.position] : AudCel::createInvalid();
}

AudLevelsCel Edit::getLevelsCel(const IdStamp& chan) const {
    const Place place = m_channels->find(chan);
    return place.list == ChannelSet::Levels ? m_channels->levels()[place.position]
                                            : AudLevelsCel::createInvalid();
}

bool Edit::setAudCel(const AudCel& audio, bool notify) {
    const Place place = m_channels->find(audio.id());
    if (place.list != ChannelSet::Audio || m_channels->content(place) != audio.getCel()) {
        return false;
    }
    const IdStamp& levels = audio.getLevelsChanID();
    if (levels.valid()) {
        const AudCel* const owner = m_channels->audioOf(levels);
        if (m_channels->find(levels).list != ChannelSet::Levels ||
            (owner != nullptr && owner->id() != audio.id())) {
            return false;
        }
    }
    const AudCel& present = m_channels->audio()[place.position];
    const bool fades = present.getXFadesEnabled() != audio.getXFadesEnabled();
    const bool sound = present.getSoundOutputEnabled() != audio.getSoundOutputEnabled() ||
                       present.getLevelsChanID() != levels;
    if (!fades && !sound) {
        return true;
    }
    if (refusesChange()) {
        return false;
    }
    m_channels->setAudio(place.position, audio);
    soundChanged(sound ? kLevelsChanged : kFadesChanged, audio.id(), notify);
    return true;
}

void Edit::verifyAudioNodes() {
    for (const AudCel& audio : m_channels->audio()) {
        getLevelsCel(audio.getLevelsChanID()).checkNodesRevision(audio);
    }
}

String Edit::getChanName(const IdStamp& chan) const {
    const ChannelSet::Entry* const known = m_channels->entry(chan);
    return known != nullptr ? known->name : String();
}

bool Edit::setChanName(const IdStamp& chan, const String& name) {
    ChannelSet::Entry* const known = m_channels->entry(chan);
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
    const ChannelSet::Entry* const known = m_channels->entry(chan);
    if (known == nullptr) {
        return {};
    }
    return known->name.empty() ? standardName(m_channels->find(chan)) : known->name;
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
    const ChannelSet::Entry* const known = m_channels->entry(chan);
    return known != nullptr ? known->materialInfo : String();
}

bool Edit::setMaterialInfo(const IdStamp& chan, const String& text) {
    ChannelSet::Entry* const known = m_channels->entry(chan);
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
    const Place place = m_channels->find(index);
    if (!isGivenCel(content) || m_channels->content(place) == nullptr) {
        return false;
    }
    if (content == m_channels->content(place)) {
        return true;
    }
    if (refusesChange()) {
        return false;
    }
    celReplaced(m_channels->content(place), content);
    m_channels->setContent(place, Qx::Ptr<cel>(content));
    if (place.list == ChannelSet::Audio) {
        soundChanged(kEventsChanged, m_channels->id(place), notify);
    } else {
        recordChangeOf(kEventsChanged, m_channels->id(place), notify);
    }
    return true;
}

bool Edit::cacheCelForTrack(const IdStamp& chan, cel* content) {
    const Place place = m_channels->find(chan);
    if (!place || place.list == ChannelSet::Levels) {
        return false;
    }
    m_channels->entry(chan)->cached = isGivenCel(content) ? content : m_channels->content(place);
    return true;
}

bool Edit::setChannelID(const IdStamp& chan, const IdStamp& newId) {
    const IdStamp old = chan;
    const Place place = m_channels->find(chan);
    if (!place || !newId.valid()) {
        return false;
    }
    if (chan == newId) {
        return true;
    }
    if (m_channels->contains(newId) || refusesChange()) {
        return false;
    }
    const IdStamp wanted = newId;
    m_channels->rename(place, wanted);
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
    const Place place{list, m_channels->size(list)};
    const String name = content->editChannelName();
    const String materialInfo = content->editChannelMaterialInfo();
    m_channels->insert(list, place.position, std::move(content), id);
    ChannelSet::Entry* const known = m_channels->entry(id);
    // The name kept with a cel is the one shown: the standard one says that the channel has none of its own.
    known->name = name == standardName(place) || !isGoodName(name) ? String() : name;
    known->materialInfo = materialInfo;
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
    for (int i = 0; i < getNumChans(); ++i) {
        const Place place = m_channels->find(i);
        if (place.list == ChannelSet::Levels) {
            const AudLevelsCel& levels = m_channels->levels()[place.position];
            if (withLevels && !levels.is_dummy()) {
                widen(levels.getExtents());
            }
        } else if (const cel* const content = m_channels->content(place); content->numEvents() > 0) {
            widen({content->get_start_time(), content->get_end_time()});
        }
    }
    return start ? extent.start() : extent.end();
}

double Edit::getSyncLoss(const IdStamp& chan) const {
    const ChannelSet::Entry* const known = m_channels->entry(chan);
    return known != nullptr ? known->syncLoss : 0;
}

bool Edit::setSyncLoss(const IdStamp& chan, double seconds, bool notify) {
    ChannelSet::Entry* const known = m_channels->entry(chan);
    if (known == nullptr || !std::isfinite(seconds) || (known->syncLoss != seconds && refusesChange())) {
        return false;
    }
    if (known->syncLoss != seconds) {
        known->syncLoss = seconds;
        recordChangeOf(kSyncChanged, chan, notify);
    }
    return true;
}
