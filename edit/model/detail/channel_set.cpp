#include "edit/model/detail/channel_set.h"

#include <algorithm>
#include <numeric>
#include <utility>

namespace {

using List = Edit::ChannelSet::List;
using Channel = Edit::ChannelSet::Channel;

constexpr size_t kFirstRoom = 16;

/// An audio channel like another, but playing a different cel or bearing a different stamp.
AudCel audioLike(const AudCel& old, Qx::Ptr<cel> content, const IdStamp& id) {
    AudCel audio(std::move(content), id);
    audio.setLevelsChanID(old.getLevelsChanID());
    audio.setSoundOutputEnabled(old.getSoundOutputEnabled());
    audio.setXFadesEnabled(old.getXFadesEnabled());
    return audio;
}

template <typename Channels>
auto channelAt(Channels& channels, int index) {
    return index >= 0 && index < std::ssize(channels) ? channels[static_cast<size_t>(index)].get() : nullptr;
}

template <typename Channels>
auto pairedWith(Channels& channels, const IdStamp& levels) {
    const auto found = std::find_if(channels.begin(), channels.end(), [&](const auto& channel) {
        return levels.valid() && channel->list == Edit::ChannelSet::Audio &&
               channel->sound.getLevelsChanID() == levels;
    });
    return found != channels.end() ? found->get() : nullptr;
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

bool Edit::ChannelSet::Channel::changed() const {
    return content != nullptr ? content->changed() : levels.changed();
}

size_t Edit::ChannelSet::first(List list) const {
    return std::accumulate(m_sizes.begin(), m_sizes.begin() + list, size_t{0});
}

Channel* Edit::ChannelSet::find(int index) {
    return channelAt(m_channels, index);
}

const Channel* Edit::ChannelSet::find(int index) const {
    return channelAt(m_channels, index);
}

Channel* Edit::ChannelSet::find(const IdStamp& chan) {
    const auto found = m_byId.find(chan);
    return found != m_byId.end() ? found->second : nullptr;
}

const Channel* Edit::ChannelSet::find(const IdStamp& chan) const {
    const auto found = m_byId.find(chan);
    return found != m_byId.end() ? found->second : nullptr;
}

Channel* Edit::ChannelSet::audioOf(const IdStamp& levels) {
    return pairedWith(m_channels, levels);
}

const Channel* Edit::ChannelSet::audioOf(const IdStamp& levels) const {
    return pairedWith(m_channels, levels);
}

int Edit::ChannelSet::index(const Channel* channel) const {
    if (channel == nullptr) {
        return NO_CHAN;
    }
    const auto from = m_channels.begin() + static_cast<ptrdiff_t>(first(channel->list));
    const auto found =
        std::find_if(from, m_channels.end(), [&](const auto& other) { return other.get() == channel; });
    return static_cast<int>(found - m_channels.begin());
}

int Edit::ChannelSet::position(const Channel* channel) const {
    return channel == nullptr ? NO_CHAN : index(channel) - static_cast<int>(first(channel->list));
}

Channel& Edit::ChannelSet::put(size_t index, std::unique_ptr<Channel> channel) {
    Channel& placed = *channel;
    // All memory is had before anything changes.
    if (m_channels.size() == m_channels.capacity()) {
        m_channels.reserve(std::max(kFirstRoom, 2 * m_channels.size()));
    }
    m_byId.insert_or_assign(placed.id, &placed);
    m_channels.insert(m_channels.begin() + static_cast<ptrdiff_t>(index), std::move(channel));
    ++m_sizes[placed.list];
    return placed;
}

Channel& Edit::ChannelSet::insert(List list, size_t at, Qx::Ptr<cel> content, const IdStamp& id) {
    auto channel = std::make_unique<Channel>();
    channel->list = list;
    channel->id = id;
    setContent(*channel, std::move(content));
    return put(first(list) + at, std::move(channel));
}

void Edit::ChannelSet::insertLevels(AudLevelsCel levels, const IdStamp& id, Channel& audio) {
    auto channel = std::make_unique<Channel>();
    channel->list = Levels;
    channel->id = id;
    channel->levels = std::move(levels);
    channel->levels.id(id);
    put(m_channels.size(), std::move(channel));
    audio.sound.setLevelsChanID(id);
}

std::unique_ptr<Channel> Edit::ChannelSet::remove(const Channel& channel) {
    const auto place = m_channels.begin() + index(&channel);
    std::unique_ptr<Channel> out = std::move(*place);
    m_channels.erase(place);
    m_byId.erase(out->id);
    --m_sizes[out->list];
    if (Channel* const audio = out->list == Levels ? audioOf(out->id) : nullptr) {
        audio->sound.setLevelsChanID(IdStamp());
    }
    return out;
}

void Edit::ChannelSet::setContent(Channel& channel, Qx::Ptr<cel> content) {
    channel.cached = content.get();
    channel.content = std::move(content);
    if (channel.list == Audio) {
        channel.sound = audioLike(channel.sound, channel.content, channel.id);
    }
}

void Edit::ChannelSet::rename(Channel& channel, const IdStamp& newId) {
    auto node = m_byId.extract(channel.id);
    node.key() = newId;
    m_byId.insert(std::move(node));
    if (Channel* const audio = channel.list == Levels ? audioOf(channel.id) : nullptr) {
        audio->sound.setLevelsChanID(newId);
    }
    channel.id = newId;
    channel.levels.id(newId);
    channel.sound.id(newId);
}

void Edit::ChannelSet::clear() {
    m_byId.clear();
    m_channels.clear();
    m_sizes.fill(0);
}

std::unique_ptr<Edit::ChannelSet> Edit::ChannelSet::clone() const {
    auto copy = std::make_unique<ChannelSet>();
    copy->m_channels.reserve(size());
    for (const auto& channel : m_channels) {
        auto twin = std::make_unique<Channel>(*channel);
        if (channel->list == Audio) {
            twin->sound = channel->sound.clone();
            twin->content = twin->sound.sharedCel();
        } else if (channel->list == Levels) {
            twin->levels = channel->levels.clone();
        } else {
            twin->content = std::make_shared<cel>(*channel->content);
        }
        twin->cached = twin->content.get();
        copy->put(copy->size(), std::move(twin));
    }
    return copy;
}
