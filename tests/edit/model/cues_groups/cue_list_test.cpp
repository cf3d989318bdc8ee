#include "cue_fixture.h"
#include "edit/model/channel_group_list.h"
#include "platform/store/tag_bag.h"
#include "support/recording_registry.h"
#include "support/temporary_folder.h"

#include <cmath>
#include <fstream>
#include <gtest/gtest.h>
#include <limits>

using test::cutList;
using test::marker;
using test::source;
using test::texts;

namespace {

constexpr double kInfinite = std::numeric_limits<double>::infinity();

cue_list threeCues() {
    cue_list list;
    list.add_cue_point(marker("a", 5, 1, 0));
    list.add_cue_point(marker("b", 0, kAnyCueChan, CueFlag::kKept));
    list.add_cue_point(marker("c", 3, 2, CueFlag::kKept | CueFlag::kInside));
    return list;
}

} // namespace

TEST(CueList, FindsAndDeletesByFlagsAndChannelInOrder) {
    EXPECT_EQ(cue_list().get_cue_point(0, 0), nullptr);
    const struct {
        int flags, chan;
        std::string found; ///< with these flags, on any channel
        const char* left;  ///< after those on the channel were deleted
    } cases[] = {{0, -1, "abc", ""},      {0, kAnyCueChan, "abc", ""}, {0, 1, "abc", "b c "},
                 {0, 7, "abc", "a b c "}, {2, -1, "bc", "a "},         {2, 2, "bc", "a b "},
                 {4, -1, "c", "a b "},    {6, 65535, "c", "a b "},     {1, -1, "", "a b c "}};
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message() << c.flags << " on " << c.chan);
        cue_list list = threeCues();
        ASSERT_EQ(list.get_num_cue_points(c.flags), c.found.size());
        for (size_t i = 0; i < c.found.size(); ++i) {
            EXPECT_EQ(list.get_cue_point(i, c.flags)->text(), c.found.substr(i, 1));
        }
        EXPECT_EQ(list.get_cue_point(c.found.size(), c.flags), nullptr);
        const size_t gone = list.delete_matching_cues(c.flags, c.chan);
        EXPECT_EQ(texts(list), c.left);
        EXPECT_EQ(list.get_num_cue_points(0) + gone, 3u);
    }
    cue_list list = threeCues();
    EXPECT_FALSE(list.delete_cue_point(3));
    EXPECT_TRUE(list.delete_cue_point(1));
    EXPECT_EQ(texts(list), "a c ");
}

TEST(CueList, SortsStablyAndSlidesBothTimes) {
    cue_list list = threeCues();
    list.add_cue_point(marker("d", 3));
    EXPECT_EQ(texts(list), "a b c d ") << "adding does not sort";
    list.sort();
    EXPECT_EQ(texts(list), "b c d a ");
    ASSERT_TRUE(list.get_cue_point(0, 0)->setSecondTime(2));
    ASSERT_TRUE(list.slide(-1.0));
    EXPECT_EQ(list.get_cue_point(0, 0)->editTime(), -1);
    EXPECT_EQ(list.get_cue_point(0, 0)->secondTime(), 1);
    EXPECT_EQ(list.get_cue_point(3, 0)->editTime(), 4);

    ASSERT_TRUE(list.get_cue_point(3, 0)->setEditTime(1.7e308));
    EXPECT_FALSE(list.slide(1.7e308)) << "one of them would not be finite";
    EXPECT_EQ(list.get_cue_point(0, 0)->editTime(), -1) << "and so none moved";
    EXPECT_FALSE(list.slide(kInfinite));
    EXPECT_FALSE(list.add_cue_point("x", kInfinite, 0, 0, {}, false));
    EXPECT_FALSE(list.add_cue_point("x", std::nan(""), 0, 0, {}, false));
    EXPECT_EQ(list.get_num_cue_points(0), 4u);
}

TEST(CueList, ShufflesChannelsButNotAnyChannel) {
    cue_list list = threeCues();
    list.shuffleChans(2, 3);
    EXPECT_EQ(list.get_cue_point(0, 0)->channel(), 1);
    EXPECT_EQ(list.get_cue_point(1, 0)->channel(), kAnyCueChan);
    EXPECT_EQ(list.get_cue_point(2, 0)->channel(), 5);
    list.get_cue_point(2, 0)->setChannel(std::numeric_limits<int>::max());
    list.get_cue_point(0, 0)->setChannel(65530);
    list.shuffleChans(0, 100);
    EXPECT_EQ(list.get_cue_point(0, 0)->channel(), 65534) << "never becomes any channel";
    EXPECT_EQ(list.get_cue_point(2, 0)->channel(), std::numeric_limits<int>::max());
}

