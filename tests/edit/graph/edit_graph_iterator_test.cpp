#include "edit/graph/edit_graph_iterator.h"
#include "edit/model/edit.h"
#include "platform/base/ole_splat.h"
#include "platform/effects/effect_graph.h"
#include "support/cel_layout.h"
#include "support/memory_meter.h"
#include "support/recording_log.h"
#include "support/recording_registry.h"

#include <gtest/gtest.h>

#include <limits>

namespace {

std::vector<String> splats;
constexpr int kUp = EditGraphIterator::kBidirectional;
constexpr int kGhosts = kUp | EditGraphIterator::kTraverseGhosts;

/// One edit with channels drawn as text: letters are material, digits the edits of those numbers, 'x' a dissolve
/// between its neighbours.
class Graph : public testing::Test {
protected:
    Graph() : m_before(Qx::setSplatHandler([](const char* text) { splats.emplace_back(text); })) {
        splats.clear();
        edit = make(9);
    }
    ~Graph() override { Qx::setSplatHandler(m_before); }

    static cookie editCookie(int number) { return {Cookie_Type::Edit, number, 0}; }

    EditPtr make(int number) {
        EditPtr made(new Edit);
        made->set_cookie(editCookie(number));
        registry.add(made);
        return made;
    }
    static IdStamp chan(const EditPtr& in, std::string_view drawing, Edit_Chan_Type type = VideoChan) {
        const IdStamp id = in->getId(in->addChan(type));
        for (size_t at = 0; at < drawing.size();) {
            const size_t end = std::min(drawing.find_first_not_of(drawing[at], at), drawing.size());
            const bool nests = drawing[at] >= '0' && drawing[at] <= '9';
            const cookie strip = nests ? editCookie(drawing[at] - '0') : layout::sourceOf(drawing[at]);
            const auto from = static_cast<double>(at);
            const auto length = static_cast<double>(end - at);
            if (drawing[at] == 'x') {
                bind(in, in->getCel(id)->appendEventPair(effect_graph_cookie, 0, from, length),
                     Fx::makeEffect(Fx::kDissolve));
            } else if (drawing[at] != ' ') {
                in->getCel(id)->appendEventPair(strip, nests ? 0 : 100, from, length);
            }
            at = end;
        }
        return id;
    }
    static IdStamp bind(const EditPtr& in, ce_handle event, std::unique_ptr<Streamable> node) {
        const IdStamp id = IdStamp::fresh(IdStampMagic::EffectNode);
        event.setEffectGraph(id);
        in->objectStore().storeObject(id, std::move(node));
        return id;
    }
    /// An effects channel with one effect of a kind, wired to some channels; its node in `node`.
    IdStamp fx(std::vector<IdStamp> inputs, double length = 10, std::string_view kind = Fx::kKey) {
        const IdStamp id = edit->getId(edit->addChan(VideoChan, nullptr, true, Edit_Chan_SubType::ALIAS));
        node = bind(edit, edit->getCel(id)->appendEventPair(effect_graph_cookie, 0, 0, length),
                    Fx::makeEffect(kind));
        for (unsigned i = 0; i < inputs.size(); ++i) {
            EXPECT_TRUE(edit->openObject(node)->setInputTrackId(i, inputs[i]));
        }
        return id;
    }
    char shown(const EditGraphIterator& at) {
        return layout::letterOf(at.getUTRHandle(-1).get_strip_cookie());
    }

    test::RecordingRegistry registry;
    EditPtr edit;
    IdStamp node;

private:
    Qx::SplatHandler m_before;
};

} // namespace

