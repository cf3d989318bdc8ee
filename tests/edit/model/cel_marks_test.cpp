#include "support/cel_marks.h"

#include <gtest/gtest.h>

#include <cstdlib>

/// "QUILLMARCH_CEL_STEPS" in the environment sets how many steps are made.
TEST(CelMarks, NoOperationNearCutsLeavesAnInconsistentCelOrASliver) {
    const char* const asked = std::getenv("QUILLMARCH_CEL_STEPS");
    const long steps = asked != nullptr ? std::atol(asked) : 300000;
    constexpr unsigned kSeeds = 10;
    for (unsigned seed = 1; seed <= kSeeds; ++seed) {
        test::MarksNearCuts marks(seed);
        for (long i = 0; i < steps / kSeeds; ++i) {
            const std::string problem = marks.step();
            ASSERT_EQ(problem, "") << "seed " << seed << ", step " << i;
        }
    }
}
