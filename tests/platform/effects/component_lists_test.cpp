// The lists that stand beside graphs: named texts, and effects whose events are gone.

#include "platform/effects/attrib_value_pair_list.h"
#include "platform/effects/effect_instance.h"
#include "platform/effects/orphaned_component_list.h"

#include <gtest/gtest.h>

namespace {

/// What a list becomes by way of its packed form; false if that does not read.
template <typename List>
bool again(const List& list, List& read) {
    PStream to;
    list.STRM_hierarchyPack(to);
    PStream from(to.bytes());
    return read.STRM_hierarchyUnpack(from) && from.remaining() == 0;
}

TEST(ComponentLists, NamedTextsAreKeptOnceEach) {
    AttribValuePairList list;
    AttribValuePairList read;
    ASSERT_TRUE(again(list, read));
    EXPECT_EQ(read.size(), 0u);
    list.add({"name", "first"});
    list.add({"name", "second = one"});
    list.add({"author", ""});
    list.add({"", "nothing"});
    ASSERT_TRUE(again(list, read));
    EXPECT_EQ(read.size(), 2u);
    EXPECT_EQ(read.getValue("name"), "second = one");
    EXPECT_EQ(read.getValue("missing"), "");
    for (const uint32_t count : {0x7FFFFFFFu, 0xFFFFFFFFu}) {
        PStream to;
        to.setUnsignedLong(count);
        PStream from(to.bytes());
        read.unpack(from);
        EXPECT_EQ(from.good(), count == 0xFFFFFFFFu);
    }
}

TEST(ComponentLists, OrphansAreFoundByTheirSpan) {
    TagBag bag;
    Vector<Tag<FXGraphNodeBase>> nodes;
    for (uint32_t i = 1; i <= 3; ++i) {
        bag.storeObject(IdStamp(5, 6, i), Fx::makeEffect(Fx::kTint));
        nodes.emplace_back(bag, IdStamp(5, 6, i));
    }
    OrphanedComponentList list;
    list.add(nodes[0], {2, 5});
    list.add(nodes[1], {5, 8});
    list.add(nodes[0], {0, 100});
    OrphanedComponentList read;
    ASSERT_TRUE(again(list, read));
    EXPECT_EQ(read.size(), 2u);
    EXPECT_EQ(read.getRangeFor(nodes[0]), (NumRange<double, Ordered>(2, 5)));
    EXPECT_EQ(read.getRangeFor(nodes[2]), (NumRange<double, Ordered>(0, 0)));
    const struct {
        double time;
        std::vector<uint32_t> found;
    } cases[] = {{2, {1}}, {2 - 5e-7, {1}}, {2 - 2e-6, {}}, {5, {2}}, {4.5, {1}}, {8, {}}, {8 - 2e-6, {2}}};
    for (const auto& its : cases) {
        Vector<IdStamp> found;
        read.findIntersecting(its.time, found);
        std::vector<uint32_t> numbers;
        for (const IdStamp& id : found) {
            numbers.push_back(id.word(2));
        }
        EXPECT_EQ(numbers, its.found) << its.time;
    }
    EXPECT_TRUE(read.remove(nodes[0]) && !read.remove(nodes[0]) && !read.isOrphan(nodes[0]));
    EXPECT_TRUE(read.isOrphan(nodes[1]));

    // Ends in the wrong order are exchanged; a count that nothing stands behind is refused.
    PStream to;
    to.setUnsignedLong(1);
    to.setCookedChar(2);
    nodes[2].id().pack(to);
    to.setDouble(5);
    to.setDouble(2);
    PStream from(to.bytes());
    read.unpack(from);
    EXPECT_EQ(read.getRangeFor(nodes[2]), (NumRange<double, Ordered>(2, 5)));
    to.patchUnsignedLong(0, 2);
    PStream tooFew(to.bytes());
    read.unpack(tooFew);
    EXPECT_FALSE(tooFew.good());
    EXPECT_EQ(read.size(), 1u);
}

} // namespace