TEST_F(Graph, WalksFromAnEffectToWhatItsInputsShow) {
    const IdStamp v1 = chan(edit, "AAAABBBBBB");
    const IdStamp v2 = chan(edit, "  CCxxDD");
    const IdStamp top = fx({v1, v2});
    EditGraphIterator at(edit, top, 4.5, kUp);
    ASSERT_TRUE(at.isValid());
    EXPECT_EQ(at.getNodeId(-1), node);
    EXPECT_FALSE(at.moveBack());
    EXPECT_FALSE(at.moveToInput(2));
    ASSERT_TRUE(at.moveToInput(0));
    EXPECT_EQ(shown(at), 'B');
    EXPECT_FALSE(at.moveToInput(0));
    EXPECT_EQ(at.getExtents(), EditGraphIterator::Extents(4, 10));
    ASSERT_TRUE(at.moveBack());
    ASSERT_TRUE(at.moveToInput(1));
    for (const unsigned input : {0u, 1u}) {
        ASSERT_TRUE(at.moveToInput(input));
        EXPECT_EQ(shown(at), input == 0 ? 'C' : 'D');
        EXPECT_EQ(at.getStackDepth(), 3);
        EXPECT_EQ(at.getParentInputNum(), static_cast<int>(input));
        ASSERT_TRUE(at.moveBack());
    }
    EXPECT_EQ(at.getExtents(), EditGraphIterator::Extents(4, 6));

    Vector<int> tracks;
    listMaterialSourceTracks(tracks, edit, top, 4.5);
    EXPECT_EQ(tracks, (Vector<int>{edit->getIdx(v1), edit->getIdx(v2)}));
    Vector<IdStamp> roots;
    findAllRootNodeChans(edit, 4.5, roots);
    EXPECT_EQ(roots, Vector<IdStamp>{top});
    EXPECT_EQ(EditGraphIterator(edit, top, 8.5, kUp).calculateMorphologyExtentsExplicit(),
              EditGraphIterator::Extents(8, 10))
        << "nothing on the second channel";
    // A single level is kept otherwise.
    EditGraphIterator one(edit, top, 4.5, 0);
    one = at;
    EXPECT_EQ(one, at);
    one = EditGraphIterator(edit, top, 4.5, 0);
    ASSERT_TRUE(one.moveToInput(1) && one.moveToInput(0));
    EXPECT_EQ(one.getStackDepth(), 1);
    EXPECT_FALSE(one.moveBack());
    EXPECT_EQ(shown(one), 'C');
}

TEST_F(Graph, RefusesTheNeighboursThatATransitionHasNot) {
    const IdStamp first = chan(edit, "xxAA");
    const IdStamp last = chan(edit, "AAxx");
    EXPECT_FALSE(EditGraphIterator(edit, first, 0, kUp).moveToInput(0));
    EXPECT_TRUE(EditGraphIterator(edit, first, 0, kUp).moveToInput(1));
    EXPECT_FALSE(EditGraphIterator(edit, last, 3, kUp).moveToInput(1));
    EXPECT_TRUE(EditGraphIterator(edit, last, 3, kUp).moveToInput(0));
}

TEST_F(Graph, TakesWhatATransitionsInputsSay) {
    const IdStamp other = chan(edit, "EEEEEE");
    const IdStamp v1 = chan(edit, "CCxxDD");
    const Tag<FXGraphNodeBase> dissolve = CelEventPair(edit, v1, 3).getEffectHandle();
    const struct {
        IdStamp inputs[2];
        const char* shows; ///< '-' for a refusal
    } cases[] = {{{previousInputId, nextInputId}, "CD"},
                 {{nextInputId, previousInputId}, "DC"},
                 {{other, nextInputId}, "ED"},
                 {{IdStamp(), other}, "-E"}};
    for (const auto& c : cases) {
        for (const unsigned input : {0u, 1u}) {
            static_cast<void>(dissolve->setInputTrackId(input, c.inputs[input]));
        }
        for (const unsigned input : {0u, 1u}) {
            EditGraphIterator at(edit, v1, 3, kUp);
            EXPECT_EQ(at.moveToInput(input) ? shown(at) : '-', c.shows[input]) << c.shows;
        }
    }
}

TEST_F(Graph, NarrowsTheExtentsToWhereMaterialIs) {
    chan(make(4), "AAA");
    const IdStamp v1 = chan(edit, "44xxBB");
    for (const bool detects : {false, true}) {
        const int flags = detects ? kUp | EditGraphIterator::kMaterialShortfallDetection : kUp;
        for (const double time : {2.5, 3.5}) {
            EditGraphIterator at(edit, v1, time, flags);
            ASSERT_TRUE(at.moveToInput(0));
            EXPECT_EQ(at.getExtents(), !detects   ? EditGraphIterator::Extents(2, 4)
                                       : time < 3 ? EditGraphIterator::Extents(2, 3)
                                                  : EditGraphIterator::Extents(3, 4));
        }
    }
}

