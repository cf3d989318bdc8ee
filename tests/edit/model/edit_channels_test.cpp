#include "edit/model/edit.h"
#include "tests/support/edit_builder.h"
#include "tests/support/edit_state.h"
#include "tests/support/recording_log.h"

#include <functional>
#include <gtest/gtest.h>

#include <limits>

using test::EditBuilder;
using test::editState;
using Sub = Edit_Chan_SubType;

namespace {

/// The shown names in index order, "FX1 V1 A1".
String layout(const Edit& edit) {
    String text;
    for (int i = 0; i < edit.getNumChans(); ++i) {
        text += (i > 0 ? " " : "") + edit.getChanDisplayName(edit.getId(i));
    }
    return text;
}

/// Gives each channel its shown name as its own, so that it can be told after others were inserted.
void fixNames(Edit& edit) {
    for (int i = 0; i < edit.getNumChans(); ++i) {
        edit.setChanName(edit.getId(i), edit.getChanDisplayName(edit.getId(i)).lower());
    }
    edit.set_dirty(false);
}

TEST(Channels, IndexRunsOverEffectsVideoAudioLevels) {
    const EditPtr edit = EditBuilder().effects(1).video(2).audio(2).levels(2).clips({1}).build();
    EXPECT_EQ(layout(*edit), "FX1 V1 V2 A1 A2 L1 L2");
    EXPECT_EQ(edit->getNumChans(), 7);
    EXPECT_EQ(edit->getNumChans(VideoChan), 3);
    EXPECT_EQ(edit->getNumChans(VideoChan, Sub::NONE), 2);
    EXPECT_EQ(edit->getNumChans(AudioChan, Sub::ANY), 2);
    EXPECT_EQ(edit->getNumChans(AnyChan), 7);
    EXPECT_EQ(edit->getNumChans(AnyChan, Sub::ALIAS), 1);
    EXPECT_EQ(edit->getNumChans(ControlChan), 0);
    EXPECT_EQ(edit->getChanType(5), NoChan);
    EXPECT_EQ(edit->getChanSubtype(5), Sub::INVALID);
    EXPECT_EQ(edit->getChanSubtype(0), Sub::ALIAS);
    const int within[] = {0, 0, 1, 0, 1, 0, 1};
    for (int i = 0; i < 7; ++i) {
        const IdStamp chan = edit->getId(i);
        EXPECT_EQ(chan.getMagicType(), IdStampMagic::Channel);
        EXPECT_EQ(edit->getIdx(chan), i);
        EXPECT_EQ(edit->getIndexWithinType(chan), within[i]);
        EXPECT_EQ(edit->getIndexWithinType(i), within[i]);
        EXPECT_EQ(edit->getCel(chan), edit->get_edit_cel_p(i));
        EXPECT_EQ(edit->getCel(chan) != nullptr, i < 5);
        EXPECT_EQ(edit->getChanType(chan), edit->getChanType(i));
        EXPECT_EQ(edit->chanValid(i, VideoChan), i < 3);
        EXPECT_EQ(edit->chanValid(chan, AudioChan), i == 3 || i == 4);
        EXPECT_TRUE(edit->chanValid(i));
        EXPECT_FALSE(edit->chanValid(i, NoChan));
    }
    EXPECT_TRUE(edit->sameType(edit->getId(0), edit->getId(1)));
    EXPECT_FALSE(edit->sameType(edit->getId(1), edit->getId(3)));
    EXPECT_FALSE(edit->sameType(IdStamp(), IdStamp()));
    Vector<int> video;
    edit->getChans(video, VideoChan, Sub::NONE);
    EXPECT_EQ(video, (Vector<int>{1, 2}));
    EXPECT_EQ(edit->getFirstChan(AudioChan), 3);
    EXPECT_EQ(edit->getChanWithName("A2"), edit->getId(4));
    EXPECT_FALSE(edit->getChanWithName("a2").valid());
}

TEST(Channels, QueriesOfWhatIsNotThereNeverFail) {
    const EditPtr edit = EditBuilder().video(1).build();
    const IdStamp unknown = IdStamp::fresh(IdStampMagic::Channel);
    for (const int index :
         {-1, 1, NO_CHAN, std::numeric_limits<int>::max(), std::numeric_limits<int>::min()}) {
        SCOPED_TRACE(index);
        EXPECT_FALSE(edit->getId(index).valid());
        EXPECT_EQ(edit->get_edit_cel_p(index), nullptr);
        EXPECT_EQ(edit->getChanType(index), NoChan);
        EXPECT_EQ(edit->getIndexWithinType(index), NO_CHAN);
        EXPECT_FALSE(edit->chanValid(index));
        EXPECT_TRUE(edit->isEmpty(index));
        int next = index;
        EXPECT_EQ(edit->getNextChan(next), index == -1 ? 0 : NO_CHAN);
    }
    for (const IdStamp& chan : {IdStamp(), unknown}) {
        EXPECT_EQ(edit->getIdx(chan), NO_CHAN);
        EXPECT_EQ(edit->getCel(chan), nullptr);
        EXPECT_EQ(edit->getChanTypeAndSubType(chan), Edit::ChanType());
        EXPECT_FALSE(edit->getVidCel(chan).valid());
        EXPECT_EQ(edit->getChanDisplayName(chan), "");
    }
}

TEST(Insertion, PutsChannelsWhereTheyAreAsked) {
    struct Case {
        Edit_Chan_Type type;
        Sub subtype;
        int at;
        unsigned count;
        bool before;
        const char* after;
    };
    for (const Case& c : {
             Case{AudioChan, Sub::NONE, 3, 2, true, "fx1 v1 v2 A1 A2 a1 a2"},
             Case{AudioChan, Sub::NONE, 3, 1, false, "fx1 v1 v2 a1 A2 a2"},
             Case{AudioChan, Sub::NONE, 4, 1, false, "fx1 v1 v2 a1 a2 A3"},
             Case{AudioChan, Sub::NONE, 2, 1, false, "fx1 v1 v2 A1 a1 a2"},
             Case{AudioChan, Sub::NONE, 1, 1, true, "fx1 v1 v2 a1 a2 A3"},
             Case{VideoChan, Sub::NONE, 0, 2, false, "fx1 V1 V2 v1 v2 a1 a2"},
             Case{VideoChan, Sub::NONE, 2, 1, false, "fx1 v1 v2 V3 a1 a2"},
             Case{VideoChan, Sub::NONE, NO_CHAN, 1, true, "fx1 v1 v2 V3 a1 a2"},
             Case{VideoChan, Sub::NONE, 99, 1, false, "fx1 v1 v2 V3 a1 a2"},
             Case{VideoChan, Sub::NONE, -1, 1, false, "fx1 v1 v2 V3 a1 a2"},
             Case{VideoChan, Sub::ALIAS, 0, 1, true, "FX1 fx1 v1 v2 a1 a2"},
             Case{VideoChan, Sub::ALIAS, 0, 1, false, "fx1 FX2 v1 v2 a1 a2"},
         }) {
        const EditPtr edit = EditBuilder().effects(1).video(2).audio(2).build();
        fixNames(*edit);
        const uint64_t count = edit->getModificationCount();
        EXPECT_TRUE(edit->insertChans(c.type, c.subtype, c.at, c.count, c.before, false, 0));
        EXPECT_EQ(layout(*edit), c.after);
        EXPECT_TRUE(edit->get_dirty());
        EXPECT_EQ(edit->getModificationCount(), count) << "without notify the caller describes the change";
    }
}

TEST(Insertion, FillsNewChannelsToATime) {
    for (const auto& [time, end] :
         {std::pair(0.0, 0.0), std::pair(4.5, 4.5), std::pair(-1.0, 6.0), std::pair(-2.0, 0.0)}) {
        const EditPtr edit = EditBuilder().video(1).clips({2, -1, 3}).build();
        ASSERT_TRUE(edit->insertChans(AudioChan, Sub::NONE, NO_CHAN, 2, false, false, time));
        for (const int chan : {1, 2}) {
            EXPECT_DOUBLE_EQ(edit->get_edit_cel_p(chan)->get_end_time(), end) << time;
            EXPECT_TRUE(edit->isEmpty(chan));
        }
        EXPECT_NE(edit->get_edit_cel_p(1), edit->get_edit_cel_p(2));
        EXPECT_FALSE(edit->isEmpty());
    }
}

TEST(Insertion, RefusedChangesNothing) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const EditPtr edit = EditBuilder().video(23).audio(31).effects(1).clips({1}).build();
    const String before = editState(*edit);
    struct Case {
        Edit_Chan_Type type;
        Sub subtype;
        unsigned count;
        double time;
        const char* logged;
    };
    for (const Case& c :
         {Case{AudioChan, Sub::NONE, 2, 0, "Too many audio channels for <E0016001>\n"},
          Case{AudioChan, Sub::NONE, 0xFFFFFFFFU, 0, "Too many audio channels for <E0016001>\n"},
          Case{VideoChan, Sub::NONE, 2, 0, "Too many video channels for <E0016001>\n"},
          Case{VideoChan, Sub::ALIAS, 40000, 0, "Too many effects channels for <E0016001>\n"},
          Case{VideoChan, Sub::FX, 1, 0, ""}, Case{VideoChan, Sub::ANY, 1, 0, ""},
          Case{ControlChan, Sub::NONE, 1, 0, ""}, Case{TChan, Sub::NONE, 1, 0, ""},
          Case{AnyChan, Sub::ANY, 1, 0, ""}, Case{NoChan, Sub::INVALID, 1, 0, ""},
          Case{VideoChan, Sub::NONE, 0, 0, ""}, Case{VideoChan, Sub::NONE, 1, nan, ""},
          Case{VideoChan, Sub::NONE, 1, Qx::kNoTime, ""},
          Case{VideoChan, Sub::NONE, 1, cel::kGreatestTime + 1, ""}}) {
        const test::RecordingLog log;
        EXPECT_FALSE(edit->insertChans(c.type, c.subtype, NO_CHAN, c.count, false, true, c.time));
        EXPECT_EQ(log.log(), c.logged);
        EXPECT_EQ(editState(*edit), before);
    }
    EXPECT_EQ(edit->addChan(TChan), NO_CHAN);
    EXPECT_EQ(editState(*edit), before);
    EXPECT_TRUE(edit->insertChans(AudioChan, Sub::NONE, NO_CHAN, 1, false, true, 0));
    EXPECT_TRUE(edit->insertChans(VideoChan, Sub::NONE, NO_CHAN, 1, false, true, 0));
}

