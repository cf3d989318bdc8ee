#include "cue_fixture.h"
#include "edit/model/channel_group_list.h"
#include "platform/store/tag_bag.h"

#include <gtest/gtest.h>

using test::marker;
using test::texts;

namespace {

constexpr auto kPlain = Edit_Chan_SubType::NONE;

/// A video and an audio channel with a ten-second pair each, and a cel cue on the first.
EditPtr cuedEdit() {
    EditPtr edit(new Edit);
    const int video = edit->addChan(VideoChan);
    const int audio = edit->addChan(AudioChan);
    for (const int chan : {video, audio}) {
        edit->get_edit_cel_p(chan)->appendEventPair(test::source(chan + 1), 100, 0, 10);
    }
    cue_list& cues = edit->get_cues();
    const Vector<cel*> cels{edit->get_edit_cel_p(video), edit->get_edit_cel_p(audio)};
    EXPECT_TRUE(cues.add_cue_point("celcue", 4, video, 0, cels, true));
    cues.get_cue_point(0, 0)->setFlags(CueFlag::kAttached | CueFlag::kInside);
    EXPECT_TRUE(cues.add_cue_point("attached", 5, audio, 0, cels, true));
    cues.add_cue_point(marker("any", 6, kAnyCueChan));
    edit->set_cel_cues_loaded(true);
    edit->resetChangeDescription();
    edit->set_dirty(false);
    return edit;
}

} // namespace

TEST(EditCues, CelCuesComeOffAndTheOthersStay) {
    const EditPtr edit = cuedEdit();
    EXPECT_TRUE(edit->cel_cues_off());
    EXPECT_FALSE(edit->get_cel_cues_loaded());
    EXPECT_EQ(texts(edit->get_cues()), "attached any ");
    EXPECT_EQ(edit->getChangeDescription().type(), kCuesChanged);
    EXPECT_TRUE(edit->get_dirty());
    edit->set_dirty(false);
    EXPECT_FALSE(edit->delete_all_cel_cues() || edit->deleteCues(7) || edit->deleteCue(2));
    EXPECT_FALSE(edit->get_dirty()) << "nothing changed";
    EXPECT_TRUE(edit->deleteCues(-1));
    EXPECT_EQ(edit->get_cues().get_num_cue_points(0), 0u);
}

TEST(EditCues, FollowTheirChannels) {
    const EditPtr edit = cuedEdit();
    ASSERT_TRUE(edit->insertChans(VideoChan, kPlain, NO_CHAN, 2, false, true, 0));
    EXPECT_EQ(edit->get_cues().get_cue_point(0, 0)->channel(), 0);
    EXPECT_EQ(edit->get_cues().get_cue_point(1, 0)->channel(), 3);
    EXPECT_EQ(edit->get_cues().get_cue_point(2, 0)->channel(), kAnyCueChan);
    ASSERT_TRUE(edit->removeChan(edit->getId(0), true));
    EXPECT_EQ(texts(edit->get_cues()), "attached any ") << "the removed channel's cue goes";
    EXPECT_EQ(edit->get_cues().get_cue_point(0, 0)->channel(), 2);
    edit->get_edit_cel_p(2)->remove({0, 2});
    EXPECT_TRUE(edit->updateCues());
    EXPECT_DOUBLE_EQ(edit->get_cues().get_cue_point(0, 0)->editTime(), 3);
    EXPECT_FALSE(edit->updateCues());
    ASSERT_TRUE(edit->removeChans(false));
    EXPECT_EQ(texts(edit->get_cues()), "any ");
}

TEST(EditCues, FollowACelThatIsReplaced) {
    const EditPtr edit = cuedEdit();
    auto other = edit->get_edit_cel_p(1)->copy();
    cel::IdMap ids;
    ASSERT_TRUE(other->insert(edit->get_edit_cel_p(0), {0, 3}, 0, ids));
    ASSERT_TRUE(edit->set_edit_cel_p(1, other.release()));
    EXPECT_TRUE(edit->updateCues());
    EXPECT_DOUBLE_EQ(edit->get_cues().get_cue_point(1, 0)->editTime(), 8);
}

TEST(EditCues, OnlyKeptCuesAreStored) {
    const EditPtr edit = cuedEdit();
    edit->storeCues();
    EXPECT_EQ(edit->get_cues().get_num_cue_points(0), 3u);
    ASSERT_TRUE(edit->retrieveCues());
    EXPECT_EQ(texts(edit->get_cues()), "attached any ");
    EXPECT_EQ(edit->get_cues().get_cue_point(0, 0)->event().get_its_cel(), edit->get_edit_cel_p(1));
    ASSERT_TRUE(edit->removeChan(edit->getId(1), false));
    ASSERT_TRUE(edit->retrieveCues());
    EXPECT_EQ(edit->get_cues().get_cue_point(0, 0)->event().get_its_cel(), nullptr) << "its cel is gone";
    edit->objectStore().storeObject("CueId", std::make_unique<ChannelGroupList>());
    EXPECT_FALSE(edit->retrieveCues());
    EXPECT_EQ(texts(edit->get_cues()), "attached any ") << "a list that is none changes nothing";
}