TEST_F(Graph, MultipliesOpacitiesAndKnowsCompoundEffects) {
    const IdStamp v1 = chan(edit, "AAAA");
    std::unique_ptr<EffectInstance> made = Fx::makeEffect(Fx::kTint);
    ASSERT_TRUE(made->setInputTrackId(0, v1) &&
                made->setParameter("opacity", Fx::ParameterValue::ofNumber(0.25)));
    const IdStamp member = IdStamp::fresh(IdStampMagic::EffectNode);
    edit->objectStore().storeObject(member, std::move(made));
    const IdStamp top = fx({member}, 4, Fx::kMosaic);
    const Tag<EffectInstance> head(edit->objectStore(), node);
    ASSERT_TRUE(head->setCompoundMembers({&member, 1}));
    ASSERT_TRUE(head->setKeyframe("opacity", 0, Fx::ParameterValue::ofNumber(1)) &&
                head->setKeyframe("opacity", 2, Fx::ParameterValue::ofNumber(0)));
    EditGraphIterator at(edit, top, 1, kUp);
    EXPECT_TRUE(at.isCompoundEffectHead());
    EXPECT_DOUBLE_EQ(at.getCompoundAlpha(), 0.125);
    ASSERT_TRUE(at.moveToInput(0) && at.moveToInput(0));
    EXPECT_EQ(shown(at), 'A');
    EXPECT_DOUBLE_EQ(at.getAlphaAt(1.5), 0.0625);
    EXPECT_FALSE(at.moveBackToCompoundEffect()) << "material is no member";
    ASSERT_TRUE(at.moveBack());
    EXPECT_DOUBLE_EQ(at.getCompoundAlpha(), 0.125);
    ASSERT_TRUE(at.moveBackToCompoundEffect());
    EXPECT_EQ(at.getStackDepth(), 1);
    Vector<FXGraphNodeBase*> components;
    at.findAllComponents(components);
    EXPECT_EQ(components.size(), 2u);
}

TEST_F(Graph, MapsTimesIntoNestedEdits) {
    chan(make(1), "AABBCC");
    const EditPtr middle = make(2);
    const IdStamp inner = chan(middle, "DD1111");
    ce_handle(middle->getCel(inner), 2).set_strip_velocity(-0.5);
    ce_handle(middle->getCel(inner), 2).set_strip_time(5);
    const IdStamp v1 = chan(edit, "E2222222");
    EditGraphIterator at(edit, fx({v1}, 10, Fx::kTint), 4.5, kGhosts);
    ASSERT_TRUE(at.moveToInput(0));
    // 4.5 is 3.5 in the second edit, and 5 - 1.5 / 2 in the first.
    EXPECT_EQ(shown(at), 'C');
    EXPECT_NEAR(at.applyTimeTransformsStackTo(4.5, false), 4.25, 1e-9);
    EXPECT_NEAR(at.applyTimeTransformsStackTo(4.25, true), 4.5, 1e-9);
    EXPECT_EQ(at.getCurrentPosEdit()->get_cookie(), editCookie(1));
    EXPECT_NEAR(at.getExtents().start(), 3, 1e-9);
    EXPECT_NEAR(at.getExtents().end(), 5, 1e-9);
    EditGraphIterator plain(at, 0);
    EXPECT_NEAR(plain.applyTimeTransformsStackTo(4.5, false), 4.25, 1e-9);
}

TEST_F(Graph, EndsAtLoops) {
    test::RecordingLog log;
    const IdStamp self = chan(edit, "A");
    edit->getCel(self)->get_start_ceh().setEffectGraph(self);
    EXPECT_EQ(EditGraphIterator(edit, self, 0.5, kUp).getStackDepth(), 0);
    EXPECT_EQ(splats, Vector<String>{"EditGraphIterator::traverseTrackAliasing() : Loop detected!"});
    // Two channels that show each other, and an edit that shows itself.
    const IdStamp a = chan(edit, "A");
    const IdStamp b = chan(edit, "B");
    edit->getCel(a)->get_start_ceh().setEffectGraph(b);
    edit->getCel(b)->get_start_ceh().setEffectGraph(a);
    chan(make(3), "3");
    const IdStamp nested = chan(edit, "3333", AudioChan);
    chan(registry.open(editCookie(3), eOpenExisting), "3", AudioChan);
    EXPECT_EQ(EditGraphIterator(edit, a, 0.5, kUp).getStackDepth(), 0);
    EXPECT_EQ(EditGraphIterator(edit, nested, 0.5, kGhosts).getStackDepth(), 0);
    EXPECT_EQ(splats.size(), 3u);
    // An effect both of whose inputs show it: 2^50 ways down.
    const IdStamp top = fx({});
    for (const unsigned input : {0u, 1u}) {
        ASSERT_TRUE(edit->openObject(node)->setInputTrackId(input, top));
    }
    for (const int flags : {0, kUp}) {
        log.clear();
        EditGraphIterator at(edit, top, 0.5, flags);
        EXPECT_FALSE(at.search(IdStamp::fresh(IdStampMagic::EffectNode), EditGraphIterator::NodeId));
        EXPECT_EQ(log.log(), String("EditGraphIterator::") +
                                 (flags == kUp ? "biDirectionalSearch" : "searchInternal") +
                                 "() : Search aborted\n");
        EXPECT_EQ(at.getStackDepth(), 1);
        Vector<int> tracks;
        at.findMaterialTracks(tracks);
        EXPECT_TRUE(tracks.empty());
    }
    EXPECT_FALSE(EditGraphIterator(edit, top, std::numeric_limits<double>::quiet_NaN(), kUp).isValid());
}

