#include "interchange/edl/edl_export.h"
#include "interchange/edl/edl_import.h"
#include "interchange/edl/edl_records.h"
#include "interchange/edl/edl_writer.h"
#include "interchange/marker_colour.h"

#include "edit/model/aud_levels_cel.h"
#include "edit/model/cel.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit_keys.h"
#include "platform/effects/effect_instance.h"
#include "platform/store/tag.h"
#include "support/recording_log.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <sys/stat.h>

using namespace interchange;
namespace fs = std::filesystem;

namespace {

/// A list that was imported, not saved, with its export.
class ImportedList {
public:
    explicit ImportedList(const std::string& text, int rateCode = Qx::FrameRate::Fps25) {
        const test::TemporaryFolder folder;
        const Qx::Status imported =
            importEdl(folder.write("list.edl", text), {Qx::FrameRate(rateCode), false}, m_import);
        EXPECT_TRUE(imported.isOk()) << imported.reason();
        options.source = [this](const cookie& strip) {
            for (const EditPtr& shot : m_import.shots) {
                if (shot->get_cookie() == strip) {
                    return shot;
                }
            }
            return EditPtr();
        };
    }
    [[nodiscard]] Edit& edit() { return *static_cast<Edit*>(m_import.sequence); }
    [[nodiscard]] Edit& shot(size_t index) { return *static_cast<Edit*>(m_import.shots.at(index)); }
    [[nodiscard]] cel& content(int chan) { return *edit().get_edit_cel_p(chan); }

    [[nodiscard]] String exported() {
        report = {};
        String text;
        status = exportEdl(edit(), options, text, report);
        return text;
    }
    [[nodiscard]] bool lost(std::string_view what) const {
        return std::any_of(report.losses().begin(), report.losses().end(),
                           [&](const Loss& loss) { return loss.what.find(what) != String::npos; });
    }

    EdlExportOptions options;
    LossReport report;
    Qx::Status status;

private:
    Import m_import;
};

/// Lines without blank ones, blanks within them folded to one.
std::string folded(const std::string& text) {
    std::istringstream lines(text);
    std::string line;
    std::string result;
    while (std::getline(lines, line)) {
        std::istringstream words(line);
        std::string word;
        std::string one;
        while (words >> word) {
            one += (one.empty() ? "" : " ") + word;
        }
        result += one.empty() ? "" : one + "\n";
    }
    return result;
}

/// What a user sees of an imported edit: tracks, spans, sources by what the shots say, markers.
std::string meaning(ImportedList& list, bool withSecondPicture = true) {
    std::string text = list.edit().getName() + "\n";
    const configb& header = list.edit().Opts();
    text += std::to_string(header.getInt64(EditKeys::kStartTimecode)) +
            (header.getBool(EditKeys::kDropFrame) ? " drop\n" : "\n");
    for (int chan = 0; chan < list.edit().getNumChans(); ++chan) {
        const String name = list.edit().getChanDisplayName(list.edit().getId(chan));
        if (name == "V2" && !withSecondPicture) {
            continue;
        }
        text += name + "\n";
        cel& content = list.content(chan);
        for (int i = 0; i < content.numEvents(); i += 2) {
            const channel_event in = content.get_event(i);
            text += " " + Qx::doubleToText(in.editTime) + "-" +
                    Qx::doubleToText(content.get_event(i + 1).editTime);
            text += " x" + Qx::doubleToText(in.velocity) + " " + Qx::doubleToText(in.stripTime);
            if (const Tag<EffectInstance> effect = list.edit().openObject<EffectInstance>(in.id)) {
                text += " by " + std::string(effect->kind()->typeId) + " " +
                        Qx::doubleToText(effect->getNumberAt("pattern", 0));
            }
            const EditPtr shot = list.options.source(in.strip);
            if (shot.valid()) {
                const configb& source = std::as_const(*shot).Opts();
                text += " " + source.getString(EdlKey::kReel) + "|" + shot->getName() + "|" +
                        source.getString(EdlKey::kSourceFile) +
                        (source.getBool(EditKeys::kDropFrame) ? "|df" : "");
            }
            text += "\n";
        }
    }
    const cue_list& cues = list.edit().get_cues();
    for (size_t i = 0; i < cues.get_num_cue_points(0); ++i) {
        const cue_point& cue = *cues.get_cue_point(i, 0);
        text += "cue " + Qx::doubleToText(cue.editTime()) + " " + std::to_string(cue.code()) + " " +
                cue.text() + "\n";
    }
    return text;
}

std::string fileText(const fs::path& path) {
    std::ifstream in(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), {}};
}