TEST(CueList, BuildsACueFromItsParts) {
    const auto video = cutList(1, {10, 10});
    auto audio = std::make_unique<cel>();
    audio->appendEventPair(black_cookie, 0, 0, 20);
    const Vector<cel*> cels{audio.get(), nullptr, video.get()};
    cue_list list;
    ASSERT_TRUE(list.add_cue_point("on", 12, 2, 7, cels, true));
    ASSERT_TRUE(list.add_cue_point("any", 10, kAnyCueChan, 0, cels, true));
    ASSERT_TRUE(list.add_cue_point("black", 4, 0, 0, cels, true));
    ASSERT_TRUE(list.add_cue_point("none", 4, 1, 0, cels, true));
    ASSERT_TRUE(list.add_cue_point("past", 20, 2, 0, cels, true));
    ASSERT_TRUE(list.add_cue_point("free", 12, 2, 0, cels, false));
    const struct {
        int event;
        double strip;
        int flags;
        cel* its;
    } expected[] = {{2, 102, 7, video.get()}, {2, 100, 7, video.get()}, {0, 4, 7, audio.get()},
                    {-1, 0, 6, nullptr},      {-1, 0, 6, nullptr},      {-1, 0, 6, nullptr}};
    for (size_t i = 0; i < std::size(expected); ++i) {
        const cue_point& cue = *list.get_cue_point(i, 0);
        EXPECT_EQ(cue.event(), ce_handle(expected[i].its, expected[i].event)) << cue.text();
        EXPECT_DOUBLE_EQ(cue.stripTime(), expected[i].strip) << cue.text();
        EXPECT_EQ(cue.flags(), expected[i].flags) << cue.text();
        EXPECT_EQ(cue.secondTime(), cue.editTime());
    }
    EXPECT_EQ(list.get_cue_point(0, 0)->code(), 7);
    EXPECT_EQ(list.get_cue_point(0, 0)->stripCookie(), source(2));
}

TEST(CueList, ExtractsARegionFromZero) {
    const auto video = cutList(1, {10, 10, 10});
    cue_list list;
    for (const double time : {4.0, 9.0, 12.0, 19.0, 20.0}) {
        const std::string text = "t" + std::to_string(static_cast<int>(time));
        ASSERT_TRUE(list.add_cue_point(text.c_str(), time, 0, 0, {video.get()}, true));
    }
    ASSERT_TRUE(list.add_cue_point("other", 12, 1, 0, {}, false));
    EXPECT_EQ(texts(*list.extract(9, 20, 0)), "t9 t12 t19 ");
    EXPECT_EQ(texts(*list.extract(9, 20, -1)), "t9 t12 t19 other ");
    EXPECT_EQ(texts(*list.extract(20, 9, -1)), "");
    EXPECT_EQ(texts(*list.extract(std::nan(""), 9, -1)), "");
    EXPECT_FALSE(list.extract(9, 20, 0)->get_cue_point(0, 0)->attached());

    const auto part = video->extract(9, 20);
    const auto cut = list.extract(9, 20, 0, part.get());
    const int events[] = {0, 2, 2};
    for (size_t i = 0; i < 3; ++i) {
        EXPECT_EQ(cut->get_cue_point(i, 0)->event(), ce_handle(part.get(), events[i])) << i;
    }
    EXPECT_EQ(cut->update_edit_time(), 0) << "they are where their events play them";
    EXPECT_DOUBLE_EQ(cut->get_cue_point(1, 0)->editTime(), 3);
    EXPECT_EQ(list.get_num_cue_points(0), 6u);
}

TEST(CueList, OverlayMergesOnce) {
    cue_list list = threeCues();
    cue_list other;
    other.add_cue_point(marker("d", 3, 2));
    other.add_cue_point(marker("c", 3 + 1e-7, 2));
    other.add_cue_point(marker("c", 3, 4));
    list.overlay(&other, -1);
    EXPECT_EQ(texts(list), "b c d c a ");
    EXPECT_EQ(list.get_cue_point(3, 0)->channel(), 4);
    list.overlay(&other, -1);
    list.overlay(&list, -1);
    list.overlay(nullptr, -1);
    EXPECT_EQ(list.get_num_cue_points(0), 5u) << "merging again is merging once";
    list.overlay(&other, 9);
    EXPECT_EQ(list.delete_matching_cues(0, 9), 3u);
}

