#include "edit_samples.h"
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

TEST_F(LegacyUpgradesTest, EachRevisionRunsItsSteps) {
    struct Case {
        int revision;
        bool ramps, ids, groups, stamps, becomesCurrent;
    };
    const Case cases[] = {{601, false, false, false, false, false}, {501, false, false, false, false, false},
                          {500, false, false, false, false, true},  {310, false, false, false, false, true},
                          {300, true, false, false, false, true},   {299, true, true, false, false, true},
                          {239, true, true, true, false, true},     {229, true, true, true, true, true}};
    for (const Case& c : cases) {
        SCOPED_TRACE(c.revision);
        Edit edit;
        addRamp(edit);
        edit.addChan(AudioChan, nullptr, false);
        const IdStamp wrongId(1, 2, 3); // of an effect node, on a channel and on events
        for (int i = 0; i < 4; ++i) {
            channel_event event = edit.get_edit_cel_p(1)->get_event(i);
            event.id = wrongId;
            edit.get_edit_cel_p(1)->setEvent(i, event);
        }
        ASSERT_TRUE(edit.setChannelID(edit.getId(2), wrongId));
        writeAs(edit, c.revision, [](configb& header) { header.setString("CHAN_GRPS", "A1A2"); });
        const Edit read(path(), eOpenExisting);
        ASSERT_FALSE(read.isBad()) << read.lastFileError();
        EXPECT_EQ(read.getNumChans(), c.ramps ? 4 : 3);
        EXPECT_EQ(read.get_edit_cel_p(1)->get_event(2).velocity, c.ramps ? 1.0 : 0.5);
        std::set<IdStamp> ids;
        for (int i = 0; i < 4; ++i) {
            ids.insert(read.get_edit_cel_p(1)->get_event(i).id);
        }
        EXPECT_EQ(ids.size(), c.ids ? 4U : 1U);
        EXPECT_EQ(log.contains("Fixed "), c.ids);
        EXPECT_EQ(read.Opts().contains("CHAN_GRPS"), !c.groups);
        EXPECT_EQ(read.getId(2).getMagicType(), c.stamps ? IdStampMagic::Channel : IdStampMagic::EffectNode);
        EXPECT_EQ(read.numGroups(), c.stamps ? 1U : 0U);
        EXPECT_EQ(read.get_ed2_revision(), c.becomesCurrent ? 602 : c.revision);
        EXPECT_EQ(read.isDirty(false), c.becomesCurrent);
        log.clear();
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

TEST_F(LegacyUpgradesTest, WhatCannotBeBroughtUpToDateIsSaid) {
    Edit edit;
    edit.addChan(VideoChan, nullptr, false);
    edit.addChan(VideoChan, nullptr, false, Edit_Chan_SubType::ALIAS);
    edit.get_edit_cel_p(0)->appendEventPair(effect_graph_cookie, 0, 0, 1);
    writeAs(edit, 210, [](configb& header) {
        header.setString("LABEL0", "text");
        header.setInt("TRANSFER", 7);
    });
    const Edit read(path(), eOpenExisting);
    ASSERT_FALSE(read.isBad());
    for (const char* line :
         {"Edit::replaceLegacyEffects( E0001000 ) - ", "Edit::updateLegacyFileLabels( E0001000 ) - ",
          "Edit::makeMaterialNodesTransient( E0001000 ) - "}) {
        EXPECT_TRUE(log.contains(line)) << line;
    }
    EXPECT_EQ(read.getNumChans(), 2);
    EXPECT_EQ(read.Opts().getInt("TRANSFER"), 7);
    EXPECT_EQ(read.Opts().getString("LABEL0"), "text");
}

} // namespace