TEST(Insertion, NoIndexReachesNoChan) {
    const EditPtr edit = EditBuilder().audio(1).build();
    const test::RecordingLog log;
    const unsigned most = NO_CHAN - 1;
    ASSERT_TRUE(edit->insertChans(VideoChan, Sub::ALIAS, NO_CHAN, most, false, false, 0));
    EXPECT_FALSE(edit->addLevelsChan(edit->getId(NO_CHAN - 1), AudLevelsCel::create()).valid());
    for (const auto& [type, subtype] : {std::pair{VideoChan, Sub::ALIAS}, std::pair{VideoChan, Sub::NONE},
                                        std::pair{AudioChan, Sub::NONE}}) {
        EXPECT_EQ(edit->addChan(type, nullptr, true, subtype), NO_CHAN);
    }
    EXPECT_EQ(edit->getNumChans(), NO_CHAN);
    EXPECT_TRUE(edit->removeChans(false));
}

TEST(Channels, RefusedChangesOfThemChangeNothing) {
    const EditPtr edit = EditBuilder().video(1).audio(2).levels(1).clips({1}).build();
    const EditPtr other = EditBuilder().audio(1).levels(1).build();
    const String before = editState(*edit);
    const IdStamp unknown = IdStamp::fresh(IdStampMagic::Channel);
    const IdStamp video = edit->getId(0);
    const IdStamp levels = edit->getId(3);
    cel spare;
    EXPECT_FALSE(edit->set_edit_cel_p(0, nullptr));
    EXPECT_FALSE(edit->set_edit_cel_p(3, &spare));
    EXPECT_FALSE(edit->set_edit_cel_p(NO_CHAN, &spare));
    EXPECT_FALSE(edit->cacheCelForTrack(unknown, &spare));
    EXPECT_FALSE(edit->cacheCelForTrack(levels, &spare));
    EXPECT_FALSE(edit->setChannelID(video, IdStamp()));
    EXPECT_FALSE(edit->setChannelID(video, levels));
    EXPECT_FALSE(edit->setChannelID(unknown, unknown));
    EXPECT_FALSE(edit->addLevelsChan(video, AudLevelsCel::create()).valid());
    EXPECT_FALSE(edit->addLevelsChan(edit->getId(1), AudLevelsCel::create()).valid()) << "it has levels";
    EXPECT_FALSE(edit->addLevelsChan(edit->getId(2), AudLevelsCel::createInvalid()).valid());
    EXPECT_FALSE(edit->setupEditChannel({ControlChan, Sub::NONE}, std::make_shared<cel>()).valid());
    EXPECT_FALSE(edit->setupEditChannel({VideoChan, Sub::NONE}, nullptr).valid());
    EXPECT_FALSE(edit->setAudCel(other->getAudCel(other->getId(0))));
    AudCel audio = edit->getAudCel(edit->getId(2));
    audio.setLevelsChanID(levels);
    EXPECT_FALSE(edit->setAudCel(audio)) << "the levels are another channel's";
    audio.setLevelsChanID(video);
    EXPECT_FALSE(edit->setAudCel(audio));
    EXPECT_FALSE(edit->setChanName(unknown, "x"));
    EXPECT_FALSE(edit->setChanName(video, "a\nb"));
    EXPECT_FALSE(edit->setChanName(video, "\xFF"));
    EXPECT_FALSE(edit->setSyncLoss(video, std::numeric_limits<double>::quiet_NaN()));
    EXPECT_FALSE(edit->setSyncLoss(unknown, 1));
    EXPECT_FALSE(edit->setMaterialInfo(unknown, "x"));
    EXPECT_EQ(editState(*edit), before);
}