TEST_F(Graph, SearchesFiftyLevelsDeep) {
    const IdStamp bottom = chan(edit, "AAAAAAAAAA");
    const IdStamp tint = fx({bottom}, 10, Fx::kTint);
    const IdStamp deepest = node;
    IdStamp top = tint;
    // Each two ways to the next, so that a search of every way would not end.
    for (int level = 2; level <= 20; ++level) {
        top = fx({top, top});
    }
    const IdStamp head = node;
    for (const int flags : {0, kUp}) {
        EditGraphIterator at(edit, top, 5, flags);
        ASSERT_TRUE(at.search(deepest, EditGraphIterator::NodeId));
        EXPECT_EQ(at.getStackDepth(), flags == kUp ? 20 : 1);
        EXPECT_EQ(at.getNodeId(-1), deepest);
        EditGraphIterator lost(edit, top, 5, flags);
        EXPECT_FALSE(lost.search(IdStamp::fresh(IdStampMagic::EffectNode), EditGraphIterator::NodeId));
        EXPECT_EQ(lost.getNodeId(-1), head);
    }
    EditGraphIterator at(edit, top, 5, kUp);
    EXPECT_TRUE(at.search(bottom, EditGraphIterator::InputTrackId));
    EXPECT_EQ(at.getNodeId(-1), deepest);
    EXPECT_EQ(EditGraphIterator(at.asString()), at);
    ASSERT_TRUE(at.searchNext()) << "the second input of the effect above";
    EXPECT_EQ(at.getStackDepth(), 20);
    EXPECT_EQ(at.getParentInputNum(), 1);
    // One level more than a search goes.
    test::RecordingLog log;
    for (int level = 21; level <= 51; ++level) {
        top = fx({top}, 10, Fx::kTint);
    }
    EXPECT_FALSE(EditGraphIterator(edit, top, 5, 0).search(deepest, EditGraphIterator::NodeId));
    EXPECT_TRUE(log.contains("EditGraphIterator::searchInternal() : Search aborted\n"));
    EXPECT_FALSE(EditGraphIterator(edit, top, 5, kUp).search(deepest, EditGraphIterator::NodeId));
    EXPECT_TRUE(log.contains("EditGraphIterator::biDirectionalSearch() : Search aborted\n"));
}

TEST_F(Graph, KeepsPositionsAsText) {
    const EditGraphIteratorState empty("E0001000 1 2");
    EXPECT_EQ(empty, EditGraphIteratorState());
    EXPECT_EQ(EditGraphIteratorState("E0001000 x 2.5 7"),
              (EditGraphIteratorState(String(editCookie(1).asString() + " - 2.5 7"))));
    EXPECT_FALSE(EditGraphIterator(String("E0001000 x nan 7")).isValid());
    EXPECT_EQ(EditGraphIterator(0).asString(), "");
}

TEST_F(Graph, StepsWithoutAllocating) {
    const IdStamp v1 = chan(edit, "AAxxBB");
    EditGraphIterator at(edit, fx({v1}, 6, Fx::kTint), 2.5, kUp);
    const auto walk = [&] {
        return at.moveToInput(0) && at.moveToInput(1) && at.moveBack() && at.moveToInput(0) &&
               at.moveBackAll();
    };
    ASSERT_TRUE(walk());
    const test::MemoryMeter meter;
    ASSERT_TRUE(walk());
    EXPECT_EQ(meter.numAllocations(), 0u);
}
