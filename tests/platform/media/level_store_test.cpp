// The level envelope against one that is sampled, and its packed form against streams that lie.

#include "platform/media/level_store.h"
#include "platform/store/pstream.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <functional>
#include <random>

namespace {

using Aud::DynamicLevelControl::Store;
using Range = NumRange<double, Ordered>;

Store make(std::initializer_list<std::pair<double, float>> nodes) {
    Store made;
    for (const auto& [time, level] : nodes) {
        made.insertNode(time, level);
    }
    return made;
}

void expectOrder(const Store& store) {
    for (size_t i = 1; i < store.size(); ++i) {
        ASSERT_GT(store[i].time - store[i - 1].time, Qx::kTimeTolerance) << "node " << i;
    }
}

TEST(LevelStore, NodesKeepTheirOrderAndPlace) {
    Store store;
    EXPECT_EQ(store.levelAt(3), 1);
    EXPECT_EQ(store.insertNode(2, 0.5f), 0u);
    EXPECT_EQ(store.insertNode(1, 1.5f), 0u);
    EXPECT_EQ(store.insertNode(2 + 5e-7, 0.25f), 1u) << "at the same time";
    EXPECT_EQ(store.size(), 2u);
    EXPECT_EQ(store.levelAt(0), 1.5);
    EXPECT_EQ(store.levelAt(9), 0.25);
    EXPECT_NEAR(store.levelAt(1.5), 0.875, 1e-9);
    EXPECT_FALSE(store.moveNode(0, 2));
    EXPECT_FALSE(store.moveNode(1, 0.5));
    EXPECT_FALSE(store.moveNode(2, 5));
    EXPECT_FALSE(store.moveNode(1, std::nan("")));
    EXPECT_TRUE(store.moveNode(1, 3));
    EXPECT_FALSE(store.setLevel(0, INFINITY));
    EXPECT_TRUE(store.setLevel(0, 1));
    EXPECT_EQ(store.insertNode(std::nan(""), 1), 2u);
    EXPECT_EQ(store.insertNode(1e99, 1), 2u);
    EXPECT_EQ(store.size(), 2u);
    EXPECT_FALSE(store.removeNode(2));
    EXPECT_TRUE(store.removeNode(0));
    EXPECT_EQ(store.size(), 1u);
}

/// An envelope as a function of time.
using Envelope = std::function<double(double)>;

Envelope of(const Store& store) {
    return [store](double time) { return store.levelAt(time); };
}

TEST(LevelStore, OperationsAgreeWithFunctionsOfTime) {
    for (const unsigned seed : {1u, 2u, 3u, 5u, 8u}) {
        SCOPED_TRACE("seed " + std::to_string(seed));
        std::mt19937 random(seed);
        const auto second = [&](unsigned limit) { return static_cast<double>(random() % limit); };
        Store store;
        for (int step = 0; step < 400; ++step) {
            Store source;
            for (auto nodes = random() % 6; nodes > 0; --nodes) {
                source.insertNode(second(20), static_cast<float>(random() % 9) / 4);
            }
            const bool own = random() % 5 == 0;
            const Envelope its = of(store);
            const Envelope laid = own ? its : of(source);
            const double from = second(15);
            const double length = 1 + second(6);
            const double at = second(30);
            const auto operation = store.size() > 60 ? 1 : random() % 4;
            Envelope expected;
            if (operation == 0) {
                store.insert(own ? store : source, {from, from + length}, at);
                expected = [=](double t) {
                    return t < at ? its(t) : t < at + length ? laid(from + t - at) : its(t - length);
                };
            } else if (operation == 1) {
                store.remove({at, at + length});
                expected = [=](double t) { return its(t < at ? t : t + length); };
            } else if (operation == 2) {
                store.replace(own ? store : source, {from, from + length}, at);
                expected = [=](double t) {
                    return t < at || t >= at + length ? its(t) : laid(from + t - at);
                };
            } else {
                store.simplify();
                expected = its;
            }
            for (double time = -2.25; time < 60; time += 0.5) {
                ASSERT_NEAR(store.levelAt(time), expected(time), 2e-3)
                    << "operation " << operation << " in step " << step << " at " << time;
            }
            ASSERT_NO_FATAL_FAILURE(expectOrder(store)) << "operation " << operation << " in step " << step;
        }
    }
}

TEST(LevelStore, SimplifyingKeepsTheShape) {
    Store line = make({{0, 0.0f}, {1, 0.25f}, {2, 0.5f}, {3, 0.75f}, {4, 0.5f}, {5, 0.25f}});
    line.simplify();
    EXPECT_EQ(line, make({{0, 0.0f}, {3, 0.75f}, {5, 0.25f}}));
    Store bow; // every node is near the line between its neighbours, the bow as a whole is not a line
    for (int i = 0; i <= 2000; ++i) {
        const double x = i / 2000.0;
        bow.insertNode(i, static_cast<float>(x * x));
    }
    const Store before = bow;
    bow.simplify();
    EXPECT_GT(before.size(), bow.size());
    for (int i = 0; i <= 2000; ++i) {
        ASSERT_NEAR(bow.levelAt(i), before.levelAt(i), 3e-6) << i;
    }
}

bool reads(const std::vector<std::byte>& bytes, Store& into) {
    PStream stream{std::span<const std::byte>(bytes)};
    into.unpack(stream);
    return stream.good();
}

TEST(LevelStore, ThePackedFormIsCheckedWhole) {
    const Store store = make({{0, 0.5f}, {2, 1.5f}, {7, 0.0f}});
    PStream packed;
    store.pack(packed);
    const std::vector<std::byte> whole = packed.bytes();
    ASSERT_EQ(whole.size(), 4u + 3 * 16);
    Store again;
    ASSERT_TRUE(reads(whole, again));
    EXPECT_EQ(again, store);
    const auto refused = [&](std::vector<std::byte> bytes) {
        Store its = make({{9, 2.0f}});
        return !reads(bytes, its) && its == make({{9, 2.0f}});
    };
    const auto with = [&](size_t offset, auto value) {
        std::vector<std::byte> bytes = whole;
        std::memcpy(bytes.data() + offset, &value, sizeof value);
        return bytes;
    };
    EXPECT_TRUE(refused(with(4, std::nan("")))) << "time";
    EXPECT_TRUE(refused(with(4, 1e99))) << "time";
    EXPECT_TRUE(refused(with(4 + 16, 0.0))) << "order";
    EXPECT_TRUE(refused(with(4 + 8, INFINITY))) << "level";
    EXPECT_TRUE(refused(with(4 + 12, 1u))) << "reserved";
}

} // namespace
