#include "interchange/edl/edl_import.h"
#include "interchange/edl/edl_records.h"
#include "interchange/marker_colour.h"

#include "edit/model/cel.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "support/faulty_file_system.h"
#include "support/recording_log.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstring>
#include <filesystem>

using namespace interchange;

namespace {

// A project in a fresh folder, the current one while it lives.
class Project {
public:
    Project() : m_before(Qx::currentProject()) {
        Qx::CurrentProject project = m_before;
        project.rootFolder = m_folder.path();
        std::filesystem::create_directories(project.folder().c_str());
        Qx::setCurrentProject(project);
    }
    ~Project() { Qx::setCurrentProject(m_before); }

    [[nodiscard]] std::vector<std::string> editFiles() const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator(Qx::currentProject().folder().c_str())) {
            const std::string name = entry.path().filename().string();
            if (name.find(".qme") != std::string::npos) {
                names.push_back(name);
            }
        }
        std::sort(names.begin(), names.end());
        return names;
    }

private:
    test::TemporaryFolder m_folder;
    Qx::CurrentProject m_before;
};

Import importText(const std::string& text, int rateCode = Qx::FrameRate::Fps25) {
    const test::TemporaryFolder folder;
    Import result;
    const Qx::Status status =
        importEdl(folder.write("list.edl", text), {Qx::FrameRate(rateCode), false}, result);
    EXPECT_TRUE(status.isOk()) << status.reason();
    return result;
}

Edit& shot(const Import& import, size_t index) {
    return *static_cast<Edit*>(import.shots.at(index));
}

Edit& sequence(const Import& import) {
    return *static_cast<Edit*>(import.sequence);
}

cel& celOf(const Edit& edit, int index) {
    cel* const content = edit.get_edit_cel_p(index);
    if (content == nullptr) {
        throw std::runtime_error("no such channel");
    }
    return *content;
}

const char* const kScene = "TITLE: Scene 4\n"
                           "FCM: NON-DROP FRAME\n"
                           "* made by hand\n"
                           "001  A012C004 B     C        01:00:04:00 01:00:06:00 10:00:00:00 10:00:02:00\n"
                           "* FROM CLIP NAME: street\n"
                           "* LOC: 10:00:01:00 RED   fix this\n"
                           "* LOC: 10:00:01:12 LILAC\n"
                           "* LOC: 09:00:00:00 RED   too early\n"
                           "GPI 1\n"
                           "002  BL       V     C        00:00:00:00 00:00:01:00 10:00:02:00 10:00:03:00\n"
                           "003  A012C004 A2    C        01:00:10:00 01:00:12:00 10:00:04:00 10:00:05:00\n"
                           "M2   A012C004       050.0                01:00:10:00\n"
                           "* FROM CLIP NAME: street\n";

} // namespace

TEST(EdlImport, AListBecomesASequenceAndItsShots) {
    const Import import = importText(kScene);
    const Edit& edit = sequence(import);
    EXPECT_EQ(edit.get_log_type(), kLogEdit);
    EXPECT_EQ(edit.getName(), "Scene 4");
    EXPECT_EQ(edit.getFrameRate().code(), Qx::FrameRate::Fps25);
    EXPECT_EQ(edit.Opts().getInt64(EditKeys::kStartTimecode), 36000 * 25);
    EXPECT_FALSE(edit.Opts().getBool(EditKeys::kDropFrame, true));
    ASSERT_EQ(edit.getNumChans(VideoChan), 1);
    ASSERT_EQ(edit.getNumChans(AudioChan), 2);

    const cel& picture = celOf(edit, 0);
    ASSERT_EQ(picture.numPairs(), 2);
    const channel_event in = picture.get_event(0);
    EXPECT_EQ(in.editTime, 0.0);
    EXPECT_EQ(in.stripTime, 3604.0);
    EXPECT_EQ(in.strip, provisionalCookie(0));
    EXPECT_EQ(picture.get_event(1).editTime, 2.0);
    EXPECT_EQ(picture.get_event(1).stripTime, 3606.0);
    EXPECT_TRUE(picture.get_event(2).strip.isBlack());
    const cel& second = celOf(edit, 2);
    ASSERT_EQ(second.numPairs(), 1) << "what comes before it is a gap";
    EXPECT_EQ(second.get_event(0).velocity, 2.0);
    EXPECT_EQ(second.get_event(0).editTime, 4.0);
    EXPECT_EQ(second.get_event(1).stripTime, 3612.0);

    ASSERT_EQ(import.shots.size(), 1U);
    const Edit& source = shot(import, 0);
    EXPECT_EQ(source.get_log_type(), kLogShot);
    EXPECT_EQ(source.getName(), "street");
    EXPECT_EQ(source.Opts().getString(EdlKey::kReel), "A012C004");
    EXPECT_EQ(source.getSourceMediumDuration(), 3612.0);
    ASSERT_EQ(source.getNumChans(), 3);
    for (int chan = 0; chan < 3; ++chan) {
        EXPECT_EQ(celOf(source, chan).get_start_time(), 3604.0) << chan;
        EXPECT_EQ(celOf(source, chan).get_end_time(), 3612.0) << chan;
        EXPECT_EQ(celOf(source, chan).get_event(0).stripTime, 3604.0) << chan;
    }
}

