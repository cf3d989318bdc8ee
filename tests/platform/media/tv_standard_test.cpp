#include "platform/media/tv_standard.h"

#include "platform/services/current_project.h"

#include <gtest/gtest.h>

using namespace Qx::Ed2Support;

TEST(TvStandard, TheProjectsTextStandsForItsRate) {
    const struct {
        int rate;
        int outputRate;
        bool dropFrame;
        const char* text;
    } cases[] = {
        {1, 5, true, "ntsc_drop_frame_24"},
        {1, 5, false, "ntsc_24"},
        {1, 0, true, "pal_24"},
        {3, 5, true, "pal"},
        {4, 0, true, "ntsc_drop_frame"},
        {4, 0, false, "ntsc"},
        {2, 0, false, ""},
        {7, 0, false, ""},
    };
    const Qx::CurrentProject before = Qx::currentProject();
    for (const auto& c : cases) {
        Qx::CurrentProject project = before;
        project.frameRateCode = c.rate;
        project.outputImageRate = c.outputRate;
        project.dropFrame = c.dropFrame;
        Qx::setCurrentProject(project);
        const String text = tvStdTextForProject();
        EXPECT_EQ(text, c.text);
        EXPECT_EQ(tvStdFromText(text).frameRateCode, text.empty() ? 0 : c.rate) << text;
    }
    Qx::setCurrentProject(before);
}

TEST(TvStandard, TextsThatAreNone) {
    for (const char* text : {"", "secam", "pal 24", "palx"}) {
        EXPECT_FALSE(tvStdFromText(text).known()) << text;
    }
    EXPECT_EQ(tvStdFromText(" PAL "), tvStdFromText("pal"));
    EXPECT_FALSE(tvStdFromText("pal") == tvStdFromText("ntsc"));
}
