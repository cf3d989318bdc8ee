#include "bench/fixed_sequence.h"

#include <algorithm>
#include <map>
#include <memory>

namespace bench {

namespace {

constexpr uint64_t kSequenceSeed = 0x9E3779B97F4A7C15U;
constexpr uint64_t kQuerySeed = 12345;
/// As many as make it pointless for a processor to learn the answers by heart.
constexpr size_t kNumQueries = size_t{1} << 16;

cookie sourceItem(uint32_t source) {
    return {Cookie_Type::Video, static_cast<int>(source + 1), 0};
}

void addChannels(Edit& edit) {
    for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
        edit.addChan(channel < FixedSequence::kNumVideo ? VideoChan : AudioChan, nullptr, false);
    }
}

} // namespace

FixedSequence::FixedSequence(size_t n) : m_n(n), m_channels(kNumChannels), m_lengths(kNumChannels) {
    Generator numbers(kSequenceSeed);
    for (size_t channel = 0; channel < kNumChannels; ++channel) {
        m_channels[channel].resize(n);
        for (size_t i = 0; i < n; ++i) {
            Clip& clip = m_channels[channel][i];
            clip.length = 25 + numbers.next() % 226;
            clip.source = numbers.next() % 200;
            clip.in = numbers.next() % 2000;
            clip.black = i % 10 == 9;
            m_lengths[channel] += clip.length;
        }
    }
    m_shortest =
        static_cast<size_t>(std::min_element(m_lengths.begin(), m_lengths.end()) - m_lengths.begin());
    Generator questions(kQuerySeed);
    m_queries.resize(kNumQueries);
    for (Query& query : m_queries) {
        query.channel = questions.next() % kNumChannels;
        query.time = static_cast<double>(questions.next() % m_lengths[query.channel]) / kFrameRate;
    }
}

const FixedSequence& FixedSequence::of(int64_t n) {
    static std::map<int64_t, std::unique_ptr<FixedSequence>> made;
    std::unique_ptr<FixedSequence>& sequence = made[n];
    if (sequence == nullptr) {
        sequence = std::make_unique<FixedSequence>(static_cast<size_t>(n));
    }
    return *sequence;
}

void FixedSequence::append(size_t channel, cel& to) const {
    uint64_t at = 0;
    for (const Clip& clip : m_channels[channel]) {
        to.appendEventPair(clip.black ? black_cookie : sourceItem(clip.source), clip.in / kFrameRate,
                           static_cast<double>(at) / kFrameRate, clip.length / kFrameRate);
        at += clip.length;
    }
}

EditPtr FixedSequence::build() const {
    EditPtr edit(new Edit);
    addChannels(*edit);
    for (size_t channel = 0; channel < kNumChannels; ++channel) {
        append(channel, celOf(edit, channel));
    }
    return edit;
}

EditPtr FixedSequence::buildInsertion() {
    EditPtr edit(new Edit);
    addChannels(*edit);
    for (size_t channel = 0; channel < kNumChannels; ++channel) {
        celOf(edit, channel).appendEventPair(sourceItem(0), 1, 0, kEditLength);
    }
    return edit;
}

double FixedSequence::place(size_t k) const {
    const uint64_t middle = m_lengths[m_shortest] / 2;
    return static_cast<double>(middle) / kFrameRate + 10.0 * static_cast<double>(k);
}

} // namespace bench
