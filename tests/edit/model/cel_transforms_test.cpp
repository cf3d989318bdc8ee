// What makes another cel of a cel: grids, clocks, parts for overlapping sounds, merging.

#include "edit/model/cel.h"
#include "support/cel_layout.h"

#include <gtest/gtest.h>

#include <array>
#include <memory>

namespace {

/// Names a case of a table after itself.
constexpr auto caseName = [](const auto& tested) { return std::string(tested.param.name); };

using layout::draw;
using layout::drawStrips;
using layout::make;

TEST(CelTransforms, BlackIsPutAtTheEnds) {
    const cel its = make("AABB");
    EXPECT_EQ(draw(*its.add_black_to_ends(2, 'S')), "..AABB");
    EXPECT_EQ(drawStrips(*its.add_black_to_ends(2, 'S')), "..0123");
    EXPECT_EQ(draw(*its.add_black_to_ends(2, 'E')), "AABB..");
    EXPECT_EQ(draw(*its.add_black_to_ends(1, 'B')), ".AABB.");
    EXPECT_EQ(draw(*its.add_black_to_ends(0, 'B')), "AABB");
    EXPECT_EQ(draw(*make(" AA").add_black_to_ends(1, 'S')), " .AA");
    EXPECT_EQ(draw(*cel().add_black_to_ends(1, 'B')), ".|.");
    EXPECT_EQ(its.add_black_to_ends(-1, 'B'), nullptr);
    EXPECT_EQ(its.add_black_to_ends(1, 'x'), nullptr);
}

TEST(CelTransforms, QuantisingKeepsSyncAndJoints) {
    cel its;
    its.set_resolution(0.5);
    its.appendEventPair(layout::sourceOf('A'), 10, 0.1, 1.1);  // ends at 1.2
    its.appendEventPair(layout::sourceOf('B'), 20, 1.2, 0.04); // becomes nothing
    its.appendEventPair(layout::sourceOf('C'), 30, 1.24, 1.06);
    const auto rounded = its.quantise();
    ASSERT_EQ(rounded->numPairs(), 2);
    const std::array<double, 4> times{0.0, 1.0, 1.0, 2.5};
    for (int i = 0; i < 4; ++i) {
        EXPECT_DOUBLE_EQ(rounded->get_event(i).editTime, times[static_cast<size_t>(i)]);
    }
    for (const double time : {0.5, 0.99, 1.5, 2.2}) {
        EXPECT_NEAR(rounded->get_strip_time(time), its.get_strip_time(time), 1e-9) << time;
    }
    EXPECT_NE(rounded->is_good_cel(), 0);
    EXPECT_EQ(its.numPairs(), 3) << "the cel itself stays";
}

struct RescaleCase {
    const char* name;
    double editIn, editOut, stripIn, stripOut;
    const char* layout;
    const char* strips;
};

void PrintTo(const RescaleCase& c, std::ostream* out) {
    *out << c.name;
}

class Rescaling : public testing::TestWithParam<RescaleCase> {};

TEST_P(Rescaling, LaysAPartOnAnotherClock) {
    const RescaleCase& c = GetParam();
    const cel its = make("AAABBBBCC");
    const auto scaled = its.rescale(c.editIn, c.editOut, c.stripIn, c.stripOut, 1, 1, 0);
    ASSERT_NE(scaled, nullptr);
    EXPECT_EQ(draw(*scaled), c.layout);
    EXPECT_EQ(drawStrips(*scaled), c.strips);
    EXPECT_NE(scaled->is_good_cel(), 0);
    for (int i = 1; i < scaled->numEvents(); i += 2) {
        const channel_event in = scaled->get_event(i - 1);
        const channel_event out = scaled->get_event(i);
        EXPECT_NEAR(out.stripTime, in.stripTime + (out.editTime - in.editTime) * in.velocity, 1e-9);
    }
}

INSTANTIATE_TEST_SUITE_P(Cel, Rescaling,
                         testing::Values(RescaleCase{"Moved", 1, 4, 2, 5, " ABB", " 234"},
                                         RescaleCase{"TwiceAsFast", 0, 4, 1, 9, "ABBC", "1357"},
                                         RescaleCase{"AtAThird", 0, 9, 1, 4, "AAAAAABBB", "112223334"},
                                         RescaleCase{"Backwards", 0, 3, 5, 2, "BBA", "543"},
                                         RescaleCase{"Frozen", 0, 3, 4, 4, "BBB", "444"},
                                         RescaleCase{"BeyondTheEnd", 0, 4, 7, 11, "CC", "78"},
                                         RescaleCase{"Nothing", 0, 4, 20, 24, "", ""}),
                         caseName);

TEST(CelTransforms, RescalingTakesLevelsAlongAndRefusesNonsense) {
    const cel its = make("AAAA");
    const auto scaled = its.rescale(0, 8, 0, 4, 0.5, 1.0, 0);
    EXPECT_FLOAT_EQ(scaled->get_event(0).level, 0.5f);
    EXPECT_FLOAT_EQ(scaled->get_event(1).level, 1.0f);
    EXPECT_DOUBLE_EQ(scaled->get_event(0).velocity, 0.5);
    EXPECT_EQ(its.rescale(1, 1, 0, 4, 1, 1, 0), nullptr);
    EXPECT_EQ(its.rescale(2, 1, 0, 4, 1, 1, 0), nullptr);
    EXPECT_EQ(its.rescale(0, 1, 0, Qx::kNoTime, 1, 1, 0), nullptr);
    EXPECT_EQ(its.rescale(0, 2e-6, 0, 4, 1, 1, 0), nullptr) << "faster than an event may be";
}

std::vector<std::string> deal(const cel& its, double overlap, int flags, SoftCuts soft, int maxParts = 8) {
    std::array<cel*, 8> parts{};
    int numParts = -1;
    const int count = its.chequerboard(parts.data(), numParts, maxParts, overlap, flags, soft);
    EXPECT_EQ(count, numParts);
    std::vector<std::string> drawings;
    for (int i = 0; i < count; ++i) {
        const std::unique_ptr<cel> part(parts[static_cast<size_t>(i)]);
        EXPECT_NE(part->is_good_cel(), 0);
        drawings.push_back(draw(*part));
    }
    return drawings;
}

TEST(CelTransforms, ChequerboardDealsOutWhatOverlaps) {
    using Drawings = std::vector<std::string>;
    const cel its = make("AABB.CC");
    EXPECT_EQ(deal(its, 0, 0, SoftCuts::Ignore), (Drawings{"AABB CC"}));
    EXPECT_EQ(deal(its, 1, 0, SoftCuts::Ignore), (Drawings{"AA   CC", "  BB"}));
    EXPECT_EQ(deal(its, 4, 0, SoftCuts::Ignore), (Drawings{"AA", "  BB", "     CC"}));
    EXPECT_EQ(deal(its, 4, 0, SoftCuts::Ignore, 2), Drawings{});
    EXPECT_EQ(deal(its, 1, cel::ChequerFill, SoftCuts::Ignore), (Drawings{"AA...CC", "..BB..."}));
    EXPECT_EQ(deal(its, 2, cel::ChequerWiden, SoftCuts::Ignore), (Drawings{"AAA CCCC", " BBBB"}));
    EXPECT_EQ(deal(make("..."), 1, 0, SoftCuts::Keep), Drawings{});
    EXPECT_EQ(deal(its, -1, 0, SoftCuts::Keep), Drawings{});
}

TEST(CelTransforms, SoftCutsReachAsFarAsTheirFades) {
    const cel its = make("AABB");
    const auto quarterFrames = static_cast<uint16_t>(channel_event::timeToQFrames(0.5));
    ASSERT_GT(quarterFrames, 0);
    EXPECT_EQ(deal(its, 0, 0, SoftCuts::Keep).size(), 1u);
    ce_handle(&its, 2).set_audioRamp_DurationQFrames(quarterFrames);
    EXPECT_EQ(deal(its, 0, 0, SoftCuts::Ignore).size(), 1u);
    EXPECT_EQ(deal(its, 0, 0, SoftCuts::Keep), (std::vector<std::string>{"AA", "  BB"}));
}

TEST(CelTransforms, SimplifyingMergesOnlyWhatIsNotSeen) {
    cel its = make(".|.A|A.|.B. .");
    const IdStamp first = its.get_event(0).id;
    const IdStamp last = its.get_event(3).id;
    EXPECT_TRUE(its.simplify(Simplification::MergeBlack));
    EXPECT_EQ(draw(its), "..A|A..B. .");
    EXPECT_EQ(its.get_event(0).id, first);
    EXPECT_EQ(its.get_event(1).id, last);
    EXPECT_DOUBLE_EQ(its.get_event(1).stripTime, 2);
    EXPECT_FALSE(its.simplify(Simplification::MergeBlack));
    EXPECT_TRUE(its.simplify(Simplification::MergeThrough));
    EXPECT_EQ(draw(its), "..AA..B. .");
    EXPECT_FALSE(its.simplify(Simplification::MergeAll));

    using Change = void (*)(ce_handle);
    for (const Change change : {Change([](ce_handle h) { h.set_strip_time(h.get_strip_time() + 0.1); }),
                                Change([](ce_handle h) { h.set_strip_level(0.5f); }),
                                Change([](ce_handle h) { h.set_dmod_code(3); }),
                                Change([](ce_handle h) { h.set_strip_velocity(0.5); }),
                                Change([](ce_handle h) { h.set_audioRamp_DurationQFrames(4); })}) {
        cel seen = make("AA|AA");
        change(ce_handle(&seen, 2));
        EXPECT_FALSE(seen.simplify(Simplification::MergeAll));
        EXPECT_EQ(seen.numPairs(), 2);
    }
}

TEST(CelTransforms, FillingReachesATimeOnce) {
    cel its = make("AA");
    EXPECT_TRUE(its.fillToTime(5));
    EXPECT_EQ(draw(its), "AA...");
    EXPECT_FALSE(its.fillToTime(5));
    EXPECT_FALSE(its.fillToTime(2));
    EXPECT_FALSE(its.fillToTime(Qx::kNoTime));
}

} // namespace
