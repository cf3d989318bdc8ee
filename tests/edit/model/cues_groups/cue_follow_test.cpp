#include "cue_fixture.h"

#include <ctime>
#include <functional>
#include <gtest/gtest.h>
#include <random>

using test::cutList;
using test::source;

namespace {

/// One channel with a cue at `time` of three ten-second pairs.
struct Followed {
    std::unique_ptr<cel> its = cutList(1, {10, 10, 10});
    std::unique_ptr<cel> other = cutList(50, {2});
    cel::IdMap ids;
    cue_point cue;

    explicit Followed(double time) : cue("cue", time, 0, 0, {its.get()}, true) {}
    void insertTwo(double at) { ASSERT_TRUE(its->insert(other.get(), {0, 2}, at, ids)); }
};

void expectAt(const cue_point& cue, double time, int event, bool inside) {
    EXPECT_NEAR(cue.editTime(), time, 1e-9);
    EXPECT_EQ(cue.event().index(), event);
    EXPECT_EQ(cue.hasFlags(CueFlag::kInside), inside);
}

} // namespace

TEST(CueFollows, ASplitInThePieceThatPlaysIt) {
    const struct {
        double cut, time;
        int event;
    } cases[] = {{15, 12, 2}, {12, 14, 6}, {11, 14, 6}, {10, 14, 4}, {20, 12, 2}};
    for (const auto& c : cases) {
        Followed f(12);
        f.insertTwo(c.cut);
        f.cue.update_edit_time();
        SCOPED_TRACE(c.cut);
        expectAt(f.cue, c.time, c.event, true);
        // It belongs to the piece from here on.
        f.insertTwo(0);
        f.cue.update_edit_time();
        expectAt(f.cue, c.time + 2, c.event + 2, true);
    }
}

TEST(CueFollows, AnotherUseOfTheSourceDoesNotCatchIt) {
    auto its = cutList(1, {10});
    its->appendEventPair(source(1), 102, 10, 6);
    cue_point cue("cue", 8, 0, 0, {its.get()}, true);
    ASSERT_TRUE(its->set_edit_time(ce_handle(its.get(), 1), 5, false));
    EXPECT_TRUE(cue.update_edit_time());
    EXPECT_EQ(cue.event().index(), 0);
    EXPECT_FALSE(cue.hasFlags(CueFlag::kInside));
    ASSERT_TRUE(its->remove({0, 5}));
    EXPECT_TRUE(cue.update_edit_time());
    EXPECT_EQ(cue.editTime(), 0) << "its event is gone";
    EXPECT_EQ(cue.event().valid(), 0);
}

TEST(CueFollows, OtherMaterialUnderTheEventKeepsItsDistance) {
    Followed f(12);
    f.other = cutList(70, {10});
    ASSERT_TRUE(f.its->replace(f.other.get(), {0, 10}, 10, f.ids, true));
    f.its->set_strip_time(ce_handle(f.its.get(), 2), 40);
    f.cue.update_edit_time();
    expectAt(f.cue, 12, 2, true);
    EXPECT_EQ(f.cue.stripCookie(), source(70));
    EXPECT_DOUBLE_EQ(f.cue.stripTime(), 42);
}

TEST(CueFollows, TheStripIsReadAgainWhereTheUserPutsIt) {
    Followed f(12);
    f.insertTwo(0);
    EXPECT_TRUE(f.cue.update_edit_time());
    EXPECT_FALSE(f.cue.update_edit_time()) << "nothing changed since";
    EXPECT_DOUBLE_EQ(f.cue.secondTime(), 14) << "the span keeps its length";
    ASSERT_TRUE(f.cue.setEditTime(16));
    f.cue.update_strip_time();
    EXPECT_DOUBLE_EQ(f.cue.stripTime(), 104);
    EXPECT_FALSE(f.cue.update_edit_time());
    expectAt(f.cue, 16, 4, true);
    f.cue.detach();
    f.insertTwo(0);
    EXPECT_FALSE(f.cue.update_edit_time());
    EXPECT_EQ(f.cue.editTime(), 16);
}

TEST(CueFollows, ARescaleOfItsCel) {
    Followed f(12);
    cue_list list;
    list.add_cue_point(f.cue);
    const double factor = 25.0 / 24.0;
    const auto scaled = std::make_unique<cel>();
    for (int i = 0; i < f.its->numEvents(); ++i) {
        channel_event event = f.its->get_event(i);
        event.editTime *= factor;
        event.stripTime *= factor;
        ASSERT_TRUE(scaled->add_event(event));
    }
    list.rebindCel(f.its.get(), scaled.get());
    EXPECT_FALSE(list.rescale(std::numeric_limits<double>::infinity(), 1));
    ASSERT_TRUE(list.rescale(factor, factor));
    list.update_edit_time();
    expectAt(*list.get_cue_point(0, 0), 12 * factor, 2, true);
}

namespace {

/// What is to be expected of a cue, found without indices, stamps kept by the cue, or hints: by the one
/// source that only its event and the pieces of that play.
struct Expected {
    cookie strip;
    double stripTime = 0;
    IdStamp event;
    double time = 0;
    bool inside = true;
    bool lost = false;

