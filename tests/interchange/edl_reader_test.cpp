#include "interchange/edl/edl_tracks.h"

#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>

using namespace interchange;

namespace {

const Qx::FrameRate kPal(Qx::FrameRate::Fps25);

// A list of one event with a field exchanged.
std::string lineWith(const std::string& reel, const std::string& channel, const std::string& type = "C") {
    return "001 " + reel + " " + channel + " " + type + " 00:00:00:00 00:00:01:00 00:00:00:00 00:00:01:00\n";
}

EdlList readGood(std::string_view text, LossReport& report, Qx::FrameRate rate = kPal) {
    EdlList list;
    const Qx::Status status = readEdl(text, rate, list, report);
    EXPECT_TRUE(status.isOk()) << status.reason();
    return list;
}

EdlList readGood(std::string_view text) {
    LossReport report;
    return readGood(text, report);
}

} // namespace

TEST(EdlReader, ChannelSpellings) {
    constexpr EdlChannels v = kEdlPicture;
    constexpr EdlChannels a1 = edlAudio(1);
    constexpr EdlChannels a2 = edlAudio(2);
    const struct {
        const char* text;
        EdlChannels channels;
    } good[] = {
        {"V", v},
        {"v", v},
        {"A", a1},
        {"A2", a2},
        {"AA", a1 | a2},
        {"B", v | a1},
        {"A2/V", v | a2},
        {"AA/V", v | a1 | a2},
        {"NONE", 0},
        {"A1", a1},
        {"A3", edlAudio(3)},
        {"A4", edlAudio(4)},
        {"V1", v},
        {"V2", kEdlPicture2},
        {"VA", v | a1},
        {"V1A1A2", v | a1 | a2},
        {"VA1A2", v | a1 | a2},
        {"1", a1},
        {"12", a1 | a2},
        {"12V", v | a1 | a2},
        {"VA12", v | a1 | a2},
        {"A34", edlAudio(3) | edlAudio(4)},
    };
    for (const auto& c : good) {
        EXPECT_EQ(readGood(lineWith("R", c.text)).events.at(0).channels, c.channels) << c.text;
    }
    for (const char* text : {"X", "A0", "V3", "A9", "/", "VX", "NONEV", "AAAAAAAAA"}) {
        EdlList list;
        LossReport report;
        const Qx::Status status = readEdl(lineWith("R", text), kPal, list, report);
        EXPECT_NE(status.reason().find("channel"), String::npos) << text << ": " << status.reason();
    }
}

TEST(EdlReader, EditTypes) {
    const struct {
        const char* text;
        EdlType type;
        int duration;
        const char* written;
    } cases[] = {
        {"C", EdlType::Cut, 0, "C"},
        {"C 000", EdlType::Cut, 0, "C"},
        {"D 024", EdlType::Dissolve, 24, "D 024"},
        {"W001 030", EdlType::Wipe, 30, "W001 030"},
        {"w120 5", EdlType::Wipe, 5, "W120 005"},
        {"K B", EdlType::KeyBackground, 0, "K B"},
        {"K B (F)", EdlType::KeyBackground, 0, "K B"},
        {"K", EdlType::Key, 0, "K 000"},
        {"K 012", EdlType::Key, 12, "K 012"},
        {"K (F) 012", EdlType::Key, 12, "K 012"},
        {"K O 300", EdlType::KeyOut, 300, "K O 300"},
        {"KO 3", EdlType::KeyOut, 3, "K O 003"},
    };
    for (const auto& c : cases) {
        const EdlEvent event = readGood(lineWith("R", "V", c.text)).events.at(0);
        EXPECT_EQ(event.type, c.type) << c.text;
        EXPECT_EQ(event.duration, c.duration) << c.text;
        EXPECT_EQ(event.typeText(), c.written);
        EXPECT_EQ(event.fade, std::string(c.text).find("(F)") != std::string::npos);
    }
    for (const char* text :
         {"D", "W001", "W 001 030", "K O", "K X", "D 24 24", "CC", "D 1000000", "W1234 5"}) {
        EdlList list;
        LossReport report;
        EXPECT_FALSE(readEdl(lineWith("R", "V", text), kPal, list, report).isOk()) << text;
    }
}

TEST(EdlReader, SizesThatAreHostile) {
    const std::string reel(200, 'R');
    EXPECT_EQ(readGood(lineWith(reel, "V")).events.at(0).reel, reel);

    const std::string megabyte(1 << 20, 'x');
    const EdlList list = readGood(lineWith("R", "V") + "* FROM CLIP NAME: " + megabyte + "\n* " + megabyte);
    EXPECT_EQ(list.events.at(0).clipName, megabyte);
    EXPECT_EQ(list.events.at(0).notes.size(), 2 * megabyte.size() + 21);

    for (const std::string& line : {"001 " + megabyte, "001 " + std::string(1 << 20, ' ') + "x",
                                    lineWith(std::string(megabyte.size() / 2, 'y') + " z z z z", "Q")}) {
        EdlList none;
        LossReport report;
        const Qx::Status status = readEdl(line, kPal, none, report);
        EXPECT_FALSE(status.isOk());
        EXPECT_LT(status.reason().size(), 300U);
    }
}

