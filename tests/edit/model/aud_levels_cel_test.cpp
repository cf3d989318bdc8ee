// The levels of an audio channel: sharing, clip nodes, the object store.

#include "edit/model/aud_levels_cel.h"
#include "support/cel_layout.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

namespace {

TEST(AudLevels, CopiesShareAndClonesDoNot) {
    AudLevelsCel levels = AudLevelsCel::create();
    EXPECT_TRUE(levels.is_dummy());
    AudLevelsCel shared = levels;
    const AudLevelsCel cloned = levels.clone();
    EXPECT_TRUE(shared.insertNode(2, 0.5f));
    EXPECT_FALSE(shared.insertNode(std::nan(""), 0.5f));
    EXPECT_EQ(levels.getNodeStore().size(), 1u);
    EXPECT_TRUE(cloned.is_dummy());
    EXPECT_EQ(cloned.id(), levels.id());
    EXPECT_TRUE(levels.insertNode(5, 1.0f));
    EXPECT_TRUE(levels.insertNode(1, 1.0f));
    EXPECT_EQ(levels.getExtents(), cel::Range(1, 5));
    EXPECT_EQ(levels.getExtents(Editable::Everything, true), cel::Range(0, 5));
    EXPECT_EQ(levels.getExtents(Editable::MaterialOnly), cel::Range(2, 2));
}

TEST(AudLevels, ClipsGetAPairOfNodesAndNothingElseMoves) {
    AudCel sound = AudCel::create();
    layout::build(*sound.getCel(), "AABBB.CC");
    AudLevelsCel levels = AudLevelsCel::create();
    levels.insertNode(0, 0.5f);
    levels.insertNode(10, 0.5f);
    levels.insertNode(3, 2.0f);
    EXPECT_FALSE(levels.replaceClipNodes(sound)) << "no clip has levels of its own";
    ce_handle(sound.getCel(), 2).set_strip_level(0.25f);
    const AudLevelsCel before = levels.clone();
    ASSERT_TRUE(levels.replaceClipNodes(sound));
    const auto& store = levels.getNodeStore();
    EXPECT_NEAR(store.levelAt(2), 0.25, 1e-6);
    EXPECT_NEAR(store.levelAt(3.5), 0.625, 1e-4);
    EXPECT_NEAR(store.levelAt(5 - 2e-5), 1, 1e-4);
    for (const double time : {-1.0, 0.0, 1.0, 1.9999, 5.0, 6.0, 9.0, 11.0}) {
        EXPECT_NEAR(store.levelAt(time), before.getNodeStore().levelAt(time), 1e-5) << time;
    }
    EXPECT_FALSE(levels.replaceClipNodes(sound)) << "they are there already";
    EXPECT_FALSE(levels.checkNodesRevision(sound)) << "of the current revision";
}

/// Levels as an older program packed them.
class LevelsOfRevisionZero : public Streamable {
public:
    const char* layerName() const override { return "LevelsOfRevisionZero"; }
    const char* shortLayerName() const override { return "AudLevels"; }
    uint8_t revisionMajor() const override { return 0; }
    uint8_t revisionMinor() const override { return 0; }
    void revisionMajor(uint8_t) override {}
    void revisionMinor(uint8_t) override {}
    void pack(PStream& stream) const override { nodes.pack(stream); }
    void unpack(PStream& stream) override { nodes.unpack(stream); }
    std::unique_ptr<Streamable> clone(BuilderType) const override {
        return std::make_unique<LevelsOfRevisionZero>(*this);
    }
    AudLevelsCel::Store nodes;
};

const cookie kItem(Cookie_Type::Edit, 1, 0);

TEST(AudLevels, OfRevisionZeroGetTheNodesOfTheirClips) {
    const test::TemporaryFolder folder;
    const IdStamp id = IdStamp::fresh(IdStampMagic::Channel);
    {
        TagBag store;
        ASSERT_EQ(store.open(kItem, folder.path(), eOpenOrCreate, ".qme"), TagBag::NewStore);
        store.storeObject(id.asString(), std::make_unique<LevelsOfRevisionZero>());
        ASSERT_TRUE(store.flush().isOk());
    }
    TagBag store;
    ASSERT_EQ(store.open(kItem, folder.path(), eOpenExisting, ".qme"), TagBag::Opened);
    AudLevelsCel levels = AudLevelsCel::createFromStore(id, store);
    ASSERT_TRUE(levels.valid());
    AudCel sound = AudCel::create();
    layout::build(*sound.getCel(), "AABB");
    ce_handle(sound.getCel(), 2).set_strip_level(0.25f);
    EXPECT_TRUE(levels.checkNodesRevision(sound));
    EXPECT_NEAR(levels.getNodeStore().levelAt(2), 0.25, 1e-6);
    EXPECT_NEAR(levels.getNodeStore().levelAt(1), 1, 1e-6);
    EXPECT_TRUE(levels.changed());
    EXPECT_FALSE(levels.checkNodesRevision(sound)) << "once is enough";
}

} // namespace
