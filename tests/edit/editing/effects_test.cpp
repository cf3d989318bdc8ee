#include "edit/editing/transition_editor.h"
#include "edit/inspect/effect_check.h"
#include "edit/model/event_objects.h"
#include "platform/effects/effect_graph.h"
#include "tests/edit/editing/editing_fixture.h"

#include <algorithm>
#include <cmath>
#include <optional>
#include <random>

using namespace test;
using Op = edit_operation;

// Effects and transitions under the operations. An edit has an effects channel, "E", and two video channels;
// a letter is a clip, '-' a transition, 'e' an effect whose opacity rises from 0 to 1 over its length and
// whose input is the first video channel through a second node.

namespace {

constexpr unsigned kBuilding = Editor::NoBackup | TransitionEditor::WithoutHandles;

Tag<EffectInstance> effectOf(Edit& edit, const channel_event& in) {
    return edit.openObject<EffectInstance>(in.id);
}

/// Turns the drawn transitions, four seconds about a cut, and effects into such.
void addEffects(const EditPtr& edit, const std::vector<double>& cuts) {
    const IdStamp picture = edit->getId(edit->getFirstChan(VideoChan, Edit_Chan_SubType::NONE));
    cel& effects = *edit->get_edit_cel_p(0);
    for (int i = 0; i < effects.numEvents(); i += 2) {
        const double length = effects.getChanEventPtr(i + 1)->editTime - effects.getChanEventPtr(i)->editTime;
        const IdStamp head = IdStamp::fresh(IdStampMagic::EffectNode);
        const IdStamp inner = IdStamp::fresh(IdStampMagic::EffectNode);
        auto first = Fx::makeEffect(Fx::kMosaic);
        auto second = Fx::makeEffect(Fx::kTint);
        for (const double time : {0.0, length}) {
            ASSERT_TRUE(first->setKeyframe("opacity", time, Fx::ParameterValue::ofNumber(time / length)));
        }
        ASSERT_TRUE(first->setInputTrackId(0, inner) && second->setInputTrackId(0, picture));
        edit->objectStore().storeObject(head, std::move(first));
        edit->objectStore().storeObject(inner, std::move(second));
        for (const int at : {i, i + 1}) {
            channel_event event = effects.get_event(at);
            event.strip = effect_graph_cookie;
            event.id = at == i ? head : event.id;
            ASSERT_TRUE(effects.setEvent(at, event));
        }
    }
    for (const double cut : cuts) {
        const TransitionEditor::Result made = TransitionEditor::add(
            edit, picture, cut, *Fx::makeEffect(Fx::kDissolve), 4, TransitionAlign::Centre, kBuilding);
        ASSERT_TRUE(made.done) << made.reason;
    }
    edit->set_dirty(true);
}

std::string clipAt(const channel_event& in, double time) {
    return in.strip.isBlack() ? "."
                              : String::format("%c%.2f", layout::letterOf(in.strip),
                                               in.stripTime + (time - in.editTime) * in.velocity);
}

/// What a channel shows at a time: one clip, or two and how far the transition has come, or an effect.
std::vector<std::string> lookAt(Edit& edit, int chan, double time) {
    const cel& content = *edit.get_edit_cel_p(chan);
    const ce_handle at = content.find_ceh(time, CE_IN_POINT);
    const channel_event* const in = content.getChanEventPtr(at.index());
    if (in == nullptr || in[1].editTime <= time) {
        return {"."};
    }
    const Tag<EffectInstance> effect = effectOf(edit, *in);
    if (!effect.valid()) {
        return {clipAt(*in, time)};
    }
    const double now = time - in->editTime;
    if (!effect->isTransition()) {
        Vector<Tag<FXGraphNodeBase>> nodes;
        Fx::listGraph(edit.objectStore(), in->id, nodes);
        const int shown = edit.getIdx(nodes.back()->getInputTrackId(0));
        return {String::format("effect of %zu nodes at %.3f on %d", nodes.size(), effect->getAlphaAt(now),
                               shown)};
    }
    const bool first = at.index() == 0;
    const bool last = at.index() + 2 >= content.numEvents();
    return {String::format("%.3f", effect->getProgressAt(now, in[1].editTime - in->editTime)),
            first ? "." : clipAt(in[-2], time), last ? "." : clipAt(in[2], time)};
}

std::string drawEffects(Edit& edit, int chan) {
    std::string drawing;
    const cel& content = *edit.get_edit_cel_p(chan);
    for (double time = 0.5; time < content.get_end_time(); ++time) {
        const std::vector<std::string> look = lookAt(edit, chan, time);
        drawing += look.size() > 1 ? '-' : look[0][0];
    }
    while (!drawing.empty() && drawing.back() == '.') {
        drawing.pop_back();
    }
    return drawing;
}

std::string faultsOf(Edit& edit) {
    std::vector<String> faults;
    checkEffects(edit, {}, faults);
    std::string text;
    for (const String& fault : faults) {
        text += fault + "\n";
    }
    for (int i = 0; i < edit.getNumChans(); ++i) {
        if (const cel* const content = edit.get_edit_cel_p(i)) {
            text += layout::faultOf(*content, 0);
        }
    }
    return text;
}

/// The content, what is bound to it and the orphans.
std::string stateOf(Edit& edit) {
    std::string text = contentState(edit);
    for (const String& name : edit.objectStore().names()) {
        const IdStamp id{std::string_view(name)};
        const Tag<EffectInstance> effect(edit.objectStore(), id);
        if (effect.valid()) {
            text += name + " " + effect->getName() + " " + effect->getInputTrackId(0).asString();
            for (double time = 0; time <= 8; ++time) {
                text += String::format(" %.4f", effect->getAlphaAt(time));
            }
            text += "\n";
        }
    }
    return text;
}

struct Case {
    const char* name;
    Op op;
    Marks source;
    Marks destination;
    const char* effects; ///< the channels afterwards; null for what may be anything
    const char* picture;
    int takenOut;       ///< how many transitions the notice tells of
    bool trims = false; ///< a clip is trimmed at a transition, which shows another part of it then
};

constexpr double kNone = Qx::kNoTime;

// Before:   E  .eeeeee.eeee          Source:  E  eeee
//           V  AAAA----BBBB----CC             V  dd----ff
//           V  GGGGGGGGGGGGGGGGGG
// with the cuts at 6 and 14, and at 4.
const Case kCases[] = {
    {"InsertInAClip", Op::Insert, {0, 1}, {2}, ".eeeeeee.eeee", "AAdAA----BBBB----CC", 0},
    {"InsertInATransition", Op::Insert, {0, 1}, {5}, ".eeeeeee.eeee", "AAAAAdBBBBBBB----CC", 1},
    {"InsertAtItsStart", Op::Insert, {0, 1}, {4}, nullptr, "AAAAdBBBBBBBB----CC", 1},
    {"InsertAtItsEnd", Op::Insert, {0, 1}, {8}, nullptr, "AAAAAAAAdBBBB----CC", 1},
    {"InsertWholeTransition", Op::Insert, {1, 7}, {10}, nullptr, "AAAA----BBd----fBB----CC", 0},
    {"InsertFromWithin", Op::Insert, {3, 5}, {10}, nullptr, "AAAA----BBdfBB----CC", 0},
    {"InsertFromItsStart", Op::Insert, {2, 7}, {10}, nullptr, "AAAA----BBfffffBB----CC", 0},
    {"ReplaceItsMiddle", Op::Replace, {0, 1}, {5}, nullptr, "AAAAAdBBBBBB----CC", 1},
    {"ReplaceAllOfIt", Op::Replace, {2, 6}, {4}, nullptr, "AAAAddffBBBB----CC", 0},
    {"ReplaceUpToIt", Op::Replace, {0, 2}, {2}, nullptr, "AAddBBBBBBBB----CC", 1},
    {"ReplaceBehindIt", Op::Replace, {0, 2}, {8}, nullptr, "AAAAAAAAddBB----CC", 1},
    {"ReplaceAcrossBoth", Op::Replace, {0, 8}, {6}, nullptr, "AAAAAAdd----ffCCCC", 2},
    {"BackReplace", Op::BackReplace, {0, 2}, {kNone, 4}, nullptr, "AAddBBBBBBBB----CC", 1},
    {"ReplaceMaterial", Op::ReplaceMaterial, {0, 2}, {5}, nullptr, nullptr, 1},
    {"ReplaceToEnd", Op::ReplaceToEnd, {0, 8}, {5}, nullptr, "AAAAAdd----ff", 2},
    {"RemoveATail", Op::Remove, {}, {2, 4}, ".eeee.eeee", "AA----BBBB----CC", 0, true},
    {"RemoveAHead", Op::Remove, {}, {8, 10}, nullptr, "AAAA----BB----CC", 0, true},
    {"RemoveAClip", Op::Remove, {}, {0, 4}, nullptr, "BBBBBBBB----CC", 1},
    {"RemoveThroughIt", Op::Remove, {}, {5, 10}, nullptr, "AAAAABB----CC", 1},
    {"RemoveWithinIt", Op::Remove, {}, {5, 7}, nullptr, "AAAAABBBBB----CC", 1},
    {"RemoveAllBetween", Op::Remove, {}, {8, 12}, nullptr, "AAAAAAAACCCCCC", 2},
    {"LiftIt", Op::Lift, {}, {4, 8}, nullptr, "AAAA....BBBB----CC", 0},
    {"LiftAcross", Op::Lift, {}, {6, 10}, nullptr, "AAAAAA....BB----CC", 1},
    {"SwapTracks", Op::SwapTracks, {}, {2, 10}, nullptr, "AAGGGGGGGGBB----CC", 0},
    {"MoveTrack", Op::MoveTrack, {}, {2, 10}, nullptr, "AA........BB----CC", 0},
    {"CopyTrack", Op::CopyTrack, {}, {6, 16}, nullptr, "AAAA----BBBB----CC", 0},
};

/// What was shown at a time of the result: in the source, in the edit before, or nowhere.
std::optional<double> placeBefore(const Case& its, double time, bool& inSource) {
    const double at = its.destination.in < kNone ? its.destination.in
                                                 : its.destination.out - (its.source.out - its.source.in);
    const double length = its.op == Op::Remove || its.op == Op::Lift ? its.destination.out - at
                                                                     : its.source.out - its.source.in;
    inSource = its.op != Op::Remove && its.op != Op::Lift && time > at && time < at + length;
    if (inSource) {
        return its.source.in + time - at;
    }
    if (time < at) {
        return time;
    }
    if (its.op == Op::Lift && time < at + length) {
        return std::nullopt;
    }
    return its.op == Op::Remove ? time + length : time - (its.op == Op::Insert ? length : 0);
}

class EffectsTest : public EditingTest {
protected:
    EditPtr makeBefore() {
        const EditPtr edit = make({"E  eeeeee eeee", "V AAAAAABBBBBBBBCCCC", "V GGGGGGGGGGGGGGGGGG"});
        addEffects(edit, {6, 14});
        edit_manager::flush_changes();
        return edit;
    }

