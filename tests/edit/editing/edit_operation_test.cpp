#include "tests/edit/editing/editing_fixture.h"

using Op = edit_operation;

namespace {

TEST(EditOperation, EveryValueIsClassified) {
    struct Row {
        int value;
        int core;
        bool sourceAndDest;
        bool interTrack;
        bool backwards;
        bool sync;
        bool length;
        bool clipboard;
    };
    const Row rows[] = {
        {0, 0, false, false, false, false, true, true},   {1, 2, true, false, false, false, true, true},
        {2, 2, true, false, false, false, true, true},    {3, 3, true, false, false, true, true, false},
        {4, 4, false, false, false, true, true, true},    {5, 3, true, false, false, true, true, false},
        {6, 2, true, false, false, false, true, true},    {7, 7, false, false, false, false, false, true},
        {8, 8, false, true, false, false, false, true},   {9, 2, true, false, true, false, true, true},
        {10, 2, true, false, true, false, true, true},    {11, 11, false, true, false, false, false, true},
        {12, 12, false, true, false, false, false, true}, {13, 13, true, false, false, false, true, true},
        {14, 3, true, false, true, true, true, false},    {15, 3, true, false, true, true, true, false},
        {16, 2, true, false, false, false, true, true},
    };
    ASSERT_EQ(std::size(rows), static_cast<size_t>(kNumEditOperations));
    for (const Row& row : rows) {
        const Op op = static_cast<Op>(row.value);
        SCOPED_TRACE(row.value);
        EXPECT_EQ(static_cast<int>(Editor::getCoreEditOperation(op)), row.core);
        EXPECT_EQ(Editor::editOpRequiresSourceAndDest(op), row.sourceAndDest);
        EXPECT_EQ(Editor::editOpIsInterTrack(op), row.interTrack);
        EXPECT_EQ(Editor::editOpIsBackwards(op), row.backwards);
        EXPECT_EQ(Editor::editOpAffectsTrackSync(op), row.sync);
        EXPECT_EQ(Editor::editOpCanAffectTrackLength(op), row.length);
        EXPECT_EQ(Editor::editOpRequiresClipboard(op), row.clipboard);
        EXPECT_EQ(static_cast<int>(editModificationOf(op)), row.value);
        Op read = Op::NoOperation;
        EXPECT_TRUE(editOperationFromText(editOperationName(op), read));
        EXPECT_EQ(read, op);
    }
}

TEST(EditOperation, TextsOfUsersAreReadAndOthersRefused) {
    Op op = Op::Lift;
    for (const char* text : {"", "17", "-1", "03", "replaces", "replac", "Insert Marked", "1x"}) {
        EXPECT_FALSE(editOperationFromText(text, op)) << text;
    }
    EXPECT_EQ(op, Op::Lift);
    for (const char* text : {"insert-marked", "INSERTMARKED", "Insert_Marked", "5"}) {
        EXPECT_TRUE(editOperationFromText(text, op)) << text;
        EXPECT_EQ(op, Op::InsertMarked);
    }
    EXPECT_EQ(editOperationName(static_cast<Op>(17)), "");
    EXPECT_EQ(editModificationOf(static_cast<Op>(-1)), kNoModification);
}

} // namespace