TEST(Channels, OfAReadOnlyEditAreNotChanged) {
    const EditPtr edit = EditBuilder().video(1).audio(3).levels(1).clips({1}).build();
    const IdStamp a1 = edit->getId(1), a2 = edit->getId(2), a3 = edit->getId(3);
    ASSERT_TRUE(edit->groupChannels({a1, a2}, ChannelGroup::eStereo));
    edit->get_cues().add_cue_point(cue_point("x", 0, 0, 0, {}, false));
    edit->set_read_only(true);
    edit->set_dirty(false);
    const String before = editState(*edit);
    cel spare;
    AudCel muted = edit->getAudCel(a1);
    muted.setSoundOutputEnabled(false);
    const std::vector<std::function<bool()>> changes{
        [&] { return edit->insertChans(AudioChan, Sub::NONE, NO_CHAN, 1, false, true, 0); },
        [&] { return edit->addChan(VideoChan) != NO_CHAN; },
        [&] { return edit->addLevelsChan(a2, AudLevelsCel::create()).valid(); },
        [&] { return edit->removeChan(a1, true) || edit->removeChans(true); },
        [&] { return edit->set_edit_cel_p(0, &spare) || edit->setAudCel(muted); },
        [&] { return edit->setChanName(a1, "x") || edit->setMaterialInfo(a1, "x"); },
        [&] {
            return edit->setSyncLoss(a1, 1) || edit->setChannelID(a1, IdStamp::fresh(IdStampMagic::Channel));
        },
        [&] {
            return edit->groupChannels({a1, a3}, ChannelGroup::ePlain) || edit->removeFromGroup(a1);
        },
        [&] { return edit->ungroupChannels(a1) || edit->ungroupAllChannels(); },
        [&] { return edit->deleteCues(-1) || edit->deleteCue(0); },
    };
    for (size_t i = 0; i < changes.size(); ++i) {
        const test::RecordingLog log;
        EXPECT_FALSE(changes[i]()) << i;
        EXPECT_TRUE(log.contains("Mild warning: attempt to dirty read-only edit")) << i;
        EXPECT_EQ(editState(*edit), before) << i;
    }
    edit->setTemporary(true);
    EXPECT_TRUE(edit->removeChans(true)) << "a temporary edit has nothing to lose";
}

