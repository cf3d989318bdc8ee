#include "platform/media/label.h"
#include "platform/media/pulldown.h"
#include "platform/media/timecode.h"

#include <gtest/gtest.h>

using Qx::FrameRate;

namespace {

label::Scale film(UserLabelType type, FilmGauge gauge = FilmGauge::Film35mm4Perf) {
    return label::Scale::film(type, gauge);
}

label read(const String& text, const label::Scale& scale) {
    label made;
    const Qx::Status status = label::parse(text, scale, made);
    EXPECT_TRUE(status.isOk()) << status.reason();
    return made;
}

const label::Scale kKey = film(kKeyKodeLabelType);
const label::Scale kKey3 = film(kKeyKodeLabelType, FilmGauge::Film35mm3Perf);
const label::Scale kKey16 = film(kKeyKodeLabelType, FilmGauge::Film16mm);
const label::Scale kFeet = film(kFootFrameLabelType);
const label::Scale kFeet16 = film(kFootFrameLabelType, FilmGauge::Film16mm);
const label::Scale kInk = film(kInkCodeLabelType);
const label::Scale kDrop = label::Scale::timecode(FrameRate(FrameRate::Fps29_97), true);
const label::Scale kPal = label::Scale::timecode(FrameRate(FrameRate::Fps25));

} // namespace

TEST(Label, IsReadAsTheFieldWritesItAndCounts) {
    const struct {
        label::Scale scale;
        const char* text;
        const char* printed;
        int64_t add;
        const char* after;
    } cases[] = {
        {kKey, "KJ 12 3456 7890+12", "KJ 12 3456 7890+12", 4, "KJ 12 3456 7891+00"},
        {kKey, " kj123456 7890+12 ", "KJ 12 3456 7890+12", -13, "KJ 12 3456 7889+15"},
        {kKey, "KX654321-0070+00", "KX 65 4321 0070+00", 160, "KX 65 4321 0080+00"},
        {kKey, "KU 22 9611 1802+02.3", "KU 22 9611 1802+02.3", 14, "KU 22 9611 1803+00.3"},
        {kKey, "EJ 00 0000 9999+15", "EJ 00 0000 9999+15", 1, "EJ 00 0000 0000+00"},
        {kKey16, "KJ 12 3456 0001+19", "KJ 12 3456 0001+19", 1, "KJ 12 3456 0002+00"},
        // 64 frames in three feet: 21, 21, 22.
        {kKey3, "KQ123456 1234+00(1)", "KQ 12 3456 1234+00(1)", 21, "KQ 12 3456 1235+00(2)"},
        {kKey3, "KQ123456 1236+21(3)", "KQ 12 3456 1236+21(3)", 1, "KQ 12 3456 1237+00(1)"},
        {kKey3, "KQ123456 1234+00(1)", "KQ 12 3456 1234+00(1)", -1, "KQ 12 3456 1233+21(3)"},
        {kFeet, "123+04", "123+04", 12, "124+00"},
        {kFeet, "-1+04", "-1+04", 20, "0+00"},
        {kFeet16, "0+39", "0+39", 1, "1+00"},
        {film(kFootFrameLabelType, FilmGauge::Film35mm2Perf), "7+31", "7+31", 1, "8+00"},
        {film(kFootFrameLabelType, FilmGauge::Film35mm8Perf), "7+07", "7+07", 1, "8+00"},
        {kInk, "AA 1234+05", "AA 1234+05", 16, "AA 1235+05"},
        {kInk, "012 3456+07", "012 3456+07", -7, "012 3456+00"},
        {kInk, "abc12345+06", "ABC12345+06", 10, "ABC12346+00"},
        {kInk, "A9 99999+15", "A9 99999+15", 1, "A9 00000+00"},
        {kInk, "1234+05", "1234+05", 0, "1234+05"},
        {kDrop, "01:00:59;29", "01:00:59;29", 1, "01:01:00;02"},
        {kDrop, "23:59:59;29", "23:59:59;29", 1, "00:00:00;00"},
        {kPal, "00:00:00:00", "00:00:00:00", -1, "23:59:59:24"},
    };
    for (const auto& c : cases) {
        const label first = read(c.text, c.scale);
        EXPECT_EQ(first.asString(), c.printed) << c.text;
        const label after = first.plus(c.add);
        EXPECT_EQ(after.asString(), c.after) << c.text;
        EXPECT_EQ(after.minus(first), c.add) << c.text;
        EXPECT_EQ(after.plus(-c.add), first) << c.text;
    }
    EXPECT_EQ(read("KJ 12 3456 7890+12", kKey).asString(label::Compact), "KJ123456 7890+12");
}

