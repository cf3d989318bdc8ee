// Tags, and what bags do for objects that have a stamp and refer to one another.

#include "platform/store/tag.h"
#include "store_fixture.h"

using namespace test;

namespace {

/// An object that refers to others.
class Linked : public Streamable, public Taggable {
public:
    [[nodiscard]] const char* layerName() const override { return "Linked"; }
    [[nodiscard]] const char* shortLayerName() const override { return "L"; }
    [[nodiscard]] uint8_t revisionMajor() const override { return 1; }
    [[nodiscard]] uint8_t revisionMinor() const override { return 0; }
    void revisionMajor(uint8_t) override {}
    void revisionMinor(uint8_t) override {}
    void pack(PStream& stream) const override {
        stream.setUnsignedLong(static_cast<uint32_t>(links.size()));
        for (const IdStamp& link : links) {
            link.pack(stream);
        }
    }
    void unpack(PStream& stream) override {
        links.resize(stream.getCount(12));
        for (IdStamp& link : links) {
            link.unpack(stream);
        }
    }
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType) const override {
        return std::make_unique<Linked>(*this);
    }
    [[nodiscard]] const TagTypeId& tagTypeId() const override {
        static const TagTypeId type("Linked");
        return type;
    }
    void listReferences(Vector<IdStamp>& stamps) const override {
        stamps.insert(stamps.end(), links.begin(), links.end());
    }
    void renameReferences(const StampMap& renamed) override {
        for (IdStamp& link : links) {
            const auto found = renamed.find(link);
            link = found != renamed.end() ? found->second : link;
        }
        setTagChanged(true);
    }
    void link(std::vector<IdStamp> to) {
        links = std::move(to);
        setTagChanged(true);
    }

    std::vector<IdStamp> links;
};

IdStamp node(uint32_t n) {
    return {1, 2, n};
}

class TagTest : public StoreTest {
protected:
    void SetUp() override {
        StoreTest::SetUp();
        Streamable::registerBuilder(
            "Linked", []() -> std::unique_ptr<Streamable> { return std::make_unique<Linked>(); });
    }
    static void put(TagBag& bag, const IdStamp& id, std::vector<IdStamp> links) {
        auto made = std::make_unique<Linked>();
        made->link(std::move(links));
        bag.storeObject(id, std::move(made));
    }
    static std::vector<IdStamp> linksOf(TagBag& bag, const IdStamp& id) {
        const Tag<Linked> its(bag, id);
        return its ? its->links : std::vector<IdStamp>{};
    }
};

TEST_F(TagTest, TagNamesItsObjectAsLongAsItIsThere) {
    Tag<Linked> tag;
    EXPECT_FALSE(tag.destroy());
    {
        TagBag bag;
        ASSERT_EQ(open(bag, eOpenNew), TagBag::NewStore);
        tag = Tag<Linked>(bag, node(1));
        EXPECT_FALSE(tag.valid());
        put(bag, node(1), {});
        ASSERT_TRUE(tag.valid());
        EXPECT_EQ(tag->tagId(), node(1));
        EXPECT_EQ(tag->tagTypeId().id(), "Linked");
        put(bag, node(1), {node(7)});
        EXPECT_NE(tag.object(), nullptr);
        EXPECT_EQ(tag->links.size(), 1u) << "the object that took the place";
        bag.storeObject(node(2), numbers({1}));
        EXPECT_TRUE(TagBase(bag, node(2)).valid());
        EXPECT_FALSE(Tag<Linked>(bag, node(2)).valid()) << "of another class";
        ASSERT_TRUE(bag.renameObject(node(1).asString(), node(3).asString()));
        EXPECT_FALSE(tag.valid());
        EXPECT_EQ(Tag<Linked>(bag, node(3))->tagId(), node(3));
        tag = Tag<Linked>(bag, node(3));
        const std::unique_ptr<Streamable> taken = bag.extractObject(node(3));
        EXPECT_FALSE(tag.valid());
        EXPECT_FALSE(dynamic_cast<Linked&>(*taken).tagId().valid());
        put(bag, node(4), {});
        EXPECT_EQ(bag.getNumObjects(), 2u);
        EXPECT_EQ(bag[0].id(), node(2));
        EXPECT_TRUE(bag[0].destroy());
        EXPECT_EQ(bag[0].id(), node(4));
        EXPECT_FALSE(bag[1].id().valid());
        tag = Tag<Linked>(bag, node(4));
        EXPECT_TRUE(tag.valid());
    }
    EXPECT_FALSE(tag.valid()) << "the bag has gone";
    EXPECT_EQ(tag.bag(), nullptr);
    EXPECT_EQ(tag.id(), node(4));
}

