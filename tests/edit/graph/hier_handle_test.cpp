#include "edit/graph/hier_handle.h"
#include "platform/base/ole_splat.h"
#include "support/cel_layout.h"
#include "support/recording_registry.h"

#include <gtest/gtest.h>

namespace {

std::vector<String> splats;

/// Edits by number, each with one video channel; a digit in a drawing shows the edit of that number.
class HierHandle : public testing::Test {
protected:
    HierHandle() : m_before(Qx::setSplatHandler([](const char* text) { splats.emplace_back(text); })) {
        splats.clear();
    }
    ~HierHandle() override { Qx::setSplatHandler(m_before); }

    static cookie editCookie(int number) { return {Cookie_Type::Edit, number, 0}; }

    void edit(int number, std::string_view drawing) {
        EditPtr made(new Edit);
        made->set_cookie(editCookie(number));
        cel* const content = made->get_edit_cel_p(made->addChan(VideoChan));
        draw(*content, drawing);
        m_registry.add(made);
    }

    /// One character a second; every event plays its strip from 0.
    static void draw(cel& content, std::string_view drawing) {
        for (size_t at = 0; at < drawing.size();) {
            const size_t end = std::min(drawing.find_first_not_of(drawing[at], at), drawing.size());
            const bool nests = drawing[at] >= '0' && drawing[at] <= '9';
            content.appendEventPair(nests ? editCookie(drawing[at] - '0') : layout::sourceOf(drawing[at]), 0,
                                    static_cast<double>(at), static_cast<double>(end - at));
            at = end;
        }
    }

    /// What is walked over from the present event on, as "A@2.0/1" for source, time and depth.
    static String walk(hier_handle& handle, bool forward) {
        String text;
        for (int steps = 0; handle.get().valid() != 0 && steps < 50; ++steps) {
            const ce_handle event = handle.get();
            text += String::format("%c@%g/%d ", layout::letterOf(event.get_strip_cookie()),
                                   event.get_edit_time(), handle.depth());
            forward ? handle.next_hier(CE_IN_POINT) : handle.prev_hier(CE_IN_POINT);
        }
        return text;
    }

    test::RecordingRegistry m_registry;
    cel m_top;

private:
    Qx::SplatHandler m_before;
};

} // namespace

TEST_F(HierHandle, WalksTheFlattenedHierarchyBothWays) {
    edit(1, "BBCC");
    edit(2, "D11E");
    draw(m_top, "AA2222FF");
    hier_handle handle(&m_top, editCookie(9));
    EXPECT_EQ(handle.getEditCookie(), editCookie(9));
    EXPECT_EQ(walk(handle, true), "A@0/0 D@2/1 B@3/2 E@5/1 F@6/0 ");

    handle = hier_handle(&m_top, editCookie(9));
    handle.find(7, CE_IN_POINT);
    EXPECT_EQ(walk(handle, false), "F@6/0 E@6/1 E@5/1 B@5/2 B@3/2 D@2/1 A@0/0 ")
        << "a nested edit is entered backwards at its last event, an out point";
    EXPECT_TRUE(splats.empty());
}

TEST_F(HierHandle, FindsTheInnermostEventAndClimbsOutAgain) {
    edit(1, "BBCC");
    edit(2, "DD11");
    draw(m_top, "A22222F1111");
    hier_handle handle(&m_top, editCookie(9));
    const struct {
        double time;
        char source;
        int depth;
        int edit;
    } cases[] = {
        {0.5, 'A', 0, 9}, {1.5, 'D', 1, 2},  {3.5, 'B', 2, 1}, {5.0, 'B', 2, 1}, // the very end of the copy
        {6.5, 'F', 0, 9}, {10.5, 'C', 1, 1}, {8.5, 'B', 1, 1}, {1.5, 'D', 1, 2},
    };
    for (const auto& c : cases) {
        handle.find(c.time, CE_IN_POINT);
        ASSERT_NE(handle.get().valid(), 0) << c.time;
        EXPECT_EQ(layout::letterOf(handle.get().get_strip_cookie()), c.source) << c.time;
        EXPECT_EQ(handle.depth(), c.depth) << c.time;
        EXPECT_EQ(handle.getEditCookie(), editCookie(c.edit)) << c.time;
    }
    // Behind the end of what is nested the outer event itself is found.
    handle.find(5.5, CE_IN_POINT);
    EXPECT_EQ(handle.depth(), 0);
    EXPECT_EQ(handle.get().get_edit_time(), 1);
    handle.find(-1, CE_IN_POINT);
    EXPECT_EQ(handle.get().valid(), 0);
}

TEST_F(HierHandle, TellsOfPopsAndDepthsThatAreTooMany) {
    hier_handle none;
    none.popd();
    none.next_hier(CE_IN_POINT);
    none.find(0, CE_IN_POINT);
    none.drill(ce_handle());
    EXPECT_EQ(splats, (std::vector<String>{"hier_handle::pop: to many pops"}));
    EXPECT_EQ(none.get().valid(), 0);

    // An edit that shows itself.
    splats.clear();
    edit(1, "11");
    draw(m_top, "11");
    hier_handle handle(&m_top, editCookie(9));
    handle.find(0.5, CE_IN_POINT);
    handle.drill(handle.get());
    EXPECT_EQ(splats, (std::vector<String>{"hier_handle::push: depth max exceeded",
                                           "hier_handle::find_aux: Edit too deep",
                                           "hier_handle::find_aux: Edit too deep"}));

    splats.clear();
    hier_handle pushed(&m_top, editCookie(9));
    for (int i = 0; i < 9; ++i) {
        pushed.push(editCookie(1), std::make_unique<cel>().release()->get_start_ceh());
    }
    EXPECT_TRUE(splats.empty());
    EXPECT_EQ(pushed.depth(), 9);
    const hier_handle copy = pushed;
    pushed.push(editCookie(1), std::make_unique<cel>().release()->get_start_ceh());
    EXPECT_EQ(splats, (std::vector<String>{"hier_handle::push: depth max exceeded"}));
    EXPECT_EQ(copy.depth(), 9);
}

TEST_F(HierHandle, StaysOnTheOuterEventWhereNothingIsNested) {
    edit(1, "");
    draw(m_top, "1A3");
    for (const char* shown : {"nothing in the edit", "material", "an edit that cannot be opened"}) {
        SCOPED_TRACE(shown);
        static int index = 0;
        ce_handle out = m_top.get_start_ceh();
        EXPECT_FALSE(sub_handle(out, ce_handle(&m_top, 2 * index++)).is_valid());
        EXPECT_EQ(out.valid(), 0);
    }
    ce_handle out;
    EXPECT_FALSE(sub_handle(out, ce_handle()).is_valid());
}
