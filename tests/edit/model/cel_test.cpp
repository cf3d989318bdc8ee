// Events, finding and stepping, single-field setters, extents.

#include "edit/model/cel.h"
#include "edit/model/channel_types.h"
#include "edit/model/managed_cel.h"
#include "support/cel_layout.h"

#include <gtest/gtest.h>

namespace {

using layout::draw;
using layout::make;

TEST(CelFinding, TheGoverningEventOfEachKind) {
    const cel its = make(" AA BBCC");
    struct Case {
        double time;
        int in, out, any;
    };
    for (const Case& c : {Case{0, -1, 1, -1}, Case{1, 0, 1, 0}, Case{1 - 5e-7, 0, 1, 0}, Case{2, 0, 1, 0},
                          Case{3, 0, 1, 1}, Case{3.5, 0, 3, 1}, Case{4, 2, 3, 2}, Case{6, 4, 3, 4},
                          Case{6 + 5e-7, 4, 3, 4}, Case{7, 4, 5, 4}, Case{8, 4, 5, 5}, Case{9, 4, -1, 5},
                          Case{-1e99, -1, 1, -1}, Case{1e99, 4, -1, 5}, Case{std::nan(""), -1, -1, -1}}) {
        EXPECT_EQ(its.find_ceh(c.time, CE_IN_POINT).index(), c.in) << c.time;
        EXPECT_EQ(its.find_ceh(c.time, CE_OUT_POINT).index(), c.out) << c.time;
        EXPECT_EQ(its.find_ceh(c.time, CE_ANY).index(), c.any) << c.time;
        EXPECT_EQ(its.find_ceh(c.time, CE_RESERVED).valid(), 0);
    }
    EXPECT_EQ(cel().find_ceh(0, CE_IN_POINT).valid(), 0);
    EXPECT_EQ(cel().find_ceh(0, CE_OUT_POINT).valid(), 0);
}

TEST(CelHandles, WhatPlaysAtATime) {
    cel its = make("AAAA BB", 10);
    ce_handle in = its.get_start_ceh();
    in.set_strip_velocity(-0.5);
    in.set_strip_level(0);
    EXPECT_DOUBLE_EQ(in.get_strip_time(2), 9);
    EXPECT_DOUBLE_EQ(in.matching_out_ceh().get_strip_time(), 8);
    EXPECT_FLOAT_EQ(in.get_strip_level(1), 0.25f);
    EXPECT_DOUBLE_EQ(its.get_strip_time(3), 8.5);
    EXPECT_EQ(its.get_strip_time(4), Qx::kNoTime) << "a gap";
    EXPECT_EQ(its.get_strip_cookie(4.0), invalid_cookie);
    EXPECT_EQ(its.get_strip_cookie(5.0), layout::sourceOf('B'));
    EXPECT_TRUE(in.time_in_range_exclusive(2));
    EXPECT_FALSE(in.time_in_range_exclusive(0));
    EXPECT_FALSE(in.time_in_range_exclusive(4));
    EXPECT_FALSE(CEHPair(its, 4.5).valid());
    EXPECT_EQ(CEHPair(its, 5.5).editRange(), cel::Range(5, 7));
    EXPECT_EQ(CEHPair(its, 9).editRange(), Editable::invalidRange());
}

TEST(CelHandles, AnInvalidOneAnswersZeroAndChangesNothing) {
    cel its = make("AA");
    its.setChanged(false);
    for (ce_handle h : {ce_handle(), ce_handle(&its, -1), ce_handle(&its, 2)}) {
        EXPECT_EQ(h.get_edit_time(), 0);
        EXPECT_EQ(h.get_strip_time(3), 0);
        EXPECT_EQ(h.get_strip_level(3), 0);
        EXPECT_EQ(h.get_strip_cookie(), invalid_cookie);
        EXPECT_EQ(h.get_chan_evnt_ptr(), nullptr);
        EXPECT_EQ(h.get_channel_event(), channel_event());
        EXPECT_EQ(h.matching_in_ceh().valid(), 0);
        EXPECT_FALSE(h.is_in_point() || h.is_out_point() || h.time_in_range_exclusive(1));
        h.set_strip_level(2);
        h.set_strip_time(2);
        h.set_strip_velocity(2);
        h.set_strip_cookie(black_cookie);
        EXPECT_FALSE(h.set_edit_time(1));
    }
    EXPECT_FALSE(its.changed());
}

TEST(CelHandles, SettersIgnoreWhatNoEventMayHold) {
    cel its = make("AA");
    ce_handle in = its.get_start_ceh();
    const channel_event before = in.get_channel_event();
    in.set_strip_level(INFINITY);
    in.set_strip_time(std::nan(""));
    in.set_strip_time(1e300);
    in.set_strip_velocity(1e30);
    in.setEffectGraph(IdStamp());
    EXPECT_FALSE(in.set_edit_time(std::nan("")));
    EXPECT_EQ(in.get_channel_event(), before);
}

TEST(CelEvents, OnlyWhatFollowsIsAdded) {
    cel its;
    const cookie source = layout::sourceOf('A');
    const auto event = [&](double time, ce_info kind) {
        return channel_event(time, 0, source, 1, kind, channel_event::newId(), 0);
    };
    EXPECT_FALSE(its.add_event(event(1, CE_OUT_POINT)));
    EXPECT_TRUE(its.add_event(event(1, CE_IN_POINT)));
    EXPECT_EQ(its.is_good_cel(), 0) << "the pair is open";
    EXPECT_FALSE(its.remove({0, 9}));
    EXPECT_FALSE(its.add_event(event(2, CE_IN_POINT)));
    EXPECT_FALSE(its.add_event(event(0.5, CE_OUT_POINT)));
    EXPECT_FALSE(its.add_event(event(std::nan(""), CE_OUT_POINT)));
    EXPECT_FALSE(its.add_event(event(2, CE_RESERVED)));
    EXPECT_TRUE(its.add_event(event(2, CE_OUT_POINT)));
    EXPECT_TRUE(its.add_event(event(2 - 5e-7, CE_IN_POINT)));
    EXPECT_EQ(its.get_event(2).editTime, 2) << "within the tolerance counts as one";
    EXPECT_TRUE(its.close());
    EXPECT_EQ(its.numPairs(), 2);
    EXPECT_NE(its.is_good_cel(), 0);

    cel pairs;
    EXPECT_TRUE(pairs.appendEventPair(source, 0, 4, 2).valid());
    EXPECT_FALSE(pairs.appendEventPair(source, 0, 5, 2).valid());
    EXPECT_FALSE(pairs.appendEventPair(source, 0, 8, -1).valid());
    EXPECT_FALSE(pairs.insertEventPair(0, source, 0, 3, 2).valid());
    EXPECT_FALSE(pairs.insertEventPair(2, source, 0, 9, 2).valid());
    EXPECT_EQ(pairs.insertEventPair(0, source, 0, 3, 1).index(), 0);
    EXPECT_EQ(pairs.get_start_time(), 3);
    EXPECT_EQ(pairs.get_end_time(), 6);
    channel_event moved = pairs.get_event(1);
    moved.editTime = 5;
    EXPECT_FALSE(pairs.setEvent(1, moved));
    moved.editTime = 3.5;
    EXPECT_TRUE(pairs.setEvent(1, moved));
    EXPECT_FALSE(pairs.setEvent(0, moved)) << "an out point at an in point's place";
    EXPECT_EQ(pairs.findId(moved.id).index(), 1);
    EXPECT_EQ(pairs.findId(moved.id, 1).index(), 1);
    EXPECT_EQ(pairs.findId(IdStamp(1, 2, 3)).valid(), 0);
}

TEST(CelExtents, CountMaterialOrAll) {
    const cel its = make(" ..AA BB..");
    EXPECT_EQ(its.getExtents(), cel::Range(1, 10));
    EXPECT_EQ(its.getExtents(Editable::Everything, true), cel::Range(0, 10));
    EXPECT_EQ(its.getExtents(Editable::MaterialOnly), cel::Range(3, 8));
    EXPECT_EQ(make("..").getExtents(Editable::MaterialOnly), Editable::invalidRange());
    EXPECT_EQ(cel().getExtents(), Editable::invalidRange());
    EXPECT_TRUE(its.isEmpty(cel::Range(0, 3)));
    EXPECT_TRUE(its.isEmpty(cel::Range(5, 6)));
    EXPECT_TRUE(its.isEmpty(cel::Range(8, 99)));
    EXPECT_FALSE(its.isEmpty(cel::Range(0, 4)));
    EXPECT_FALSE(its.isEmpty(cel::Range(7, 20)));
    EXPECT_FALSE(its.isEmpty());
    EXPECT_TRUE(make(". .").isEmpty());
}

TEST(ManagedCels, ShareOneCelAndCloneAnother) {
    AudCel sound = AudCel::create();
    EXPECT_EQ(sound.id().getMagicType(), IdStampMagic::Channel);
    layout::build(*sound.getCel(), "AABB");
    const AudCel shared = sound;
    const AudCel cloned = sound.clone();
    EXPECT_EQ(shared.getCel(), sound.getCel());
    EXPECT_NE(cloned.getCel(), sound.getCel());
    EXPECT_EQ(cloned.id(), sound.id());
    sound.setXFadesEnabled(true);
    EXPECT_FALSE(sound.getXFadeCelsValid());
    sound.setXFadeCels(std::make_shared<cel>(), std::make_shared<cel>());
    EXPECT_TRUE(sound.getXFadeCelsValid());
    EXPECT_NE(sound.getXFadeCel(1), nullptr);
    EXPECT_EQ(sound.getXFadeCel(2), nullptr);
    AudCel other = shared;
    EXPECT_TRUE(other.setShotSound(3, BeginEnd::End, 0.25f));
    EXPECT_FALSE(sound.getXFadeCelsValid()) << "changed through another object";
    EXPECT_EQ(sound.getCel()->get_event(3).level, 0.25f);
    EXPECT_EQ(cloned.getCel()->get_event(3).level, 1.0f);
    EXPECT_FALSE(other.setShotSound(9, BeginEnd::Begin, 1));
    EXPECT_TRUE(other.setFadeLength(other.getCel()->get_start_ceh(), 6));
    EXPECT_FALSE(other.setFadeLength(cloned.getCel()->get_start_ceh(), 6));

    AudCel none = AudCel::createInvalid();
    cel::IdMap ids;
    EXPECT_FALSE(none.insert(sound, {0, 1}, 0, ids) || none.remove({0, 1}) ||
                 none.simplify(Simplification::MergeAll) || none.setShotSound(0, BeginEnd::Begin, 1));
    EXPECT_FALSE(sound.insert(none, {0, 1}, 0, ids));
    EXPECT_EQ(none.getExtents(), Editable::invalidRange());
    EXPECT_FALSE(none.clone().valid() || ManagedCel::createInvalid().valid());

    ManagedCel base = sound.clone().ManagedCel::clone();
    cel::Splits splits;
    EXPECT_TRUE(base.insert(sound, {0, 1}, 1, ids, &splits) && base.remove({3.5, 4}, &splits) &&
                base.replace(sound, {0, 0.1}, 0.5, ids, false, &splits));
    EXPECT_EQ(splits.size(), 3u);
}

TEST(CelFinding, AgreesWithALoopOnAnyNumberOfPairs) {
    for (int pairs = 0; pairs < 70; ++pairs) {
        cel its;
        for (int k = 0; k < pairs; ++k) {
            its.appendEventPair(layout::sourceOf('A'), 0, 2 * k, k % 3 == 0 ? 2 : 1);
        }
        for (double time = -1; time < 2 * pairs + 2; time += 0.5) {
            int in = -1;
            int out = -1;
            for (int i = 0; i < its.numEvents(); ++i) {
                in = i % 2 == 0 && its.get_event(i).editTime <= time ? i : in;
                out = i % 2 == 1 && out < 0 && its.get_event(i).editTime >= time ? i : out;
            }
            ASSERT_EQ(its.find_ceh(time, CE_IN_POINT).index(), in) << pairs << " pairs at " << time;
            ASSERT_EQ(its.find_ceh(time, CE_OUT_POINT).index(), out) << pairs << " pairs at " << time;
        }
    }
}

} // namespace
