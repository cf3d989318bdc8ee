#include "platform/base/attrib_value_pair.h"
#include "platform/base/exception.h"
#include "platform/base/num_range.h"
#include "platform/base/ole_splat.h"
#include "platform/base/status.h"

#include <gtest/gtest.h>

namespace {

TEST(AttribValuePair, OnlyTheFirstEqualsSignDivides) {
    const Qx::AttribValuePair pair("width=a=b");
    EXPECT_EQ(pair.attrib(), "width");
    EXPECT_EQ(pair.value(), "a=b");
    EXPECT_EQ(pair.asString(), "width=a=b");
    EXPECT_TRUE(Qx::AttribValuePair("empty=").valid());
    for (const char* text : {"", "none", "=value"}) {
        EXPECT_FALSE(Qx::AttribValuePair(text).valid()) << text;
        EXPECT_EQ(Qx::AttribValuePair(text).asString(), "") << text;
    }
    EXPECT_EQ(Qx::AttribValuePair("a=b", "c").asString(), "") << "an attribute cannot hold the divider";
}

TEST(NumRange, OrderedRangesPutTheirEndsInOrder) {
    const NumRange<double> range(5, 2);
    EXPECT_EQ(range.start(), 2);
    EXPECT_EQ(range.length(), 3);
    EXPECT_EQ((NumRange<double, Unordered>(5, 2).start()), 5);
    NumRange<double> wide(3, 4);
    wide.widen(NumRange<double>(1, 3.5));
    EXPECT_EQ(wide, NumRange<double>(1, 4));
}

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

TEST(Status, AFailureIsOneEvenWithoutAReason) {
    EXPECT_TRUE(Qx::Status().isOk());
    EXPECT_FALSE(Qx::Status::failure("").isOk());
    EXPECT_EQ(Qx::Status::failure("no room").reason(), "no room");
}

TEST(RuntimeError, IsCaughtAcrossTheLibraryAsAStandardException) {
    try {
        throw Qx::Exception::RuntimeError("lost", "queue", 12);
    } catch (const std::runtime_error& error) {
        const auto* own = dynamic_cast<const Qx::Exception::RuntimeError*>(&error);
        ASSERT_NE(own, nullptr);
        EXPECT_STREQ(own->what(), "lost");
        EXPECT_EQ(own->source(), "queue");
        EXPECT_EQ(own->line(), 12);
    }
}

} // namespace
