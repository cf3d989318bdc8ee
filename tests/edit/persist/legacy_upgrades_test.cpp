#include "edit/material/log_attributes.h"
#include "edit/model/edit_upgrade.h"
#include "edit_samples.h"
#include "platform/media/edit_label.h"
#include "platform/media/frame_rate.h"
#include "platform/store/edit_header_proxy.h"
#include "support/recording_log.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>
#include <set>

namespace {

// Edits of older revisions, made as stores and read through the upgrade.
class LegacyUpgradesTest : public testing::Test {
protected:
    [[nodiscard]] WString path() const { return Qx::widen(folder.path("E0001000.qme")); }

    // Puts the content of an edit into a store that says that it is of a revision.
    void writeAs(Edit& edit, int revision, const std::function<void(configb&)>& adjust = {}) {
        edit.set_cookie(cookie(test::kItem));
        edit.init_dirty();
        ASSERT_TRUE(edit.write_file(path())) << edit.lastFileError();
        TagBag bag;
        ASSERT_EQ(bag.open(cookie(test::kItem), folder.path(), eOpenExisting, ".qme"), TagBag::Opened);
        configb header = edit.Opts();
        header.setInt("ED2_REVISION", revision);
        if (adjust) {
            adjust(header);
        }
        bag.storeObject(EditHeaderProxy::EditHeaderId, std::make_unique<EditHeaderProxy>(header));
        ASSERT_TRUE(bag.flush().isOk());
    }
    // One video channel, one audio channel with a ramp of 0.5 to 1 over two seconds and a flat second.
    static void addRamp(Edit& edit) {
        edit.addChan(VideoChan, nullptr, false);
        cel& content = *edit.get_edit_cel_p(edit.addChan(AudioChan, nullptr, false));
        content.appendEventPair(cookie("M0001000"), 0, 0, 2);
        content.appendEventPair(cookie("M0001000"), 5, 2, 1);
        ce_handle(&content, 0).set_strip_level(0.5F);
        ce_handle(&content, 2).set_strip_velocity(0.5);
    }