TEST(EdlImport, MarkersBecomeCues) {
    const Import import = importText(kScene);
    const cue_list& cues = sequence(import).get_cues();
    ASSERT_EQ(cues.get_num_cue_points(0), 2U);
    EXPECT_EQ(cues.get_cue_point(0, 0)->text(), "fix this");
    EXPECT_EQ(markerColourName(cues.get_cue_point(0, 0)->code()), "RED");
    EXPECT_EQ(cues.get_cue_point(0, 0)->editTime(), 1.0);
    EXPECT_EQ(cues.get_cue_point(1, 0)->text(), "LILAC");
    EXPECT_EQ(cues.get_cue_point(1, 0)->editTime(), 1.48);
    // They follow the clip they lie on.
    ASSERT_TRUE(celOf(sequence(import), 0).remove({0.0, 0.4}));
    EXPECT_TRUE(sequence(import).updateCues());
    EXPECT_NEAR(cues.get_cue_point(0, 0)->editTime(), 0.6, 1e-6);
    ASSERT_EQ(import.report.losses().size(), 1U);
    EXPECT_EQ(import.report.lines().front(),
              import.report.file() + ":8: loss: the marker lies before the programme and is left out");
}

TEST(EdlImport, WhatAnEditHasNoPlaceForIsKept) {
    const Import import = importText(kScene);
    const configb& header = sequence(import).Opts();
    EXPECT_EQ(header.getString(EdlKey::kNotes), "* made by hand");
    const auto records = unpackEdlRecords(header.getString(EdlKey::kEvents));
    ASSERT_EQ(records.size(), 3U);
    EXPECT_EQ(records[0].number, "001");
    EXPECT_EQ(records[0].reel, "A012C004");
    EXPECT_TRUE(records[0].notes.ends_with("RED   too early\nGPI 1")) << records[0].notes;
    ASSERT_EQ(records[0].events.size(), 2U) << "one on the picture, one on A1";
    EXPECT_EQ(records[0].events[0], celOf(sequence(import), 0).get_event(0).id);
    EXPECT_EQ(records[2].speedDigits, "050.0");
    EXPECT_EQ(unpackEdlRecords(packEdlRecords(records)), records);
}

TEST(EdlImport, WhatIsOneSource) {
    const auto line = [](int i, const char* reel, const char* notes) {
        return String::format("%03d %s V C %d %d %d %d\n%s", i, reel, 100 * i, 100 * i + 10, 10 * i,
                              10 * i + 10, notes);
    };
    const struct {
        const char* firstReel;
        const char* firstNotes;
        const char* secondReel;
        const char* secondNotes;
        size_t shots;
    } cases[] = {
        {"R1", "", "R1", "", 1},
        {"R1", "", "R2", "", 2},
        {"AX", "", "AX", "", 2},
        {"ax", "", "AX", "", 2},
        {"AX", "* FROM CLIP NAME: a\n", "AX", "* FROM CLIP NAME: a\n", 1},
        {"AX", "* FROM CLIP NAME: a\n", "AX", "* FROM CLIP NAME: b\n", 2},
        {"R1", "* FROM CLIP NAME: a\n", "R2", "* FROM CLIP NAME: a\n", 2},
        {"ZZ", "* SOURCE FILE: ZZ_501\n", "ZZ", "* SOURCE FILE: ZZ_502\n", 2},
        {"BL", "", "BLACK", "", 0},
    };
    for (const auto& c : cases) {
        const Import import =
            importText(line(1, c.firstReel, c.firstNotes) + line(2, c.secondReel, c.secondNotes));
        EXPECT_EQ(import.shots.size(), c.shots)
            << c.firstReel << c.firstNotes << c.secondReel << c.secondNotes;
    }
}

