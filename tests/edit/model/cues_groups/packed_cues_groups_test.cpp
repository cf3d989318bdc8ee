#include "cue_fixture.h"
#include "edit/model/channel_group_list.h"

#include <gtest/gtest.h>

using test::packed;
using test::unpacked;

namespace {

std::vector<std::byte> bytesOf(const PStream& stream) {
    return stream.bytes();
}

cue_list manyCues() {
    cue_list list;
    for (int i = 0; i < 20; ++i) {
        cue_point cue = test::marker("cue of some length", i, i, i);
        cue.setCode(-i);
        cue.setSecondTime(i + 0.5);
        list.add_cue_point(cue);
    }
    return list;
}

} // namespace

TEST(PackedCues, ExactBytes) {
    cue_list list;
    cue_point cue = test::marker("ab", 1.5, 65535, 6);
    cue.setStripTime(2);
    cue.setSecondTime(3);
    cue.setCode(-1);
    list.add_cue_point(cue);
    PStream expected;
    expected.setUnsignedLong(1);
    expected.setCookedChar(1); // the cue
    expected.setCookedChar(1); // its text
    expected.setString("ab");
    expected.setCookedChar(1); // its time
    expected.setDouble(1.5);
    expected.setDouble(2);
    expected.setDouble(3);
    expected.setLong(65535);
    expected.setLong(-1);
    expected.setCookedChar(1); // its flags
    expected.setLong(6);
    expected.setLong(0); // the end
    EXPECT_EQ(packed(list), bytesOf(expected));
    cue_list read;
    ASSERT_TRUE(unpacked(read, packed(list)));
    EXPECT_EQ(packed(read), packed(list));
    EXPECT_EQ(packed(*list.clone()), packed(list));
}

TEST(PackedCues, BadFormsLeaveTheListAsItWas) {
    const auto good = packed(manyCues());
    const auto with = [&](size_t at, std::vector<int> values) {
        auto bytes = good;
        for (size_t i = 0; i < values.size(); ++i) {
            bytes[at + i] = static_cast<std::byte>(values[i]);
        }
        return bytes;
    };
    const size_t last = good.size() - 4;
    const struct {
        const char* what;
        std::vector<std::byte> bytes;
    } cases[] = {{"count beyond the stream", with(0, {255, 255, 255, 255})},
                 {"one cue too many", with(0, {21})},
                 {"one too few", with(0, {19})},
                 {"a cue from the future", with(4, {2})},
                 {"a cue of no revision", with(4, {0})},
                 {"a text from the future", with(5, {9})},
                 {"a text beyond the stream", with(6, {255, 255, 255, 127})},
                 {"a time that is not finite", with(29, {0, 0, 0, 0, 0, 0, 0xF0, 0x7F})},
                 {"another terminator", with(last, {1})},
                 {"no terminator", {good.begin(), good.end() - 4}},
                 {"nothing", {}}};
    ASSERT_EQ(good[28], std::byte{1}) << "the time's revision stands before the times";
    for (const auto& c : cases) {
        cue_list list;
        list.add_cue_point(test::marker("kept", 1));
        EXPECT_FALSE(unpacked(list, c.bytes)) << c.what;
        EXPECT_EQ(test::texts(list), "kept ") << c.what;
    }
    cue_list future;
    future.revisionMajor(2);
    EXPECT_FALSE(unpacked(future, good));
}

TEST(PackedGroups, ExactBytesAndOlderRevisions) {
    const IdStamp a = IdStamp::fresh(IdStampMagic::Channel), b = IdStamp::fresh(IdStampMagic::Channel);
    ChannelGroupList list;
    ASSERT_TRUE(list.addGroup({a, b}, ChannelGroup::eSurround));
    for (const int revision : {0, 1, 2}) {
        PStream form;
        form.setUnsignedLong(1);
        form.setCookedChar(static_cast<uint8_t>(revision));
        form.setUnsignedLong(2);
        for (const IdStamp& chan : {a, b}) {
            form.setCookedChar(2);
            chan.pack(form);
        }
        if (revision == 2) {
            form.setUnsignedLong(4);
            EXPECT_EQ(packed(list), bytesOf(form));
        }
        ChannelGroupList read;
        ASSERT_TRUE(unpacked(read, form.bytes())) << revision;
        ASSERT_EQ(read.size(), 1u);
        EXPECT_EQ(read.getGroup(0)->getType(),
                  revision == 2 ? ChannelGroup::eSurround : ChannelGroup::ePlain);
        EXPECT_EQ(read.getGroup(0)->getChans(), Vector<IdStamp>({a, b}));
    }
}

TEST(PackedGroups, SmallGroupsAreDroppedAndBadFormsRefused) {
    const IdStamp a = IdStamp::fresh(IdStampMagic::Channel), b = IdStamp::fresh(IdStampMagic::Channel);
    const auto form = [](uint32_t groups, uint8_t revision, uint32_t members, uint8_t stampRevision,
                         const Vector<IdStamp>& chans) {
        PStream stream;
        stream.setUnsignedLong(groups);
        stream.setCookedChar(revision);
        stream.setUnsignedLong(members);
        for (const IdStamp& chan : chans) {
            stream.setCookedChar(stampRevision);
            chan.pack(stream);
        }
        stream.setUnsignedLong(1);
        return stream.bytes();
    };
    const struct {
        const char* what;
        std::vector<std::byte> bytes;
        bool good;
    } cases[] = {{"one member", form(1, 2, 1, 2, {a}), true},
                 {"no member", form(1, 2, 0, 2, {}), true},
                 {"one member twice", form(1, 2, 2, 2, {a, a}), true},
                 {"a null member", form(1, 2, 2, 2, {a, IdStamp()}), true},
                 {"a group from the future", form(1, 3, 2, 2, {a, b}), false},
                 {"a stamp from the future", form(1, 2, 2, 3, {a, b}), false},
                 {"more groups than bytes", form(0xFFFFFFFF, 2, 2, 2, {a, b}), false},
                 {"more members than bytes", form(1, 2, 0x20000000, 2, {a, b}), false},
                 {"one group too many", form(2, 2, 2, 2, {a, b}), false}};
    for (const auto& c : cases) {
        ChannelGroupList list;
        list.addGroup({a, b}, ChannelGroup::eStereo);
        ASSERT_EQ(unpacked(list, c.bytes), c.good) << c.what;
        EXPECT_EQ(list.size(), c.good ? 0u : 1u) << c.what;
    }
    ChannelGroupList list, read;
    list.addGroup({a, b}, ChannelGroup::eStereo);
    read = list;
    PStream stream;
    list.STRM_hierarchyPack(stream);
    const auto built = Streamable::build(list.layerName());
    ASSERT_NE(built, nullptr);
    PStream in(stream.bytes());
    ASSERT_TRUE(built->STRM_hierarchyUnpack(in));
    EXPECT_TRUE(dynamic_cast<const ChannelGroupList&>(*built) == read);
}
