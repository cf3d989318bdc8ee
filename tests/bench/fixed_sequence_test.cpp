// The sequence that all figures are measured on: figures of two runs, or of two libraries, mean something
// only if it is the same to the last frame. The numbers expected here were worked out apart from this code.

#include "bench/fixed_sequence.h"

#include <gtest/gtest.h>

#include <cmath>

namespace {

using bench::FixedSequence;

TEST(FixedSequence, IsTheSameEverywhere) {
    const struct {
        int64_t n;
        double firstEnd; ///< of the first channel, frames
        double lastEnd;  ///< of the last
        size_t shortest;
        double middle; ///< of the shortest channel, frames
        uint64_t sum;  ///< over the sources and in points of all clips in order
        double query;  ///< the second one's time, on channel 10, frames
    } cases[] = {
        {100, 14083, 13591, 6, 6212, 999333757, 7197},
        {1000, 137212, 137861, 5, 66389, 259846118, 30757},
        {10000, 1377810, 1389801, 5, 684255, 18519234, 512913},
    };
    for (const auto& c : cases) {
        const FixedSequence& sequence = FixedSequence::of(c.n);
        const EditPtr edit = sequence.build();
        ASSERT_EQ(edit->getNumChans(), 12);
        uint64_t sum = 0;
        for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
            const cel& content = bench::celOf(edit, channel);
            ASSERT_EQ(content.numPairs(), c.n);
            ASSERT_EQ(edit->getChanType(static_cast<int>(channel)), channel < 4 ? VideoChan : AudioChan);
            for (int i = 0; i < content.numPairs(); ++i) {
                const channel_event in = content.get_event(2 * i);
                ASSERT_EQ(in.strip.isBlack(), i % 10 == 9);
                sum = (sum * 31 + (in.strip.isBlack() ? 0 : in.strip.word(0)) * 7 +
                       static_cast<uint64_t>(std::llround(in.stripTime * 25))) %
                      1000000007;
            }
        }
        EXPECT_EQ(sum, c.sum) << c.n;
        EXPECT_DOUBLE_EQ(bench::celOf(edit, 0).get_end_time() * 25, c.firstEnd);
        EXPECT_DOUBLE_EQ(bench::celOf(edit, 11).get_end_time() * 25, c.lastEnd);
        EXPECT_EQ(sequence.shortestChannel(), c.shortest);
        EXPECT_DOUBLE_EQ(sequence.place(0) * 25, c.middle);
        EXPECT_DOUBLE_EQ(sequence.place(3), sequence.place(0) + 30);
        EXPECT_EQ(sequence.queries()[1].channel, 10U);
        EXPECT_DOUBLE_EQ(sequence.queries()[1].time * 25, c.query);
    }
}

} // namespace
