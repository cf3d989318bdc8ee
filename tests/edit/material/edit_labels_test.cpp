#include "edit/material/label_kinds.h"
#include "edit/material/log_attributes.h"
#include "edit/material/qx_umid.h"
#include "edit/model/edit.h"
#include "platform/notify/val_server.h"
#include "platform/store/configb.h"
#include "support/recording_log.h"

#include <gtest/gtest.h>

namespace {

const Qx::FrameRate kRate(Qx::FrameRate::Fps25);

edit_label timecodeOn(const MediumRollIdent& roll, int64_t frames) {
    return {roll, label(label::Scale::timecode(kRate), frames), 0, kRate};
}

/// The media and roll numbers of an edit's labels.
String rollsOfLabels(const Edit& edit) {
    String text;
    for (const edit_label& label : edit.labels()) {
        text += String::format("%d.%d ", label.get_MediumRoll().medium, label.get_MediumRoll().number);
    }
    return text;
}

} // namespace

TEST(EditLabels, AreReadOutOfTheHeader) {
    const struct {
        int count; ///< -1 for no key
        std::vector<std::pair<int, MediumRollIdent>> labels;
        bool isShot;
        const char* bad; ///< text of label 7
        const char* read;
        const char* told;
        const char* untold;
    } cases[] = {
        {-1, {{0, {4, 1}}, {5, {2, 1}}}, true, "", "4.1 2.1 ", "", "expected label"},
        {0, {{5, {2, 1}}, {6, {4, 1}}}, true, "", "2.1 ", "", "expected label"},
        {2, {{1, {4, 1}}}, true, "", "4.1 ", "Edit::build_labels:  expected label 0 on E0001000\n", "badly"},
        {3, {{0, {4, 1}}, {1, {4, 1}}, {2, {13, 2}}}, true, "", "4.1 15.2 ", "", "expected"},
        {2, {{0, {3, 2}}, {1, {4, 1}}}, false, "", "8.1 4.1 ", "", "expected"},
        {2, {{0, {3, 2}}, {1, {4, 1}}}, true, "", "3.2 4.1 ", "", "expected"},
        {8, {{0, {4, 1}}}, true, "text", "4.1 ", "Edit::build_labels:  badly formed label 7\n", "label 0"},
        {2000000000, {{15, {4, 1}}, {16, {4, 2}}}, true, "", "4.1 ", "expected label 14", "label 16"},
    };
    for (const auto& c : cases) {
        const test::RecordingLog log;
        Edit edit;
        edit.set_cookie(cookie("E0001000"));
        edit.Opts().setInt("ORIGINAL_MATERIAL", c.isShot ? 1 : 0);
        if (c.count >= 0) {
            edit.Opts().setInt("numLabels_", c.count);
        }
        edit.Opts().setString("LABEL7", c.bad);
        for (const auto& [index, roll] : c.labels) {
            edit.Opts().setString(String::format("LABEL%d", index), timecodeOn(roll, 5).make_keep_string());
        }
        EXPECT_EQ(rollsOfLabels(edit), c.read) << c.count;
        EXPECT_TRUE(log.contains(c.told)) << c.count << c.told;
        EXPECT_FALSE(log.contains(c.untold)) << c.count << c.untold;
        // A change writes them all, and what did not read is kept.
        EXPECT_TRUE(edit.setLabel(timecodeOn({10, 1}, 1)));
        edit.clear_cache_flags();
        EXPECT_EQ(rollsOfLabels(edit), String(c.read) + "10.1 ");
        EXPECT_EQ(edit.Opts().getString("LabelUnread0"), c.bad);
    }
}