    void check(const Case& its) {
        SCOPED_TRACE(its.name);
        EditPtr edit = makeBefore();
        const EditPtr before = edit->copy();
        const EditPtr source = editOf({"E eeee", "V ddddffff"});
        addEffects(source, {4});
        const bool interTrack =
            its.op == Op::SwapTracks || its.op == Op::MoveTrack || its.op == Op::CopyTrack;
        EditModule to = moduleOf(edit, its.destination);
        if (interTrack) {
            to.selectChan(edit->getId(0), false);
        }
        const std::string stateBefore = stateOf(*edit);
        ASSERT_EQ(faultsOf(*edit), "");
        const Editor::Result result = Editor::apply(moduleOf(source, its.source), to, its.op);
        ASSERT_TRUE(result.valid()) << result.reason();
        const long told = std::count(result.notice().begin(), result.notice().end(), ',') +
                          (result.notice().empty() ? 0 : 1);
        EXPECT_EQ(told, its.takenOut) << result.notice();
        if (its.picture != nullptr) {
            EXPECT_EQ(drawEffects(*edit, 1), its.picture);
        }
        if (its.effects != nullptr) {
            EXPECT_EQ(drawEffects(*edit, 0), its.effects);
        }
        EXPECT_EQ(faultsOf(*edit), "");
        if (!interTrack && its.op != Op::ReplaceMaterial) {
            compareLooks(its, *edit, *before, *source);
        }
        const EditPtr kept = clipboard();
        EXPECT_EQ(kept.valid() ? faultsOf(*kept) : "", "");

        const cookie item = edit->get_cookie();
        const std::string stateAfter = stateOf(*edit);
        edit.invalidate();
        ASSERT_TRUE(edit_manager::undoRequest(item));
        EXPECT_EQ(stateOf(*edit_manager::openEdit(item, eOpenExisting)), stateBefore);
        ASSERT_TRUE(edit_manager::redoRequest(item));
        EXPECT_EQ(stateOf(*edit_manager::openEdit(item, eOpenExisting)), stateAfter);
        EXPECT_EQ(faultsOf(*edit_manager::openEdit(item, eOpenExisting)), "");
    }

