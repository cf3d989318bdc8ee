// The packed form, and streams that lie.

#include "edit/model/cel.h"
#include "platform/store/pstream.h"
#include "support/cel_layout.h"

#include <gtest/gtest.h>

#include <cstring>

namespace {

using Bytes = std::vector<std::byte>;

Bytes packed(const cel& its) {
    PStream stream;
    its.pack(stream);
    return stream.bytes();
}

cel makeNamed() {
    cel its = layout::make("AAB..C D");
    its.editChannelInfo("V1", IdStamp(1, 2, 3), "SUBTYPE:NONE", "stills");
    its.set_resolution(0.04);
    return its;
}

constexpr size_t kEventSize = 64;

bool reads(const Bytes& bytes, cel& into) {
    PStream stream{std::span<const std::byte>(bytes)};
    into.unpack(stream);
    return stream.good();
}

TEST(CelStream, CarriesEverything) {
    const cel its = makeNamed();
    cel again;
    ASSERT_TRUE(reads(packed(its), again));
    EXPECT_FALSE(again.changed());
    EXPECT_EQ(again.editChannelName(), "V1");
    EXPECT_EQ(again.editChannelId(), IdStamp(1, 2, 3));
    EXPECT_EQ(again.editChannelSubType(), "SUBTYPE:NONE");
    EXPECT_EQ(again.editChannelMaterialInfo(), "stills");
    EXPECT_EQ(again.resolution(), 0.04);
    EXPECT_EQ(packed(again), packed(its));
    const auto built = Streamable::build(its.layerName());
    EXPECT_NE(dynamic_cast<cel*>(built.get()), nullptr);
}

TEST(CelStream, EveryFieldIsChecked) {
    const Bytes whole = packed(makeNamed());
    const size_t second = whole.size() - 8 * kEventSize; // the third event of ten: an in point
    const auto broken = [&](size_t offset, auto value) {
        Bytes bytes = whole;
        std::memcpy(bytes.data() + second + offset, &value, sizeof value);
        cel its;
        return !reads(bytes, its);
    };
    const double nan = std::nan("");
    EXPECT_FALSE(broken(offsetof(channel_event, code), 77)) << "what is free may be anything";
    EXPECT_TRUE(broken(offsetof(channel_event, editTime), nan));
    EXPECT_TRUE(broken(offsetof(channel_event, editTime), 1.9)) << "overlaps the pair before";
    EXPECT_TRUE(broken(offsetof(channel_event, editTime), 99.0)) << "after its out point";
    EXPECT_FALSE(broken(offsetof(channel_event, editTime), 2 - 5e-7)) << "within the tolerance";
    EXPECT_TRUE(broken(offsetof(channel_event, stripTime), static_cast<double>(INFINITY)));
    EXPECT_TRUE(broken(offsetof(channel_event, velocity), nan));
    EXPECT_TRUE(broken(offsetof(channel_event, level), INFINITY));
    EXPECT_TRUE(broken(offsetof(channel_event, kind), uint8_t{4}));
    EXPECT_TRUE(broken(offsetof(channel_event, kind), uint8_t{2}));
    EXPECT_TRUE(broken(offsetof(channel_event, reserved), 1u));
    EXPECT_TRUE(broken(offsetof(channel_event, id), IdStamp()));
    EXPECT_TRUE(broken(offsetof(channel_event, strip) + 8, uint32_t{'/'})) << "no kind of item";
}

TEST(CelStream, ALaterRevisionIsRefused) {
    PStream stream;
    makeNamed().STRM_hierarchyPack(stream);
    Bytes bytes = stream.bytes();
    constexpr size_t kMajorAt = 4 + 4 + 3; // behind the number of layers and the name
    ASSERT_EQ(bytes[kMajorAt], std::byte{2});
    bytes[kMajorAt] = std::byte{3};
    PStream input{std::span<const std::byte>(bytes)};
    cel again;
    EXPECT_FALSE(again.STRM_hierarchyUnpack(input));
    EXPECT_EQ(again.numEvents(), 0);
}

TEST(CelStream, TheFirstRevisionHadNoFilling) {
    const cel its = makeNamed();
    Bytes bytes = packed(its);
    const std::ptrdiff_t events = static_cast<std::ptrdiff_t>(kEventSize) * its.numEvents();
    auto filling = bytes.end() - events - 1;
    while (*filling == std::byte{0} && bytes.end() - events - 1 - filling < 7) {
        --filling;
    }
    bytes.erase(filling, bytes.end() - events);
    cel again;
    EXPECT_FALSE(reads(bytes, again)) << "it is not of the present revision";
    again.revisionMajor(1);
    ASSERT_TRUE(reads(bytes, again));
    EXPECT_EQ(packed(again), packed(its));
}

TEST(CelStream, ManyEventsMayStayWhereTheyLie) {
    cel its;
    for (int i = 0; i < 3000; ++i) {
        its.appendEventPair(cookie("E0001000"), 0, 2.0 * i, 1);
    }
    const auto kept = std::make_shared<const Bytes>(packed(its));
    const Bytes before = *kept;
    PStream stream(std::span<const std::byte>(*kept), kept);
    cel lying;
    lying.unpack(stream);
    ASSERT_TRUE(stream.good());
    const auto inBytes = [&](const cel& which) {
        const auto* const first = reinterpret_cast<const std::byte*>(which.getChanEventPtr(0));
        return first >= kept->data() && first < kept->data() + kept->size();
    };
    EXPECT_TRUE(inBytes(lying));
    EXPECT_GT(kept.use_count(), 1 + 1) << "the stream holds one, the cel another";
    const auto changed = lying.copy();
    EXPECT_TRUE(inBytes(*changed));
    ASSERT_TRUE(changed->remove({100, 102}));
    changed->get_start_ceh().set_dmod_code(7);
    EXPECT_FALSE(inBytes(*changed));
    EXPECT_EQ(changed->numPairs(), 2999);
    EXPECT_EQ(changed->find_ceh(100.5, CE_IN_POINT).get_edit_time(), 100);
    EXPECT_EQ(packed(lying), before);
    lying.get_start_ceh().set_edit_time(0.5);
    EXPECT_EQ(lying.find_ceh(0.4, CE_IN_POINT).valid(), 0);
    EXPECT_EQ(*kept, before) << "what is kept never changes";
}

TEST(CelStream, AnOpenPairIsNotPacked) {
    cel its = layout::make("AA");
    ASSERT_TRUE(its.add_event(channel_event(5, 0, black_cookie, 1, CE_IN_POINT, channel_event::newId(), 0)));
    cel again;
    ASSERT_TRUE(reads(packed(its), again));
    EXPECT_EQ(layout::draw(again), "AA");
}

} // namespace
