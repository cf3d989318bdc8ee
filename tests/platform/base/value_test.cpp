#include "platform/base/num_range.h"
#include "platform/base/ole_splat.h"
#include "platform/base/qx_string.h"

#include <gtest/gtest.h>

namespace {

TEST(NumRange, TheStartBelongsAndTheEndDoesNotWithTolerance) {
    const NumRange<double> region(10, 20);
    const struct {
        double time;
        bool in;
    } cases[] = {{10, true},  {10 - 0.9e-6, true},  {10 - 1.1e-6, false},
                 {20, false}, {20 - 0.9e-6, false}, {20 - 1.1e-6, true},
                 {15, true}};
    for (const auto& c : cases) {
        EXPECT_EQ(Qx::timeIsConsideredToBeInRegion(c.time, region), c.in) << c.time;
    }
    EXPECT_FALSE(Qx::timeIsConsideredToBeInRegion(10, NumRange<double>(10, 10)))
        << "an empty region holds nothing";
}

String splatted;

TEST(OleSplat, ReportsToTheHandlerAndReturns) {
    const auto before = Qx::setSplatHandler([](const char* message) { splatted = message; });
    ole_splat("pops: %d of %s", 3, "2");
    EXPECT_EQ(splatted, "pops: 3 of 2");
    EXPECT_NE(Qx::setSplatHandler(before), nullptr);
}

} // namespace
