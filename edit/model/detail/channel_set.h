#pragma once

#include "edit/model/edit.h"

#include <array>
#include <optional>
#include <unordered_map>
#include <vector>

/// The channels of an edit: four lists that define the channel index, and a map from stamp to what is known
/// of a channel besides its cel.
///
/// It owns the cels (shared), the level envelopes, names, material texts and sync losses. It knows nothing of
/// dirt, descriptions, notification, groups or cues: `Edit` calls it and sees to those.
///
/// Invariants: every channel of a list has one entry of the map under its stamp and every entry has its
/// channel; no stamp is null; an entry's list is the list that the channel is in; the levels stamp of an
/// audio channel is null or that of a levels channel, and no two audio channels have the same. Not
/// thread-safe.
class Edit::ChannelSet {
public:
    /// The lists in the order of the channel index.
    enum List : unsigned { Effects, Video, Audio, Levels, kNumLists };

    /// Where a channel is.
    struct Place {
        List list = kNumLists;
        size_t position = 0;
        [[nodiscard]] explicit operator bool() const { return list != kNumLists; }
    };

    /// What is known of a channel besides its content.
    struct Entry {
        List list = kNumLists;
        cel* cached = nullptr; ///< what `getCel` by stamp answers; null for a levels channel
        String name;           ///< empty unless the channel has one of its own
        String materialInfo;
        double syncLoss = 0; ///< seconds
    };

    /// A channel that was taken out: holds its content until it goes.
    struct Removed {
        List list = kNumLists;
        int index = NO_CHAN; ///< before the removal
        IdStamp id;
        ManagedCel content;
        AudLevelsCel levels;
    };

    /// The list for a type and subtype as callers give them; `kNumLists` if an edit holds no such channels.
    [[nodiscard]] static List listFor(Edit_Chan_Type type, Edit_Chan_SubType subtype);
    [[nodiscard]] static ChanType typeOf(List list);

    [[nodiscard]] size_t size() const;
    [[nodiscard]] size_t size(List list) const;
    [[nodiscard]] Place find(int index) const;
    [[nodiscard]] Place find(const IdStamp& chan) const;
    [[nodiscard]] int index(const Place& place) const;
    [[nodiscard]] IdStamp id(const Place& place) const;
    /// Null for a levels channel or no channel.
    [[nodiscard]] cel* content(const Place& place) const;
    [[nodiscard]] const Entry* entry(const IdStamp& chan) const;
    [[nodiscard]] Entry* entry(const IdStamp& chan);
    [[nodiscard]] bool contains(const IdStamp& chan) const { return entry(chan) != nullptr; }

    [[nodiscard]] const std::vector<VFXCel>& effects() const { return m_effects; }
    [[nodiscard]] const std::vector<VidCel>& video() const { return m_video; }
    [[nodiscard]] const std::vector<AudCel>& audio() const { return m_audio; }
    [[nodiscard]] const std::vector<AudLevelsCel>& levels() const { return m_levels; }
    /// The audio channel that a levels channel belongs to; null if none.
    [[nodiscard]] const AudCel* audioOf(const IdStamp& levels) const;

    /// Puts a channel with a stamp that is not null and not taken before position `at` of a list.
    void insert(List list, size_t at, Qx::Ptr<cel> content, const IdStamp& id);
    void insertLevels(AudLevelsCel levels, const IdStamp& id, size_t audio);
    /// `place` must be one of a channel. A pairing with its levels or its audio channel ends.
    Removed remove(const Place& place);
    /// Gives the channel another cel; not for a levels channel.
    void setContent(const Place& place, Qx::Ptr<cel> content);
    /// Takes over output, cross-fades and pairing for the audio channel at a position.
    void setAudio(size_t position, const AudCel& audio) { m_audio[position] = audio; }
    void rename(const Place& place, const IdStamp& newId);
    void clear();
    /// A deep copy, stamps kept.
    [[nodiscard]] std::unique_ptr<ChannelSet> clone() const;

private:
    [[nodiscard]] const ManagedCel* managed(const Place& place) const;
    [[nodiscard]] AudCel* audioPairedWith(const IdStamp& levels);

    std::vector<VFXCel> m_effects;
    std::vector<VidCel> m_video;
    std::vector<AudCel> m_audio;
    std::vector<AudLevelsCel> m_levels;
    std::unordered_map<IdStamp, Entry> m_entries;
};