const char* const kFull = "TITLE: Everything\n"
                          "FCM: NON-DROP FRAME\n"
                          "REM above all\n"
                          "001  A012C004 AA/V  C        01:00:04:00 01:00:06:00 10:00:00:00 10:00:02:00\n"
                          "AUD  3    4\n"
                          "* FROM CLIP NAME: street\n"
                          "* LOC: 10:00:01:00 RED     fix this\n"
                          "* LOC: 10:00:01:12\n"
                          "GPI 1\n"
                          "* ASC_SAT 0.9\n"
                          "002  A012C004 V     C        01:00:06:00 01:00:06:00 10:00:02:00 10:00:02:00\n"
                          "002  SC00.JPG V     D    012 00:00:00:00 00:00:02:00 10:00:02:00 10:00:04:00\n"
                          "* BLEND, DISSOLVE\n"
                          "* FROM CLIP NAME: street\n"
                          "* TO CLIP NAME: sea\n"
                          "007  BL       V     C        00:00:00:00 00:00:01:00 10:00:04:00 10:00:05:00\n"
                          "008  R3       V     C        00:00:10:00 00:00:14:00 10:00:06:00 10:00:08:00\n"
                          "M2   R3             050.0                00:00:10:00\n"
                          "009  R3       V     C        00:00:10:00 00:00:10:01 10:00:08:00 10:00:09:00\n"
                          "M2   R3             000.0                00:00:10:00\n"
                          "* * FREEZE FRAME\n"
                          "010  R3       V     C        00:00:10:00 00:00:11:00 10:00:09:00 10:00:10:00\n"
                          "M2   R3            -025.0                00:00:10:24\n"
                          "SPLIT: AUDIO DELAY= 00:00:00:10\n"
                          "011  R4       V     C        00:00:00:00 00:00:02:00 10:00:10:00 10:00:12:00\n"
                          "011  R4       A     C        00:00:00:10 00:00:02:00 10:00:10:10 10:00:12:00\n"
                          "012  BG       V     K B      01:00:00:00 01:00:04:00 10:00:12:00 10:00:16:00\n"
                          "012  TITLE1   V     K    010 00:00:00:00 00:00:02:00 10:00:13:00 10:00:15:00\n"
                          "* FROM CLIP NAME: sea\n"
                          "* KEY CLIP NAME: main title\n"
                          "013  LAST     V     C        01:00:00:00 01:00:01:00 10:00:16:00 10:00:17:00\n"
                          "014  BL       V     C        00:00:00:00 00:00:00:00 10:00:17:00 10:00:17:00\n"
                          "014  NEXT     V     W001 010 01:00:00:00 01:00:01:00 10:00:17:00 10:00:18:00\n"
                          "015  NONE1    NONE  C        06:00:00:00 06:00:01:00 10:00:18:00 10:00:19:00\n"
                          "AUD  4\n";

} // namespace

TEST(EdlExport, AnImportedListIsGivenBack) {
    ImportedList list(kFull);
    EXPECT_EQ(folded(list.exported()), folded(kFull));
    EXPECT_TRUE(list.status.isOk()) << list.status.reason();
    EXPECT_TRUE(list.report.losses().empty()) << list.report.lines().front();
    list.options.strict = true;
    EXPECT_FALSE(list.exported().empty()) << list.status.reason();
}

