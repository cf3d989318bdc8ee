#pragma once

#include "edit/model/aud_levels_cel.h"
#include "edit/model/cel.h"
#include "edit/model/edit.h"
#include "edit/model/managed_cel.h"

#include <array>
#include <memory>
#include <unordered_map>
#include <vector>

/// The channels of an edit: one sequence in the order of the channel index, which its four lists follow one
/// another in.
///
/// It owns the cels (shared), the level envelopes, names, material texts and sync losses. It knows nothing of
/// dirt, descriptions, notification, groups or cues: `Edit` calls it and sees to those.
///
/// Invariants: the sequence is in the order of the lists; no stamp is null or there twice; the levels stamp
/// of an audio channel is null or that of a levels channel, and no two audio channels have the same. A
/// channel stays where it is in memory until it is removed. Not thread-safe.
class Edit::ChannelSet {
public:
    /// The lists in the order of the channel index.
    enum List : unsigned { Effects, Video, Audio, Levels, kNumLists };

    /// All that is known of one channel.
    struct Channel {
        List list = kNumLists;
        IdStamp id;
        Qx::Ptr<cel> content;  ///< null for a levels channel
        cel* cached = nullptr; ///< what `getCel` by stamp answers
        AudLevelsCel levels;   ///< of a levels channel
        AudCel sound;          ///< of an audio channel: its cel with what is heard of it
        String name;           ///< empty unless the channel has one of its own
        String materialInfo;
        double syncLoss = 0; ///< seconds

        [[nodiscard]] ChanType type() const { return typeOf(list); }
        [[nodiscard]] bool changed() const;
    };

    /// The list for a type and subtype as callers give them; `kNumLists` if an edit holds no such channels.
    [[nodiscard]] static List listFor(Edit_Chan_Type type, Edit_Chan_SubType subtype);
    [[nodiscard]] static ChanType typeOf(List list);

    [[nodiscard]] size_t size() const { return m_channels.size(); }
    [[nodiscard]] size_t size(List list) const { return m_sizes[list]; }
    /// The index of the first channel of a list, or where it would be.
    [[nodiscard]] size_t first(List list) const;

    /// The channel with an index or a stamp; null if there is none.
    [[nodiscard]] Channel* find(int index);
    [[nodiscard]] const Channel* find(int index) const;
    [[nodiscard]] Channel* find(const IdStamp& chan);
    [[nodiscard]] const Channel* find(const IdStamp& chan) const;
    [[nodiscard]] bool contains(const IdStamp& chan) const { return m_byId.contains(chan); }
    /// The audio channel that a levels channel belongs to; null if none.
    [[nodiscard]] Channel* audioOf(const IdStamp& levels);
    [[nodiscard]] const Channel* audioOf(const IdStamp& levels) const;

    /// The index of a channel of the set, and its position in its list; `NO_CHAN` for null.
    [[nodiscard]] int index(const Channel* channel) const;
    [[nodiscard]] int position(const Channel* channel) const;

    /// True if `test` is of some channel.
    template <typename Test>
    [[nodiscard]] bool any(Test test) const {
        for (const auto& channel : m_channels) {
            if (test(*channel)) {
                return true;
            }
        }
        return false;
    }
    /// Calls `visit` with each channel in the order of the index.
    template <typename Visit>
    void forEach(Visit visit) const {
        for (const auto& channel : m_channels) {
            visit(*channel);
        }
    }

    /// Puts a channel with a stamp that is not null and not taken before position `at` of a list.
    Channel& insert(List list, size_t at, Qx::Ptr<cel> content, const IdStamp& id);
    /// Adds a levels channel, with such a stamp, and pairs it with an audio channel.
    void insertLevels(AudLevelsCel levels, const IdStamp& id, Channel& audio);
    /// Takes a channel out. A pairing of levels with their audio channel ends.
    std::unique_ptr<Channel> remove(const Channel& channel);
    /// Gives the channel another cel; not for a levels channel.
    static void setContent(Channel& channel, Qx::Ptr<cel> content);
    void rename(Channel& channel, const IdStamp& newId);
    void clear();
    /// A deep copy, stamps kept.
    [[nodiscard]] std::unique_ptr<ChannelSet> clone() const;

private:
    Channel& put(size_t index, std::unique_ptr<Channel> channel);

    std::vector<std::unique_ptr<Channel>> m_channels;
    std::array<size_t, kNumLists> m_sizes{};
    std::unordered_map<IdStamp, Channel*> m_byId;
};
