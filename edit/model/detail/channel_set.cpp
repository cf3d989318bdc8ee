#include "edit/model/detail/channel_set.h"

#include <algorithm>
#include <utility>

namespace {

using List = Edit::ChannelSet::List;

ptrdiff_t offset(size_t position) {
    return static_cast<ptrdiff_t>(position);
}

template <typename Channel>
size_t positionOf(const std::vector<Channel>& channels, const IdStamp& id) {
    const auto found = std::find_if(channels.begin(), channels.end(),
                                    [&](const Channel& channel) { return channel.id() == id; });
    return static_cast<size_t>(found - channels.begin());
}

/// An audio channel like another, but playing a different cel or bearing a different stamp.
AudCel audioLike(const AudCel& old, Qx::Ptr<cel> content, const IdStamp& id) {
    AudCel audio(std::move(content), id);
    audio.setLevelsChanID(old.getLevelsChanID());
    audio.setSoundOutputEnabled(old.getSoundOutputEnabled());
    audio.setXFadesEnabled(old.getXFadesEnabled());
    return audio;
}

} // namespace

List Edit::ChannelSet::listFor(Edit_Chan_Type type, Edit_Chan_SubType subtype) {
    if (type == AudioChan) {
        return Audio;
    }
    if (type == VideoChan && subtype == Edit_Chan_SubType::NONE) {
        return Video;
    }
    if (type == VideoChan && subtype == Edit_Chan_SubType::ALIAS) {
        return Effects;
    }
    return kNumLists;
}

Edit::ChanType Edit::ChannelSet::typeOf(List list) {
    switch (list) {
    case Effects:
        return {VideoChan, Edit_Chan_SubType::ALIAS};
    case Video:
        return {VideoChan, Edit_Chan_SubType::NONE};
    case Audio:
        return {AudioChan, Edit_Chan_SubType::NONE};
    case Levels:
    case kNumLists:
        break;
    }
    return {};
}

size_t Edit::ChannelSet::size() const {
    return m_effects.size() + m_video.size() + m_audio.size() + m_levels.size();
}

size_t Edit::ChannelSet::size(List list) const {
    switch (list) {
    case Effects:
        return m_effects.size();
    case Video:
        return m_video.size();
    case Audio:
        return m_audio.size();
    case Levels:
        return m_levels.size();
    case kNumLists:
        break;
    }
    return 0;
}

Edit::ChannelSet::Place Edit::ChannelSet::find(int index) const {
    if (index < 0) {
        return {};
    }
    size_t left = static_cast<size_t>(index);
    for (const List list : {Effects, Video, Audio, Levels}) {
        if (left < size(list)) {
            return {list, left};
        }
        left -= size(list);
    }
    return {};
}

Edit::ChannelSet::Place Edit::ChannelSet::find(const IdStamp& chan) const {
    const Entry* const known = entry(chan);
    if (known == nullptr) {
        return {};
    }
    switch (known->list) {
    case Effects:
        return {Effects, positionOf(m_effects, chan)};
    case Video:
        return {Video, positionOf(m_video, chan)};
    case Audio:
        return {Audio, positionOf(m_audio, chan)};
    case Levels:
        return {Levels, positionOf(m_levels, chan)};
    case kNumLists:
        break;
    }
    return {};
}

int Edit::ChannelSet::index(const Place& place) const {
    if (!place) {
        return NO_CHAN;
    }
    size_t first = 0;
    for (const List list : {Effects, Video, Audio}) {
        first += list < place.list ? size(list) : 0;
    }
    return static_cast<int>(first + place.position);
}

const ManagedCel* Edit::ChannelSet::managed(const Place& place) const {
    switch (place.list) {
    case Effects:
        return &m_effects[place.position];
    case Video:
        return &m_video[place.position];
    case Audio:
        return &m_audio[place.position];
    case Levels:
    case kNumLists:
        break;
    }
    return nullptr;
}

IdStamp Edit::ChannelSet::id(const Place& place) const {
    if (place.list == Levels) {
        return m_levels[place.position].id();
    }
    const ManagedCel* const channel = managed(place);
    return channel != nullptr ? channel->id() : IdStamp();
}

cel* Edit::ChannelSet::content(const Place& place) const {
    const ManagedCel* const channel = managed(place);
    return channel != nullptr ? channel->getCel() : nullptr;
}

const Edit::ChannelSet::Entry* Edit::ChannelSet::entry(const IdStamp& chan) const {
    const auto found = m_entries.find(chan);
    return found != m_entries.end() ? &found->second : nullptr;
}

Edit::ChannelSet::Entry* Edit::ChannelSet::entry(const IdStamp& chan) {
    const auto found = m_entries.find(chan);
    return found != m_entries.end() ? &found->second : nullptr;
}