TEST_F(TagTest, ChangedObjectIsPackedWithoutBeingTold) {
    TagBag bag;
    ASSERT_EQ(open(bag, eOpenNew), TagBag::NewStore);
    put(bag, node(1), {node(2)});
    put(bag, node(2), {});
    ASSERT_TRUE(bag.flush());
    EXPECT_EQ(bag.numPacked(), 2u);
    ASSERT_EQ(open(bag), TagBag::Opened);
    const Tag<Linked> tag(bag, node(1));
    EXPECT_EQ(linksOf(bag, node(2)).size(), 0u);
    tag->link({node(5)});
    ASSERT_TRUE(bag.flush());
    EXPECT_EQ(bag.numPacked(), 1u);
    ASSERT_TRUE(bag.flush());
    EXPECT_EQ(bag.numPacked(), 0u);
    ASSERT_EQ(open(bag), TagBag::Opened);
    EXPECT_EQ(linksOf(bag, node(1)), std::vector<IdStamp>{node(5)});
}

TEST_F(TagTest, CopiesBringWhatTheyReferToUnderFreshStamps) {
    const IdStamp channel(0x80000000, 0, 9);
    const IdStamp otherChannel(0x80000000, 0, 10);
    writeSmall();
    TagBag from;
    ASSERT_EQ(open(from), TagBag::Opened);
    put(from, node(1), {node(2), node(3), channel});
    put(from, node(2), {node(3)});
    put(from, node(3), {node(1), node(8)}); // a loop, and a reference to nothing
    ASSERT_TRUE(from.renameObject("strange", node(4).asString()));
    put(from, node(5), {node(4)});
    put(from, node(6), {});
    for (const bool isSame : {false, true}) {
        TagBag other;
        TagBag& to = isSame ? from : other;
        const size_t before = to.getNumObjects();
        StampMap renamed{{channel, otherChannel}, {node(1), node(100)}};
        const std::vector<IdStamp> wanted{node(1), node(5)};
        ASSERT_TRUE(to.copyAndStoreComponents(from, wanted, renamed));
        EXPECT_EQ(to.getNumObjects(), before + 5);
        EXPECT_EQ(linksOf(to, node(100)),
                  (std::vector<IdStamp>{renamed[node(2)], renamed[node(3)], otherChannel}));
        EXPECT_EQ(linksOf(to, renamed[node(3)]), (std::vector<IdStamp>{node(100), node(8)}));
        EXPECT_EQ(linksOf(to, renamed[node(5)]), std::vector<IdStamp>{renamed[node(4)]});
        Stranger stranger;
        EXPECT_TRUE(to.readObject(renamed[node(4)].asString(), stranger)) << "of an unknown class";
        EXPECT_EQ(stranger.values, std::vector<uint32_t>{7});
        EXPECT_EQ(linksOf(from, node(1)), (std::vector<IdStamp>{node(2), node(3), channel}));

        const size_t held = to.getNumObjects();
        const StampMap mapped = renamed;
        const std::vector<IdStamp> missing{node(6), node(77)};
        EXPECT_EQ(to.copyAndStoreComponents(from, missing, renamed).code(), Qx::StatusCode::NotFound);
        EXPECT_EQ(to.getNumObjects(), held);
        EXPECT_EQ(renamed, mapped);
        to.removeObject(node(100));
        EXPECT_TRUE(from.contains(node(1)));
    }
}

} // namespace
