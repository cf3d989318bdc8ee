// Thousands of operations on a cel and on a model that holds what each second shows.

#include "edit/model/cel.h"
#include "platform/store/pstream.h"
#include "support/cel_layout.h"

#include <gtest/gtest.h>

#include <random>
#include <thread>

namespace {

/// What one second shows: a source, the second of it, and the level in the middle.
struct Second {
    char letter = ' ';
    long strip = 0;
    double level = 0;
};

using Model = std::vector<Second>;

Model part(const Model& of, size_t from, size_t to) {
    Model taken(to - from);
    for (size_t i = from; i < to && i < of.size(); ++i) {
        taken[i - from] = of[i];
    }
    return taken;
}

void insert(Model& its, const Model& laid, size_t at) {
    its.resize(std::max(its.size(), at));
    its.insert(its.begin() + static_cast<std::ptrdiff_t>(at), laid.begin(), laid.end());
}

void remove(Model& its, size_t from, size_t to) {
    from = std::min(from, its.size());
    to = std::min(to, its.size());
    its.erase(its.begin() + static_cast<std::ptrdiff_t>(from), its.begin() + static_cast<std::ptrdiff_t>(to));
}

void replace(Model& its, const Model& laid, size_t at, bool materialOnly) {
    its.resize(std::max(its.size(), at + laid.size()));
    for (size_t i = 0; i < laid.size(); ++i) {
        Second& second = its[at + i];
        if (!materialOnly || second.letter == ' ') {
            second = laid[i];
        } else {
            second.letter = laid[i].letter == ' ' ? '.' : laid[i].letter;
            second.strip = laid[i].strip;
        }
    }
}

Model modelOf(const cel& its) {
    Model model(static_cast<size_t>(std::lround(its.get_end_time())));
    for (size_t i = 0; i < model.size(); ++i) {
        const double middle = static_cast<double>(i) + 0.5;
        const CEHPair pair(its, middle);
        if (pair.valid()) {
            const channel_event in = pair.inH().get_channel_event();
            model[i].letter = layout::letterOf(in.strip);
            model[i].strip = std::lround(pair.inH().get_strip_time(middle) - 0.5);
            model[i].level = double{pair.inH().get_strip_level(middle)};
        }
    }
    return model;
}

::testing::AssertionResult same(const cel& its, Model expected) {
    while (!expected.empty() && expected.back().letter == ' ') {
        expected.pop_back();
    }
    const Model found = modelOf(its);
    if (found.size() != expected.size()) {
        return ::testing::AssertionFailure() << found.size() << " seconds, not " << expected.size();
    }
    for (size_t i = 0; i < found.size(); ++i) {
        const bool black = expected[i].letter == '.' || expected[i].letter == ' ';
        if (found[i].letter != expected[i].letter || (!black && found[i].strip != expected[i].strip) ||
            std::abs(found[i].level - expected[i].level) > 1e-3) {
            return ::testing::AssertionFailure()
                   << "second " << i << " shows '" << found[i].letter << found[i].strip << "' at "
                   << found[i].level << ", not '" << expected[i].letter << expected[i].strip << "' at "
                   << expected[i].level;
        }
    }
    return ::testing::AssertionSuccess();
}

class Random {
public:
    explicit Random(unsigned seed) : m_engine(seed) {}
    size_t below(size_t limit) { return m_engine() % limit; }
    /// A whole second, or so near to one that it counts as that even when many such have added up.
    double near(size_t second) {
        static constexpr double kNoise[] = {0, 0, 1e-10, -1e-10, 1e-12, -1e-12};
        return static_cast<double>(second) + kNoise[below(6)];
    }

    cel freshCel() {
        cel its;
        double time = static_cast<double>(below(3));
        for (size_t pairs = below(6); pairs > 0; --pairs) {
            const double length = static_cast<double>(1 + below(5));
            const char letter = below(4) == 0 ? '.' : static_cast<char>('A' + below(20));
            const double strip = static_cast<double>(below(1000));
            ce_handle in = its.appendEventPair(layout::sourceOf(letter), strip, time, length);
            in.set_strip_level(static_cast<float>(below(5)) / 4);
            in.matching_out_ceh().set_strip_level(static_cast<float>(below(5)) / 4);
            time += length + static_cast<double>(below(8) == 0 ? below(4) : 0);
        }
        return its;
    }

private:
    std::mt19937 m_engine;
};

void run(unsigned seed, int steps) {
    SCOPED_TRACE("seed " + std::to_string(seed));
    Random random(seed);
    cel its;
    Model model;
    for (int step = 0; step < steps; ++step) {
        const cel other = random.freshCel();
        const bool own = random.below(4) == 0;
        const cel* source = own ? &its : &other;
        const Model sourceModel = own ? model : modelOf(other);
        const size_t from = random.below(12);
        const size_t to = from + 1 + random.below(10);
        const size_t at = random.below(model.size() + 4);
        const size_t operation = model.size() > 120 ? 1 : random.below(6);
        const cel::Range range(random.near(from), random.near(to));
        cel::IdMap ids;
        bool done = true;
        // A copy shares the events until one of the two is changed: every other step has one to disturb.
        const bool copied = random.below(2) == 0;
        const cel before(copied ? its : cel());
        const Model modelBefore = copied ? model : Model();
        switch (operation) {
        case 0:
            done = its.insert(source, range, random.near(at), ids);
            insert(model, part(sourceModel, from, to), at);
            break;
        case 1:
            done = its.remove({random.near(at), random.near(at + to - from)});
            remove(model, at, at + to - from);
            break;
        case 2:
        case 3:
            done = its.replace(source, range, random.near(at), ids, operation == 3);
            replace(model, part(sourceModel, from, to), at, operation == 3);
            break;
        case 4: {
            const auto taken = its.extract(random.near(from), random.near(to));
            ASSERT_NE(taken, nullptr);
            ASSERT_TRUE(same(*taken, part(model, from, to))) << "extract in step " << step;
            its.simplify(Simplification::MergeThrough);
            break;
        }
        default: {
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
        }
        ASSERT_TRUE(done) << "operation " << operation << " in step " << step;
        while (!model.empty() && model.back().letter == ' ') {
            model.pop_back();
        }
        ASSERT_TRUE(same(its, model)) << "operation " << operation << " in step " << step;
        ASSERT_TRUE(same(before, modelBefore)) << "the copy, operation " << operation << " in step " << step;
        ASSERT_EQ(layout::faultOf(its, 0.9), "") << "operation " << operation << " in step " << step;
        for (const auto& [old, fresh] : ids) {
            ASSERT_NE(its.findId(fresh).valid(), 0) << "operation " << operation << " in step " << step;
        }
    }
}

TEST(CelRandom, AgreesWithASecondBySecondModel) {
    for (const unsigned seed : {1u, 2u, 3u, 5u, 8u, 13u, 21u, 34u}) {
        run(seed, 1500);
        if (testing::Test::HasFatalFailure()) {
            return;
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
