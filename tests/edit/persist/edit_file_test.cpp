#include "edit/persist/edit_init.h"
#include "edit/persist/revision_history.h"
#include "edit_samples.h"
#include "platform/services/clock.h"
#include "platform/services/current_project.h"
#include "platform/store/edit_header_proxy.h"
#include "support/recording_log.h"
#include "support/temporary_folder.h"

#include <cmath>
#include <gtest/gtest.h>

namespace {

using test::kItem;
using test::stateOf;

class EditFileTest : public testing::Test {
protected:
    [[nodiscard]] WString path(const std::string& name = "E0001000.qme") const {
        return Qx::widen(folder.path(name));
    }
    [[nodiscard]] String bytes(const std::string& name) const { return test::bytesOf(folder.path(name)); }
    void save(Edit& edit) const {
        edit.init_dirty();
        ASSERT_TRUE(edit.write_file(path())) << edit.lastFileError();
    }
    // A store of hand-made objects.
    struct RawStore {
        explicit RawStore(const String& folder) {
            bag.open(cookie(kItem), folder, eOpenNew, ".qme");
            header.setInt("ED2_REVISION", 602);
        }
        void addCel(int number, const char* name, const char* subType = "SUBTYPE:NONE",
                    const IdStamp& id = IdStamp::fresh(IdStampMagic::Channel)) {
            auto content = std::make_unique<cel>();
            content->editChannelInfo(name, id, subType, "");
            bag.storeObject("Celid" + std::to_string(number), std::move(content));
        }
        void finish() {
            bag.storeObject(EditHeaderProxy::EditHeaderId, std::make_unique<EditHeaderProxy>(header));
            ASSERT_TRUE(bag.flush().isOk());
        }
        TagBag bag;
        configb header{"EDIT", "END_EDIT_HEADER"};
    };

