// The operations on regions, drawn: one character a second (tests/support/cel_layout.h).

#include "edit/model/cel.h"
#include "support/cel_layout.h"

#include <gtest/gtest.h>

#include <chrono>

namespace {

/// Names a case of a table after itself.
constexpr auto caseName = [](const auto& tested) { return std::string(tested.param.name); };

using layout::draw;
using layout::drawStrips;
using layout::make;

constexpr double kNoise = 4e-7; // within the tolerance of a cut

void expectSound(const cel& its) {
    EXPECT_EQ(layout::faultOf(its), "");
}

struct LayCase {
    const char* name;
    const char* its;
    const char* source;
    double from, to, at;
    const char* layout;
    const char* strips;
};

void PrintTo(const LayCase& c, std::ostream* out) {
    *out << c.name;
}

class Insertion : public testing::TestWithParam<LayCase> {};

TEST_P(Insertion, OpensTheCelAndMovesWhatFollows) {
    const LayCase& c = GetParam();
    for (const double noise : {0.0, kNoise, -kNoise}) {
        cel its = make(c.its);
        const cel source = make(c.source);
        cel::IdMap ids;
        ASSERT_TRUE(its.insert(&source, {c.from + noise, c.to - noise}, c.at + noise, ids));
        EXPECT_EQ(draw(its), c.layout);
        EXPECT_EQ(drawStrips(its), c.strips);
        expectSound(its);
        EXPECT_TRUE(its.changed());
    }
}

INSTANTIATE_TEST_SUITE_P(
    Cel, Insertion,
    testing::Values(LayCase{"AtACut", "AAABBB", "ddee", 1, 3, 3, "AAAdeBBB", "01212345"},
                    LayCase{"InsideAPair", "AAAAAA", "ddee", 1, 3, 3, "AAAdeAAA", "01212345"},
                    LayCase{"AtTheStart", "AABB", "ddee", 0, 2, 0, "ddAABB", "010123"},
                    LayCase{"AtTheEnd", "AABB", "ddee", 2, 4, 4, "AABBee", "012323"},
                    LayCase{"PastTheEnd", "AA", "ddee", 1, 3, 3, "AA de", "01 12"},
                    LayCase{"IntoAnEmptyCel", "", "ddee", 1, 3, 2, "  de", "  12"},
                    LayCase{"SourceEndsInside", "AAABBB", "ddee", 3, 6, 3, "AAAe  BBB", "0123  345"},
                    LayCase{"SourceStartsInside", "AABB", "  dd", 1, 3, 2, "AA dBB", "01 223"},
                    LayCase{"PastTheSource", "AABB", "dd", 5, 7, 1, "A  ABB", "0  123"},
                    LayCase{"BlackIsContent", "AABB", ".d.", 0, 3, 2, "AA.d.BB", "01.1.23"},
                    LayCase{"IntoAGap", "A   B", "dd", 0, 1, 2, "A d  B", "0 0  4"},
                    LayCase{"SeveralPairs", "AABB", "cdefg", 1, 4, 2, "AAdefBB", "0112323"}),
    caseName);

class Replacement : public testing::TestWithParam<LayCase> {};

TEST_P(Replacement, OverwritesAndMovesNothing) {
    const LayCase& c = GetParam();
    for (const double noise : {0.0, kNoise, -kNoise}) {
        cel its = make(c.its);
        const cel source = make(c.source);
        cel::IdMap ids;
        ASSERT_TRUE(its.replace(&source, {c.from + noise, c.to + noise}, c.at - noise, ids));
        EXPECT_EQ(draw(its), c.layout);
        EXPECT_EQ(drawStrips(its), c.strips);
        expectSound(its);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Cel, Replacement,
    testing::Values(LayCase{"AcrossACut", "AAABBB", "ddee", 1, 3, 2, "AAdeBB", "011245"},
                    LayCase{"InsideAPair", "AAAAAA", "ddee", 1, 3, 2, "AAdeAA", "011245"},
                    LayCase{"ReachesPastTheEnd", "AAA", "ddee", 1, 3, 2, "AAde", "0112"},
                    LayCase{"PastTheEnd", "A", "ddee", 1, 3, 2, "A de", "0 12"},
                    LayCase{"GapOverwrites", "AAABBB", "ddee", 3, 5, 2, "AAe BB", "013 45"},
                    LayCase{"OnlyAGap", "AAABBB", "dd", 7, 9, 2, "AA  BB", "01  45"},
                    LayCase{"WholePairs", "ABCD", "ee", 0, 2, 1, "AeeD", "0013"},
                    LayCase{"HeadOfAPair", "AABBB", "ee", 0, 1, 2, "AAeBB", "01034"},
                    LayCase{"TailOfAPair", "AABBB", "ee", 0, 1, 4, "AABBe", "01230"},
                    LayCase{"SeveralPairs", "AABCDEFF", "xyyz", 0, 4, 2, "AAxyyzFF", "01012367"},
                    LayCase{"EmptyCel", "", "xy", 0, 2, 0, "xy", "01"}),
    caseName);

class MaterialReplacement : public testing::TestWithParam<LayCase> {};

TEST_P(MaterialReplacement, KeepsTheBoundsOfPairs) {
    const LayCase& c = GetParam();
    for (const double noise : {0.0, kNoise, -kNoise}) {
        cel its = make(c.its);
        const cel source = make(c.source);
        cel::IdMap ids;
        ASSERT_TRUE(its.replace(&source, {c.from - noise, c.to}, c.at + noise, ids, true));
        EXPECT_EQ(draw(its), c.layout);
        EXPECT_EQ(drawStrips(its), c.strips);
        expectSound(its);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Cel, MaterialReplacement,
    testing::Values(LayCase{"OneSourceUnderTwoPairs", "AABB", "dddd", 0, 4, 0, "dd|dd", "0123"},
                    LayCase{"TwoSourcesUnderOnePair", "AAAA", "ddee", 0, 4, 0, "ddee", "0123"},
                    LayCase{"InsideAPair", "AAAAAA", "dd", 0, 2, 2, "AAddAA", "010145"},
                    LayCase{"GapOfTheSourcePlaysBlack", "AAAA", "d  e", 0, 4, 0, "d..e", "0..3"},
                    LayCase{"GapOfTheCelIsFilled", "AA  BB", "dddddd", 0, 6, 0, "dd|dd|dd", "012345"},
                    LayCase{"GapUnderAGap", "A  B", "d  e", 0, 4, 0, "d  e", "0  3"},
                    LayCase{"PastTheEnd", "AA", "ddd", 0, 3, 1, "Ad|dd", "0012"},
                    LayCase{"BlackBecomesMaterial", "A..B", "dddd", 0, 3, 1, "Add|d", "0012"}),
    caseName);

struct RemoveCase {
    const char* name;
    const char* its;
    double from, to;
    const char* layout;
    const char* strips;
};

void PrintTo(const RemoveCase& c, std::ostream* out) {
    *out << c.name;
}

class Removal : public testing::TestWithParam<RemoveCase> {};

TEST_P(Removal, ClosesUp) {
    const RemoveCase& c = GetParam();
    for (const double noise : {0.0, kNoise, -kNoise}) {
        cel its = make(c.its);
        ASSERT_TRUE(its.remove({c.from - noise, c.to + noise}));
        EXPECT_EQ(draw(its), c.layout);
        EXPECT_EQ(drawStrips(its), c.strips);
        expectSound(its);
    }
}

INSTANTIATE_TEST_SUITE_P(Cel, Removal,
                         testing::Values(RemoveCase{"AcrossPairs", "AAABBCC", 2, 5, "AACC", "0156"},
                                         RemoveCase{"InsideAPair", "AAAAAAA", 2, 5, "AA|AA", "0156"},
                                         RemoveCase{"WholePair", "AABBCC", 2, 4, "AACC", "0145"},
                                         RemoveCase{"TheStart", "AABB", 0, 1, "ABB", "123"},
                                         RemoveCase{"TheEnd", "AABB", 3, 4, "AAB", "012"},
                                         RemoveCase{"OverTheEnd", "AABB", 3, 9, "AAB", "012"},
                                         RemoveCase{"AGap", "     BB", 2, 5, "  BB", "  56"},
                                         RemoveCase{"Everything", "AABB", 0, 4, "", ""},
                                         RemoveCase{"PastTheEnd", "A", 4, 6, "A", "0"},
                                         RemoveCase{"FromEmpty", "", 0, 6, "", ""}),
                         caseName);

TEST(CelRegions, ExtractTakesAPartAtItsTimesOrAtZero) {
    const cel its = make("AAABB CCC");
    EXPECT_EQ(draw(*its.extract(3, 7)), "BB C");
    EXPECT_EQ(drawStrips(*its.extract(4, 8)), "4 67");
    EXPECT_EQ(draw(*its.extract(3, 7, cel::KeepTimes)), "   BB C");
    EXPECT_EQ(draw(*its.extract(20, 21)), "");
    EXPECT_EQ(its.extract(3, 3), nullptr);
    EXPECT_EQ(its.extract(5, 3), nullptr);
    EXPECT_EQ(its.extract(0, Qx::kNoTime), nullptr);
}

TEST(CelRegions, PartsThatWereExtractedWeldTogetherAgain) {
    const cel whole = make("AAABB CC|CC");
    auto joined = whole.extract(0, 2);
    ASSERT_TRUE(joined->weld(whole.extract(2, 10).get(), 2));
    EXPECT_EQ(draw(*joined), "AA|ABB CC|CC");
    expectSound(*joined);
    EXPECT_TRUE(joined->simplify(Simplification::MergeThrough));
    EXPECT_EQ(draw(*joined), "AAABB CCCC");
    EXPECT_EQ(drawStrips(*joined), drawStrips(whole));
    EXPECT_FALSE(joined->weld(&whole, 9)) << "overlaps";
    EXPECT_TRUE(joined->weld(joined.get(), 10));
    EXPECT_EQ(draw(*joined), "AAABB CCCCAAABB CCCC");
    expectSound(*joined);
}

TEST(CelRegions, TheSourceMayBeTheCelItself) {
    cel::IdMap ids;
    cel inserted = make("AABBCC");
    ASSERT_TRUE(inserted.insert(&inserted, {1, 5}, 3, ids));
    EXPECT_EQ(draw(inserted), "AABABBCBCC");
    expectSound(inserted);
    cel replaced = make("AABBCC");
    ASSERT_TRUE(replaced.replace(&replaced, {0, 3}, 1, ids));
    EXPECT_EQ(draw(replaced), "A|AABCC");
    expectSound(replaced);
    cel under = make("AABBCC");
    ASSERT_TRUE(under.replace(&under, {0, 3}, 1, ids, true));
    EXPECT_EQ(draw(under), "A|A|ABCC");
    expectSound(under);
}

TEST(CelRegions, CopiesAndPartsOfAnEffectAreEffects) {
    cel its = make("AAAABB");
    its.get_start_ceh().setEffectGraph(IdStamp::fresh(IdStampMagic::EffectNode));
    cel::IdMap ids;
    cel::Splits splits;
    cel copy = make("CCCC");
    ASSERT_TRUE(copy.insert(&its, {0, 6}, 2, ids, &splits));
    ASSERT_TRUE(its.remove({1, 2}, &splits));
    ASSERT_TRUE(its.replace(&copy, {0, 1}, 1, ids, false, &splits));
    for (const cel* one : {&its, &copy}) {
        for (int i = 0; i < one->numEvents(); i += 2) {
            const channel_event& in = *one->getChanEventPtr(i);
            EXPECT_EQ(in.id.getMagicType() == IdStampMagic::EffectNode, in.strip == layout::sourceOf('A'))
                << i;
        }
    }
}

TEST(CelRegions, RefusalsChangeNothing) {
    const double huge = cel::kGreatestTime * 2;
    cel its = make("AABB");
    its.setChanged(false);
    const uint64_t count = its.changeCount();
    cel::IdMap ids;
    for (const cel::Range& range :
         {cel::Range(1, 1), cel::Range(1, 1 + 5e-7), cel::Range(0, huge), cel::Range(0, Qx::kNoTime),
          cel::Range(std::nan(""), 1), Editable::invalidRange()}) {
        EXPECT_FALSE(its.insert(&its, range, 0, ids));
        EXPECT_FALSE(its.replace(&its, range, 0, ids));
        EXPECT_FALSE(its.replace(&its, range, 0, ids, true));
        EXPECT_FALSE(its.remove(range));
    }
    for (const double at : {huge, -huge, Qx::kNoTime, std::nan(""), cel::kGreatestTime - 0.5}) {
        EXPECT_FALSE(its.insert(&its, {0, 1}, at, ids));
        EXPECT_FALSE(its.replace(&its, {0, 1}, at, ids));
        EXPECT_FALSE(its.weld(&its, at));
    }
    EXPECT_FALSE(its.insert(nullptr, {0, 1}, 0, ids));
    EXPECT_FALSE(its.replace(nullptr, {0, 1}, 0, ids));
    EXPECT_FALSE(its.weld(nullptr, 9));
    EXPECT_TRUE(ids.empty());
    EXPECT_FALSE(its.changed());
    EXPECT_EQ(its.changeCount(), count);
    EXPECT_EQ(draw(its), "AABB");
}

/// A pair over [0, 10) with everything that a cut must treat: levels 0 to 1, fades, a code, velocity 2.
cel makeRich() {
    cel its;
    channel_event in(0, 100, layout::sourceOf('A'), 0, CE_IN_POINT, channel_event::newId(), 5);
    in.velocity = 2;
    in.rampQFrames = 8;
    in.rampCurve = Aud::GainCurve::SCurve;
    channel_event out(10, 120, layout::sourceOf('A'), 1, CE_OUT_POINT, channel_event::newId(), 6);
    out.velocity = 2;
    out.rampQFrames = 12;
    EXPECT_TRUE(its.add_event(in) && its.add_event(out));
    return its;
}

TEST(CelRegions, ACutChangesNothingOfWhatIsHeard) {
    cel its = makeRich();
    const channel_event in = its.get_event(0);
    const channel_event out = its.get_event(1);
    cel::Splits splits;
    ASSERT_TRUE(its.remove({4, 6}, &splits));
    ASSERT_EQ(its.numEvents(), 4);
    EXPECT_EQ(its.get_event(0), in);
    const channel_event cutOut = its.get_event(1);
    const channel_event cutIn = its.get_event(2);
    EXPECT_DOUBLE_EQ(cutOut.stripTime, 108);
    EXPECT_DOUBLE_EQ(cutIn.stripTime, 112);
    EXPECT_FLOAT_EQ(cutOut.level, 0.4f);
    EXPECT_FLOAT_EQ(cutIn.level, 0.6f);
    EXPECT_EQ(cutOut.rampQFrames, 0);
    EXPECT_EQ(cutIn.rampQFrames, 0);
    EXPECT_EQ(cutIn.rampCurve, 0);
    EXPECT_EQ(cutIn.velocity, 2);
    EXPECT_EQ(cutOut.velocity, 2);
    EXPECT_EQ(its.get_event(3).rampQFrames, 12);
    EXPECT_EQ(its.get_event(3).id, out.id);
    EXPECT_EQ(splits, (cel::Splits{{in.id, cutIn.id}}));
    expectSound(its);
}

TEST(CelRegions, WhatIsLeftOfATrimmedPairKeepsItsStamps) {
    cel its = makeRich();
    const channel_event in = its.get_event(0);
    const channel_event out = its.get_event(1);
    ASSERT_TRUE(its.remove({0, 3}));
    EXPECT_EQ(its.get_event(0).id, in.id);
    EXPECT_EQ(its.get_event(0).rampQFrames, 0);
    EXPECT_DOUBLE_EQ(its.get_event(0).stripTime, 106);
    cel::IdMap ids;
    cel::Splits splits;
    const cel source = make("dddddd");
    ASSERT_TRUE(its.replace(&source, {0, 4}, 5, ids, false, &splits));
    EXPECT_EQ(its.get_event(1).id, out.id);
    EXPECT_TRUE(splits.empty());
    ASSERT_EQ(ids.size(), 2u);
    EXPECT_EQ(ids.at(source.get_event(0).id), its.get_event(2).id);
    EXPECT_EQ(ids.at(source.get_event(1).id), its.get_event(3).id);
}

TEST(CelRegions, MaterialReplacementKeepsAllButTheMaterial) {
    cel its = makeRich();
    const channel_event in = its.get_event(0);
    const channel_event out = its.get_event(1);
    cel source;
    ASSERT_TRUE(source.appendEventPair(layout::sourceOf('d'), 50, 0, 20).valid());
    source.get_start_ceh().set_strip_velocity(-1);
    cel::IdMap ids;
    ASSERT_TRUE(its.replace(&source, {5, 15}, 0, ids, true));
    ASSERT_EQ(its.numEvents(), 2);
    channel_event expectedIn = in;
    expectedIn.strip = layout::sourceOf('d');
    expectedIn.stripTime = 45;
    expectedIn.velocity = -1;
    channel_event expectedOut = out;
    expectedOut.strip = layout::sourceOf('d');
    expectedOut.stripTime = 35;
    expectedOut.velocity = -1;
    EXPECT_EQ(its.get_event(0), expectedIn);
    EXPECT_EQ(its.get_event(1), expectedOut);
    EXPECT_TRUE(ids.empty()) << "nothing was copied, the events are the cel's own";

    // Under the middle alone: three pieces, and whoever binds effects is told of both further ones.
    cel::Splits splits;
    ASSERT_TRUE(its.replace(&source, {5, 7}, 4, ids, true, &splits));
    ASSERT_EQ(its.numEvents(), 6);
    EXPECT_EQ(splits, (cel::Splits{{in.id, its.get_event(2).id}, {in.id, its.get_event(4).id}}));
    // In gaps a pair of the source is copied: once, and split.
    splits.clear();
    cel gaps = make(" A  A ");
    ASSERT_TRUE(gaps.replace(&source, {0, 6}, 0, ids, true, &splits));
    const IdStamp copy = gaps.get_event(0).id;
    EXPECT_EQ(ids.at(source.get_event(0).id), copy);
    EXPECT_EQ(splits, (cel::Splits{{copy, gaps.get_event(4).id}, {copy, gaps.get_event(8).id}}));
}

TEST(CelRegions, AWeldCostsWhatIsJoinedOn) {
    const auto start = std::chrono::steady_clock::now();
    const cel part = make("A");
    cel joined;
    for (int i = 0; i < 16000; ++i) {
        ASSERT_TRUE(joined.weld(&part, i));
    }
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(5));
    expectSound(joined);
}

} // namespace