TEST(Channels, KeepTheirPropertiesThroughChangesOfCelAndStamp) {
    const EditPtr edit = EditBuilder().audio(1).levels(1).clips({1}).build();
    const IdStamp old = edit->getId(0);
    AudCel audio = edit->getAudCel(old);
    audio.setSoundOutputEnabled(false);
    EXPECT_TRUE(edit->setAudCel(audio));
    EXPECT_TRUE(edit->setChanName(old, "Böhm"));
    EXPECT_TRUE(edit->setSyncLoss(old, -0.04));
    cel* const fresh = new cel;
    EXPECT_TRUE(edit->set_edit_cel_p(0, fresh));
    EXPECT_EQ(edit->getCel(old), fresh);
    const IdStamp stamp = IdStamp::fresh(IdStampMagic::Channel);
    EXPECT_TRUE(edit->setChannelID(old, stamp));
    const IdStamp levels = IdStamp::fresh(IdStampMagic::Channel);
    EXPECT_TRUE(edit->setChannelID(edit->getId(1), levels));

    EXPECT_EQ(edit->getIdx(old), NO_CHAN);
    EXPECT_EQ(edit->getChanName(stamp), "Böhm");
    EXPECT_EQ(edit->getSyncLoss(stamp), -0.04);
    EXPECT_FALSE(edit->getAudCel(stamp).getSoundOutputEnabled());
    EXPECT_EQ(edit->getAudCel(stamp).getLevelsChanID(), levels);
    EXPECT_EQ(edit->getCel(stamp), fresh);

    cel shown;
    EXPECT_TRUE(edit->cacheCelForTrack(stamp, &shown));
    EXPECT_EQ(edit->getCel(stamp), &shown);
    EXPECT_EQ(edit->get_edit_cel_p(0), fresh);
    EXPECT_TRUE(edit->cacheCelForTrack(stamp, nullptr));
    EXPECT_EQ(edit->getCel(stamp), fresh);
}