// Written otherwise than an export of their edit would by itself.
TEST(EdlExport, WhatWritersDoDifferentlyIsGivenBack) {
    const char* const events[] = {
        // A source out as at normal speed, one that is a frame off, one without M2 that does not agree.
        "002 R2 V C 00:00:10:00 00:00:12:00 10:00:02:00 10:00:04:00\nM2 R2 050.0 00:00:10:00\n",
        "002 R2 V C 00:00:10:00 00:00:14:01 10:00:02:00 10:00:04:00\nM2 R2 050.0 00:00:10:00\n",
        "002 R2 V C 00:00:10:00 00:00:12:02 10:00:02:00 10:00:04:00\n",
        // Reverse that says its first frame first, and last.
        "002 R2 V C 00:00:12:00 00:00:10:00 10:00:02:00 10:00:04:00\nM2 R2 -025.0 00:00:12:00\n",
        "002 R2 V C 00:00:10:00 00:00:12:00 10:00:02:00 10:00:04:00\nM2 R2 -025.0 00:00:11:24\n",
        // A freeze of a frame inside the span that it names.
        "002 R2 V C 00:00:10:00 00:00:12:00 10:00:02:00 10:00:04:00\nM2 R2 000.0 00:00:11:00\n",
        // A dissolve that hangs: from another source, and from another frame, than plays before it.
        "002 R9 V C 00:00:10:00 00:00:10:00 10:00:02:00 10:00:02:00\n"
        "002 R2 V D 010 00:00:10:00 00:00:12:00 10:00:02:00 10:00:04:00\n",
        "002 R1 V C 00:00:30:00 00:00:30:00 10:00:02:12 10:00:02:12\n"
        "002 R2 V D 010 00:00:10:00 00:00:12:00 10:00:02:12 10:00:04:12\n",
        // What goes on is named by the list's source out, which does not agree with the record side.
        "002 R2 V C 00:00:10:00 00:00:12:01 10:00:02:00 10:00:04:00\n"
        "003 R2 V C 00:00:12:01 00:00:12:01 10:00:04:00 10:00:04:00\n"
        "003 R3 V D 010 00:00:10:00 00:00:12:00 10:00:04:00 10:00:06:00\n",
        // Black that counts.
        "002 BL V C 00:00:10:00 00:00:12:00 10:00:02:00 10:00:04:00\n",
    };
    for (const std::string event : events) {
        const std::string text = "TITLE: x\nFCM: NON-DROP FRAME\n"
                                 "001 R1 V C 00:00:00:00 00:00:02:00 10:00:00:00 10:00:02:00\n" +
                                 event;
        ImportedList list(text);
        EXPECT_EQ(folded(list.exported()), text);
        EXPECT_TRUE(list.report.losses().empty()) << list.report.lines().front();
        // Trimmed, it says what it plays.
        list.content(0).remove({3.0, 3.04});
        const String trimmed = list.exported();
        ImportedList again(trimmed);
        EXPECT_EQ(again.exported(), trimmed);
    }
}

TEST(EdlExport, DropFrameIsGivenBack) {
    const std::string text = "TITLE: drop\nFCM: DROP FRAME\n"
                             "001  R1       V     C        00:00:59;28 00:01:00;04 01:00:59;28 01:01:00;04\n"
                             "* LOC: 01:00:59;29 RED     here\n"
                             "002  R2       V     C        00:01:00.00 00:02:00.00 01:01:00;04 01:02:00;06\n";
    ImportedList list(text, Qx::FrameRate::Fps29_97);
    EXPECT_EQ(folded(list.exported()), folded(text));
}

TEST(EdlExport, WhatWasImportedImportsAgainAsTheSame) {
    size_t lists = 0;
    for (const auto& entry :
         fs::directory_iterator(fs::path(QUILLMARCH_SOURCE_DIR) / "tests/interchange/corpus/good")) {
        if (entry.path().extension() != ".edl") {
            continue;
        }
        std::ifstream in(fs::path(entry.path()).replace_extension(".txt"));
        std::string word;
        in >> word >> word;
        const int rate = Qx::FrameRate::fromString(word).code();
        ImportedList list(fileText(entry.path()), rate);
        const String text = list.exported();
        ASSERT_TRUE(list.status.isOk()) << entry.path() << list.status.reason();
        ImportedList again(text, rate);
        // A second picture track that is not made of keys is a loss.
        EXPECT_EQ(meaning(again), meaning(list, !list.lost("channel V2"))) << entry.path().filename() << "\n"
                                                                           << text;
        EXPECT_EQ(again.exported(), text) << entry.path().filename() << ": a second export differs";
        ++lists;
    }
    EXPECT_GE(lists, 18U);
}

// Lists as tools in the field wrote them. They are not part of this tree: the folder is named from outside.
TEST(EdlExport, ListsOfTheFieldAreGivenBack) {
    const char* const folder = std::getenv("QUILLMARCH_EDL_SAMPLES");
    if (folder == nullptr || !fs::is_directory(folder)) {
        GTEST_SKIP() << "QUILLMARCH_EDL_SAMPLES does not name a folder of edit lists";
    }
    for (const auto& entry : fs::directory_iterator(folder)) {
        const std::string before = folded(fileText(entry.path()));
        // A frame field that is too high rules a rate out.
        int rate = Qx::FrameRate::Fps24;
        EdlList read;
        LossReport unused;
        if (!readEdl(before, Qx::FrameRate(rate), read, unused)) {
            rate = readEdl(before, Qx::FrameRate(Qx::FrameRate::Fps25), read, unused) ? Qx::FrameRate::Fps25
                                                                                      : Qx::FrameRate::Fps30;
        }
        ImportedList list(before, rate);
        std::string text = folded(list.exported());
        if (before.find("FCM:") == std::string::npos) {
            text.erase(text.find("FCM:"), text.find('\n', text.find("FCM:")) + 1 - text.find("FCM:"));
        }
        EXPECT_EQ(text, before) << entry.path();
        EXPECT_TRUE(list.report.losses().empty()) << entry.path() << list.report.lines().front();
    }
}

