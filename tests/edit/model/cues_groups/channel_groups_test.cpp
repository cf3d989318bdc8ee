#include "cue_fixture.h"
#include "edit/model/channel_group_list.h"
#include "platform/store/configb.h"
#include "platform/store/tag_bag.h"
#include "support/recording_log.h"

#include <gtest/gtest.h>
#include <set>
#include <thread>

namespace {

using Groups = std::vector<Vector<IdStamp>>;

IdStamp channel() {
    return IdStamp::fresh(IdStampMagic::Channel);
}

Groups contents(const ChannelGroupList& list) {
    Groups all;
    for (unsigned i = 0; i < list.size(); ++i) {
        list.getGroupContents(i, all.emplace_back());
    }
    return all;
}

/// An edit with channels of each kind; the levels are not among them.
struct Tracks {
    EditPtr edit{new Edit};
    Vector<IdStamp> fx, v, a;

    Tracks(unsigned numFx, unsigned numV, unsigned numA) {
        add(VideoChan, Edit_Chan_SubType::ALIAS, numFx);
        add(VideoChan, Edit_Chan_SubType::NONE, numV);
        add(AudioChan, Edit_Chan_SubType::NONE, numA);
        edit->getChans(fx, VideoChan, Edit_Chan_SubType::ALIAS);
        edit->getChans(a, AudioChan);
        for (int i = edit->getFirstChan(VideoChan); i != NO_CHAN; edit->getNextChan(i, VideoChan)) {
            if (edit->getChanSubtype(i) == Edit_Chan_SubType::NONE) {
                v.push_back(edit->getId(i));
            }
        }
    }
    void add(Edit_Chan_Type type, Edit_Chan_SubType subtype, unsigned count) const {
        if (count > 0) {
            ASSERT_TRUE(edit->insertChans(type, subtype, NO_CHAN, count, false, false, 0));
        }
    }
    [[nodiscard]] Groups groups() const { return contents(*edit->retrieveGroupsList()); }
};

} // namespace

TEST(ChannelGroupList, DestroysGroupsOfAType) {
    for (const auto& [type, left] : {std::pair(ChannelGroup::eAll, 0u), std::pair(ChannelGroup::eStereo, 2u),
                                     std::pair(ChannelGroup::eSurround, 3u)}) {
        ChannelGroupList list;
        list.addGroup({channel(), channel()}, ChannelGroup::ePlain);
        list.addGroup({channel(), channel()}, ChannelGroup::eStereo);
        list.addGroup({channel(), channel()}, ChannelGroup::ePlain);
        EXPECT_EQ(list.destroyAllGroups(type), 3u - left) << type;
        EXPECT_EQ(list.size(), left) << type;
    }
}

TEST(ChannelGroups, KnowTheirEndsAndTakeOnlyChannels) {
    const Tracks t(0, 1, 6);
    const auto& a = t.a;
    t.edit->set_dirty(false);
    EXPECT_FALSE(t.edit->groupChannels({a[0]}, ChannelGroup::ePlain));
    EXPECT_FALSE(t.edit->ungroupChannels(t.v[0]) || t.edit->removeFromGroup(t.v[0]));
    EXPECT_TRUE(t.edit->ungroupAllChannels());
    EXPECT_FALSE(t.edit->get_dirty()) << "nothing changed";
    EXPECT_TRUE(t.edit->groupChannels({a[0], IdStamp::fresh(IdStampMagic::Material)}, ChannelGroup::ePlain));
    EXPECT_EQ(t.groups(), Groups());
    ASSERT_TRUE(t.edit->groupChannels({a[2], a[3]}, ChannelGroup::eStereo));
    EXPECT_TRUE(t.edit->get_dirty());
    EXPECT_EQ(t.edit->getChangeDescription().type(), kGroupsChanged);
    ASSERT_TRUE(t.edit->groupChannels({a[5], a[3]}, ChannelGroup::eSurround));
    EXPECT_EQ(t.groups(), Groups({{a[5], a[2], a[3]}}));
    EXPECT_EQ(t.edit->getTrackGroup(0)->getType(), ChannelGroup::eSurround);
    EXPECT_EQ(t.edit->getTrackGroup(1), nullptr);
    EXPECT_EQ(t.edit->getFirstInGroup(a[2]), a[5]);
    EXPECT_EQ(t.edit->getLastInGroup(a[2]), a[3]);
    EXPECT_TRUE(t.edit->isFirstInGroup(a[5]) && t.edit->isLastInGroup(a[3]));
    EXPECT_FALSE(t.edit->isFirstInGroup(a[3]) || t.edit->isLastInGroup(a[5]));
    EXPECT_TRUE(t.edit->isFirstInGroup(t.v[0]) && t.edit->isLastInGroup(t.v[0]));
    Vector<IdStamp> members;
    t.edit->getGroupContainingChan(t.v[0], members);
    t.edit->getGroupContainingChan(channel(), members);
    EXPECT_EQ(members, Vector<IdStamp>({t.v[0]}));
}