TEST(EdlImport, DropFrameBecomesRealTime) {
    const Import import = importText("FCM: DROP FRAME\n"
                                     "001 R V C 01:00:00:00 01:01:00:02 02:00:00:00 02:01:00:02\n",
                                     Qx::FrameRate::Fps29_97);
    const double frame = 1001.0 / 30000.0;
    EXPECT_DOUBLE_EQ(celOf(sequence(import), 0).get_end_time(), 1800 * frame);
    EXPECT_DOUBLE_EQ(celOf(sequence(import), 0).get_event(0).stripTime, 107892 * frame);
    EXPECT_TRUE(sequence(import).Opts().getBool(EditKeys::kDropFrame));
    EXPECT_EQ(sequence(import).Opts().getInt64(EditKeys::kStartTimecode), 215784);
}

TEST(EdlImport, AFailureLeavesTheResult) {
    Import import = importText(kScene);
    const Edit* const before = import.sequence;
    const test::TemporaryFolder folder;
    EXPECT_FALSE(importEdl(folder.write("bad.edl", "001 R V\n"), {Qx::FrameRate(3), false}, import).isOk());
    EXPECT_FALSE(importEdl(folder.path("none.edl"), {Qx::FrameRate(3), false}, import).isOk());
    EXPECT_TRUE(import.sequence == before);
    EXPECT_EQ(Qx::fileNameOf(import.report.file()), "none.edl") << "what was met is told of";
}

TEST(EdlImport, TenThousandEventsAreNotFelt) {
    for (const bool stacked : {false, true}) {
        std::string text = "TITLE: feature\n";
        for (int i = 0; i < 10000; ++i) {
            // Stacked: each event lies inside all those before it, so that everything is split.
            const int in = stacked ? i : 10 * i;
            const int out = stacked ? 20000 - i : 10 * i + 10;
            text += String::format("%06d R%d B C %d %d %d %d\n* FROM CLIP NAME: clip %d\n", i + 1, i % 200,
                                   in, out, in, out, i % 200);
        }
        const auto start = std::chrono::steady_clock::now();
        const Import import = importText(text);
        const std::chrono::duration<double> took = std::chrono::steady_clock::now() - start;
        EXPECT_EQ(import.shots.size(), 200U);
        EXPECT_EQ(celOf(sequence(import), 0).numPairs(), stacked ? 19999 : 10000);
        RecordProperty(stacked ? "stacked_ms" : "plain_ms", static_cast<int>(took.count() * 1000));
        EXPECT_LT(took.count(), 5.0) << "a quadratic step";
    }
}

TEST(SaveImport, WritesTheShotsThenTheSequence) {
    const Project project;
    Import import = importText(kScene);
    const Qx::Status status = saveImport(import);
    ASSERT_TRUE(status.isOk()) << status.reason();
    EXPECT_EQ(project.editFiles(), (std::vector<std::string>{"E0001000.qme", "E0002000.qme"}));

    Edit source;
    ASSERT_EQ(source.read_file(cookie("E0001000"), eEditOpenBehaviour{}), Edit::kReadOk);
    EXPECT_EQ(source.getName(), "street");
    EXPECT_EQ(celOf(source, 0).get_event(0).strip.asString(), "V0001000");
    EXPECT_EQ(celOf(source, 1).get_event(0).strip.asString(), "S0001000");
    Edit edit;
    ASSERT_EQ(edit.read_file(cookie("E0002000"), eEditOpenBehaviour{}), Edit::kReadOk);
    EXPECT_EQ(edit.getName(), "Scene 4");
    EXPECT_EQ(celOf(edit, 0).get_event(0).strip, cookie("E0001000"));
    EXPECT_TRUE(celOf(edit, 0).get_event(2).strip.isBlack());
    EXPECT_EQ(edit.get_cues().get_num_cue_points(0), 2U);
    EXPECT_EQ(unpackEdlRecords(edit.Opts().getString(EdlKey::kEvents)).size(), 3U);
}