TEST(EditLabels, AreChangedWithinTheirLimitsAndLastInTheHeader) {
    Edit edit;
    edit.set_cookie(cookie("E0001000"));
    for (int i = 1; i <= 16; ++i) {
        EXPECT_TRUE(edit.setLabel(timecodeOn({2, i}, i)));
    }
    EXPECT_FALSE(edit.setLabel(timecodeOn({2, 17}, 1)));
    EXPECT_FALSE(edit.setLabel(edit_label()));
    const uint64_t count = edit.getModificationCount();
    EXPECT_TRUE(edit.setLabel(timecodeOn({2, 3}, 3))) << "is there already";
    EXPECT_EQ(edit.getModificationCount(), count);
    EXPECT_TRUE(edit.setLabel(timecodeOn({2, 3}, 77)));
    EXPECT_EQ(edit.getModificationCount(), count + 1);
    EXPECT_TRUE(edit.removeLabel(kTimecodeLabelType, {2, 1}));
    EXPECT_FALSE(edit.removeLabel(kTimecodeLabelType, {2, 1}));
    edit.clear_cache_flags();
    EXPECT_EQ(edit.labels().size(), 15U);
    EXPECT_EQ(edit.get_label_(kTimecodeLabelType, {2, 3}).first().frames(), 77);
    EXPECT_EQ(edit.get_label_(kAnyLabelType, {1, 0}).get_MediumRoll().number, 2) << "the first of any roll";
    EXPECT_FALSE(edit.get_label_(kKeyKodeLabelType, {2, 0}).is_valid());
    EXPECT_EQ(edit.copy()->labels().size(), 15U);
    for (int i = 2; i <= 16; ++i) {
        EXPECT_TRUE(edit.removeLabel(kAnyLabelType, {2, i}));
    }
    edit.clear_cache_flags();
    EXPECT_TRUE(edit.labels().empty()) << "none comes back";
    edit.set_read_only(true);
    EXPECT_FALSE(edit.setLabel(timecodeOn({2, 1}, 1)));
    EXPECT_FALSE(edit.give_new_edit_all_its_labels());
    EXPECT_TRUE(edit.labels().empty());
}

TEST(EditLabels, OwnTimecodeFollowsTheStart) {
    EditPtr edit(new Edit);
    edit->set_cookie(cookie("E0001000"));
    edit->setFrameRate(Qx::FrameRate(Qx::FrameRate::Fps29_97));
    edit->setDropFrame(true);
    edit->setStartTimecode(107892 + 15); // 01:00:00;15
    const UserLabelSpec own{kTimecodeLabelType, {kEditMedium, 0}};
    const UserLabelSpec own24{kTimecodeLabelType, {kEdit24Medium, 0}};
    for (const bool isStored : {false, true}) {
        EXPECT_EQ(edit->labels().size(), isStored ? 2U : 0U);
        EXPECT_EQ(FM_get_edit_label(edit, own).labelAt(1.001).asString(), "01:00:01;15");
        EXPECT_EQ(FM_get_edit_label(edit, own24).labelAt(1.001).asString(), "01:00:01:12");
        EXPECT_EQ(edit->give_new_edit_all_its_labels(), !isStored);
    }
    edit->setStartTimecode(0);
    edit->clear_cache_flags();
    EXPECT_EQ(edit->labels().front().labelAt(0).asString(), "00:00:00;00");
    EXPECT_FALSE(FM_get_edit_label(EditPtr(), own).is_valid());
}

TEST(EditRolls, AreReadAndKeepTheirReels) {
    const test::RecordingLog log;
    Edit edit;
    edit.set_cookie(cookie("E0001000"));
    EXPECT_TRUE(edit.rolls().empty());
    EXPECT_TRUE(log.contains("Edit::build_rolls:  E0001000: V3 ED2 with bad roll-count\n"));
    EXPECT_TRUE(log.contains("Edit::build_rolls:  expected roll 5 on \n"));
    edit.Opts().setInt("NUM_MEDIUMROLLS", 4);
    const char* const texts[] = {"2 1 CAM", "3 1 TAPE", "4 1 SND", "no roll"};
    for (int i = 0; i < 4; ++i) {
        edit.Opts().setString(String::format("MEDIUMROLL%d", i), texts[i]);
    }
    edit.clear_cache_flags();
    EXPECT_EQ(edit.get_reelid({3, 1}), "TAPE");
    EXPECT_TRUE(log.contains("badly formed MediumRoll 3\n"));
    EXPECT_TRUE(edit.setAttribute(LogAttribute::kReel, "A001"));
    EXPECT_TRUE(edit.set_reelid({4, 1}, "B"));
    EXPECT_FALSE(edit.set_reelid({2, 1}, "B")) << "has the edit's own";
    EXPECT_FALSE(edit.set_reelid({4, 0}, "B"));
    EXPECT_FALSE(edit.set_reelid({4, 1}, "two\nlines"));
    EXPECT_TRUE(edit.set_reelid({10, 1}, "LAB"));
    edit.clear_cache_flags();
    EXPECT_EQ(edit.get_reelid({2, 1}) + edit.get_reelid({3, 1}) + edit.get_reelid({4, 1}), "A001A001B");
    EXPECT_EQ(edit.Opts().getString("MEDIUMROLL3"), "10 1 LAB");
    EXPECT_EQ(edit.Opts().getString("RollUnread0"), "no roll");
    edit.set_ed2_revision(159);
    edit.clear_cache_flags();
    EXPECT_TRUE(edit.rolls().empty());
}

