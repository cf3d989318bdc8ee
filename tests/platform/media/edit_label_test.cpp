#include "platform/media/edit_label.h"

#include <gtest/gtest.h>

#include <limits>

using Qx::FrameRate;

namespace {

edit_label make(const char* keep) {
    const edit_label made(keep);
    EXPECT_TRUE(made.is_valid()) << keep;
    return made;
}

} // namespace

TEST(EditLabel, KeepStringsSurviveAndDoWithoutTheirTail) {
    for (const char* keep : {"TC29.97DF 8 1 0 29.97 01:00:00;00,LABEL_REV:1 ffffffff none",
                             "KK1 2 1 36000 25 KJ 12 3456 7890+12,LABEL_REV:1 00000003 24&1",
                             "IN5 10 2 -0.5 29.97 AA 1234+05,LABEL_REV:1 ffffffff 2:3 C",
                             "TC24 15 0 1.25 29.97 00:00:10:00,LABEL_REV:1 ffffffff 2:3 A"}) {
        EXPECT_EQ(make(keep).make_keep_string(), keep);
        EXPECT_FALSE(make(keep).toBeSaved());
    }
    EXPECT_EQ(make("TC24 15 1 0 29.97 00:00:10:00").make_keep_string(),
              "TC24 15 1 0 29.97 00:00:10:00,LABEL_REV:1 ffffffff 2:3 A");
    for (const char* keep :
         {"", "TC25", "TC25 8 1 0 25", "TC25 8 1 nan 25 00:00:00:00", "TC25 0 1 0 25 00:00:00:00",
          "TC26 8 1 0 25 00:00:00:00", "KK9 2 1 0 25 KJ 12 3456 7890+12", "TC25 8 -1 0 25 00:00:00:00",
          "TC25 8 1 0 13 00:00:00:00", "TC25 8 1 0 25 00:00:00:25"}) {
        EXPECT_FALSE(edit_label(keep).is_valid()) << keep;
    }
    EXPECT_FALSE(edit_label(nullptr).is_valid());
}

TEST(EditLabel, LeadsFromEditTimeToLabelAndBack) {
    const struct {
        const char* keep;
        double time;
        const char* text;
    } cases[] = {
        {"TC25 8 1 36000 25 10:00:00:00", 36001.04, "10:00:01:01"},
        {"TC25 8 1 36000 25 10:00:00:00", 36000.0399999,
         "10:00:00:01"}, // a hair before a frame is that frame
        {"TC25 8 1 36000 25 10:00:00:00", 35999.96, "09:59:59:24"},
        {"TC24 15 1 0 29.97 00:00:10:00", 5 * 1001.0 / 30000, "00:00:10:04"},
        {"TC29.97 3 1 0 23.976 01:00:00:00", 4 * 1001.0 / 24000, "01:00:00:05"},
        {"KK1 2 1 0 24 KJ 12 3456 7890+12", 1.0, "KJ 12 3456 7892+04"},
        {"FF5 2 1 0 25 10+00", 40.0, "35+00"},
        {"TC25 8 1 0 25 00:00:00:00", 86400.0, "00:00:00:00"},
    };
    for (const auto& c : cases) {
        const edit_label kept = make(c.keep);
        const label found = kept.labelAt(c.time);
        EXPECT_EQ(found.asString(), c.text) << c.keep;
        if (c.time < 86400) {
            ASSERT_TRUE(kept.timeOf(found).has_value());
            EXPECT_NEAR(*kept.timeOf(found), c.time, 2e-6) << c.keep;
        }
    }
    const edit_label kept = make(cases[0].keep);
    for (const double time :
         {std::numeric_limits<double>::quiet_NaN(), std::numeric_limits<double>::infinity()}) {
        EXPECT_FALSE(kept.labelAt(time).valid());
    }
    EXPECT_TRUE(kept.labelAt(1e300).valid());
    EXPECT_EQ(kept.timeOf(label()), std::nullopt);
}

TEST(MediumRoll, KeepsItsNumbersAndReelId) {
    MediumRoll roll("2 1 A 007 ");
    EXPECT_TRUE(roll.is_valid());
    EXPECT_EQ(roll.get_reelid(), "A 007 ");
    EXPECT_EQ(roll.asString(), "2 1 A 007 ");
    EXPECT_FALSE(roll.set_reelid("A\n007"));
    EXPECT_EQ(roll.get_reelid(), "A 007 ");
    EXPECT_EQ(MediumRoll("2 1"), MediumRoll(MediumRollIdent{2, 1}));
    for (const char* text : {"", "2", "x 1 A", "0 1 A", "2 0 A", "2 -1 A", "99999999999 1 A"}) {
        EXPECT_FALSE(MediumRoll(text).is_valid()) << text;
    }
    EXPECT_TRUE((MediumRollIdent{4, 1}.MediumRollId_fits_this({4, 0})));
    EXPECT_FALSE((MediumRollIdent{4, 1}.MediumRollId_fits_this({4, 2})));
    EXPECT_FALSE((MediumRollIdent{4, 0}.MediumRollId_fits_this({2, 0})));
}