TEST(Extent, SkipsChannelsThatHoldNothing) {
    const EditPtr edit = EditBuilder().video(2).audio(1).levels(1).build();
    EXPECT_EQ(edit->getStartTime(), 0.0);
    EXPECT_EQ(edit->getEndTime(), 0.0);
    edit->get_edit_cel_p(1)->appendEventPair(black_cookie, 0, 5, 2);
    EXPECT_EQ(edit->getStartTime(), 5.0);
    EXPECT_EQ(edit->getEndTime(), 7.0);
    EXPECT_LE(edit->get_start_or_end_time(true, true), 1.0) << "the levels have a node at 1";
}

TEST(Copy, IsDeepAndKeepsStamps) {
    const EditPtr edit = EditBuilder().effects(1).video(1).audio(2).levels(1).clips({2, -1}).build();
    edit->setName("Reel one");
    edit->setSyncLoss(edit->getId(2), 0.5);
    edit->setMaterialInfo(edit->getId(1), "info");
    edit->groupChannels({edit->getId(2), edit->getId(3)}, ChannelGroup::eStereo);
    Vector<cel*> cels(4, nullptr);
    cels[1] = edit->get_edit_cel_p(1);
    edit->get_cues().add_cue_point("cue", 1, 1, 0, cels, true);
    edit->set_mark_time(0, 1.5);
    edit->set_current_time(0, 2.5);
    const String before = editState(*edit);

    EditPtr copy = edit->copy();
    EXPECT_EQ(test::contentState(*copy), test::contentState(*edit));
    EXPECT_TRUE(copy->Opts() == edit->Opts());
    EXPECT_EQ(copy->get_cookie(), invalid_cookie);
    EXPECT_FALSE(copy->get_dirty());
    EXPECT_EQ(copy->refCount(), 1);

    copy->get_edit_cel_p(1)->remove({0, 1});
    copy->getLevelsCel(copy->getId(4)).changeNodeStore().insertNode(9, 0.25F);
    copy->ungroupAllChannels();
    copy->updateCues();
    copy->setChanName(copy->getId(1), "other");
    EXPECT_EQ(editState(*edit), before);
    EXPECT_EQ(copy->get_cues().get_cue_point(0, 0)->event().get_its_cel(), copy->get_edit_cel_p(1));
}

} // namespace