TEST(EdlReader, FilesThatAreRefusedUnread) {
    const test::TemporaryFolder folder;
    const String path = folder.write("big.edl", "");
    std::filesystem::resize_file(path.c_str(), kMaxEdlBytes + 1); // a hole: nothing is written
    EdlList list;
    LossReport report;
    Qx::Status status = readEdlFile(path, kPal, list, report);
    EXPECT_NE(status.reason().find("64 MiB"), String::npos) << status.reason();
    status = readEdlFile(folder.path("missing.edl"), kPal, list, report);
    EXPECT_NE(status.reason().find("missing.edl"), String::npos) << status.reason();
    status = readEdl(lineWith("R", "V"), Qx::FrameRate(), list, report);
    EXPECT_NE(status.reason().find("frame rate"), String::npos) << status.reason();
    EXPECT_TRUE(list.events.empty());
}

TEST(EdlReader, NotesKeepTheirWordsAndOrder) {
    const EdlList list =
        readGood("* above\nSPLIT: AUDIO DELAY= 00:00:00:00\n" + lineWith("R", "V") +
                 "  * first\x93\xE9\x94  \n\n*caf\xC3\xA9\n*second\nUNKNOWN third\t\n" + lineWith("R", "A"));
    EXPECT_EQ(list.notes, "* above");
    EXPECT_EQ(
        list.events.at(0).notes,
        "SPLIT: AUDIO DELAY= 00:00:00:00\n* first\u201c\u00e9\u201d\n*caf\u00e9\n*second\nUNKNOWN third")
        << "a line that is not UTF-8 is Windows-1252";
    EXPECT_EQ(list.events.at(1).notes, "");
}

TEST(EdlReader, MoreEventsThanThreeDigitsCanNumber) {
    std::string text;
    for (int i = 0; i < 1001; ++i) {
        text += String::format("%06d R V C %d %d %d %d\n", i + 1, i, i + 1, i, i + 1);
    }
    const EdlList list = readGood(text);
    ASSERT_EQ(list.events.size(), 1001U);
    EXPECT_EQ(list.events.back().number, "001001");
}

// Over-recording against a painter who colours single frames, on random lists.
TEST(EdlTracks, OverRecordingIsWhatAPainterWouldDo) {
    for (unsigned seed = 1; seed <= 200; ++seed) {
        unsigned state = seed;
        const auto draw = [&](int below) {
            state = state * 1664525U + 1013904223U;
            return static_cast<int>((state >> 16) % static_cast<unsigned>(below));
        };
        std::vector<std::pair<int, int>> spans;
        std::string text;
        for (int i = 0; i < 12; ++i) {
            const int in = draw(80);
            const int length = 1 + draw(25);
            spans.emplace_back(in, in + length);
            text += String::format("%03d R%d V C %d %d %d %d\n", i, i, 1000 * i, 1000 * i + length, in,
                                   in + length);
        }
        // By record in, the later line on top of an earlier one that starts with it.
        std::vector<size_t> order(spans.size());
        for (size_t i = 0; i < order.size(); ++i) {
            order[i] = i;
        }
        std::stable_sort(order.begin(), order.end(),
                         [&](size_t a, size_t b) { return spans[a].first < spans[b].first; });
        std::vector<int> painted(200, -1);
        for (const size_t i : order) {
            for (int frame = spans[i].first; frame < spans[i].second; ++frame) {
                painted[static_cast<size_t>(frame)] = 1000 * static_cast<int>(i) + frame - spans[i].first;
            }
        }
        LossReport report;
        EdlProgramme programme;
        ASSERT_TRUE(layTracks(readGood(text), false, programme, report).isOk());
        std::vector<int> laid(200, -1);
        int64_t end = 0;
        for (const EdlClip& clip : programme.tracks.at(0).clips) {
            ASSERT_LT(clip.recordIn, clip.recordOut) << "seed " << seed;
            ASSERT_GE(clip.recordIn, end) << "seed " << seed;
            end = clip.recordOut;
            for (int64_t frame = clip.recordIn; frame < clip.recordOut; ++frame) {
                laid[static_cast<size_t>(frame + programme.start)] =
                    static_cast<int>(clip.sourceIn) + static_cast<int>(frame - clip.recordIn);
            }
        }
        ASSERT_EQ(laid, painted) << "seed " << seed << "\n" << text;
    }
}
