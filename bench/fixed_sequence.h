#pragma once

#include "edit/model/cel.h"
#include "edit/model/edit.h"

#include <vector>

namespace bench {

/// The linear congruential generator that everything random here comes from, so that every run, on every
/// machine, works on the same sequence (the multiplier and increment are Knuth's for MMIX).
class Generator {
public:
    explicit Generator(uint64_t seed) : m_state(seed) {}
    uint32_t next() {
        m_state = m_state * 6364136223846793005U + 1442695040888963407U;
        return static_cast<uint32_t>(m_state >> 33);
    }

private:
    uint64_t m_state;
};

/// Where a question of "what plays here" is asked.
struct Query {
    size_t channel = 0;
    double time = 0; ///< seconds
};

/// The sequence that all measures work on: 25 frames a second, 4 video then 8 audio channels of `n` clips
/// each, back to back, out of 200 sources; every tenth clip is black.
class FixedSequence {
public:
    static constexpr double kFrameRate = 25;
    static constexpr size_t kNumVideo = 4;
    static constexpr size_t kNumAudio = 8;
    static constexpr size_t kNumChannels = kNumVideo + kNumAudio;
    /// Length of what is laid, opened or taken out, seconds.
    static constexpr double kEditLength = 5;

    struct Clip {
        uint32_t length = 0; ///< frames
        uint32_t source = 0;
        uint32_t in = 0; ///< frames into the source
        bool black = false;
    };

    explicit FixedSequence(size_t n);
    /// The sequence of `n` clips a channel, made on first use and kept.
    static const FixedSequence& of(int64_t n);

    [[nodiscard]] size_t numClips() const { return m_n; }
    [[nodiscard]] size_t numEvents() const { return 2 * kNumChannels * m_n; }
    /// What the events of all channels take, bytes.
    [[nodiscard]] size_t numBytes() const { return numEvents() * sizeof(channel_event); }
    [[nodiscard]] const std::vector<Clip>& clips(size_t channel) const { return m_channels[channel]; }

    /// Appends a channel's clips to an empty cel, one by one.
    void append(size_t channel, cel& to) const;
    /// An edit with the whole sequence, built by appending.
    [[nodiscard]] EditPtr build() const;
    /// An edit with as many channels, each with one clip of `kEditLength`: what is laid.
    [[nodiscard]] static EditPtr buildInsertion();

    [[nodiscard]] const std::vector<Query>& queries() const { return m_queries; }
    [[nodiscard]] size_t shortestChannel() const { return m_shortest; }
    /// Where repetition `k` of an edit takes place: from the middle of the shortest channel 10 s further each
    /// time, seconds.
    [[nodiscard]] double place(size_t k) const;

private:
    size_t m_n;
    std::vector<std::vector<Clip>> m_channels;
    std::vector<uint64_t> m_lengths; ///< frames
    std::vector<Query> m_queries;
    size_t m_shortest = 0;
};

/// The cel of a channel of an edit, by the channel's index.
[[nodiscard]] inline cel& celOf(const EditPtr& edit, size_t channel) {
    return *edit->get_edit_cel_p(static_cast<int>(channel));
}

} // namespace bench