    void follow(const cel& its) {
        int found = -1;
        for (int in = 0; in < its.numEvents() && !lost; in += 2) {
            const channel_event a = its.get_event(in);
            const double end = a.stripTime + its.get_event(in + 1).editTime - a.editTime;
            if (a.strip == strip && stripTime >= a.stripTime - 1e-6 && stripTime < end - 1e-6) {
                found = in;
            }
        }
        for (int in = 0; in < its.numEvents() && found < 0 && !lost; in += 2) {
            found = its.get_event(in).id == event ? in : -1;
        }
        lost = found < 0;
        if (lost) {
            time = 0;
            return;
        }
        const channel_event a = its.get_event(found);
        event = a.id;
        time = stripTime - a.stripTime + a.editTime;
        inside = time >= a.editTime - 1e-9 && time <= its.get_event(found + 1).editTime + 1e-9;
    }
};

class RandomCelOperations {
public:
    explicit RandomCelOperations(unsigned seed) : m_random(seed) {}

    void step(cel& its) {
        const double end = std::max(its.get_end_time(), 1.0);
        const double at = frames(end);
        const double length = frames(8) + 0.04;
        const auto other = cutList(m_fresh, {length / 2, length / 2});
        m_fresh += 2;
        switch (m_random() % 4) {
        case 0:
            its.insert(other.get(), {0, length}, at, m_ids);
            break;
        case 1:
            its.remove({at, at + length});
            break;
        case 2:
            its.replace(other.get(), {0, length}, at, m_ids);
            break;
        default: { // an out point is trimmed
            const ce_handle out = its.find_ceh(at, CE_OUT_POINT);
            if (out.valid() != 0 && out.matching_in_ceh().get_edit_time() < at - 0.01) {
                its.set_edit_time(out, at, false);
            }
        }
        }
    }

private:
    double frames(double upTo) { return static_cast<double>(m_random() % 1000) * upTo / 1000.0; }

    std::mt19937 m_random;
    int m_fresh = 100000;
    cel::IdMap m_ids;
};

} // namespace

TEST(CueFollows, ManyCuesTakeNoMoreThanAMomentEach) {
    constexpr int kMany = 20000;
    const std::vector<double> lengths(kMany, 2.0);
    const auto timed = [](const char* what, const std::function<void()>& work) {
        const std::clock_t start = std::clock(); // of the processor: the machine may be busy
        work();
        EXPECT_LT(std::clock() - start, CLOCKS_PER_SEC / 5) << what;
    };
    const EditPtr edit(new Edit);
    cel* const its = edit->get_edit_cel_p(edit->addChan(VideoChan, cutList(1, lengths).release()));
    cue_list& cues = edit->get_cues();
    for (int i = 0; i < kMany; ++i) {
        cues.add_cue_point("c", 2 * i + 0.5, 0, i, {its}, true);
        cues.get_cue_point(static_cast<size_t>(i), 0)->setFlags(CueFlag::kAttached + i % 2 * CueFlag::kKept);
    }
    cue_list elsewhere = cues;
    elsewhere.dropCels();
    const auto moved = cutList(100000, lengths);
    timed("converted to what plays elsewhere", [&] { elsewhere.convert({moved.get()}); });
    EXPECT_TRUE(elsewhere.get_cue_point(0, 0)->attached()) << "to what plays there";
    timed("stored", [&] { edit->storeCues(); });
    cel::IdMap ids;
    ASSERT_TRUE(its->replace(moved.get(), {0, kMany}, 0, ids));
    timed("half of the events replaced", [&] { edit->updateCues(); });
    EXPECT_EQ(cues.get_cue_point(kMany / 2 - 1, 0)->editTime(), 0);
    EXPECT_EQ(cues.get_cue_point(kMany - 1, 0)->editTime(), 2 * kMany - 1.5);
    timed("cel cues deleted", [&] { edit->delete_all_cel_cues(); });
    EXPECT_EQ(cues.get_num_cue_points(0), kMany / 2);
}

TEST(CueFollows, RandomOperationsAsExpected) {
    for (unsigned seed = 1; seed <= 40; ++seed) {
        SCOPED_TRACE("seed " + std::to_string(seed));
        const auto its = cutList(1, std::vector<double>(60, 5.0));
        cue_list list;
        std::vector<Expected> expected;
        for (int i = 0; i < 120; ++i) {
            const double time = i * 2.5 + 0.4;
            ASSERT_TRUE(list.add_cue_point("c", time, 0, i, {its.get()}, true));
            const cue_point& cue = *list.get_cue_point(static_cast<size_t>(i), 0);
            expected.push_back(
                {cue.stripCookie(), cue.stripTime(), cue.event().get_channel_event().id, time});
        }
        RandomCelOperations operations(seed);
        for (int step = 0; step < 60; ++step) {
            operations.step(*its);
            ASSERT_NE(its->is_good_cel(), 0);
            list.update_edit_time();
            for (size_t i = 0; i < expected.size(); ++i) {
                expected[i].follow(*its);
                const cue_point& cue = *list.get_cue_point(i, 0);
                ASSERT_NEAR(cue.editTime(), expected[i].time, 1e-6) << "step " << step << " cue " << i;
                ASSERT_EQ(cue.event().valid() != 0, !expected[i].lost) << "step " << step << " cue " << i;
                if (!expected[i].lost) {
                    ASSERT_EQ(cue.event().get_channel_event().id, expected[i].event)
                        << "step " << step << " cue " << i;
                    const double edge = std::abs(expected[i].time - cue.event().get_edit_time());
                    ASSERT_TRUE(edge < 1e-6 || cue.hasFlags(CueFlag::kInside) == expected[i].inside)
                        << "step " << step << " cue " << i;
                }
            }
        }
    }
}