TEST(Label, RefusesWhatNamesNoFrameAndSaysWhere) {
    const struct {
        label::Scale scale;
        const char* text;
        const char* says;
    } cases[] = {
        {kKey, "KJ 12 3456 7890+16", "00 to 15 here, at character 17"},
        {kKey, "K1 12 3456 7890+12", "at character 2"},
        {kKey, "KJ 12 3456 789+12", "four digits"},
        {kKey, "KJ 12 3456 7890+12.4", "perforation 0 to 3"},
        {kKey, "KJ 12 3456 7890+12(1)", "35mm 3-perf"},
        {kKey, "KJ 12 3456 7890+12 x", "nothing more"},
        {kKey3, "KQ123456 1234+21(1)", "00 to 20"},
        {kKey3, "KQ123456 1234+00(4)", "(1), (2) or (3)"},
        {kFeet, "99999999999999999999+00", "more feet"},
        {kFeet, "12", "'+'"},
        {kFeet, "", "feet are expected, at character 1"},
        {kInk, "0123456+07", "put a blank"},
        {kInk, "ABCD 1234+05", "three"},
        {kDrop, "00:01:00;00", "leaves this frame out"},
        {kPal, "00:00:00;10", "does not drop frames"},
        {kPal, "00:00:00:25", "frame 25"},
        {kPal, "24:00:00:00", "hour 24"},
        {label::Scale(), "1", "without knowing"},
    };
    for (const auto& c : cases) {
        label made = read("5+05", kFeet);
        const Qx::Status status = label::parse(c.text, c.scale, made);
        EXPECT_FALSE(status.isOk()) << c.text;
        EXPECT_NE(status.reason().find(c.says), String::npos) << status.reason();
        EXPECT_EQ(made.asString(), "5+05") << "a failure leaves what was there";
    }
}

TEST(Label, SaysWhenItsDigitsNoLongerTellTheCount) {
    const label last = read("KJ 12 3456 9999+15", kKey);
    EXPECT_FALSE(last.isAmbiguous());
    EXPECT_TRUE(last.plus(1).isAmbiguous());
    EXPECT_TRUE(read("KJ 12 3456 0000+00", kKey).plus(-1).isAmbiguous());
    EXPECT_FALSE(last.plus(1).plus(-1).isAmbiguous());
    EXPECT_EQ(last.minus(read("KK 12 3456 9999+15", kKey)), std::nullopt);
    EXPECT_EQ(last.minus(read("1+00", kFeet)), std::nullopt);
}

// Every frame of a day at every rate, and every frame of 2 000 feet of every gauge, is the same frame after a
// round through its text, and texts go up by one.
TEST(Label, EveryFrameSurvivesItsText) {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    const int64_t step = 101;
#else
    const int64_t step = 1;
#endif
    for (int code = FrameRate::Fps24; code <= FrameRate::Fps47_952; ++code) {
        const FrameRate rate(code);
        for (const bool drop : {false, true}) {
            if (drop && !rate.hasDropFrame()) {
                continue;
            }
            const label::Scale scale = label::Scale::timecode(rate, drop);
            for (int64_t frame = 0; frame < Qx::framesPerDay(rate, drop); frame += step) {
                label back;
                const bool reads = label::parse(label(scale, frame).asString(), scale, back).isOk();
                ASSERT_TRUE(reads && back.frames() == frame) << rate.asString() << " " << frame;
            }
        }
    }
    for (int gauge = 1; gauge <= 6; ++gauge) {
        const label::Scale scale = film(kFootFrameLabelType, static_cast<FilmGauge>(gauge));
        label key;
        ASSERT_TRUE(
            label::parse("AB 12 3456 0000+00", film(kKeyKodeLabelType, static_cast<FilmGauge>(gauge)), key));
        const int64_t end = Qx::FilmCount(scale.gauge, Qx::FilmCount::Foot).firstFrameOf(2000);
        for (int64_t frame = -end; frame < end; ++frame) {
            label back;
            ASSERT_TRUE(label::parse(label(scale, frame).asString(), scale, back)) << gauge << " " << frame;
            ASSERT_EQ(back.frames(), frame) << gauge;
            if (frame >= 0) {
                ASSERT_TRUE(label::parse(key.plus(frame).asString(), key.scale(), back));
                ASSERT_EQ(back.frames(), frame) << gauge;
            }
        }
    }
}

// The table of fields that film people draw: A B C D take 2, 3, 2, 3 fields.
TEST(Pulldown, LaysFilmOnVideoByItsFields) {
    const String fields = "AABBBCCDDD";
    for (const char phase : {'A', 'B', 'C', 'D'}) {
        const Qx::Pulldown pulldown(Qx::Pulldown::TwoThree, phase);
        const int64_t startFrame[] = {0, 1, 2, 3};
        for (int64_t video = -25; video < 25; ++video) {
            const int64_t placed = video + startFrame[phase - 'A'] + 50;
            const char first = fields[static_cast<size_t>(2 * placed % 10)];
            const char second = fields[static_cast<size_t>((2 * placed + 1) % 10)];
            const int64_t film = pulldown.filmFrame(video);
            EXPECT_EQ("ABCD"[static_cast<size_t>((film + phase - 'A' + 400) % 4)], first) << phase << video;
            EXPECT_EQ(pulldown.isMixed(video), first != second) << phase << video;
            EXPECT_LE(pulldown.videoFrame(film), video);
            EXPECT_GT(pulldown.videoFrame(film + 1) + (first != second ? 1 : 0), video);
        }
        EXPECT_EQ(pulldown.videoFrame(0), 0);
        EXPECT_EQ(pulldown.videoFrame(4000), 5000);
    }
    const Qx::Pulldown held(Qx::Pulldown::OneHeld);
    EXPECT_EQ(held.filmFrame(24), 23);
    EXPECT_EQ(held.filmFrame(25), 24);
    EXPECT_EQ(held.videoFrame(24), 25);
    EXPECT_EQ(held.filmFrame(-1), -1);
}
