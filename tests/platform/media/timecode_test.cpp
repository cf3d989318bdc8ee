#include "platform/media/timecode.h"

#include <gtest/gtest.h>

using Qx::FrameRate;

namespace {

int64_t framesOf(std::string_view text, int code, bool dropFrame, bool* skipped = nullptr) {
    Qx::TimecodeFields fields;
    const Qx::Status status = Qx::parseTimecode(text, FrameRate(code), fields);
    EXPECT_TRUE(status.isOk()) << status.reason();
    return Qx::timecodeFrames(fields, FrameRate(code), dropFrame, skipped);
}

// A clock that counts labels one by one, as drop frame is told to a person: at the start of every minute but
// each tenth the first labels are passed over.
struct LabelClock {
    int nominal;
    int dropped;
    int h = 0, m = 0, s = 0, f = 0;

    void tick() {
        if (++f < nominal) {
            return;
        }
        f = 0;
        if (++s < 60) {
            return;
        }
        s = 0;
        if (++m == 60) {
            m = 0;
            ++h;
        }
        if (m % 10 != 0) {
            f = dropped;
        }
    }
    [[nodiscard]] bool shows(const String& text) const {
        const auto two = [&](size_t at) { return (text[at] - '0') * 10 + text[at + 1] - '0'; };
        return text.size() == 11 && two(0) == h && two(3) == m && two(6) == s && two(9) == f;
    }
};

} // namespace

TEST(Timecode, EveryFrameOfADropFrameDay) {
    for (const int code : {FrameRate::Fps29_97, FrameRate::Fps59_94}) {
        const FrameRate rate(code);
        const int64_t day = Qx::framesPerDay(rate, true);
        LabelClock clock{rate.nominal(), rate.nominal() / 15};
        Qx::TimecodeFields fields;
        for (int64_t frame = 0; frame < day; ++frame, clock.tick()) {
            const String text = Qx::timecodeText(frame, rate, true);
            if (!clock.shows(text)) {
                FAIL() << rate.asString() << ": frame " << frame << " is labelled " << text;
            }
            bool skipped = true;
            if (!Qx::parseTimecode(text, rate, fields).isOk() ||
                Qx::timecodeFrames(fields, rate, true, &skipped) != frame || skipped) {
                FAIL() << rate.asString() << ": " << text << " does not read back as frame " << frame;
            }
        }
        EXPECT_EQ(clock.h, 24) << "the day ends with its last frame";
        EXPECT_EQ(clock.m + clock.s + clock.f, 0);
    }
}

TEST(Timecode, DropFrameAtTheMinutes) {
    const struct {
        const char* text;
        int code;
        int64_t frames;
    } cases[] = {
        {"00:00:59;29", FrameRate::Fps29_97, 1799},   {"00:01:00;02", FrameRate::Fps29_97, 1800},
        {"00:09:59;29", FrameRate::Fps29_97, 17981},  {"00:10:00;00", FrameRate::Fps29_97, 17982},
        {"01:00:00;00", FrameRate::Fps29_97, 107892}, {"00:01:00;04", FrameRate::Fps59_94, 3600},
        {"01:00:00;00", FrameRate::Fps59_94, 215784},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(framesOf(c.text, c.code, true), c.frames) << c.text;
        EXPECT_EQ(Qx::timecodeText(c.frames, FrameRate(c.code), true), c.text);
    }
    EXPECT_EQ(framesOf("01:00:00:00", FrameRate::Fps29_97, false), 108000);
}

TEST(Timecode, ALabelThatDoesNotExistMovesUp) {
    bool skipped = false;
    EXPECT_EQ(framesOf("00:01:00;00", FrameRate::Fps29_97, true, &skipped), 1800);
    EXPECT_TRUE(skipped);
    EXPECT_EQ(framesOf("00:01:00;03", FrameRate::Fps59_94, true, &skipped), 3600);
    EXPECT_TRUE(skipped);
    EXPECT_EQ(framesOf("00:10:00;00", FrameRate::Fps29_97, true, &skipped), 17982);
    EXPECT_FALSE(skipped);
    EXPECT_EQ(framesOf("00:01:00:00", FrameRate::Fps29_97, false, &skipped), 1800);
    EXPECT_FALSE(skipped);
}