TEST(EditAttributes, AreSetTogetherOrNotAtAll) {
    Edit edit;
    edit.set_cookie(cookie("E0001000"));
    edit.setChangeDescription(kInitial, false);
    int told = 0;
    const auto listening =
        edit.getChangeDescriptionServer().addListener([&told](const EditModification&) { ++told; });
    LogAttributes::Map map;
    map.add(LogAttributes::kName, "Reel one");
    map.add(LogAttributes::kScene, "12A");
    map.add(LogAttributes::kReel, "A\n1");
    const uint64_t count = edit.getModificationCount();
    const struct {
        LogAttribute attribute;
        const char* text;
    } refused[] = {{LogAttribute::kReel, "A\n1"},    {LogAttribute::kDate, "2026"},
                   {LogAttribute{99}, "x"},          {LogAttribute::kChans, "V1"},
                   {LogAttribute::kNoAttribute, ""}, {LogAttribute::kCookie, "E9"}};
    for (const auto& c : refused) {
        LogAttributes::Map bad = map;
        bad.add(LogAttribute::kReel, "A1");
        bad.add(c.attribute, c.text);
        EXPECT_FALSE(edit.setAttributes(bad)) << static_cast<uint32_t>(c.attribute);
        EXPECT_EQ(edit.getName() + edit.getAttribute(LogAttribute::kScene), "");
    }
    map.add(LogAttributes::kReel, "A1");
    EXPECT_TRUE(edit.setAttributes(map));
    EXPECT_EQ(edit.getModificationCount(), count + 1);
    EXPECT_EQ(told, 1);
    EXPECT_EQ(edit.getName(), "Reel one");
    EXPECT_EQ(edit.Opts().getString("scene"), "12A");
    EXPECT_EQ(edit.get_Natural_reelid(), "A1");
    EXPECT_TRUE(edit.setAttributes(map));
    EXPECT_EQ(edit.getModificationCount(), count + 1) << "they are there";
    edit.set_original_material(1);
    EXPECT_TRUE(edit.setAttribute(LogAttribute::kName, "12A/3"));
    EXPECT_EQ(edit.Opts().getString("slate/take"), "12A/3");
    EXPECT_EQ(edit.getName(), "Reel one");
    edit.set_read_only(true);
    EXPECT_FALSE(edit.setAttribute(LogAttribute::kScene, "13"));
    EXPECT_EQ(edit.getAttribute(LogAttribute::kScene), "12A");
}

TEST(EditOrigin, IsKeptWithItsChannel) {
    Edit edit;
    edit.addChan(VideoChan);
    const QxUMID umid = QxUMID::create(QxUMIDDefs::MaterialType::ePicture);
    const IdStamp other = IdStamp::fresh(IdStampMagic::Channel);
    EXPECT_FALSE(edit.setTrackOriginInfo(other, umid));
    EXPECT_TRUE(edit.setTrackOriginInfo(edit.getId(0), umid));
    EXPECT_TRUE(edit.setChannelID(edit.getId(0), other));
    EXPECT_EQ(edit.getTrackOriginInfo_UMID(other), umid);
    EXPECT_EQ(edit.copy()->getTrackOriginInfo_UMID(other), umid);
    EXPECT_TRUE(edit.setTrackOriginInfo(other, QxUMID()));
    EXPECT_FALSE(edit.getTrackOriginInfo_UMID(other).valid());
}