TEST(EdlExport, ChangedEventsAreNotedAfresh) {
    ImportedList list(kFull);
    // The first clip is cut in two, which its sound is not.
    ASSERT_TRUE(list.content(0).remove({1.0, 1.2}));
    list.shot(1).setName("ocean");
    const String text = list.exported();
    ASSERT_TRUE(list.status.isOk()) << list.status.reason();
    EXPECT_NE(text.find("001  A012C004 V     C        01:00:04:00 01:00:05:00 10:00:00:00 10:00:01:00\n"),
              String::npos)
        << text;
    EXPECT_NE(
        text.find(
            "016  A012C004 AA    C        01:00:04:00 01:00:06:00 10:00:00:00 10:00:02:00\nAUD  3    4\n"),
        String::npos)
        << "the sound is an event of its own\n"
        << text;
    EXPECT_NE(text.find("* FROM CLIP NAME: street\n* TO CLIP NAME: ocean\n"), String::npos) << text;
    EXPECT_EQ(text.find("SPLIT"), String::npos) << "the delay is another\n" << text;
    EXPECT_NE(text.find("* BLEND, DISSOLVE\n"), String::npos) << "notes on other things stay";
    EXPECT_EQ(text.find("sea\n* TO"), String::npos) << text;
}

// As in an edit that no list was read into: nothing but what lies on its channels says what is written.
TEST(EdlExport, TransitionsAreWrittenAsTheyLie) {
    const std::string text = "TITLE: all kinds\nFCM: NON-DROP FRAME\n"
                             "001 BL B C 00:00:00:00 00:00:00:00 10:00:00:00 10:00:00:00\n"
                             "001 R1 B D 010 00:01:00:00 00:01:02:00 10:00:00:00 10:00:02:00\n"
                             "002 R1 V C 00:01:02:00 00:01:02:00 10:00:02:00 10:00:02:00\n"
                             "002 R2 V W201 025 00:02:00:00 00:02:01:00 10:00:02:00 10:00:03:00\n"
                             "003 R9 A C 00:09:00:00 00:09:00:00 10:00:02:00 10:00:02:00\n"
                             "003 R2 A D 005 00:02:00:00 00:02:01:00 10:00:02:00 10:00:03:00\n"
                             "004 R2 V C 00:02:01:00 00:02:01:00 10:00:03:00 10:00:03:00\n"
                             "004 R3 V D 012 00:03:00:00 00:03:04:00 10:00:03:00 10:00:05:00\n"
                             "M2 R3 050.0 00:03:00:00\n"
                             "005 R3 V C 00:03:04:00 00:03:04:00 10:00:05:00 10:00:05:00\n"
                             "005 BL V D 025 00:00:00:00 00:00:01:00 10:00:05:00 10:00:06:00\n";
    ImportedList list(text);
    list.edit().Opts().remove(EdlKey::kEvents);
    EXPECT_EQ(folded(list.exported()), text);
    EXPECT_TRUE(list.report.losses().empty()) << list.report.lines().front();
    // R1 plays on under the wipe, and R9, of which nothing else is used, under the dissolve of the sound.
    EXPECT_DOUBLE_EQ(list.shot(0).get_edit_cel_p(0)->get_event(1).editTime, 63);
    EXPECT_DOUBLE_EQ(list.shot(3).get_edit_cel_p(0)->get_event(0).editTime, 540);
    ASSERT_TRUE(list.content(0).get_event(4).strip.isEffectGraph());
    list.edit()
        .openObject<EffectInstance>(list.content(0).get_event(4).id)
        ->setParameter("opacity", Fx::ParameterValue::ofNumber(0.5));
    (void)list.exported();
    EXPECT_TRUE(list.lost("the settings of a transition"));
}

TEST(EdlExport, ATransitionThatWentIsACut) {
    ImportedList list(kFull);
    ASSERT_TRUE(list.content(0).remove({0.0, 2.48}));
    const String text = list.exported();
    EXPECT_EQ(text.find(" D    012"), String::npos) << text;
    EXPECT_NE(text.find("002  SC00.JPG V     C        00:00:00:12 00:00:02:00 10:00:00:00 10:00:01:13\n"
                        "* FROM CLIP NAME: sea\n007"),
              String::npos)
        << text;
}

