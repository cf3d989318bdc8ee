#include "platform/media/frame_rate.h"

#include "platform/services/current_project.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

using Qx::FrameRate;

namespace {

class ProjectAt {
public:
    explicit ProjectAt(int frameRateCode) : m_before(Qx::currentProject()) {
        Qx::CurrentProject project = m_before;
        project.frameRateCode = frameRateCode;
        Qx::setCurrentProject(project);
    }
    ~ProjectAt() { Qx::setCurrentProject(m_before); }

private:
    Qx::CurrentProject m_before;
};

} // namespace

TEST(FrameRate, TextsThatUsersWrite) {
    const std::pair<const char*, int> cases[] = {
        {"25.00", FrameRate::Fps25},          {" 25 ", FrameRate::Fps25},
        {"23.98", FrameRate::Fps23_976},      {"24", FrameRate::Fps24},
        {"23.99", FrameRate::Fps24},          {"29.97", FrameRate::Fps29_97},
        {"29.97002997", FrameRate::Fps29_97}, {"59.94", FrameRate::Fps59_94},
        {"47.95", FrameRate::Fps47_952},      {"24000/1001", FrameRate::Fps23_976}};
    for (const auto& [text, code] : cases) {
        EXPECT_EQ(FrameRate::fromString(text).code(), code) << text;
    }
    for (const char* text :
         {"", "25fps", "26", "25.02", "0", "-25", "1/0", "0/0", "nan", "inf", "25/", "/25"}) {
        EXPECT_FALSE(FrameRate::fromString(text).valid()) << text;
    }
    for (int code = 1; code <= 10; ++code) {
        const FrameRate rate(code);
        EXPECT_EQ(FrameRate::fromString(rate.asString()), rate) << rate.asString();
        EXPECT_EQ(FrameRate::fromString(Qx::doubleToText(rate.framesPerSecond())), rate);
        for (int64_t frames = -3; frames < 200'000'000'000; frames = frames * 2 + 5) {
            ASSERT_EQ(rate.toFrames(rate.toSeconds(frames)), frames) << rate.asString();
        }
    }
}

TEST(FrameRate, ACodeThatIsNoneIsUnknownAndHarmless) {
    for (const int code : {-1, 0, 11, std::numeric_limits<int>::max(), std::numeric_limits<int>::min()}) {
        const FrameRate rate(code);
        EXPECT_FALSE(rate.valid());
        EXPECT_EQ(rate.asString(), "");
        EXPECT_EQ(rate.toFrames(10.0), 0);
        EXPECT_EQ(rate.toSeconds(10), 0.0);
        EXPECT_EQ(rate.frameDuration(), 0.0);
    }
}

TEST(FrameRate, FramesRoundToNearest) {
    const FrameRate pal(FrameRate::Fps25);
    EXPECT_EQ(pal.toFrames(1.16), 29) << "1.16 x 25 is a little below 29 in binary";
    EXPECT_EQ(pal.toFrames(-1.16), -29);
    EXPECT_EQ(pal.toFrames(0.02), 1) << "halves go away from zero";
    EXPECT_EQ(pal.toFrames(-0.02), -1);
    EXPECT_EQ(pal.toFrames(0.0199), 0);
    EXPECT_EQ(FrameRate(FrameRate::Fps23_976).toFrames(7207.2), 172800);
    EXPECT_EQ(FrameRate(FrameRate::Fps23_976).toSeconds(172800), 7207.2);
}

TEST(FrameRate, HugeTimesAreClamped) {
    const FrameRate pal(FrameRate::Fps25);
    constexpr int64_t limit = int64_t{1} << 53;
    EXPECT_EQ(pal.toFrames(1e99), limit);
    EXPECT_EQ(pal.toFrames(-std::numeric_limits<double>::infinity()), -limit);
    EXPECT_EQ(pal.toFrames(std::nan("")), 0);
    EXPECT_EQ(pal.toSeconds(std::numeric_limits<int64_t>::max()), pal.toSeconds(limit));
    EXPECT_EQ(pal.toSeconds(std::numeric_limits<int64_t>::min()), pal.toSeconds(-limit));
}

TEST(FrameRate, TheProjectsRateRoundsTimes) {
    const ProjectAt ntsc(FrameRate::Fps29_97);
    EXPECT_EQ(Qx::projectFrameRate().code(), FrameRate::Fps29_97);
    EXPECT_EQ(Qx::frameRound(1.0), 30 * 1001 / 30000.0);
    const ProjectAt none(FrameRate::Unknown);
    EXPECT_EQ(Qx::frameRound(1.2345), 1.2345);
}
