#include "edit_samples.h"
#include "platform/services/current_project.h"
#include "support/recording_log.h"
#include "support/temporary_folder.h"

#include <clocale>
#include <cstring>
#include <gtest/gtest.h>

namespace {

class LegacyTextTest : public testing::Test {
protected:
    [[nodiscard]] WString path(const char* name = "E0001000.ed2") const {
        return Qx::widen(folder.path(name));
    }
    [[nodiscard]] std::string textOf(Edit& edit, const char* name = "E0001000.ed2") const {
        EXPECT_TRUE(edit.writeToLegacyFile(path(name))) << edit.lastFileError();
        return test::bytesOf(folder.path(name));
    }
    static void useProjectRate(int code, bool dropFrame) {
        Qx::CurrentProject project = Qx::currentProject();
        project.frameRateCode = code;
        project.dropFrame = dropFrame;
        Qx::setCurrentProject(project);
    }
    void expectRoundTrips(unsigned seeds) const {
        for (unsigned seed = 1; seed <= seeds; ++seed) {
            SCOPED_TRACE(seed);
            Edit edit;
            test::fillAtRandom(edit, seed);
            const std::string first = textOf(edit);
            Edit read;
            ASSERT_TRUE(read.readFromLegacyFile(path())) << read.lastFileError();
            EXPECT_EQ(read.get_cookie(), cookie(test::kItem));
            ASSERT_EQ(textOf(read, "again.ed2"), first);
        }
    }