const AudCel* Edit::ChannelSet::audioOf(const IdStamp& levels) const {
    const auto found = std::find_if(m_audio.begin(), m_audio.end(), [&](const AudCel& audio) {
        return levels.valid() && audio.getLevelsChanID() == levels;
    });
    return found != m_audio.end() ? &*found : nullptr;
}

AudCel* Edit::ChannelSet::audioPairedWith(const IdStamp& levels) {
    return const_cast<AudCel*>(audioOf(levels));
}

void Edit::ChannelSet::insert(List list, size_t at, Qx::Ptr<cel> content, const IdStamp& id) {
    Entry known;
    known.list = list;
    known.cached = content.get();
    switch (list) {
    case Effects:
        m_effects.insert(m_effects.begin() + offset(at), VFXCel(std::move(content), id));
        break;
    case Video:
        m_video.insert(m_video.begin() + offset(at), VidCel(std::move(content), id));
        break;
    case Audio:
        m_audio.insert(m_audio.begin() + offset(at), AudCel(std::move(content), id));
        break;
    case Levels:
    case kNumLists:
        return;
    }
    m_entries.insert_or_assign(id, std::move(known));
}

void Edit::ChannelSet::insertLevels(AudLevelsCel levels, const IdStamp& id, size_t audio) {
    levels.id(id);
    m_levels.push_back(std::move(levels));
    m_audio[audio].setLevelsChanID(id);
    Entry known;
    known.list = Levels;
    m_entries.insert_or_assign(id, std::move(known));
}

Edit::ChannelSet::Removed Edit::ChannelSet::remove(const Place& place) {
    Removed out;
    out.list = place.list;
    out.index = index(place);
    out.id = id(place);
    const ptrdiff_t at = offset(place.position);
    switch (place.list) {
    case Effects:
        out.content = m_effects[place.position];
        m_effects.erase(m_effects.begin() + at);
        break;
    case Video:
        out.content = m_video[place.position];
        m_video.erase(m_video.begin() + at);
        break;
    case Audio:
        out.content = m_audio[place.position];
        m_audio.erase(m_audio.begin() + at);
        break;
    case Levels:
        out.levels = m_levels[place.position];
        m_levels.erase(m_levels.begin() + at);
        if (AudCel* const audio = audioPairedWith(out.id)) {
            audio->setLevelsChanID(IdStamp());
        }
        break;
    case kNumLists:
        break;
    }
    m_entries.erase(out.id);
    return out;
}

void Edit::ChannelSet::setContent(const Place& place, Qx::Ptr<cel> content) {
    const IdStamp stamp = id(place);
    Entry* const known = entry(stamp);
    if (known == nullptr) {
        return;
    }
    known->cached = content.get();
    switch (place.list) {
    case Effects:
        m_effects[place.position] = VFXCel(std::move(content), stamp);
        break;
    case Video:
        m_video[place.position] = VidCel(std::move(content), stamp);
        break;
    case Audio:
        m_audio[place.position] = audioLike(m_audio[place.position], std::move(content), stamp);
        break;
    case Levels:
    case kNumLists:
        break;
    }
}

void Edit::ChannelSet::rename(const Place& place, const IdStamp& newId) {
    const IdStamp old = id(place);
    auto node = m_entries.extract(old);
    node.key() = newId;
    m_entries.insert(std::move(node));
    switch (place.list) {
    case Effects:
        m_effects[place.position].id(newId);
        break;
    case Video:
        m_video[place.position].id(newId);
        break;
    case Audio:
        m_audio[place.position].id(newId);
        break;
    case Levels:
        m_levels[place.position].id(newId);
        if (AudCel* const audio = audioPairedWith(old)) {
            audio->setLevelsChanID(newId);
        }
        break;
    case kNumLists:
        break;
    }
}

void Edit::ChannelSet::clear() {
    m_effects.clear();
    m_video.clear();
    m_audio.clear();
    m_levels.clear();
    m_entries.clear();
}

std::unique_ptr<Edit::ChannelSet> Edit::ChannelSet::clone() const {
    auto copy = std::make_unique<ChannelSet>();
    const auto cloneAll = [](const auto& from, auto& to) {
        to.reserve(from.size());
        for (const auto& channel : from) {
            to.push_back(channel.clone());
        }
    };
    cloneAll(m_effects, copy->m_effects);
    cloneAll(m_video, copy->m_video);
    cloneAll(m_audio, copy->m_audio);
    cloneAll(m_levels, copy->m_levels);
    copy->m_entries = m_entries;
    for (auto& [id, known] : copy->m_entries) {
        known.cached = copy->content(copy->find(id));
    }
    return copy;
}