    test::TemporaryFolder folder;
    test::RecordingLog log;
};

TEST_F(EditFileTest, ALargeEditUsesItsEventsWhereTheFileWasRead) {
    {
        Edit made;
        made.set_cookie(cookie(kItem));
        for (int channel = 0; channel < 3; ++channel) {
            cel* const content = made.get_edit_cel_p(made.addChan(VideoChan));
            for (int i = 0; i < 10'000; ++i) {
                content->appendEventPair(cookie("V0001000"), i, 2.0 * i, 1 + channel * 0.25);
            }
        }
        save(made);
    }
    const std::string before = bytes("E0001000.qme");
    EditPtr edit(new Edit(path(), eOpenExisting));
    ASSERT_FALSE(edit->isBad()) << edit->lastFileError();
    const EditPtr copied = edit->copy();
    ASSERT_TRUE(copied->get_edit_cel_p(1)->remove({100, 200}));
    // The image goes with the edit; what the copy uses of it stays.
    edit.invalidate();
    for (int channel = 0; channel < 3; ++channel) {
        const cel& content = *copied->get_edit_cel_p(channel);
        ASSERT_NE(content.is_good_cel(), 0);
        EXPECT_EQ(content.numPairs(), channel == 1 ? 9950 : 10'000);
        EXPECT_EQ(content.get_strip_time(1000.5), channel == 1 ? 550.5 : 500.5);
    }
    copied->set_cookie(cookie(kItem));
    save(*copied);
    EXPECT_LT(bytes("E0001000.qme").size(), before.size());
    const EditPtr again(new Edit(path(), eOpenExisting));
    ASSERT_FALSE(again->isBad());
    // A save of what lies in the image of its own file, half of it changed.
    ASSERT_TRUE(again->get_edit_cel_p(0)->remove({100, 200}));
    save(*again);
    const Edit last(path(), eOpenExisting);
    for (int channel = 0; channel < 3; ++channel) {
        const cel& content = *last.get_edit_cel_p(channel);
        EXPECT_EQ(content.numPairs(), channel == 2 ? 10'000 : 9950);
        for (int i = 0; i < content.numEvents(); ++i) {
            ASSERT_EQ(content.get_event(i), again->get_edit_cel_p(channel)->get_event(i));
        }
    }
}

TEST_F(EditFileTest, RandomEditsComeBackExactly) {
    for (unsigned seed = 1; seed <= 60; ++seed) {
        SCOPED_TRACE(seed);
        Edit edit;
        test::fillAtRandom(edit, seed);
        ASSERT_NO_FATAL_FAILURE(save(edit));
        EXPECT_FALSE(edit.isDirty(true));
        const Edit read(path(), eOpenExisting);
        ASSERT_FALSE(read.isBad()) << read.lastFileError();
        ASSERT_EQ(stateOf(read), stateOf(edit));
        EXPECT_FALSE(read.isDirty(true));
    }
}

TEST_F(EditFileTest, RoundsOfOpeningAndSavingLeaveTheBytesAndPackNoCelAgain) {
    const Qx::Clock before = Qx::setClock([] { return int64_t{1'800'000'000}; });
    Edit edit;
    test::fillAtRandom(edit, 5);
    ASSERT_NO_FATAL_FAILURE(save(edit));
    const std::string first = bytes("E0001000.qme");
    EXPECT_FALSE(edit.write_file(path())) << "it is clean";
    ASSERT_NO_FATAL_FAILURE(save(edit));
    EXPECT_LE(edit.objectStore().numPacked(), 2U); // the header and the cues
    for (int round = 0; round < 50; ++round) {
        Edit read(path(), eOpenExisting);
        ASSERT_FALSE(read.isBad()) << round << ": " << read.lastFileError();
        read.init_dirty();
        ASSERT_TRUE(read.write_file(path())) << round << ": " << read.lastFileError();
        EXPECT_LE(read.objectStore().numPacked(), 2U);
        ASSERT_EQ(bytes("E0001000.qme"), first) << round;
    }
    // An edit that was read before is replaced whole.
    const std::string state = stateOf(edit);
    edit.addChan(AudioChan);
    edit.ungroupAllChannels();
    ASSERT_EQ(edit.readFile(path(), eOpenExisting), Edit::kReadOk) << edit.lastFileError();
    EXPECT_EQ(stateOf(edit), state);
    // What is not set leaves no key.
    edit.set_mark_time(NO_CHAN, 3);
    edit.setSyncLoss(edit.getId(0), 0.5);
    ASSERT_NO_FATAL_FAILURE(save(edit));
    EXPECT_TRUE(edit.Opts().contains("MARK_TIME") && edit.Opts().contains("SyncLoss0"));
    edit.mark_invalidate();
    edit.setSyncLoss(edit.getId(0), 0);
    ASSERT_NO_FATAL_FAILURE(save(edit));
    EXPECT_FALSE(edit.Opts().contains("MARK_TIME") || edit.Opts().contains("SyncLoss0"));
    Qx::setClock(before);
}

TEST_F(EditFileTest, OldKeysAreTakenOver) {
    RawStore raw(folder.path());
    raw.addCel(0, "V1");
    raw.addCel(1, "A1");
    raw.addCel(2, "A2");
    raw.header.setInt("SOUND_OUTPUT_FLAG2", 0);
    raw.header.setInt("SOUND_OUTPUT_XFADE1", 1);
    raw.header.setDouble("SYNC_ERROR1", 0.25);
    raw.header.setInt("quality", 12);
    raw.header.setDouble("CURRENT_TIME", std::nan(""));
    raw.header.setDouble("MARK_TIME", HUGE_VAL);
    raw.header.setInt("ENTIRE_MEDIUM", 1);
    raw.finish();
    Edit edit(path(), eOpenExisting);
    ASSERT_FALSE(edit.isBad()) << edit.lastFileError();
    EXPECT_TRUE(edit.getAudCel(edit.getId(1)).getSoundOutputEnabled());
    EXPECT_FALSE(edit.getAudCel(edit.getId(2)).getSoundOutputEnabled());
    EXPECT_TRUE(edit.getAudCel(edit.getId(1)).getXFadesEnabled());
    EXPECT_EQ(edit.getSyncLoss(edit.getId(1)), 0.25);
    EXPECT_EQ(edit.Opts().getString("quality_string"), "12 mins");
    EXPECT_EQ(edit.get_entire_medium(), 1);
    EXPECT_EQ(edit.get_current_time(), 0);
    EXPECT_FALSE(edit.mark_is_valid());
    EXPECT_EQ(edit.getChanName(edit.getId(1)), "");
    edit.setSyncLoss(edit.getId(1), 0);
    ASSERT_NO_FATAL_FAILURE(save(edit));
    const Edit again(path(), eOpenExisting);
    EXPECT_EQ(again.getSyncLoss(again.getId(1)), 0);
}

TEST_F(EditFileTest, ANameThatIsNoItemLeavesTheEditLoading) {
    for (const char* name : {"hello.qme", "I0001000.qme", "e0001000.qme", "E0001000.qme.U1"}) {
        Edit edit;
        EXPECT_EQ(edit.readFile(path(name), eOpenExisting), Edit::kReadFailed);
        EXPECT_TRUE(edit.isLoading());
        EXPECT_EQ(edit.refCount(), 1);
        EXPECT_NE(edit.lastFileError().find(name), String::npos);
    }
    EXPECT_EQ(log.log(), "");
}

TEST_F(EditFileTest, WhatCannotBeReadIsRefusedWhole) {
    struct Case {
        const char* what;
        std::function<void(RawStore&)> make;
        const char* reason;
    };
    const Case cases[] = {
        {"no channels", [](RawStore&) {}, "no channels"},
        {"header of another class",
         [](RawStore& raw) {
             raw.addCel(0, "V1");
             raw.bag.storeObject(EditHeaderProxy::EditHeaderId, std::make_unique<cel>());
             ASSERT_TRUE(raw.bag.flush().isOk());
         },
         "no header"},
        {"no channel that reads", [](RawStore& raw) { raw.addCel(0, "Q7"); }, "no channels"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        RawStore raw(folder.path());
        c.make(raw);
        if (std::string_view(c.what) != "header of another class") {
            raw.finish();
        }
        const Edit edit(path(), eOpenExisting);
        EXPECT_TRUE(edit.isBad());
        EXPECT_EQ(edit.getNumChans(), 0);
        EXPECT_NE(edit.lastFileError().find(c.reason), String::npos) << edit.lastFileError();
        EXPECT_NE(edit.lastFileError().find("E0001000.qme"), String::npos) << edit.lastFileError();
    }
    Edit missing;
    EXPECT_EQ(missing.readFile(path("E0002000.qme"), eOpenExisting), Edit::kReadFailed);
    EXPECT_TRUE(log.contains("Edit::readFile( E0002000 ) : Failed to open store\n"));
    EXPECT_FALSE(missing.isLoading());
}

// The rest of the edit is whole, every number still means its channel, and the bytes survive a save.
TEST_F(EditFileTest, AnObjectThatDoesNotReadCostsWhatItHolds) {
    Edit made;
    made.set_cookie(cookie(kItem));
    for (const Edit_Chan_Type type : {VideoChan, VideoChan, AudioChan, AudioChan}) {
        const int index = made.addChan(type, nullptr, false);
        made.get_edit_cel_p(index)->appendEventPair(cookie("M0001000"), 0, 0, index + 1);
        made.setSyncLoss(made.getId(index), 0.25 * (index + 1));
    }
    for (const int audio : {3, 2}) { // in another order than their channels
        AudLevelsCel levels = AudLevelsCel::create();
        levels.insertNode(audio, 0.5F);
        made.setSyncLoss(made.addLevelsChan(made.getId(audio), levels), audio);
    }
    AudCel muted = made.getAudCel(made.getId(3));
    muted.setSoundOutputEnabled(false);
    made.setAudCel(muted);
    made.groupChannels({made.getId(2), made.getId(3)}, ChannelGroup::ePlain);
    for (int chan = 0; chan < 6; ++chan) {
        made.get_cues().add_cue_point(cue_point(std::to_string(chan).c_str(), 0, chan, 0, {}, false));
    }
    ASSERT_NO_FATAL_FAILURE(save(made));
    const std::string good = bytes("E0001000.qme");
    const struct {
        String object;
        String kept;  ///< the name that its bytes have afterwards
        int gone;     ///< the channel that it was; -1 for none
        int alsoGone; ///< its levels
    } cases[] = {{"Celid0", "Celid0.unread", 0, -1},
                 {"Celid2", "Celid2.unread", 2, 5},
                 {"Celid3", "Celid3.unread", 3, 4},
                 {"CueId", "CueId.unread", -1, -1},
                 {"ChannelGroupList", "ChannelGroupList.unread", -1, -1},
                 {made.getId(4).asString(), made.getId(4).asString(), 4, -1}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.object);
        folder.write("E0001000.qme", good);
        {
            TagBag bag;
            ASSERT_EQ(bag.open(cookie(kItem), folder.path(), eOpenExisting, ".qme"), TagBag::Opened);
            bag.storeObject(c.object, std::make_unique<EditHeaderProxy>(made.Opts()));
            ASSERT_TRUE(bag.flush().isOk());
        }
        log.clear();
        Edit read(path(), eOpenExisting);
        ASSERT_FALSE(read.isBad()) << read.lastFileError();
        EXPECT_TRUE(log.contains(c.object));
        for (int round = 0; round < 3; ++round) {
            const cue_list& cues = read.get_cues();
            ASSERT_EQ(cues.get_num_cue_points(0), c.object == "CueId" ? 0U : 6U);
            for (int i = 0; i < 6; ++i) {
                const IdStamp id = made.getId(i);
                const bool gone = i == c.gone || i == c.alsoGone;
                EXPECT_EQ(read.getIdx(id) == NO_CHAN, gone) << i;
                EXPECT_EQ(read.getSyncLoss(id), gone ? 0 : made.getSyncLoss(id)) << i;
                const AudCel audio = gone ? AudCel::createInvalid() : made.getAudCel(id);
                EXPECT_EQ(read.getAudCel(id).getSoundOutputEnabled(), audio.getSoundOutputEnabled()) << i;
                if (c.object != "CueId") {
                    EXPECT_EQ(cues.get_cue_point(static_cast<size_t>(i), 0)->channel(),
                              gone ? kAnyCueChan : read.getIdx(id));
                }
            }
            EXPECT_EQ(read.getCel(made.getId(1))->numPairs(), 1);
            if (round == 1) {
                read.addChan(VideoChan);
            }
            ASSERT_NO_FATAL_FAILURE(save(read));
            ASSERT_EQ(read.readFile(path(), eOpenExisting), Edit::kReadOk) << read.lastFileError();
            EXPECT_TRUE(read.objectStore().contains(made.getId(4).asString()) &&
                        read.objectStore().contains(made.getId(5).asString()));
            EditHeaderProxy kept;
            EXPECT_TRUE(read.objectStore().readObject(c.kept, kept)) << read.objectStore().objectError();
            EXPECT_EQ(kept.header(), made.Opts());
        }
    }
}

TEST_F(EditFileTest, ChannelLimits) {
    struct Case {
        int video, audio, levels;
        const char* message;
    };
    const Case cases[] = {{24, 0, 0, nullptr},
                          {25, 0, 0, "Too many video channels (25)\n"},
                          {1, 32, 32, nullptr},
                          {1, 33, 0, "Too many audio channels (33)\n"},
                          {25, 33, 0, "Too many audio channels (33)\n"},
                          {25, 1, 2, "Too many levels tracks (2)\n"}};
    for (const Case& c : cases) {
        SCOPED_TRACE(c.message != nullptr ? c.message : "within");
        log.clear();
        RawStore raw(folder.path());
        int n = 0;
        for (int i = 0; i < c.video; ++i) {
            raw.addCel(n++, "V1");
        }
        std::vector<AudLevelsCel> levels;
        for (int i = 0; i < std::max(c.audio, c.levels); ++i) {
            const IdStamp audio(0x80000000U, 7, static_cast<uint32_t>(std::min(i, c.audio - 1)));
            if (i < c.audio) {
                raw.addCel(n++, "A1", "SUBTYPE:NONE", audio);
            }
            if (i < c.levels) {
                levels.push_back(AudLevelsCel::create());
                levels.back().insertNode(1, 0.5F);
                levels.back().writeToStore(raw.bag);
                raw.header.setString("Levels" + std::to_string(i),
                                     levels.back().id().asString() + "=" + audio.asString());
            }
        }
        raw.finish();
        const Edit edit(path(), eOpenExisting);
        EXPECT_EQ(edit.isBad(), c.message != nullptr) << edit.lastFileError();
        EXPECT_EQ(edit.getNumChans(), c.message != nullptr ? 0 : c.video + c.audio + c.levels);
        EXPECT_EQ(log.standardOutput(), c.message != nullptr ? c.message : "");
        if (c.message != nullptr) {
            EXPECT_TRUE(log.contains(c.message));
        }
    }
}

TEST_F(EditFileTest, RepeatedStampsAreReplacedAndLonelyLevelsIgnored) {
    RawStore raw(folder.path());
    const IdStamp id = IdStamp::fresh(IdStampMagic::Channel);
    raw.addCel(0, "V1", "SUBTYPE:NONE", id);
    raw.addCel(1, "V2", "SUBTYPE:NONE", id);
    const IdStamp behindAGap = IdStamp::fresh(IdStampMagic::Channel);
    raw.addCel(3, "V4", "SUBTYPE:NONE", behindAGap);
    const AudLevelsCel levels = AudLevelsCel::create();
    levels.writeToStore(raw.bag);
    raw.header.setString("Levels0", levels.id().asString() + "=" + id.asString());
    raw.finish();
    Edit edit(path(), eOpenExisting);
    ASSERT_FALSE(edit.isBad()) << edit.lastFileError();
    ASSERT_EQ(edit.getNumChans(), 2);
    EXPECT_EQ(edit.getId(0), id);
    EXPECT_TRUE(edit.getId(1).valid());
    EXPECT_NE(edit.getId(1), id);
    // A channel that closes the gap neither brings back what lay behind it nor costs its bytes.
    edit.addChan(VideoChan);
    ASSERT_NO_FATAL_FAILURE(save(edit));
    Edit again(path(), eOpenExisting);
    EXPECT_EQ(again.getNumChans(), 3);
    EXPECT_TRUE(again.objectStore().contains("Celid3.unread"));
    EXPECT_EQ(again.getIdx(behindAGap), NO_CHAN);
}

TEST_F(EditFileTest, WhatIsNotToBeWrittenIsNot) {
    Edit edit;
    test::fillAtRandom(edit, 4);
    edit.init_dirty();
    edit.setTemporary(true);
    EXPECT_FALSE(edit.write_file(path()));
    edit.setTemporary(false);
    EXPECT_FALSE(edit.write_file(path("E0002000.qme"))); // named after another item
    EXPECT_NE(edit.lastFileError().find("E0002000.qme"), String::npos);
    EXPECT_FALSE(edit.write_file(L""));
    EXPECT_FALSE(edit.writeToFile(path("E0002000.qme"), kObjectStoreFile));
    EXPECT_FALSE(edit.writeToFile(path(), kObjectStoreEd3File));
    EXPECT_FALSE(edit.writeToFile(path(), kUnknownFile));
    edit.set_cookie(cookie("F0001000"));
    EXPECT_FALSE(edit.write_file(path("F0001000.qme")));
    EXPECT_TRUE(edit.isDirty(false));
    EXPECT_EQ(folder.numNames(), 0U);

    Edit empty;
    empty.set_cookie(cookie(kItem));
    empty.init_dirty();
    EXPECT_FALSE(empty.write_file(path()));
    EXPECT_NE(empty.lastFileError().find("no channels"), String::npos);
}

TEST_F(EditFileTest, AnEditGoesWhereItIsTold) {
    Edit edit;
    test::fillAtRandom(edit, 6);
    ASSERT_NO_FATAL_FAILURE(save(edit));
    EXPECT_TRUE(edit.writeToFile(path(), kObjectStoreFile)); // holds it already
    EXPECT_FALSE(edit.writeToFile(path("E0001000.ED3"), kObjectStoreFile));
    const std::string first = bytes("E0001000.qme");
    edit.set_cookie(cookie("E0002000"));
    edit.setName("the other");
    edit.init_dirty();
    ASSERT_TRUE(edit.write_file(path("E0002000.qme"))) << edit.lastFileError();
    EXPECT_EQ(bytes("E0001000.qme"), first);
    edit.init_dirty();
    ASSERT_TRUE(edit.write_file(path("E0002000.ED3"))) << edit.lastFileError();
    EXPECT_EQ(stateOf(Edit(path("E0002000.qme"), eOpenExisting)), stateOf(edit));
    EXPECT_EQ(stateOf(Edit(path("E0002000.ED3"), eOpenExisting)), stateOf(edit));
}

TEST_F(EditFileTest, StartingWritesTheVersionFile) {
    const Qx::CurrentProject before = Qx::currentProject();
    Qx::CurrentProject project = before;
    project.rootFolder = folder.path();
    Qx::setCurrentProject(project);
    folder.write("Last.Version.Used.txt", "old");
    EXPECT_TRUE(edit_init().isOk());
    const std::string text = bytes("Last.Version.Used.txt");
    EXPECT_NE(
        text.find("Version:string 11.1.0.0\nCosmeticVersion:string Quillmarch 11.1\nEditRevision:int 602\n"
                  "History310:string Track sound levels are now saved in edits\n"),
        std::string::npos)
        << text;
    EXPECT_NE(text.find("History602:string Added stereoscopic effects\n"), std::string::npos);
    EXPECT_EQ(editRevisionHistory().size(), 10U);
    project.rootFolder = folder.path("none");
    Qx::setCurrentProject(project);
    EXPECT_FALSE(edit_init().isOk());
    Qx::setCurrentProject(before);
}

} // namespace