    test::TemporaryFolder folder;
    test::RecordingLog log;
};

TEST_F(LegacyTextTest, ExportImportExportGivesTheSameText) {
    expectRoundTrips(40);
}

TEST_F(LegacyTextTest, ForeignLocalesChangeNothing) {
    int tried = 0;
    for (const char* name : {"de_DE.UTF-8", "tr_TR.UTF-8", "de_DE.utf8", "tr_TR.utf8"}) {
        if (std::setlocale(LC_ALL, name) != nullptr) {
            ++tried;
            expectRoundTrips(5);
        }
    }
    std::setlocale(LC_ALL, "C");
    if (tried == 0) {
        GTEST_SKIP() << "neither de_DE nor tr_TR is installed here";
    }
}

TEST_F(LegacyTextTest, TheSectionsAreThoseOfTheForm) {
    Edit edit;
    edit.set_cookie(cookie(test::kItem));
    for (int i = 0; i < 5; ++i) {
        edit.addChan(i < 2 ? VideoChan : AudioChan, nullptr, false);
    }
    edit.setChanName(edit.getId(3), "Music 1");
    edit.get_edit_cel_p(0)->appendEventPair(cookie("M0001000"), 12.5, 0, 2.5);
    for (const char* name : {"one", "two", "three"}) {
        cue_point cue;
        cue.setText(name);
        cue.setEditTime(0.1);
        cue.setCode(7);
        cue.setChannel(2); // the first audio channel, which is the text's channel 1
        cue.setFlags(*name == 't' && name[1] == 'h' ? CueFlag::kKept : CueFlag::kInside);
        edit.get_cues().add_cue_point(cue);
    }
    edit.Opts().setString("CHANNEL_MAP_1", "x");
    edit.Opts().setString("LABEL0", "a,LABEL_REV:2,b");
    edit.Opts().setString("LABEL1", "a,b");
    const String text = textOf(edit);
    EXPECT_NE(text.find("\nNUM_CHANS:int 4\n"), String::npos);
    EXPECT_NE(text.find("\ntvtype:textdata pal\n"), String::npos);
    EXPECT_NE(text.find("\nLABEL0:string a\nLABEL1:string a,b\n"), String::npos);
    EXPECT_NE(text.find("\nCUE_LIST_ENTRIES 1\n3 0\none\n0.1\n00000004\n7\n1\nCHANNEL_NAME V " +
                        edit.getId(0).asString() +
                        " SUBTYPE:NONE\nCEL_EVENTS 2\nIN 0 STRIP M0001000 12.5 SPEED 1 "),
              String::npos)
        << text;
    EXPECT_NE(text.find("END_CHANNEL\nCHANNEL_NAME A%_Music%201 "), String::npos);
    EXPECT_TRUE(text.ends_with("END_CHANNEL\nEND_EDIT\n"));
    for (const char* gone : {"FRAME_RATE", "CHANNEL_MAP", "UNDO_COOKIE", "REDO_COOKIE"}) {
        EXPECT_EQ(text.find(gone), String::npos) << gone;
    }
    size_t sections = 0;
    for (size_t at = 0; (at = text.find("CHANNEL_NAME ", at)) != String::npos; ++at) {
        ++sections;
    }
    EXPECT_EQ(sections, 4U);
}

TEST_F(LegacyTextTest, TheRateComesBackFromTheStandard) {
    const Qx::CurrentProject before = Qx::currentProject();
    const std::tuple<int, bool, const char*> rates[] = {
        {1, false, "pal_24"}, {3, false, "pal"}, {4, false, "ntsc"}, {4, true, "ntsc_drop_frame"}};
    for (const auto& [code, drop, name] : rates) {
        SCOPED_TRACE(name);
        useProjectRate(code, drop);
        Edit edit;
        test::fillAtRandom(edit, 4);
        EXPECT_NE(textOf(edit).find("tvtype:textdata " + std::string(name) + "\n"), std::string::npos);
        useProjectRate(3, false);
        Edit read(path(), eOpenExisting);
        ASSERT_FALSE(read.isBad()) << read.lastFileError();
        EXPECT_EQ(read.getFrameRate().code(), code);
        EXPECT_TRUE(read.isDirty(false)); // to be saved in the current form
    }
    useProjectRate(Qx::FrameRate::Fps50, false);
    Edit edit;
    test::fillAtRandom(edit, 4);
    EXPECT_NE(textOf(edit).find("tvtype:textdata \n"), std::string::npos);
    EXPECT_TRUE(log.contains("cannot be read again"));
    Edit read;
    EXPECT_FALSE(read.readFromLegacyFile(path()));
    EXPECT_NE(read.lastFileError().find("tvtype"), String::npos);
    Qx::setCurrentProject(before);
}

// What other programs and people write, and what they mean by it.
TEST_F(LegacyTextTest, TextsOfOthersReadAsTheyAreMeant) {
    Edit edit;
    edit.set_cookie(cookie(test::kItem));
    for (const Edit_Chan_Type type : {VideoChan, AudioChan, AudioChan}) {
        edit.addChan(type, nullptr, false);
    }
    edit.setSyncLoss(edit.getId(2), 0.5);
    edit.setMaterialInfo(edit.getId(0), "CHANNEL_NAME A9");
    edit.setName("CUE_LIST_ENTRIES 7");
    edit.Opts().setInt("END_EDIT_HEADER is near", 1);
    edit.Opts().setString("CHANNEL_NAME V", "CHANNEL_NAME A1 SUBTYPE:NONE");
    for (const char* const name : {"one", "CHANNEL_NAME A7 x"}) {
        edit.get_cues().add_cue_point(cue_point(name, 1, 2, 7, {}, false));
    }
    const String good = textOf(edit);
    const struct {
        const char* from;
        const char* to;
        size_t cues;
        const char* losses; ///< sync losses of the channels
    } cases[] = {
        {"", "", 2, "0 0 0.5"},
        {"ENTRIES 2\n", "ENTRIES 2 \n", 2, "0 0 0.5"},
        {"ENTRIES 2\n", "ENTRIES +2 cues\n", 2, "0 0 0.5"},
        {"ENTRIES 2\n", "ENTRIES  99999999999\n", 2, "0 0 0.5"},
        {"ENTRIES 2\n", "ENTRIES -2\n", 0, nullptr}, // its cues are then lines like any others
        {"ENTRIES 2\n", "ENTRIES x\n", 0, nullptr},
        {"ENTRIES 2\n", "ENTRIES 1\n", 1, nullptr},
        {"one\n1\n", "one\n +1.0 s\n", 2, "0 0 0.5"},
        {"\n00000006\n", "\n0x6 \n", 2, "0 0 0.5"},
        {"NUM_CHANS:int 3", "NUM_CHANS:int +3 ", 2, "0 0 0.5"},
        {"NUM_CHANS:int 3", "NUM_CHANS:int 2000000000", 2, "0 0 0.5"},
        {"\nCHANNEL_NAME A1", "\nCHANNEL_NAME Q1", 2,
         "0 0.5"}, // a section that is passed over has its number, too
        {"CEL_EVENTS 0\nEND_CHANNEL", "CEL_EVENTS  +0 \n", 2, "0 0 0.5"},
        {"END_EDIT\n", "", 2, "0 0 0.5"},
        {"tvtype:textdata pal", "tvtype:textdata pal ", 2, "0 0 0.5"},
    };
    for (const auto& c : cases) {
        for (const bool dos : {false, true}) {
            SCOPED_TRACE(String(c.to) + (dos ? " CRLF" : ""));
            String text = good;
            text.replace(text.find(c.from), std::strlen(c.from), c.to);
            for (size_t at = 0; dos && (at = text.find('\n', at)) != String::npos; at += 2) {
                text.insert(at, 1, '\r');
            }
            folder.write("E0001000.ed2", text);
            Edit read;
            const bool done = read.readFromLegacyFile(path());
            EXPECT_EQ(read.get_cues().get_num_cue_points(0), done ? c.cues : 0);
            if (c.losses == nullptr) {
                continue;
            }
            ASSERT_TRUE(done) << read.lastFileError();
            String losses;
            for (int i = 0; i < read.getNumChans(); ++i) {
                losses += (i == 0 ? "" : " ") + Qx::doubleToText(read.getSyncLoss(read.getId(i)));
            }
            EXPECT_EQ(losses, c.losses);
            const cue_point& last = *read.get_cues().get_cue_point(1, 0);
            EXPECT_EQ(last.text(), "CHANNEL_NAME A7 x");
            EXPECT_EQ(last.channel(), read.getNumChans() - 1);
            EXPECT_EQ(read.getMaterialInfo(read.getId(0)), "CHANNEL_NAME A9");
            EXPECT_EQ(read.getName(), "CUE_LIST_ENTRIES 7");
        }
    }
}

TEST_F(LegacyTextTest, OnlyAProjectIsWrittenWithoutChannels) {
    Edit edit;
    edit.set_cookie(cookie(test::kItem));
    edit.addChan(AudioChan);
    EXPECT_FALSE(edit.writeToLegacyFile(path()));
    EXPECT_EQ(folder.numNames(), 0U);
    edit.set_cookie(Qx::currentProject().project);
    EXPECT_EQ(textOf(edit).find("END_EDIT\n"), std::string::npos);
}

TEST_F(LegacyTextTest, BadLinesAreNamed) {
    Edit edit;
    edit.set_cookie(cookie(test::kItem));
    edit.addChan(VideoChan, nullptr, false);
    edit.addChan(AudioChan, nullptr, false);
    edit.get_edit_cel_p(0)->appendEventPair(cookie("M0001000"), 12.5, 0, 2.5);
    const String good = textOf(edit);
    const std::tuple<const char*, const char*, const char*> cases[] = {
        {"CEL_EVENTS 2", "CEL_EVENTS 3", "even number"},
        {"CEL_EVENTS 2", "CEL_EVENTS 2000000000", "fewer lines"},
        {"CEL_EVENTS 2", "CEL_EVENTS 4", "17 words"},
        {"IN 0 ", "IN zero ", "number"},
        {"IN 0 ", "IN nan ", "does not follow"},
        {"OUT 2.5", "OUT -1", "does not follow"},
        {"M0001000", "../../ab", "no cookie"},
        {"FADE 0", "FADE 70000", "in range"},
        {" SPEED 1", " SPED 1", "missing"},
    };
    for (const auto& [from, to, reason] : cases) {
        String text = good;
        text.replace(text.find(from), std::strlen(from), to);
        folder.write("E0001000.ed2", text);
        Edit read;
        EXPECT_FALSE(read.readFromLegacyFile(path())) << to;
        EXPECT_NE(read.lastFileError().find("line "), String::npos) << read.lastFileError();
        EXPECT_NE(read.lastFileError().find(reason), String::npos) << read.lastFileError();
        EXPECT_EQ(read.getNumChans(), 0) << to;
        EXPECT_TRUE(read.isBad());
    }
    String unknown = good;
    unknown.replace(unknown.find("CHANNEL_NAME A1"), 15, "CHANNEL_NAME Q1");
    folder.write("E0001000.ed2", unknown);
    Edit read;
    EXPECT_TRUE(read.readFromLegacyFile(path())) << read.lastFileError();
    EXPECT_EQ(read.getNumChans(), 1);
    EXPECT_TRUE(log.contains("Edit::readED2Cels() encountered unknown track type"));
    folder.write("E0001000.ed2", "");
    EXPECT_FALSE(read.readFromLegacyFile(path()));
    EXPECT_EQ(read.getNumChans(), 0);
}

// Every line left out, and every line doubled: refused with a reason, or an edit that is whole.
TEST_F(LegacyTextTest, MissingAndRepeatedLines) {
    Edit edit;
    test::fillAtRandom(edit, 12);
    const String good = textOf(edit);
    TextFile lines;
    lines.setText(good);
    for (unsigned i = 0; i < 2 * lines.numLines(); ++i) {
        TextFile changed;
        for (unsigned n = 0; n < lines.numLines(); ++n) {
            for (unsigned copies = n != i / 2 ? 1 : (i % 2 == 0 ? 0 : 2); copies > 0; --copies) {
                changed.appendLine(lines[n]);
            }
        }
        folder.write("E0001000.ed2", changed.text());
        Edit read;
        if (read.readFromLegacyFile(path())) {
            EXPECT_GT(read.getNumChans(), 0);
            for (int chan = 0; chan < read.getNumChans(); ++chan) {
                EXPECT_NE(read.get_edit_cel_p(chan)->is_good_cel(), 0) << i;
            }
        } else {
            EXPECT_EQ(read.getNumChans(), 0) << i;
            EXPECT_FALSE(read.lastFileError().empty()) << i;
        }
    }
}

} // namespace
