// The levels of an audio channel: sharing, clip nodes, the object store.

#include "edit/model/aud_levels_cel.h"
#include "support/cel_layout.h"

#include <gtest/gtest.h>

namespace {

TEST(AudLevels, AnInvalidOneHasNoNodesAndTakesNone) {
    AudLevelsCel none = AudLevelsCel::createInvalid();
    EXPECT_FALSE(none.valid());
    EXPECT_TRUE(none.is_dummy());
    EXPECT_TRUE(none.getNodeStore().empty());
    EXPECT_FALSE(none.insertNode(1, 1) || none.remove({0, 1}) || none.insert(none, {0, 1}, 0) ||
                 none.replace(none, {0, 1}, 0) || none.simplify() || none.changed());
    EXPECT_EQ(none.getExtents(), Editable::invalidRange());
    EXPECT_FALSE(none.clone().valid());
}

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

TEST(AudLevels, GoThroughTheObjectStore) {
    AudLevelsCel levels = AudLevelsCel::create();
    levels.insertNode(1, 0.5f);
    levels.insertNode(2, 0.75f);
    TagBag store;
    levels.writeToStore(store);
    PStream layers;
    levels.extractFromStore(store);
    EXPECT_FALSE(AudLevelsCel::createFromStore(IdStamp(9, 9, 9), store).valid());
    EXPECT_FALSE(AudLevelsCel::createFromStore(IdStamp(), store).valid());
}

} // namespace