TEST(Timecode, OnlyTwoRatesDropFrames) {
    for (int code = 1; code <= 10; ++code) {
        const FrameRate rate(code);
        if (!rate.hasDropFrame()) {
            EXPECT_EQ(Qx::framesPerDay(rate, true), int64_t{86400} * rate.nominal());
            EXPECT_EQ(Qx::timecodeText(60 * rate.nominal(), rate, true), "00:01:00:00") << rate.asString();
        }
    }
    EXPECT_EQ(framesOf("02:00:00:00", FrameRate::Fps23_976, true), 172800) << "24 labels a second";
}

TEST(Timecode, WrapsAtMidnightAndLengthsDoNot) {
    const FrameRate pal(FrameRate::Fps25);
    const FrameRate ntsc(FrameRate::Fps29_97);
    EXPECT_EQ(Qx::timecodeText(24 * 3600 * 25, pal, false), "00:00:00:00");
    EXPECT_EQ(Qx::timecodeText(-1, pal, false), "23:59:59:24");
    EXPECT_EQ(Qx::timecodeText(-1, ntsc, true), "23:59:59;29");
    EXPECT_EQ(Qx::timecodeText(Qx::framesPerDay(ntsc, true) + 1800, ntsc, true), "00:01:00;02");
    EXPECT_EQ(Qx::durationText(25 * 3600 * 25 + 3, pal, false), "25:00:00:03");
    EXPECT_EQ(Qx::durationText(-26, pal, false), "-00:00:01:01");
    EXPECT_EQ(Qx::durationText(1800, ntsc, true), "00:01:00;02");
    EXPECT_EQ(Qx::durationText(123 * 3600 * 25, pal, false), "123:00:00:00");
    EXPECT_EQ(Qx::timecodeText(5, FrameRate(), false), "");
}

TEST(Timecode, SeparatorsAreTold) {
    const struct {
        const char* text;
        bool drop;
        bool nonDrop;
    } cases[] = {{"01:02:03:04", false, false}, {"01:02:03;04", true, false}, {"01;02;03;04", true, false},
                 {"01:02:03,04", true, false},  {"01:02:03.04", false, true}, {"1:2:3:4", false, false}};
    for (const auto& c : cases) {
        Qx::TimecodeFields fields;
        ASSERT_TRUE(Qx::parseTimecode(c.text, FrameRate(FrameRate::Fps29_97), fields).isOk()) << c.text;
        EXPECT_EQ(fields.dropSeparator, c.drop) << c.text;
        EXPECT_EQ(fields.nonDropSeparator, c.nonDrop) << c.text;
        EXPECT_EQ(fields.hours * 1000000 + fields.minutes * 10000 + fields.seconds * 100 + fields.frames,
                  1020304);
    }
}

TEST(Timecode, RefusalsNameWhatIsWrong) {
    const struct {
        const char* text;
        const char* names;
    } cases[] = {
        {"01:00:00:25", "frame 25 at 25 frames a second"},
        {"24:00:00:00", "hour 24"},
        {"99:99:99:99", "hour 99"},
        {"00:60:00:00", "minute 60"},
        {"00:00:60:00", "second 60"},
        {"", "hh:mm:ss:ff"},
        {"01:00:00", "hh:mm:ss:ff"},
        {"01:00:00:", "hh:mm:ss:ff"},
        {"01:00:00:001", "hh:mm:ss:ff"},
        {"-1:00:00:00", "hh:mm:ss:ff"},
        {"01 00 00 00", "hh:mm:ss:ff"},
        {"01:00:00:00 ", "hh:mm:ss:ff"},
        {"01\n00:00:00", "hh:mm:ss:ff"},
    };
    for (const auto& c : cases) {
        Qx::TimecodeFields fields;
        fields.hours = 7;
        const Qx::Status status = Qx::parseTimecode(c.text, FrameRate(FrameRate::Fps25), fields);
        ASSERT_FALSE(status.isOk()) << c.text;
        EXPECT_NE(status.reason().find(c.names), String::npos) << status.reason();
        EXPECT_EQ(status.reason().find('\n'), String::npos);
        EXPECT_EQ(fields.hours, 7) << "a failure leaves the fields";
    }
}
