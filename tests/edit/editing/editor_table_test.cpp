#include "tests/edit/editing/editing_fixture.h"

#include <algorithm>
#include <cmath>

using namespace test;
using Op = edit_operation;

namespace {

/// One operation on one channel: what is laid comes from `source`, the destination's channel is `before`.
struct Case {
    const char* name;
    Op op;
    Marks source;
    const char* before;
    Marks destination;
    const char* after;
    const char* sourceRow = "ddee";
};

constexpr Marks kDe{1, 3};
constexpr double kNone = Qx::kNoTime;

Marks in(double time) {
    return {time};
}
Marks out(double time) {
    return {kNone, time};
}
Marks at(double time) {
    return {kNone, kNone, time};
}
Marks span(double from, double to) {
    return {from, to};
}

const Case kCases[] = {
    {"ReplaceInside", Op::Replace, kDe, "AAAABBB", in(1), "AdeABBB"},
    {"ReplacePastTheEnd", Op::Replace, kDe, "AAAABBB", in(6), "AAAABBde"},
    {"ReplaceBeyondTheEnd", Op::Replace, kDe, "AAAABBB", in(9), "AAAABBB..de"},
    {"ReplaceAtTheCurrentTime", Op::Replace, kDe, "AAAABBB", at(5), "AAAABde"},
    {"ReplaceTheInMarkWins", Op::Replace, kDe, "AAAABBB", {2, kNone, 5}, "AAdeBBB"},
    {"ReplaceFromShortSource", Op::Replace, span(2, 6), "AAAABBB", in(1), "Aee..BB"},
    {"ReplaceFromUnmarkedSource", Op::Replace, {}, "AAAABBB", in(1), "AddeeBB"},
    {"ReplaceFromEqualMarks", Op::Replace, {1, 1, 3}, "AAAABBB", in(1), "AdeABBB"},
    {"ReplaceInAnEmptyChannel", Op::Replace, kDe, "", in(1), ".de"},
    {"ReplaceFillsTheSourcesGaps", Op::Replace, span(0, 4), "AAAABBB", in(1), "Ad..dBB", "d  d"},
    {"ReplaceMergesBlack", Op::Replace, span(0, 2), "A..BBBB", in(3), "A....BB", "..dd"},
    {"ReplaceMarked", Op::ReplaceMarked, kDe, "AAAABBB", span(2, 5), "AAdeeBB"},
    {"ReplaceMarkedAcrossTheEnd", Op::ReplaceMarked, kDe, "AAAABBB", span(5, 9), "AAAABdee."},
    {"ReplaceMarkedEqualMarks", Op::ReplaceMarked, kDe, "AAAABBB", {2, 2, 4}, "AAdeBBB"},
    {"ReplaceMarkedFromCurrentTime", Op::ReplaceMarked, at(2), "AAAABBB", span(2, 4), "AAeeBBB"},
    {"InsertInside", Op::Insert, kDe, "AAAABBB", in(2), "AAdeAABBB"},
    {"InsertBeyondTheEnd", Op::Insert, kDe, "AAAABBB", in(9), "AAAABBB..de"},
    {"InsertFromShortSource", Op::Insert, span(3, 6), "AAAABBB", at(1), "Ae..AAABBB"},
    {"RemoveInside", Op::Remove, {}, "AAAABBB", span(1, 2), "A|AABBB"},
    {"RemoveAcrossACut", Op::Remove, {}, "AAAABBB", span(2, 5), "AABB"},
    {"RemoveAcrossTheEnd", Op::Remove, {}, "AAAABBB", span(5, 9), "AAAAB"},
    {"RemoveAll", Op::Remove, {}, "AAAABBB", span(0, 7), ""},
    {"RemoveMergesBlack", Op::Remove, {}, "A.BB.C", span(2, 4), "A..C"},
    {"InsertMarked", Op::InsertMarked, kDe, "AAAABBB", span(2, 5), "AAdeeAABBB"},
    {"InsertMarkedBeyondTheEnd", Op::InsertMarked, kDe, "AAAABBB", span(8, 10), "AAAABBB.de"},
    {"ReplaceToEnd", Op::ReplaceToEnd, kDe, "AAAABBB", in(2), "AAde"},
    {"Lift", Op::Lift, {}, "AAAABBB", span(2, 5), "AA...BB"},
    {"LiftMergesBlack", Op::Lift, {}, "AA.BB.", span(3, 5), "AA...."},
    {"LiftStopsAtTheEnd", Op::Lift, {}, "AAAABBB", span(5, 9), "AAAAB.."},
    {"BackReplace", Op::BackReplace, kDe, "AAAABBB", out(5), "AAAdeBB"},
    {"ReplaceAtReversedMarks", Op::Replace, {3, 1}, "AAAABBB", span(6, 2), "AAdeBBB"},
    {"ReplaceMarkedFromReversedMarks", Op::ReplaceMarked, {3, 1}, "AAAABBB", span(5, 2), "AAdeeBB"},
    {"BackReplaceAtReversedMarks", Op::BackReplace, {3, 1}, "AAAABBB", span(5, 2), "AAAdeBB"},
    {"BackReplaceMarkedReversed", Op::BackReplaceMarked, {3, 1}, "AAAABBB", span(5, 2), "AAddeBB"},
    {"InsertAtReversedMarks", Op::Insert, {3, 1}, "AAAABBB", span(6, 2), "AAdeAABBB"},
    {"InsertBehindAnEndOfBlack", Op::Insert, kDe, "AAA.", in(9), "AAA......de"},
    {"BackReplaceMarked", Op::BackReplaceMarked, kDe, "AAAABBB", span(2, 5), "AAddeBB"},
    {"FillBlack", Op::FillBlack, kDe, "AAA.BBB", in(2), "AAAeBBB"},
    {"FillBlackBothEnds", Op::FillBlack, {}, ".AA.BBB", in(0), "dAAeBBB"},
    {"FillBlackPastTheEnd", Op::FillBlack, kDe, "AAA", in(2), "AAAe"},
    {"FillBlackWithinMarks", Op::FillBlack, {}, ".....BB", span(1, 3), ".dd..BB"},
    {"FillBlackWithinReversedMarks", Op::FillBlack, {}, ".....BB", span(3, 1), ".dd..BB"},
    {"FillBlackFromEqualMarks", Op::FillBlack, {}, ".......", {1, 1, 2}, ".ddee.."},
    {"BackInsert", Op::BackInsert, kDe, "AAAABBB", out(3), "AdeAAABBB"},
    {"BackInsertMarked", Op::BackInsertMarked, kDe, "AAAABBB", span(2, 5), "AAddeAABBB"},
    {"ReplaceMaterial", Op::ReplaceMaterial, kDe, "AAAABBB", in(2), "AAdeBBB"},
    {"ReplaceMaterialAcrossACut", Op::ReplaceMaterial, span(0, 2), "AAAABBB", in(3), "AAAd|dBB"},
    {"MarksAreRoundedToFrames", Op::Remove, {}, "AAAABBB", span(2.013, 4.991), "AABB"},
};

Rows rowsOf(const std::vector<char>& kinds, const char* row) {
    Rows rows;
    for (const char kind : kinds) {
        rows.push_back(std::string(1, kind) + " " + row);
    }
    return rows;
}

class EditorTable : public EditingTest {
protected:
    /// Operate, undo, redo, with all of the edit checked after each.
    void run(const Rows& before, const EditModule& source, const Marks& marks, Op op, const Rows& after) {
        EditPtr edit = make(before);
        const cookie item = edit->get_cookie();
        const String stateBefore = contentState(*edit);
        const Editor::Result result = Editor::apply(source, moduleOf(edit, marks), op);
        ASSERT_TRUE(result.valid()) << result.reason();
        EXPECT_EQ(result.notificationType(), editModificationOf(op));
        EXPECT_FALSE(result.syncLoss());
        EXPECT_EQ(drawRows(*edit), after);
        for (int i = 0; i < edit->getNumChans(); ++i) {
            EXPECT_NE(edit->get_edit_cel_p(i)->is_good_cel(), 0);
        }
        EXPECT_EQ(Editor::wasClipboardUsed(edit), editOpRequiresClipboard(op));
        const String stateAfter = contentState(*edit);
        edit.invalidate();

        ASSERT_TRUE(edit_manager::undoRequest(item));
        EXPECT_STREQ(contentState(*edit_manager::openEdit(item, eOpenExisting)).c_str(), stateBefore.c_str());
        ASSERT_TRUE(edit_manager::redoRequest(item));
        EXPECT_STREQ(contentState(*edit_manager::openEdit(item, eOpenExisting)).c_str(), stateAfter.c_str());
    }
};

TEST_F(EditorTable, OperationsOnOneChannelAndOnMany) {
    for (const std::vector<char>& kinds :
         {std::vector<char>{'V'}, std::vector<char>{'V', 'V', 'A', 'A', 'A'}}) {
        for (const Case& its : kCases) {
            SCOPED_TRACE(String(its.name) + " on " + std::to_string(kinds.size()));
            const EditPtr from = editOf(rowsOf(kinds, its.sourceRow));
            run(rowsOf(kinds, its.before), moduleOf(from, its.source), its.destination, its.op,
                rowsOf(kinds, its.after));
        }
    }
}

TEST_F(EditorTable, OperationsBetweenChannels) {
    struct BetweenCase {
        const char* name;
        Op op;
        Rows before;
        Marks marks;
        Rows after;
    };
    const BetweenCase cases[] = {
        {"Swap", Op::SwapTracks, {"V AAAABBB", "V CCCCDDD"}, span(2, 5), {"V AACCDBB", "V CCAABDD"}},
        {"SwapEachKind",
         Op::SwapTracks,
         {"V AAA", "V BBB", "A CCC", "A DDD"},
         span(1, 2),
         {"V ABA", "V BAB", "A CDC", "A DCD"}},
        {"SwapUpToAnEnd", Op::SwapTracks, {"V AAA..BB", "V CCC"}, span(2, 5), {"V AAC..BB", "V CCA"}},
        {"SwapEffects",
         Op::SwapTracks,
         {"E EE", "E  FF", "V AAA", "V BBB"},
         span(1, 2),
         {"E EF", "E  EF", "V ABA", "V BAB"}},
        {"SwapEffectsAtAnEnd", Op::SwapTracks, {"E EE", "E F "}, span(0, 1), {"E FE", "E E"}},
        {"MoveEffectsFromAnEnd", Op::MoveTrack, {"E  EE", "E FFF"}, span(1, 3), {"E  ..", "E FEE"}},
        {"LiftEffectsAtAnEnd", Op::Lift, {"E EEEE"}, span(2, 4), {"E EE.."}},
        {"Copy",
         Op::CopyTrack,
         {"A AAAABBB", "A CCCCDDD", "A EEEEEEE"},
         span(2, 5),
         {"A AAAABBB", "A CCAABDD", "A EEAABEE"}},
        {"CopyAcrossTheEnd",
         Op::CopyTrack,
         {"V AAAABBB", "V CCCCCC."},
         span(5, 9),
         {"V AAAABBB", "V CCCCCBB"}},
        {"Move", Op::MoveTrack, {"V AAAABBB", "V CCCCDDD"}, span(2, 5), {"V AA...BB", "V CCAABDD"}},
    };
    for (const BetweenCase& its : cases) {
        SCOPED_TRACE(its.name);
        run(its.before, EditModule(), its.marks, its.op, its.after);
    }
}

TEST_F(EditorTable, CutsOfASourceOfAnotherRateComeOntoTheFramesAndThatIsTold) {
    const EditPtr from = editOf({"V ", "A "});
    from->setFrameRate(Qx::FrameRate(Qx::FrameRate::Fps24));
    for (int pair = 0; pair < 100; ++pair) {
        for (int chan = 0; chan < 2; ++chan) {
            from->get_edit_cel_p(chan)->appendEventPair(layout::sourceOf(static_cast<char>('a' + pair % 9)),
                                                        5, pair * 7 / 24.0, 7 / 24.0);
        }
    }
    for (const Op op : {Op::Replace, Op::InsertMarked, Op::FillBlack}) {
        for (const unsigned flags : {0u, unsigned{Editor::ExactTimes}}) {
            const EditPtr edit = editOf({"V AAA.......", "A AAA......."});
            edit->get_edit_cel_p(0)->set_edit_time(ce_handle(edit->get_edit_cel_p(0), 1), 2.99, true);
            edit->get_edit_cel_p(0)->set_edit_time(ce_handle(edit->get_edit_cel_p(0), 2), 2.99, true);
            const Editor::Result result =
                Editor::apply(moduleOf(from, {1 / 24.0, 4 + 2 / 24.0}), moduleOf(edit, {1, 6}), op, flags);
            ASSERT_TRUE(result.valid()) << result.reason();
            EXPECT_EQ(result.notice().empty(), flags != 0);
            double furthest = 0;
            for (int chan = 0; chan < 2; ++chan) {
                const cel& its = *edit->get_edit_cel_p(chan);
                ASSERT_NE(its.is_good_cel(), 0);
                for (int i = 0; i < its.numEvents(); ++i) {
                    const double time = its.getChanEventPtr(i)->editTime;
                    const bool own = std::abs(std::fmod(time, 5) - 2.99) < 1e-6; // cut there before
                    furthest = std::max(furthest, own ? 0 : std::abs(time - Qx::frameRound(time)));
                }
            }
            EXPECT_EQ(furthest < 1e-6, flags == 0) << editOperationName(op);
            // What plays is what played before, of the source from its first frame on.
            EXPECT_NEAR(edit->get_edit_cel_p(1)->get_strip_time(5.0),
                        from->get_edit_cel_p(1)->get_strip_time(4 + 1 / 24.0), 1e-6);
        }
    }
}

} // namespace