TEST(EdlExport, ReelsAreShortNamesInFull) {
    std::string text = "TITLE: reels\n";
    const char* const names[] = {"zz100_501", "zz100_502", "ZZ10050", "BLACK", "caf\xC3\xA9 au lait", "--"};
    int frame = 0;
    for (const char* const name : names) {
        text += String::format("%03d AX V C 0 10 %d %d\n* FROM CLIP NAME: %s\n", frame / 10 + 1, frame,
                               frame + 10, name);
        frame += 10;
    }
    ImportedList list(text);
    for (size_t i = 0; i < std::size(names); ++i) {
        list.shot(i).Opts().setString(EdlKey::kReel, names[i]);
    }
    list.edit().Opts().remove(EdlKey::kEvents);
    std::vector<String> reels;
    ImportedList again(list.exported());
    EXPECT_EQ(list.exported(), again.exported()) << "short reels stay as they are";
    for (size_t i = 0; i < std::size(names); ++i) {
        const configb& header = std::as_const(again.shot(i)).Opts();
        reels.push_back(header.getString(EdlKey::kReel));
        EXPECT_EQ(again.shot(i).getName(), names[i]);
    }
    EXPECT_EQ(reels, (std::vector<String>{"ZZ100501", "ZZ100502", "ZZ10050", "BLACK2", "CAFAULAI", "REEL"}));
}

TEST(EdlExport, WhatAListCannotHoldIsReportedItemByItem) {
    ImportedList list("TITLE: x\n001 R1 B C 0 100 0 100\n002 R2 B C 0 100 100 200\n");
    Edit& edit = list.edit();
    const cookie strip = list.content(0).get_event(0).strip;
    const auto addClips = [&](Edit_Chan_Type type, Edit_Chan_SubType subtype) {
        cel* const content = edit.get_edit_cel_p(edit.addChan(type, nullptr, false, subtype));
        content->appendEventPair(strip, 0, 0, 2);
    };
    addClips(VideoChan, Edit_Chan_SubType::NONE);
    addClips(VideoChan, Edit_Chan_SubType::ALIAS);
    for (int i = 0; i < 4; ++i) {
        addClips(AudioChan, Edit_Chan_SubType::NONE);
    }
    Vector<IdStamp> audio;
    edit.getChans(audio, AudioChan);
    AudLevelsCel levels = AudLevelsCel::create();
    levels.insertNode(1, 0.5F);
    ASSERT_TRUE(edit.addLevelsChan(audio[0], levels).valid());
    Vector<IdStamp> pair;
    pair.push_back(audio[0]);
    pair.push_back(audio[1]);
    ASSERT_TRUE(edit.groupChannels(pair, ChannelGroup::ePlain));
    cel& sound = *edit.getCel(audio[0]);
    channel_event event = sound.get_event(0);
    event.level = 0.5F;
    event.rampQFrames = 4;
    ASSERT_TRUE(sound.setEvent(0, event));
    edit.get_cues().add_cue_point(cue_point("off", 0.5, 2, 99, {}, false));
    const String text = list.exported();
    ASSERT_TRUE(list.status.isOk()) << list.status.reason();
    for (const char* const what :
         {"channel V2 with 1 clip is left out", "channel FX1 with 1 clip is left out",
          "channel A5 with 1 clip is left out", "channel L1: levels of 1 node", "channel group A1-A2",
          "A1 at 00:00:00:00: a level of 0.5", "A1 at 00:00:00:00: a fade", "cue at 00:00:00:13: the channel",
          "code 99 is no colour", "lies between two frames"}) {
        EXPECT_TRUE(list.lost(what)) << what;
    }
    list.options.strict = true;
    EXPECT_TRUE(list.exported().empty());
    EXPECT_NE(list.status.reason().find("without the strict mode"), String::npos);
}

TEST(EdlExport, LongListsHaveLongNumbers) {
    for (const int events : {999, 1000}) {
        std::string text = "TITLE: long\nFCM: NON-DROP FRAME\n";
        for (int i = 0; i < events; ++i) {
            text += String::format("%03d R%d V C %d %d %d %d\n", i % 999 + 1, i % 7, i, i + 1, i, i + 1);
        }
        ImportedList list(text);
        const String out = list.exported();
        EXPECT_NE(out.find(events > 999 ? "\n000002  R1 " : "\n002  R1 "), String::npos);
        list.options.strict = true;
        EXPECT_EQ(list.exported().empty(), events > 999);
        EXPECT_EQ(list.status.isOk(), events <= 999) << list.status.reason();
    }
}

