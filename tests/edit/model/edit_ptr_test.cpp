#include "edit/model/edit.h"
#include "tests/support/edit_builder.h"
#include "tests/support/recording_registry.h"

#include <gtest/gtest.h>

#include <utility>

using test::EditBuilder;
using test::RecordingRegistry;

namespace {

/// An edit that tells when it goes.
class MortalEdit : public Edit {
public:
    explicit MortalEdit(int& alive) : m_alive(alive) { ++m_alive; }
    ~MortalEdit() override { --m_alive; }

private:
    int& m_alive;
};

TEST(Handle, TheLastOneDestroysTheEdit) {
    int alive = 0;
    const Edit alone;
    EditPtr first(new MortalEdit(alive));
    EXPECT_EQ(first->refCount(), 1);
    {
        const EditPtr copy = first;
        EXPECT_EQ(first->refCount(), 2);
        EXPECT_TRUE(copy == first);
    }
    EXPECT_EQ(alive, 1);
    EditPtr moved = std::move(first);
    EXPECT_FALSE(first.valid()); // NOLINT(bugprone-use-after-move)
    EXPECT_EQ(moved->refCount(), 1);
    moved = static_cast<Edit*>(moved);
    EXPECT_EQ(moved->refCount(), 1);
    moved = EditPtr(new MortalEdit(alive));
    EXPECT_EQ(alive, 1);
    moved.invalidate();
    EXPECT_EQ(alive, 0);
    EXPECT_FALSE(moved.valid());
    EXPECT_TRUE(moved == static_cast<Edit*>(nullptr));
    EXPECT_TRUE(moved == nullptr && nullptr == EditPtr() && moved != &alone);
}

TEST(Handle, OpensThroughTheRegistryAndReleasesFirst) {
    const cookie item("E0005001");
    cookie other("E0006001");
    EXPECT_FALSE(EditPtr(item, eOpenExisting).valid()) << "without a project nothing opens";
    RecordingRegistry registry;
    registry.add(EditBuilder().item(item).build());

    EditPtr edit(item, eOpenOrCreate);
    ASSERT_TRUE(edit.valid());
    EXPECT_EQ(edit->refCount(), 2);
    edit = other;
    EXPECT_FALSE(edit.valid()) << "an unknown item leaves a null handle";
    edit.open(item, eOpenNew);
    EXPECT_TRUE(edit.valid());
    EXPECT_EQ(registry.take(),
              (std::vector<String>{"open E0005001 2", "open E0006001 0", "open E0005001 1"}));
    // The item may live in the edit that is released.
    edit.open(edit->get_cookie(), eOpenExisting);
    EXPECT_TRUE(edit.valid());
}

} // namespace
