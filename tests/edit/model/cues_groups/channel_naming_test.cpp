#include "cue_fixture.h"
#include "edit/model/channel_group_list.h"
#include "edit/model/channel_mask.h"
#include "edit/model/channel_view.h"

#include <gtest/gtest.h>

TEST(ChannelMask, TextFormsBothWays) {
    const struct {
        const char* text;
        unsigned bits;
        const char* written;
    } cases[] = {{"VA1A2A10", 0x407, "VA1A2A10"},
                 {"va3", 0x9, "VA3"},
                 {"A17V", 0x1, "V"},
                 {"A0", 0, ""},
                 {"A99999999999999999999", 0, ""},
                 {"A016", 0x10000, "A16"},
                 {"A +5A-3 A\t7", 0xA0, "A5A7"},
                 {"AA1?", 0x2, "A1"},
                 {"", 0, ""},
                 {"V12", 0x1, "V"}};
    for (const auto& c : cases) {
        const channel_mask mask(c.text);
        EXPECT_EQ(static_cast<unsigned>(mask), c.bits) << c.text;
        EXPECT_STREQ(static_cast<const char*>(mask), c.written) << c.text;
    }
    EXPECT_EQ(static_cast<unsigned>(channel_mask(static_cast<const char*>(nullptr))), 0u);
    EXPECT_STREQ(static_cast<const char*>(channel_mask(~0u)), "VA1A2A3A4A5A6A7A8A9A10A11A12A13A14A15A16");
}

TEST(ChannelMask, HoldsSeventeenBits) {
    channel_mask mask(0xFFFFFFFFu);
    EXPECT_EQ(mask, 0x1FFFFu);
    EXPECT_EQ(mask.num_audio_set(), 16);
    mask.invert();
    mask.set(17, true);
    mask.set(-1, true);
    EXPECT_EQ(mask, 0);
    EXPECT_EQ(mask.highest_channel_set(), -1);
    mask.set(16, true);
    EXPECT_EQ(mask.highest_channel_set(), 16);
    EXPECT_EQ(mask.lowest_channel_set(), -1) << "16 is not searched from below";
    EXPECT_TRUE(mask.has_audio() && !mask.has_video() && mask[16]);
    mask = 0x80000005u;
    mask |= 0xFFFE0000u;
    mask &= 0xFFFFFFF4u;
    EXPECT_EQ(mask, channel_mask(4));
}

namespace {

/// FX1, V1, V2, A1 to A5; V2 and V1 are one group, A2, A4 and A5 another.
EditPtr displayed() {
    EditPtr edit(new Edit);
    edit->insertChans(VideoChan, Edit_Chan_SubType::ALIAS, NO_CHAN, 1, false, false, 0);
    edit->insertChans(VideoChan, Edit_Chan_SubType::NONE, NO_CHAN, 2, false, false, 0);
    edit->insertChans(AudioChan, Edit_Chan_SubType::NONE, NO_CHAN, 5, false, false, 0);
    EXPECT_TRUE(edit->groupChannels({edit->getId(2), edit->getId(1)}, ChannelGroup::eStereoscopic));
    EXPECT_TRUE(edit->groupChannels({edit->getId(4), edit->getId(6), edit->getId(7)}, ChannelGroup::ePlain));
    return edit;
}

} // namespace

TEST(ChannelView, OrdersFiltersAndFolds) {
    const EditPtr edit = displayed();
    const struct {
        bool expanded;
        unsigned types, include, exclude;
        Vector<int> order;
    } cases[] = {{false, 3, 15, 0, {0, 2, 3, 4, 5}},
                 {true, 3, 15, 0, {0, 2, 1, 3, 4, 6, 7, 5}},
                 {true, 1, 15, 0, {0, 2, 1}},
                 {true, 1, 0, 0, {2, 1}},
                 {true, 1, 0, 15, {2, 1}},
                 {true, 1, 8, 0, {0}},
                 {true, 1, 8, 8, {}},
                 {true, 3, 15, 8, {2, 1, 3, 4, 6, 7, 5}},
                 {false, 2, 4, 0, {}},
                 {true, 4, 15, 0, {}},
                 {false, 127, 15, 0, {0, 2, 3, 4, 5}}};
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message()
                     << c.expanded << " " << c.types << " " << c.include << " " << c.exclude);
        const ChannelView view(edit, c.expanded);
        Vector<int> order;
        view.getChannelOrder(order, c.types, c.include, c.exclude);
        EXPECT_EQ(order, c.order);
        Vector<IdStamp> stamps;
        view.getChannelOrder(stamps, c.types, c.include, c.exclude);
        ASSERT_EQ(stamps.size(), c.order.size());
        ChannelIndexList list;
        view.getChannelOrder(list, c.types, c.include, c.exclude);
        for (size_t i = 0; i < stamps.size(); ++i) {
            EXPECT_EQ(edit->getIdx(stamps[i]), c.order[i]);
            EXPECT_EQ(list.getChan(static_cast<int>(i)), c.order[i]);
        }
    }
    // What a group names that is no channel, first, last or between, hides nobody.
    ChannelGroupList& groups = *edit->retrieveGroupsList();
    const auto absent = [] { return IdStamp::fresh(IdStampMagic::Channel); };
    Vector<IdStamp> members;
    groups.getGroupContents(1, members);
    groups.destroyGroup(1);
    ASSERT_TRUE(groups.addGroup({absent(), members[0], absent(), members[1], members[2], absent()},
                                ChannelGroup::ePlain));
    for (const auto& c : cases) {
        Vector<int> order;
        ChannelView(edit, c.expanded).getChannelOrder(order, c.types, c.include, c.exclude);
        EXPECT_EQ(order, c.order);
    }
    EXPECT_EQ(edit->getLastInGroup(members[0]), members[2]);

    ChannelView none({}, true);
    Vector<int> order;
    none.getChannelOrder(order, 3, 15, 0);
    EXPECT_TRUE(order.empty());
    none.setEdit(edit);
    none.setGroupsExpanded(false);
    none.getChannelOrder(order, 3, 15, 0);
    EXPECT_EQ(order.size(), 5u);
}
