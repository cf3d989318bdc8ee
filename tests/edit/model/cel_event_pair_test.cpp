// Pairs and iterators over a channel of an edit.

#include "edit/model/cel_event_pair.h"
#include "edit/model/cel_iterator.h"
#include "edit/model/edit.h"
#include "platform/store/tag.h"
#include "support/cel_layout.h"

#include <gtest/gtest.h>

namespace {

using layout::make;

class PairsOfAnEdit : public testing::Test {
protected:
    PairsOfAnEdit() {
        edit = new Edit;
        index = edit->addChan(VideoChan, new cel(make("AAABB  CC")), false);
        chan = edit->getId(index);
        empty = edit->getId(edit->addChan(VideoChan, new cel, false));
    }
    CelEventPair at(double time) const { return {edit, chan, time}; }

    EditPtr edit;
    int index = 0;
    IdStamp chan;
    IdStamp empty;
};

TEST_F(PairsOfAnEdit, AreFoundWhereTheyPlay) {
    struct Case {
        double time;
        int inIndex; // -1: invalid
    };
    for (const Case& c : {Case{-1, -1}, Case{0, 0}, Case{2.9, 0}, Case{3, 2}, Case{3 - 5e-7, 2}, Case{5, -1},
                          Case{6.9, -1}, Case{7, 4}, Case{9, -1}, Case{99, -1}}) {
        const CelEventPair pair = at(c.time);
        EXPECT_EQ(pair.valid(), c.inIndex >= 0) << c.time;
        EXPECT_EQ(pair.getCelIdx(), c.inIndex) << c.time;
        EXPECT_EQ(pair, CelEventPair(edit, index, c.time));
    }
    EXPECT_FALSE(CelEventPair(edit, IdStamp(), 0).valid());
    EXPECT_FALSE(CelEventPair(edit, IdStamp(7, 7, 7), 0).valid());
    EXPECT_FALSE(CelEventPair(edit, NO_CHAN, 0.0).valid());
    EXPECT_FALSE(CelEventPair(EditPtr(), chan, 0).valid());
}

TEST_F(PairsOfAnEdit, AnswerForTheirSpanAndForNone) {
    CelEventPair pair = at(3);
    EXPECT_EQ(pair.editTime(), 3);
    EXPECT_EQ(pair.endEditTime(), 5);
    EXPECT_EQ(pair.stripTime(), 3);
    EXPECT_EQ(pair.endStripTime(), 5);
    EXPECT_EQ(pair.stripCookie(), layout::sourceOf('B'));
    EXPECT_EQ(pair.length(), 2);
    EXPECT_FALSE(pair.isZeroLength());
    EXPECT_EQ(pair.getChanType(), VideoChan);
    EXPECT_EQ(pair.getChanSubType(), Edit_Chan_SubType::NONE);
    EXPECT_EQ(pair.getObjectID(), edit->getCel(chan)->get_event(2).id);
    EXPECT_EQ(pair.getEffectHandle().object(), nullptr);
    pair.invalidate();
    EXPECT_FALSE(pair.valid());
    EXPECT_EQ(pair.idx(), NO_CHAN);
    EXPECT_EQ(pair.editTime(), Qx::kNoPairTime);
    EXPECT_EQ(pair.endEditTime(), Qx::kNoPairTime);
    EXPECT_EQ(pair.stripTime(), Qx::kNoPairTime);
    EXPECT_EQ(pair.endStripTime(), Qx::kNoPairTime);
    EXPECT_EQ(pair.stripCookie(), cookie());
    EXPECT_EQ(pair.length(), 0);
    EXPECT_TRUE(pair.isZeroLength());
    EXPECT_EQ(pair.editRange(), Editable::invalidRange());
    EXPECT_FALSE(pair.getObjectID().valid());
    EXPECT_FALSE(pair.overlaps(-1, -1) || pair.containsEditTime(-1) || pair.coincidesWith(-1, -1));
    EXPECT_FALSE(pair <= pair);
}

TEST_F(PairsOfAnEdit, FadesWidenTheRange) {
    cel* its = edit->getCel(chan);
    ce_handle(its, 2).set_audioRamp_DurationQFrames(8);
    ce_handle(its, 3).set_audioRamp_DurationQFrames(4);
    ce_handle(its, 2).set_strip_velocity(-2);
    const double frame = Qx::projectFrameRate().frameDuration();
    const CelEventPair pair = at(4);
    EXPECT_EQ(pair.getAudioFadeInQFrames(), 8);
    EXPECT_EQ(pair.getAudioFadeOutQFrames(), 4);
    EXPECT_EQ(pair.editRange(), cel::Range(3, 5));
    EXPECT_DOUBLE_EQ(pair.editRange(CelEventPair::WithFades).start(), 3 - 2 * frame);
    EXPECT_DOUBLE_EQ(pair.editRange(CelEventPair::WithFades).end(), 5 + frame);
    EXPECT_DOUBLE_EQ(pair.stripRange().start(), 3);
    EXPECT_DOUBLE_EQ(pair.stripRange().end(), -1);
    EXPECT_DOUBLE_EQ(pair.stripRange(CelEventPair::WithFades).start(), 3 + 4 * frame);
    EXPECT_DOUBLE_EQ(pair.stripRange(CelEventPair::WithFades).end(), -1 - 2 * frame);
}

TEST_F(PairsOfAnEdit, OverlapIsComparedEndByEnd) {
    const CelEventPair pair = at(3); // [3, 5)
    struct Case {
        double from, to;
        bool overlaps;
    };
    for (const Case& c : {Case{3, 3 + 5e-7, true}, Case{3, 2, true}, Case{1, 5, true}, Case{0, 3, false},
                          Case{0, 3 + 2e-6, true}, Case{0, 3 - 5e-7, false}, Case{5, 9, false},
                          Case{5 - 5e-7, 9, true}, Case{3.5, 4, true}, Case{0, 9, true}, Case{4, 9, true}}) {
        EXPECT_EQ(pair.overlaps(c.from, c.to), c.overlaps) << c.from << " " << c.to;
    }
    EXPECT_FALSE(pair.overlaps(at(0)));
    EXPECT_TRUE(pair.overlaps(pair));
    EXPECT_FALSE(pair.overlaps(CelEventPair()));
    EXPECT_TRUE(pair.coincidesWith(5 + 5e-7, 3));
    EXPECT_FALSE(pair.coincidesWith(3, 5.1));
    EXPECT_TRUE(pair.coincidesWith(pair));
    EXPECT_FALSE(pair.coincidesWith(CelEventPair()));
    EXPECT_TRUE(at(0) <= pair);
    EXPECT_FALSE(pair <= at(0));
}

TEST_F(PairsOfAnEdit, ResizingMovesTheOutPointAlone) {
    CelEventPair pair = at(3);
    pair.inH().set_strip_velocity(0.5);
    pair.resize(1);
    EXPECT_EQ(pair.endEditTime(), 4);
    EXPECT_EQ(pair.endStripTime(), 3.5);
    pair.resize(0);
    EXPECT_TRUE(pair.isZeroLength());
    EXPECT_EQ(pair.endStripTime(), 3);
    pair.resize(100);
    EXPECT_EQ(pair.endEditTime(), 7) << "stops at the next pair";
    EXPECT_EQ(pair.endStripTime(), 5);
    EXPECT_EQ(pair.editTime(), 3);
    pair.setStripCookie(black_cookie);
    EXPECT_TRUE(pair.inH().get_strip_cookie().isBlack() && pair.outH().get_strip_cookie().isBlack());
    CelEventPair().resize(3);
}

std::string letters(CelIterator it, bool forward) {
    std::string found;
    for (; it.valid(); forward ? it.inc() : it.dec()) {
        found += layout::letterOf(it.stripCookie());
    }
    return found;
}

TEST_F(PairsOfAnEdit, AreWalkedBothWays) {
    CelIterator it(edit, chan);
    EXPECT_EQ(letters(it, true), "ABC");
    it.moveToEnd();
    EXPECT_EQ(letters(it, false), "CBA");
    EXPECT_EQ(letters(CelIterator(edit, index), true), "ABC");
    EXPECT_EQ(letters(CelIterator(edit->getCel(chan)), true), "ABC");
    EXPECT_EQ(letters(CelIterator(edit, chan, 4), true), "BC");
    EXPECT_EQ(letters(CelIterator(edit, index, 4.0), false), "BA");
    EXPECT_EQ(letters(CelIterator(edit, index, ce_handle(edit->getCel(chan), 5)), true), "C");
    EXPECT_FALSE(it.inc());
    EXPECT_EQ(it.outH().index(), 6) << "one step past the end";
    EXPECT_EQ(it.inH().index(), 6);
    EXPECT_TRUE(it.dec());
    EXPECT_EQ(it.editTime(), 7);
    it.moveToStart();
    EXPECT_FALSE(it.dec());
    EXPECT_FALSE(it.valid());
    EXPECT_TRUE(it.inc());
    EXPECT_EQ(it, CelIterator(edit, chan));
    CelEventPair later = at(4);
    it.moveTo(later);
    EXPECT_EQ(*it, later);
    EXPECT_EQ(it++.getCelIdx(), 2);
    EXPECT_EQ((--it).getCelIdx(), 2);
    EXPECT_EQ(it.idx(), index);

    CelIterator none(edit, empty);
    EXPECT_FALSE(none.valid());
    none.moveToEnd();
    EXPECT_FALSE(none.valid());
    EXPECT_FALSE(none.inc());
    EXPECT_FALSE(CelIterator(edit, NO_CHAN).valid());
    EXPECT_FALSE(CelIterator().valid());
    EXPECT_EQ(CelIterator().idx(), NO_CHAN);
}

TEST_F(PairsOfAnEdit, AWalkGoesOnOverTheCelThatItBeganWithUntilItIsMoved) {
    CelIterator it(edit, chan);
    ASSERT_TRUE(edit->set_edit_cel_p(index, new cel(make("XYZ"))));
    const std::weak_ptr<cel> second = edit->getCel(chan)->weak_from_this();
    EXPECT_EQ(letters(it, true), "ABC");
    for (CelIterator removed(edit, chan); removed.valid(); removed.inc()) {
        ASSERT_FALSE(second.expired());
        EXPECT_EQ(removed.length(), 1);
        edit->removeChan(chan, false);
        EXPECT_EQ(removed.idx(), NO_CHAN);
    }
    EXPECT_TRUE(second.expired());
    const EditPtr other = edit->copy();
    index = other->addChan(VideoChan, new cel(make("XYZ")), false);
    it = CelIterator(other, index);
    EXPECT_EQ(letters(it, true), "XYZ");
    it.moveToEnd();
    EXPECT_EQ(letters(it, false), "ZYX");
}

} // namespace