TEST(ChannelGroups, SameAndSimilar) {
    const Tracks t(0, 2, 6);
    const auto& a = t.a;
    ASSERT_TRUE(t.edit->groupChannels({a[0], a[1]}, ChannelGroup::eStereo));
    ASSERT_TRUE(t.edit->groupChannels({a[2], a[3]}, ChannelGroup::eStereo));
    ASSERT_TRUE(t.edit->groupChannels({t.v[0], t.v[1]}, ChannelGroup::ePlain));
    const struct {
        IdStamp x, y;
        bool same, similar;
    } cases[] = {{a[0], a[1], true, true},   {a[0], a[3], false, true},  {a[0], t.v[0], false, false},
                 {a[0], a[5], false, false}, {a[4], a[5], false, false}, {a[4], a[4], false, false}};
    for (const auto& c : cases) {
        EXPECT_EQ(t.edit->sameGroup(c.x, c.y), c.same);
        EXPECT_EQ(t.edit->similarGroups(c.x, c.y), c.similar);
    }
}

TEST(ChannelGroups, NamesJoinRuns) {
    const Tracks t(1, 2, 6);
    const auto& a = t.a;
    t.edit->setChanName(a[4], "Boom");
    ASSERT_TRUE(t.edit->groupChannels({a[0], a[1], a[2], a[3]}, ChannelGroup::eSurround));
    ASSERT_TRUE(t.edit->groupChannels({t.v[1], t.v[0], a[4], a[5], t.fx[0]}, ChannelGroup::ePlain));
    EXPECT_EQ(t.edit->getGroupName(a[2], false), "A1-A4");
    EXPECT_EQ(t.edit->getGroupName(a[2], true), "Surround A1-A4");
    EXPECT_EQ(t.edit->getGroupName(a[4], true), "V2,V1,A5-A6,FX1");
    EXPECT_EQ(t.edit->getGroupDisplayName(a[4], true), "V2,V1,Boom,A6,FX1");
    EXPECT_EQ(t.edit->getGroupName(channel(), true), "");
    EXPECT_TRUE(t.edit->ungroupAllChannels());
    EXPECT_EQ(t.edit->getGroupName(a[4], true), "A5");
    EXPECT_EQ(t.edit->getGroupDisplayName(a[4], true), "Boom");
}

TEST(ChannelGroups, LegacyTextBecomesGroups) {
    const struct {
        const char* text;
        std::vector<std::vector<size_t>> groups;
    } cases[] = {{"A1A2-A3A4", {{0, 1}, {2, 3}}},
                 {"A1", {}},
                 {"--A4A2-", {{3, 1}}},
                 {"A1A9A3-A9", {{0, 2}}},
                 {"A1A2-A2A3A4", {{0, 1}, {2, 3}}},
                 {"nonsense", {}},
                 {"", {}}};
    for (const auto& c : cases) {
        const Tracks t(0, 1, 4);
        t.edit->Opts().setString("CHAN_GRPS", c.text);
        EXPECT_EQ(t.edit->getGroupTextFromED2(), c.text);
        t.edit->updateChannelGroups();
        Groups expected;
        for (const auto& group : c.groups) {
            expected.emplace_back();
            for (const size_t i : group) {
                expected.back().push_back(t.a[i]);
            }
        }
        EXPECT_EQ(t.groups(), expected) << c.text;
        EXPECT_EQ(t.edit->Opts().contains("CHAN_GRPS"), *c.text == '\0') << c.text;
        EXPECT_EQ(t.edit->numGroups() > 0 ? t.edit->getTrackGroup(0)->getType() : ChannelGroup::ePlain,
                  ChannelGroup::ePlain);
    }
}