TEST(EdlExport, HostileHeadersWriteNoEvents) {
    ImportedList list("TITLE: x\n001 R1 V C 0 100 0 100\n* FROM CLIP NAME: a\n");
    const String stamp = list.content(0).get_event(0).id.asString();
    Edit& edit = list.edit();
    edit.Opts().setString(EdlKey::kEvents,
                          "E999999999999 D -5\nR002 X V\tC\nS" + stamp +
                              "\nV1e999\nN002 R9 V C 0 9 0 9\nNTITLE: evil\nN\x1b[2J\nNAUD 9 3\n");
    edit.Opts().setString(EdlKey::kNotes, "003 R9 V C 0 9 0 9\nFCM: DROP FRAME\nREM good");
    edit.Opts().setInt64(EditKeys::kStartTimecode, INT64_MIN);
    edit.setName("two\nlines");
    list.shot(0).setName("001 R9 V C 0 9 0 9\nTITLE: z");
    EdlList read;
    const String text = list.exported();
    ASSERT_TRUE(list.status.isOk()) << list.status.reason();
    LossReport report;
    ASSERT_TRUE(readEdl(text, Qx::FrameRate(Qx::FrameRate::Fps25), read, report).isOk()) << text;
    ASSERT_EQ(read.events.size(), 1U) << text;
    EXPECT_EQ(read.title, "two lines");
    EXPECT_EQ(read.notes, "REM good");
    EXPECT_EQ(read.events[0].channels, kEdlPicture);
    EXPECT_EQ(text.find('\x1b'), String::npos);
}

TEST(EdlExport, AnEditWithoutClipsIsRefused) {
    EditPtr edit(new Edit);
    String text = "before";
    LossReport report;
    EXPECT_FALSE(exportEdl(*edit, {}, text, report).isOk());
    EXPECT_EQ(text, "before");
}

TEST(EdlExport, TargetsThatAreNoFilesAreLeft) {
    const test::TemporaryFolder folder;
    ImportedList list(kFull);
    const String file = folder.write("real.edl", "old");
    fs::create_symlink(file.c_str(), folder.path("link.edl").c_str());
    fs::create_directory(folder.path("folder.edl").c_str());
    ASSERT_EQ(::mkfifo(folder.path("pipe.edl").c_str(), 0600), 0);
    for (const char* const name : {"link.edl", "folder.edl", "pipe.edl", "none/x.edl"}) {
        EXPECT_FALSE(exportEdlFile(list.edit(), list.options, folder.path(name), list.report).isOk()) << name;
    }
    EXPECT_EQ(folder.read("real.edl"), "old");
    EXPECT_EQ(folder.numNames(), 4U) << "no temporary file stays";
    ASSERT_TRUE(exportEdlFile(list.edit(), list.options, file, list.report).isOk());
    EXPECT_EQ(folder.read("real.edl"), list.exported());
    list.options.crlf = true;
    const String text = list.exported();
    EXPECT_EQ(std::count(text.begin(), text.end(), '\r'), std::count(text.begin(), text.end(), '\n'));
}

TEST(EdlExport, TenThousandEventsAreNotFelt) {
    std::string text = "TITLE: feature\n";
    for (int i = 0; i < 5000; ++i) {
        const int in = 10 * i;
        text += String::format("%06d R%d V C %d %d %d %d\n", i + 1, i % 200, in, in, in, in);
        text += String::format("%06d R%d V D 005 %d %d %d %d\n* TO CLIP NAME: clip %d\n* LOC: %d:00:00:00\n",
                               i + 1, (i + 1) % 200, in, in + 10, in, in + 10, (i + 1) % 200, i % 3);
        text += String::format("%06d S%d AA C %d %d %d %d\n", i + 5001, i % 200, in, in + 10, in, in + 10);
    }
    ImportedList list(text);
    const auto start = std::chrono::steady_clock::now();
    const String out = list.exported();
    const std::chrono::duration<double> took = std::chrono::steady_clock::now() - start;
    RecordProperty("ms", static_cast<int>(took.count() * 1000));
    EXPECT_TRUE(list.status.isOk()) << list.status.reason();
    EXPECT_LT(took.count(), 5.0) << "a quadratic step";
}