    test::TemporaryFolder folder;
    test::RecordingLog log;
};

constexpr MediumRollIdent kSound2{kSoundMedium, 2};
constexpr MediumRollIdent kSound3{kSoundMedium, 3};
const IdStamp kWrongId(1, 2, 3); // of an effect node, on a channel and on events
const IdStamp kMaterialId((uint32_t{IdStampMagic::Material} << 30) + 7, 7, 7);

/// Something for every step: a hidden effects channel, V1, A1 with a ramp, A2; all in 30 frames a second.
void fillOld(Edit& edit, void (*addRamp)(Edit&)) {
    addRamp(edit);
    edit.addChan(AudioChan, nullptr, false);
    edit.addChan(VideoChan, nullptr, false, Edit_Chan_SubType::ALIAS);
    cel& picture = *edit.get_edit_cel_p(1);
    picture.appendEventPair(cookie("M0001000"), 10, 0, 1);
    picture.appendEventPair(black_cookie, 0, 1, 1);
    channel_event event = picture.get_event(0);
    event.id = kMaterialId;
    picture.setEvent(0, event);
    for (int i = 0; i < 4; ++i) {
        event = edit.get_edit_cel_p(2)->get_event(i);
        event.id = kWrongId;
        edit.get_edit_cel_p(2)->setEvent(i, event);
    }
    ASSERT_TRUE(edit.setChannelID(edit.getId(3), kWrongId));
    edit.objectStore().storeObject(kMaterialId.asString(), std::make_unique<cue_list>());
}

void oldHeader(configb& header) {
    const label::Scale scale = label::Scale::timecode(Qx::FrameRate(Qx::FrameRate::Fps30));
    const edit_label sound(kSound3, label(scale, 1000), 0, scale.rate);
    header.setString("CHAN_GRPS", "A1A2");
    header.setInt("FRAME_RATE", Qx::FrameRate::Fps30);
    header.setInt("numLabels_", 3);
    header.setString("LABEL0", sound.make_keep_string());
    header.setString("LABEL1", "KK1 2 1 0 24 KJ 12 3456 7890+12");
    // The tape that an edit was laid off to tells its own timecode.
    const edit_label tape({kVideoTapeMedium, 1}, label(scale, 108000), 0, scale.rate);
    header.setString("LABEL2", tape.make_keep_string());
    header.setInt("NUM_MEDIUMROLLS", 3);
    header.setString("MEDIUMROLL0", "2 1 CAM1");
    header.setString("MEDIUMROLL1", "3 1 TAPE");
    header.setString("MEDIUMROLL2", "4 3 SND7");
}

// What every revision must become is worked out here from its number, event by event.
TEST_F(LegacyUpgradesTest, EveryRevisionBecomesWhatItIsToBe) {
    for (const int revision : {100, 160, 210, 225, 235, 290, 305, 400, 500, 501, 503, 600, 602}) {
        SCOPED_TRACE(revision);
        Edit edit;
        fillOld(edit, addRamp);
        writeAs(edit, revision, oldHeader);
        log.clear();
        Edit read(path(), eOpenExisting);
        ASSERT_FALSE(read.isBad()) << read.lastFileError();
        const bool isOld = revision < 501;
        const bool isHidden = revision >= 220;
        EXPECT_EQ(read.get_ed2_revision(), isOld ? 602 : revision);
        EXPECT_EQ(read.isDirty(true), isOld);
        ASSERT_EQ(read.lastUpgrade() != nullptr, isOld);
        if (isOld) {
            EXPECT_EQ(read.lastUpgrade()->from, revision);
            EXPECT_TRUE(read.lastUpgrade()->notDone.empty()) << read.lastUpgrade()->notDone.front();
        }
        ASSERT_EQ(read.getNumChans(), 3 + (isHidden ? 1 : 0) + (revision < 310 ? 1 : 0));
        const int first = isHidden ? 1 : 0;
        std::set<IdStamp> ids;
        for (int chan = 1; chan <= 2; ++chan) {
            const cel& before = *edit.get_edit_cel_p(chan);
            const cel& after = *read.get_edit_cel_p(chan - 1 + first);
            ASSERT_EQ(after.numEvents(), before.numEvents());
            for (int i = 0; i < before.numEvents(); ++i) {
                channel_event wanted = before.get_event(i);
                const channel_event event = after.get_event(i);
                const double factor = isOld ? 1.001 : 1;
                EXPECT_NEAR(event.editTime, wanted.editTime * factor, 1e-9);
                // At another speed the out point shows another time.
                const bool isSpedUp = i % 2 == 1 && event.velocity != wanted.velocity;
                EXPECT_NEAR(event.stripTime,
                            isSpedUp ? after.get_event(i - 1).stripTime + event.editTime -
                                           after.get_event(i - 1).editTime
                                     : wanted.stripTime * factor,
                            1e-9);
                EXPECT_EQ(event.velocity, revision < 310 && chan == 2 ? 1.0 : wanted.velocity);
                EXPECT_EQ(event.level, revision < 310 && chan == 2 ? 1.0F : wanted.level);
                EXPECT_EQ(event.strip, wanted.strip);
                ids.insert(event.id);
                if (revision >= 300 || wanted.id == kMaterialId) {
                    EXPECT_EQ(event.id, wanted.id);
                }
            }
        }
        EXPECT_EQ(ids.size(), revision < 300 ? 8U : 5U) << "each event, or those of one stamp, has its own";
        EXPECT_EQ(log.contains("Fixed "), revision < 300);
        EXPECT_EQ(read.getId(first + 2).getMagicType(),
                  revision < 230 ? IdStampMagic::Channel : IdStampMagic::EffectNode);
        EXPECT_EQ(read.objectStore().contains(kMaterialId.asString()), revision >= 230);
        EXPECT_EQ(read.Opts().contains("CHAN_GRPS"), revision >= 240);
        EXPECT_EQ(read.numGroups(), revision < 230 ? 1U : 0U) << "of channels that have a channel's stamp";
        EXPECT_EQ(read.getFrameRate().code(), isOld ? Qx::FrameRate::Fps29_97 : Qx::FrameRate::Fps30);
        EXPECT_EQ(read.labels().size(), isOld ? 4U : 3U) << "its own timecode in 24 came";
        EXPECT_EQ(read.get_label_(kTimecodeLabelType, {kEditMedium, 0}).labelAt(1.001).asString(),
                  "01:00:01:00");
        EXPECT_EQ(read.get_label_(kTimecodeLabelType, {kEdit24Medium, 0}).labelAt(1.001).asString(),
                  isOld ? "01:00:01:00" : "00:00:01:00");
        EXPECT_EQ(read.getStartTimecode(), isOld ? 108000 : 0);
        EXPECT_EQ(read.get_label_(kTimecodeLabelType, kSound2).is_valid(), isOld);
        for (const edit_label& label : read.labels()) {
            if (isOld && label.user_type() == kTimecodeLabelType) {
                EXPECT_EQ(label.rate(), read.getFrameRate()) << label.make_keep_string();
            }
        }
        EXPECT_EQ(read.get_label_(kTimecodeLabelType, kSound3).is_valid(), !isOld);
        EXPECT_EQ(read.get_label_(kKeyKodeLabelType, {kCameraMedium, 0}).labelAt(1).asString(),
                  "KJ 12 3456 7892+04");
        const bool isMoved = isOld && revision >= 160;
        EXPECT_EQ(read.get_reelid(kSound2), isMoved ? "SND7" : "");
        EXPECT_EQ(read.get_reelid(kSound3), isMoved ? "" : "SND7");
        if (isOld) {
            ASSERT_TRUE(read.write_file(path())) << read.lastFileError();
            const Edit again(path(), eOpenExisting);
            EXPECT_EQ(again.lastUpgrade(), nullptr);
            EXPECT_EQ(again.labels().size(), 4U);
        }
    }
}

TEST_F(LegacyUpgradesTest, ARampBecomesNodes) {
    Edit edit;
    addRamp(edit);
    writeAs(edit, 300);
    const Edit read(path(), eOpenExisting);
    ASSERT_EQ(read.getNumChans(), 3);
    const auto& nodes = read.getLevelsCel(read.getId(2)).getNodeStore().nodes();
    ASSERT_EQ(nodes.size(), 2U);
    EXPECT_EQ(nodes[0], (Aud::DynamicLevelControl::Node{0, 0.5F}));
    EXPECT_EQ(nodes[1], (Aud::DynamicLevelControl::Node{2, 1}));
    EXPECT_EQ(read.getAudCel(read.getId(1)).getLevelsChanID(), read.getId(2));
    for (int i = 0; i < 4; ++i) {
        EXPECT_EQ(read.get_edit_cel_p(1)->get_event(i).level, 1.0F);
    }
}

TEST_F(LegacyUpgradesTest, RampsThatMeetAreKeptApartByAQuarterFrame) {
    const double quarter = Qx::projectFrameRate().frameDuration() / 4;
    Edit edit;
    edit.addChan(VideoChan, nullptr, false);
    cel& content = *edit.get_edit_cel_p(edit.addChan(AudioChan, nullptr, false));
    const float levels[] = {0.5F, 0.75F, 0.25F, 0.5F, 2, 3, 1, 1}; // the last pair is flat
    for (int i = 0; i < 8; ++i) {
        if (i % 2 == 0) {
            content.appendEventPair(cookie("M0001000"), 0, 1 + i, 2);
        }
    }
    for (int i = 0; i < 8; ++i) {
        ce_handle(&content, i).set_strip_level(levels[i]);
    }
    writeAs(edit, 300);
    const Edit read(path(), eOpenExisting);
    ASSERT_EQ(read.getNumChans(), 3);
    const auto& store = read.getLevelsCel(read.getId(2)).getNodeStore();
    const std::pair<double, float> expected[] = {{1 - quarter, 1}, {1, 0.5F}, {3 - quarter, 0.75F},
                                                 {3, 0.25F},       {5, 0.5F}, {5 + quarter, 2},
                                                 {7 - quarter, 3}, {7, 1}};
    for (const auto& [time, level] : expected) {
        EXPECT_NEAR(store.levelAt(time), static_cast<double>(level), 1e-6) << time;
    }
}

TEST_F(LegacyUpgradesTest, OldRatesScaleEveryTime) {
    Edit edit;
    addRamp(edit);
    edit.addLevelsChan(edit.getId(1), [] {
        AudLevelsCel levels = AudLevelsCel::create();
        levels.insertNode(1, 0.5F);
        levels.insertNode(2, 1);
        return levels;
    }());
    cue_point cue;
    cue.setEditTime(1);
    cue.setSecondTime(2);
    cue.setFlags(CueFlag::kKept | CueFlag::kInside);
    edit.get_cues().add_cue_point(cue);
    const struct {
        int from, to;
        double factor;
    } rates[] = {{Qx::FrameRate::Fps30, Qx::FrameRate::Fps29_97, 1.001},
                 {Qx::FrameRate::Fps23_976, Qx::FrameRate::Fps24, 1 / 1.001},
                 {Qx::FrameRate::Fps25, Qx::FrameRate::Fps25, 1}};
    for (const auto& [from, to, factor] : rates) {
        SCOPED_TRACE(from);
        writeAs(edit, 400, [rate = from](configb& header) { header.setInt("FRAME_RATE", rate); });
        const Edit read(path(), eOpenExisting);
        ASSERT_FALSE(read.isBad()) << read.lastFileError();
        EXPECT_EQ(read.getFrameRate().code(), to);
        const double frame = Qx::projectFrameRate().frameDuration(); // cels are rounded to its frames
        EXPECT_NEAR(read.get_edit_cel_p(1)->get_end_time(), 3 * factor, frame / 2 + 1e-9);
        EXPECT_NEAR(read.getLevelsCel(read.getId(2)).getNodeStore()[1].time, 2 * factor, 1e-12);
        EXPECT_NEAR(read.get_cues().get_cue_point(0, 0)->editTime(), factor, 1e-12);
        EXPECT_NEAR(read.get_cues().get_cue_point(0, 0)->secondTime(), 2 * factor, 1e-12);
    }
}

TEST_F(LegacyUpgradesTest, ATextIsBroughtUpToDate) {
    Edit edit;
    addRamp(edit);
    oldHeader(edit.Opts());
    edit.setFrameRate(Qx::FrameRate(Qx::FrameRate::Fps25));
    const WString text = Qx::widen(folder.path("E0001000.ED2"));
    ASSERT_TRUE(edit.writeToLegacyFile(text)) << edit.lastFileError();
    const Edit read(text, eOpenExisting);
    ASSERT_FALSE(read.isBad()) << read.lastFileError();
    EXPECT_EQ(read.get_ed2_revision(), 602);
    EXPECT_TRUE(read.isDirty(false));
    ASSERT_EQ(read.getNumChans(), 3);
    EXPECT_EQ(read.get_edit_cel_p(1)->get_event(2).velocity, 1.0);
    EXPECT_EQ(read.getLevelsCel(read.getId(2)).getNodeStore().nodes().size(), 2U);
    EXPECT_TRUE(read.get_label_(kTimecodeLabelType, kSound2).is_valid());
    EXPECT_EQ(read.get_reelid(kSound2), "SND7");
    EXPECT_TRUE(read.get_label_(kTimecodeLabelType, {kEdit24Medium, 1}).is_valid());
    ASSERT_NE(read.lastUpgrade(), nullptr);
    EXPECT_EQ(read.lastUpgrade()->from, 0);
}

TEST_F(LegacyUpgradesTest, AShotGetsItsPicturesItsMediumAndTheSpeedOfItsSound) {
    const struct {
        const char* standard;
        int audioMediumBefore, medium, audioMedium;
        double duration, factor;
        const char* pictures;
    } cases[] = {
        {"pal", 2, 1, 2, 4, 1, "720x576 interlaced YUY2"},
        {"pal_24", 0, 24, 2, 4, 25 / 24.0, "720x576 interlaced YUY2"},
        {"pal_24", 2, 23, 3, 4.004, 25 * 1.001 / 24, "720x576 interlaced YUY2"},
        {"ntsc", 0, 3, 3, 4, 25 * 1.001 / 30, "720x486 interlaced YUY2"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.standard);
        Edit edit;
        edit.addChan(VideoChan, nullptr, false);
        edit.get_edit_cel_p(0)->appendEventPair(cookie("M0001000"), 0, 0, 4);
        writeAs(edit, 400, [&](configb& header) {
            header.setInt("ORIGINAL_MATERIAL", 1);
            header.setString("tvtype", c.standard);
            header.setInt("TRANSFER", 7);
            header.setInt("TRANSFER_AUDIO_MEDIUM", c.audioMediumBefore);
        });
        const Edit read(path(), eOpenExisting);
        ASSERT_TRUE(read.isShot());
        EXPECT_EQ(read.getSourceMedium(), c.medium);
        EXPECT_EQ(read.Opts().getInt("TRANSFER_AUDIO_MEDIUM"), c.audioMedium);
        EXPECT_NEAR(read.getSourceMediumDuration(), c.duration, 1e-9);
        EXPECT_NEAR(read.Opts().getDouble("FILM_SYNC_FACTOR"), c.factor, 1e-12);
        EXPECT_EQ(read.getAttribute(LogAttribute::kSourceFormat), c.pictures);
        EXPECT_EQ(read.Opts().getInt("TRANSFER"), 7) << "is remembered over the upgrade";
        EXPECT_TRUE(read.labels().empty()) << "a shot gets no labels of an edit";
    }
    Edit shot;
    addRamp(shot);
    writeAs(shot, 400, [](configb& header) {
        header.setInt("ORIGINAL_MATERIAL", 1);
        header.setString("tvtype", "pal_24");
        header.setDouble("TRANSFER_FILM_SPEED", -1);
    });
    const Edit read(path(), eOpenExisting);
    EXPECT_TRUE(log.contains("ED2 IMPORT - legacy edit has invalid audio-rate factors"));
}

} // namespace