TEST(ChannelGroups, UnreadableListIsLeftAlone) {
    const Tracks t(0, 0, 4);
    t.edit->objectStore().storeObject(ChannelGroupList::Id, std::make_unique<cue_list>());
    t.edit->Opts().setString("CHAN_GRPS", "A1A2");
    test::RecordingLog log;
    t.edit->updateChannelGroups();
    const String warning = "Warning: Could not obtain GroupList object in Edit::updateChannelGroups\n";
    EXPECT_EQ(log.standardOutput(), warning);
    EXPECT_TRUE(log.contains(warning));
    EXPECT_EQ(t.edit->getGroupTextFromED2(), "A1A2") << "the text stays";
    EXPECT_EQ(t.edit->retrieveGroupsList(), nullptr);
    EXPECT_FALSE(t.edit->groupChannels({t.a[0], t.a[1]}, ChannelGroup::ePlain));
    EXPECT_FALSE(t.edit->ungroupAllChannels() || t.edit->isGrouped(t.a[0]));
    EXPECT_EQ(t.edit->numGroups(), 0u);
    EXPECT_EQ(t.edit->getFirstInGroup(t.a[0]), t.a[0]);
    EXPECT_EQ(t.edit->getTrackGroup(0), nullptr);
}

TEST(ChannelGroups, DefaultGroupingOfAShot) {
    const Tracks t(0, 1, 4);
    ASSERT_TRUE(t.edit->groupChannels({t.a[0], t.a[1]}, ChannelGroup::eStereo));
    EXPECT_FALSE(t.edit->updateDefaultGroupingForShot()) << "it is an edit";
    t.edit->Opts().setInt("ORIGINAL_MATERIAL", 1);
    ASSERT_EQ(t.edit->get_log_type(), kLogShot);
    EXPECT_FALSE(t.edit->isDefaultGroupingPresent() || t.edit->applyDefaultGrouping());
    EXPECT_EQ(t.edit->retrieveDefaultGroupsList(), nullptr);
    EXPECT_TRUE(t.edit->updateDefaultGroupingForShot());
    EXPECT_FALSE(t.edit->updateDefaultGroupingForShot()) << "it is that already";
    EXPECT_TRUE(t.edit->isDefaultGroupingPresent());
    ASSERT_TRUE(t.edit->ungroupAllChannels());
    EXPECT_EQ(t.edit->retrieveDefaultGroupsList()->size(), 1u) << "a copy, not the groups themselves";
    EXPECT_TRUE(t.edit->applyDefaultGrouping());
    EXPECT_EQ(t.groups(), Groups({{t.a[0], t.a[1]}}));
    ASSERT_TRUE(t.edit->removeChan(t.a[1], false));
    EXPECT_EQ(t.groups(), Groups());
    EXPECT_FALSE(t.edit->isDefaultGroupingPresent()) << "the default group lost its member too";
}

TEST(ChannelGroups, FirstFetchFromManyThreadsGivesOneList) {
    const Tracks t(0, 0, 2);
    std::vector<ChannelGroupList*> seen(8);
    std::vector<std::thread> threads;
    for (auto& mine : seen) {
        threads.emplace_back([&t, &mine] { mine = t.edit->retrieveGroupsList(); });
    }
    for (auto& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(std::set<ChannelGroupList*>(seen.begin(), seen.end()).size(), 1u);
    EXPECT_NE(seen[0], nullptr);
}
