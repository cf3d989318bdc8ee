// Thousands of operations on a cel and on a row that holds what each second shows.

#include "edit/model/cel.h"
#include "platform/store/pstream.h"
#include "support/cel_layout.h"
#include "support/row_model.h"

#include <gtest/gtest.h>

#include <random>
#include <thread>

namespace {

using rows::Row;

class Random {
public:
    explicit Random(unsigned seed) : m_engine(seed) {}
    int below(int limit) { return static_cast<int>(m_engine() % static_cast<unsigned>(limit)); }
    /// A whole second, or so near to one that it counts as that even when many such have added up.
    double near(int second) {
        static constexpr double kNoise[] = {0, 0, 1e-10, -1e-10, 1e-12, -1e-12};
        return second + kNoise[below(6)];
    }
    cel freshCel() {
        cel its;
        double time = below(3);
        for (int pairs = below(6); pairs > 0; --pairs) {
            const double length = 1 + below(5);
            const char letter = below(4) == 0 ? '.' : static_cast<char>('A' + below(20));
            its.appendEventPair(layout::sourceOf(letter), below(1000), time, length);
            time += length + (below(8) == 0 ? below(4) : 0);
        }
        return its;
    }

private:
    std::mt19937 m_engine;
};

Row rowOf(const cel& its) {
    std::string problem;
    Row row = rows::rowOf(its, 1, problem);
    EXPECT_EQ(problem, "");
    return row;
}

void expectRepacks(const cel& its) {
    PStream packed;
    its.STRM_hierarchyPack(packed);
    PStream stream{std::span<const std::byte>(packed.bytes())};
    cel again;
    ASSERT_TRUE(again.STRM_hierarchyUnpack(stream));
    ASSERT_EQ(again.numEvents(), its.numEvents());
    for (int i = 0; i < its.numEvents(); ++i) {
        ASSERT_EQ(again.get_event(i), its.get_event(i));
    }
}

void run(Random& random, int step, cel& its, Row& row) {
    const cel other = random.freshCel();
    const bool own = random.below(4) == 0;
    const cel* const source = own ? &its : &other;
    const int from = random.below(12);
    const int length = 1 + random.below(10);
    const int at = random.below(rows::lengthOf(row) + 4);
    const Row taken = rows::part(own ? row : rowOf(other), from, length);
    const int operation = row.size() > 120 ? 1 : random.below(6);
    const cel::Range range(random.near(from), random.near(from + length));
    cel::IdMap ids;
    // A copy shares the events until one of the two is changed: every other step has one to disturb.
    const bool copied = random.below(2) == 0;
    const cel before(copied ? its : cel());
    const Row rowBefore = copied ? row : Row();
    SCOPED_TRACE(testing::Message() << "operation " << operation << " in step " << step);
    switch (operation) {
    case 0:
        ASSERT_TRUE(its.insert(source, range, random.near(at), ids));
        rows::insert(row, at, taken);
        break;
    case 1:
        ASSERT_TRUE(its.remove({random.near(at), random.near(at + length)}));
        rows::remove(row, at, at + length);
        break;
    case 2:
    case 3:
        ASSERT_TRUE(its.replace(source, range, random.near(at), ids, operation == 3));
        rows::put(row, at, taken, operation == 3);
        break;
    case 4: {
        const auto part = its.extract(random.near(from), random.near(from + length));
        ASSERT_NE(part, nullptr);
        Row expected = rows::part(row, from, length);
        expected.resize(rowOf(*part).size());
        ASSERT_EQ(rowOf(*part), expected);
        its.simplify(Simplification::MergeThrough);
        break;
    }
    default:
        expectRepacks(its);
    }
    while (!row.empty() && row.back() == rows::kGap) {
        row.pop_back();
    }
    ASSERT_EQ(rowOf(its), row);
    ASSERT_EQ(rowOf(before), rowBefore) << "the copy";
    ASSERT_EQ(layout::faultOf(its, 0.9), "");
    for (const auto& [old, fresh] : ids) {
        ASSERT_NE(its.findId(fresh).valid(), 0);
    }
}

TEST(CelRandom, AgreesWithARowOfSeconds) {
    for (const unsigned seed : {1u, 2u, 3u, 5u, 8u, 13u, 21u, 34u}) {
        SCOPED_TRACE("seed " + std::to_string(seed));
        Random random(seed);
        cel its;
        Row row;
        for (int step = 0; step < 1500; ++step) {
            ASSERT_NO_FATAL_FAILURE(run(random, step, its, row));
        }
    }
}

TEST(CelRandom, CopiesAreChangedOnThreadsOfTheirOwn) {
    cel its;
    for (int i = 0; i < 2000; ++i) {
        its.appendEventPair(layout::sourceOf('A'), i, i, 1);
    }
    const auto work = [](std::unique_ptr<cel> copied, int number) {
        for (int step = 0; step < 50; ++step) {
            const auto next = copied->copy();
            ASSERT_TRUE(copied->remove({static_cast<double>(number), number + 1.0}));
            copied->get_start_ceh().set_dmod_code(number);
            ASSERT_EQ(next->numPairs(), 2000 - step);
            ASSERT_EQ(copied->numPairs(), 1999 - step);
        }
    };
    std::vector<std::thread> threads;
    for (int number = 1; number <= 4; ++number) {
        threads.emplace_back(work, its.copy(), number);
    }
    for (int i = 0; i < 1000; ++i) {
        ASSERT_EQ(its.find_ceh(i + 0.5, CE_IN_POINT).index(), 2 * i);
    }
    its.get_start_ceh().set_dmod_code(9);
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(its.numPairs(), 2000);
    EXPECT_EQ(its.get_start_ceh().get_dmod_code(), 9);
}

} // namespace