TEST(CueList, ConvertAttachesAgainAfterLoading) {
    const auto video = cutList(1, {10, 10, 10});
    cue_list saved;
    ASSERT_TRUE(saved.add_cue_point("in", 12, 0, 0, {video.get()}, true));
    ASSERT_TRUE(saved.add_cue_point("outside", 15, 0, 0, {video.get()}, true));
    ASSERT_TRUE(saved.add_cue_point("lost", 25, 0, 0, {video.get()}, true));
    // Its event is the second; its moment was trimmed away.
    cue_point& outside = *saved.get_cue_point(1, 0);
    ASSERT_TRUE(outside.setStripTime(111));
    ASSERT_TRUE(outside.update_edit_time());
    ASSERT_EQ(outside.editTime(), 21);
    ASSERT_FALSE(outside.hasFlags(CueFlag::kInside));
    saved.get_cue_point(2, 0)->setChannel(3);

    cue_list loaded;
    ASSERT_TRUE(test::unpacked(loaded, test::packed(saved)));
    const auto again = video->copy();
    loaded.convert({again.get()});
    EXPECT_EQ(loaded.get_cue_point(0, 0)->event(), ce_handle(again.get(), 2));
    EXPECT_EQ(loaded.get_cue_point(1, 0)->event(), ce_handle(again.get(), 2));
    const cue_point& lost = *loaded.get_cue_point(2, 0);
    EXPECT_FALSE(lost.attached()) << "there is no such channel";
    EXPECT_EQ(lost.editTime(), 25) << "and so it stays where it was";
    EXPECT_EQ(loaded.update_edit_time(), 0);

    const auto twin = again->copy();
    loaded.rebindCel(again.get(), twin.get());
    EXPECT_EQ(loaded.get_cue_point(0, 0)->event(), ce_handle(twin.get(), 2));
    loaded.dropCel(twin.get());
    EXPECT_EQ(loaded.get_cue_point(0, 0)->event().valid(), 0);
    EXPECT_NE(loaded.update_edit_time(), 0);
    EXPECT_EQ(loaded.get_cue_point(0, 0)->editTime(), 0);
}

TEST(CuePoint, FindsAndDeletesItsOriginal) {
    test::RecordingRegistry registry;
    const EditPtr held(new Edit);
    held->set_cookie(source(2));
    registry.add(held);
    held->get_cues().add_cue_point(marker("other", 102));
    held->get_cues().add_cue_point(marker("slate", 102));
    const auto video = cutList(1, {10, 10});
    const cue_point cue("slate", 12, 0, 0, {video.get()}, true);
    const cue_point elsewhere("slate", 13, 0, 0, {video.get()}, true);
    const cue_point notOpen("slate", 2, 0, 0, {video.get()}, true);
    cookie item;
    int index = -1;
    EXPECT_FALSE(elsewhere.find_original(item, index));
    EXPECT_FALSE(notOpen.find_original(item, index));
    EXPECT_FALSE(marker("slate", 12).find_original(item, index));
    EXPECT_EQ(index, -1);
    ASSERT_TRUE(cue.find_original(item, index));
    EXPECT_EQ(item, source(2));
    EXPECT_EQ(index, 1);
    held->set_read_only(true);
    EXPECT_FALSE(cue.delete_if_original());
    held->set_read_only(false);
    EXPECT_TRUE(cue.delete_if_original());
    EXPECT_EQ(texts(held->get_cues()), "other ");
    EXPECT_FALSE(cue.delete_if_original());
}

TEST(CueFields, BadTextFormsAreRefused) {
    const test::TemporaryFolder folder;
    for (const std::string& bad :
         {std::string("99999999999 0\nx\n"), std::string("5 0\nab\n"), std::string("-1 0\n\n"),
          std::string(2000, '7'), std::string("nan\n"), std::string("2 0\nabc\n"), std::string()}) {
        const String path = folder.write("bad", bad);
        std::ifstream forText(path), forTime(path);
        strp_field text(String("kept"));
        tc_field time;
        EXPECT_FALSE(text.read(&forText)) << bad;
        EXPECT_EQ(text.get(), "kept");
        EXPECT_FALSE(time.read(&forTime)) << bad;
    }
}

namespace {

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