TEST(SaveImport, ASecondImportPlaysTheShotsThatAreThere) {
    const Project project;
    const String event = "001 R1 V C 00:00:10:00 00:00:12:00 00:00:00:00 00:00:02:00\n* FROM CLIP NAME: a\n";
    const auto save = [&](const std::string& text, size_t reused, size_t made) {
        Import import = importText(text);
        const size_t found = reuseShots(import, [](const String& name) {
            std::vector<EditPtr> shots;
            for (int number = 1; number < 30; ++number) {
                EditPtr shot(new Edit);
                if (shot->read_file(cookie(Cookie_Type::Edit, number, 0), eOpenExisting) == Edit::kReadOk &&
                    shot->getName() == name) {
                    shots.push_back(shot);
                }
            }
            return shots;
        });
        EXPECT_EQ(found, reused) << text;
        EXPECT_EQ(import.shots.size(), made) << text;
        EXPECT_TRUE(saveImport(import).isOk());
        return import;
    };
    const Import first = save(event, 0, 1);
    const cookie known = shot(first, 0).get_cookie();
    const Import again = save(event + "* LOC: 00:00:01:00 RED x\n", 1, 0);
    EXPECT_EQ(celOf(sequence(again), 0).get_event(0).strip, known);
    EXPECT_EQ(sequence(again).get_cues().get_cue_point(0, 0)->stripCookie(), known);
    // Another source, more of it, another track of it, and a reel that says nothing.
    const struct {
        const char* from;
        const char* to;
        bool isOther;
    } changes[] = {
        {"R1", "R2", true},
        {": a", ": b", true},
        {"12:00 00", "13:00 00", false},
        {"00:12:00 00:00:00:00 00:00:02", "00:13:00 00:00:00:00 00:00:03", true},
        {" V ", " B ", true},
        {"* FROM", "* SOURCE FILE: f\n* FROM", true},
        {"10:00 00:00:12:00 00:00:00:00 00:00:02:00", "11:00 00:00:12:00 00:00:00:00 00:00:01:00", false}};
    for (const auto& change : changes) {
        String text = event;
        ASSERT_NE(text.find(change.from), String::npos) << change.from;
        text.replace(text.find(change.from), std::strlen(change.from), change.to);
        save(text, change.isOther ? 0 : 1, change.isOther ? 1 : 0);
    }
    const std::string nameless = "001 AX V C 00:00:10:00 00:00:12:00 00:00:00:00 00:00:02:00\n";
    save(nameless, 0, 1);
    save(nameless, 0, 1);

    Import late = importText(event);
    reuseShots(late, [&](const String&) { return std::vector<EditPtr>{first.shots[0]}; });
    std::filesystem::remove(getFilenameForCookie(known).c_str());
    const Qx::Status gone = saveImport(late);
    EXPECT_EQ(gone.code(), Qx::StatusCode::NotFound) << gone.reason();
}

TEST(SaveImport, AFailureLeavesTheProjectAndCanBeRepeated) {
    const Project project;
    const test::RecordingLog log;
    Import import = importText(kScene);
    {
        test::FaultyFileSystem faulty;
        faulty.failWhere("E0002000", ENOSPC);
        EXPECT_FALSE(saveImport(import).isOk());
        faulty.reset();
        faulty.fullAfter(2000);
        EXPECT_FALSE(saveImport(import).isOk());
    }
    // The first of two names may hold its new file by then: nothing refers to it.
    EXPECT_LE(project.editFiles().size(), 1U);
    EXPECT_EQ(celOf(sequence(import), 0).get_event(0).strip, provisionalCookie(0));
    const Qx::Status status = saveImport(import);
    ASSERT_TRUE(status.isOk()) << status.reason();
    const cookie source = shot(import, 0).get_cookie();
    EXPECT_EQ(celOf(sequence(import), 0).get_event(0).strip, source);
    EXPECT_TRUE(std::filesystem::exists(getFilenameForCookie(source).c_str()));
}

TEST(SaveImport, NeedsASequence) {
    Import none;
    EXPECT_FALSE(saveImport(none).isOk());
}

TEST(LossReport, LinesComeInTheOrderOfTheFile) {
    LossReport report;
    report.setFile("a.edl");
    report.addLoss(9, "nine");
    report.addWarning(2, "two");
    report.addLoss(0, "all of it");
    report.addLoss(2, "two as well");
    EXPECT_EQ(report.lines(), (std::vector<String>{"a.edl: loss: all of it", "a.edl:2: loss: two as well",
                                                   "a.edl:2: warning: two", "a.edl:9: loss: nine"}));
}