    /// At each moment the result shows what was there, or one of two clips that a transition joined.
    static void compareLooks(const Case& its, Edit& after, Edit& before, Edit& source) {
        for (const int chan : {0, 1}) {
            for (double time = 0.25; time < after.get_edit_cel_p(chan)->get_end_time(); time += 0.5) {
                bool inSource = false;
                const std::optional<double> was = placeBefore(its, time, inSource);
                const std::vector<std::string> look = lookAt(after, chan, time);
                std::vector<std::string> expected{"."};
                if (was.has_value()) {
                    expected = lookAt(inSource ? source : before, chan, *was);
                }
                const bool isOneOf = look.size() == 1 && expected.size() > 1 &&
                                     (look[0] == expected[1] || look[0] == expected[2]);
                const bool isTrimmed = its.trims && look.size() > 1 && expected.size() > 1 &&
                                       look[0] == expected[0] && look[1][0] == expected[1][0] &&
                                       look[2][0] == expected[2][0];
                EXPECT_TRUE(look == expected || isOneOf || isTrimmed)
                    << "channel " << chan << " at " << time << ": " << testing::PrintToString(look) << " for "
                    << testing::PrintToString(expected);
            }
        }
    }
};

TEST_F(EffectsTest, OperationsKeepWhatIsSeenAndAreUndone) {
    for (const Case& its : kCases) {
        check(its);
    }
}

/// Whatever is done in whatever order, an edit's graphs hang together, and so does a copy of it.
TEST_F(EffectsTest, RandomOperationsLeaveNothingLoose) {
    constexpr unsigned kSeed = 20250;
    constexpr int kRuns = 60;
    constexpr int kSteps = 25;
    std::mt19937 random(kSeed);
    const auto below = [&](int end) { return static_cast<int>(random() % static_cast<unsigned>(end)); };
    for (int run = 0; run < kRuns; ++run) {
        SCOPED_TRACE(String::format("seed %u, run %d", kSeed, run));
        const EditPtr edit =
            editOf({"E  eeeeee eeee", "V AAAAAABBBBBBBBCCCC", "V GGGGGGGGGGGGGGGGGG", "E   eeee"});
        const EditPtr source = editOf({"E eeee  ee", "V ddddffffgg"}, 901);
        addEffects(edit, {6, 14});
        addEffects(source, {4});
        std::string done;
        for (int step = 0; step < kSteps && !HasFailure(); ++step) {
            const Op op = static_cast<Op>(1 + below(kNumEditOperations - 1));
            const auto marks = [&] {
                const double in = below(40) / 2.0;
                return Marks{in, in + 0.5 + below(12) / 2.0};
            };
            EditModule from = moduleOf(below(3) == 0 ? edit : source, marks());
            EditModule to = moduleOf(edit, marks());
            for (int chan = 0; chan < edit->getNumChans(); ++chan) {
                to.selectChan(edit->getId(chan), op == Op::SwapTracks || below(4) != 0);
            }
            const unsigned flags = Editor::NoBackup | Editor::NoNewChannels;
            done += Editor::apply(from, to, op, flags).valid()
                        ? String::format(" %s", editOperationName(op).data())
                        : String();
            ASSERT_EQ(faultsOf(*edit), "") << done;
            if (below(4) == 0) {
                // Half of the cuts that are tried are none, or have no room.
                const IdStamp chan = edit->getId(edit->getFirstChan(VideoChan, Edit_Chan_SubType::NONE));
                const auto kind = Fx::makeEffect(below(2) == 0 ? Fx::kDissolve : Fx::kWipe);
                const cel& content = *edit->get_edit_cel_p(edit->getIdx(chan));
                const int event = content.numEvents() > 0 ? below(content.numEvents()) : 0;
                const double at = content.get_event(event).editTime;
                if (below(3) == 0) {
                    TransitionEditor::remove(edit, chan, at, kBuilding & ~TransitionEditor::WithoutHandles);
                } else {
                    TransitionEditor::add(edit, chan, at, *kind, 0.5 + below(4) / 2.0,
                                          static_cast<TransitionAlign>(below(3)), kBuilding);
                }
                ASSERT_EQ(faultsOf(*edit), "") << done;
            }
        }
        EXPECT_EQ(stateOf(*edit->copy()), stateOf(*edit));
    }
}

TEST_F(EffectsTest, TransitionsAreLaidChangedAndTakenOut) {
    struct Lay {
        double at, length;
        TransitionAlign align;
        const char* after; ///< null when it is refused
    };
    const Lay lays[] = {
        {6, 4, TransitionAlign::Start, "AAAAAA----BB"},
        {6, 4, TransitionAlign::Centre, "AAAA----BBBB"},
        {6, 4, TransitionAlign::End, "AA----BBBBBB"},
        {6, 12, TransitionAlign::Centre, "------------"},
        {0, 2, TransitionAlign::Start, "--AAAABBBBBB"},
        {12, 2, TransitionAlign::End, "AAAAAABBBB--"},
        {6, 14, TransitionAlign::Centre, nullptr},
        {5, 2, TransitionAlign::Centre, nullptr},
        {0, 2, TransitionAlign::Centre, nullptr},
        {6, 0, TransitionAlign::Centre, nullptr},
        {6, std::nan(""), TransitionAlign::Start, nullptr},
        {std::nan(""), 2, TransitionAlign::Start, nullptr},
    };
    for (const Lay& lay : lays) {
        SCOPED_TRACE(String::format("%g %g %d", lay.at, lay.length, static_cast<int>(lay.align)));
        EditPtr edit = make({"V AAAAAABBBBBB"});
        const cookie item = edit->get_cookie();
        const IdStamp chan = edit->getId(0);
        const std::string before = stateOf(*edit);
        const auto dissolve = Fx::makeEffect(Fx::kDissolve);
        const auto made = TransitionEditor::add(edit, chan, lay.at, *dissolve, lay.length, lay.align);
        EXPECT_EQ(made.done, lay.after != nullptr) << made.reason;
        EXPECT_EQ(drawEffects(*edit, 0), lay.after != nullptr ? lay.after : "AAAAAABBBBBB");
        EXPECT_EQ(faultsOf(*edit), "");
        if (lay.after == nullptr) {
            EXPECT_EQ(stateOf(*edit), before);
            EXPECT_FALSE(made.reason.empty());
            continue;
        }
        edit.invalidate();
        ASSERT_TRUE(edit_manager::undoRequest(item));
        edit = edit_manager::openEdit(item, eOpenExisting);
        EXPECT_EQ(stateOf(*edit), before);
    }

    const EditPtr edit = make({"V AAAAAABBBBBB"});
    const IdStamp chan = edit->getId(0);
    const auto made = TransitionEditor::add(edit, chan, 6, *Fx::makeEffect(Fx::kDissolve), 4);
    const auto wipe = Fx::makeEffect(Fx::kWipe);
    EXPECT_FALSE(TransitionEditor::add(edit, chan, 8, *wipe, 2).done) << "beside another";
    EXPECT_FALSE(TransitionEditor::add(edit, chan, 6, *Fx::makeEffect(Fx::kCrossFade), 2).done);
    EXPECT_FALSE(TransitionEditor::set(edit, chan, 1, wipe.get(), 2).done);
    const auto set = TransitionEditor::set(edit, chan, 6, wipe.get(), 2, TransitionAlign::Start);
    ASSERT_TRUE(set.done) << set.reason;
    EXPECT_EQ(set.event, made.event);
    EXPECT_EQ(drawEffects(*edit, 0), "AAAAAA--BBBB");
    EXPECT_EQ(effectOf(*edit, *edit->get_edit_cel_p(0)->getChanEventPtr(2))->tagTypeId().id(), Fx::kWipe);
    ASSERT_TRUE(TransitionEditor::remove(edit, chan, 7).done);
    EXPECT_EQ(drawEffects(*edit, 0), "AAAAAAABBBBB");

    // The graph is an orphan now, and comes back where it was.
    EXPECT_TRUE(EventObjects::bringBack(*edit, set.event, chan));
    EXPECT_EQ(drawEffects(*edit, 0), "AAAAAA--BBBB");
    EXPECT_EQ(faultsOf(*edit), "");
    EXPECT_FALSE(EventObjects::bringBack(*edit, set.event, chan));
}

TEST_F(EffectsTest, WhatNeedsMoreMaterialThanThereIsIsRefused) {
    const EditPtr shots[] = {make({"V aaaaaaaa"}, 201), make({"V bbbbbbbb"}, 202)};
    const EditPtr edit = make({"V "});
    cel& content = *edit->get_edit_cel_p(0);
    // The first has 1 second behind its end, the second 2 before its start, played backwards at double speed.
    content.appendEventPair(shots[0]->get_cookie(), 1, 0, 6);
    content.appendEventPair(shots[1]->get_cookie(), 4, 6, 2);
    for (const int i : {2, 3}) {
        channel_event event = content.get_event(i);
        event.velocity = -2;
        event.stripTime = i == 2 ? 4 : 0;
        ASSERT_TRUE(content.setEvent(i, event));
    }
    const auto dissolve = Fx::makeEffect(Fx::kDissolve);
    const struct {
        double length;
        TransitionAlign align;
        double missing[2];
    } cases[] = {
        {1, TransitionAlign::Start, {0, 0}}, {2, TransitionAlign::Start, {1, 0}},
        {2, TransitionAlign::End, {0, 0}},   {4, TransitionAlign::Centre, {1, 0}},
        {4, TransitionAlign::End, {0, 2}},
    };
    for (const auto& its : cases) {
        const EditPtr twin = edit->copy();
        const auto made = TransitionEditor::add(twin, twin->getId(0), 6, *dissolve, its.length, its.align);
        EXPECT_EQ(made.done, its.missing[0] + its.missing[1] == 0) << made.reason;
        for (const int side : {0, 1}) {
            EXPECT_TRUE(made.handles.known[side]);
            EXPECT_NEAR(made.handles.missing[side], its.missing[side], 1e-6) << its.length;
        }
    }
}

TEST_F(EffectsTest, ChannelsTakeTheirGraphsWithThem) {
    const EditPtr edit = makeBefore();
    const IdStamp other = IdStamp::fresh(IdStampMagic::Channel);
    const IdStamp picture = edit->getId(1);
    const IdStamp shown = edit->get_edit_cel_p(0)->getChanEventPtr(0)->id;
    ASSERT_TRUE(edit->setChannelID(picture, other));
    EXPECT_EQ(lookAt(*edit, 0, 4)[0], "effect of 2 nodes at 0.500 on 1");
    EXPECT_EQ(faultsOf(*edit), "");

    // An event that shows a channel names it still when it is copied, and is black when that is gone.
    cel& effects = *edit->get_edit_cel_p(0);
    ce_handle alias = effects.appendEventPair(alias_cookie, 0, 14, 2);
    alias.setEffectGraph(other);
    cel copy;
    cel::IdMap ids;
    ASSERT_TRUE(copy.insert(&effects, {14, 16}, 0, ids));
    EXPECT_EQ(copy.getChanEventPtr(0)->id, other);
    ASSERT_TRUE(edit->removeChan(other, false));
    EXPECT_EQ(faultsOf(*edit), "");
    EXPECT_EQ(lookAt(*edit, 0, 15)[0], ".");
    ASSERT_TRUE(edit->removeChan(edit->getId(0), false));
    const IdStamp chan = edit->getId(edit->addChan(VideoChan, nullptr, false, Edit_Chan_SubType::ALIAS));
    EXPECT_TRUE(EventObjects::bringBack(*edit, shown, chan));
    EXPECT_EQ(lookAt(*edit, edit->getIdx(chan), 4)[0].substr(0, 26), "effect of 2 nodes at 0.500");
    EXPECT_EQ(EventObjects::removeOrphans(*edit), 3U);
    EXPECT_EQ(faultsOf(*edit), "");
}

TEST_F(EffectsTest, CheckFindsWhatIsWrong) {
    struct Fault {
        const char* says;
        std::function<void(Edit&, Tag<EffectInstance>)> make;
    };
    const Fault faults[] = {
        {"which is no channel",
         [](Edit&, auto head) { head->setInputTrackId(0, IdStamp::fresh(IdStampMagic::Channel)); }},
        {"has a loop",
         [](Edit& edit, auto head) {
             edit.openObject<EffectInstance>(head->getInputTrackId(0))->setInputTrackId(0, head.id());
         }},
        {"comes back to it", [](Edit& edit, auto head) { head->setInputTrackId(0, edit.getId(0)); }},
        {"is referred to by nothing", [](Edit&, auto head) { head->setInputTrackId(0, IdStamp()); }},
        {"is not there",
         [](Edit& edit, auto head) { edit.objectStore().removeObject(head->getInputTrackId(0)); }},
        {"shares the node",
         [](Edit& edit, auto head) {
             effectOf(edit, *edit.get_edit_cel_p(0)->getChanEventPtr(2))
                 ->setInputTrackId(0, head->getInputTrackId(0));
         }},
        {"is that of two events",
         [](Edit& edit, auto head) { ce_handle(edit.get_edit_cel_p(0), 2).setEffectGraph(head.id()); }},
        {"no clip is beside",
         [](Edit& edit, auto) {
             edit.get_edit_cel_p(1)->replacePairs(0, 1, {});
             edit.get_edit_cel_p(1)->replacePairs(1, 1, {});
         }},
    };
    for (const Fault& fault : faults) {
        const EditPtr edit = makeBefore();
        fault.make(*edit, effectOf(*edit, *edit->get_edit_cel_p(0)->getChanEventPtr(0)));
        EXPECT_NE(faultsOf(*edit).find(fault.says), std::string::npos)
            << fault.says << ": " << faultsOf(*edit);
    }
}

} // namespace
