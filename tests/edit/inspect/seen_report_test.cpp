#include "edit/inspect/seen_report.h"
#include "platform/effects/effect_instance.h"
#include "platform/effects/effect_kinds.h"
#include "support/cel_layout.h"
#include "support/recording_registry.h"

#include <gtest/gtest.h>

namespace {

ce_handle bind(const EditPtr& edit, ce_handle event, std::string_view kind) {
    event.setEffectGraph(IdStamp::fresh(IdStampMagic::EffectNode));
    edit->objectStore().storeObject(event.getEffectGraph(), Fx::makeEffect(kind));
    return event;
}

EditPtr makeEdit(test::RecordingRegistry& registry, int number) {
    EditPtr edit(new Edit);
    edit->set_cookie(cookie(Cookie_Type::Edit, number, 0));
    registry.add(edit);
    return edit;
}

TEST(SeenReport, TellsBothClipsOfADissolveAndWhatIsNested) {
    test::RecordingRegistry registry;
    const EditPtr inner = makeEdit(registry, 1);
    layout::build(*inner->get_edit_cel_p(inner->addChan(VideoChan)), "AABBBB", 100);
    const EditPtr edit = makeEdit(registry, 2);
    const IdStamp v1 = edit->getId(edit->addChan(VideoChan));
    cel& content = *edit->getCel(v1);
    layout::build(content, "CCCC", 10);
    bind(edit, content.appendEventPair(effect_graph_cookie, 0, 4, 4), Fx::kDissolve);
    content.appendEventPair(inner->get_cookie(), 4, 8, 2);
    const int fx = edit->addChan(VideoChan, nullptr, true, Edit_Chan_SubType::ALIAS);
    const ce_handle tint =
        bind(edit, edit->get_edit_cel_p(fx)->appendEventPair(effect_graph_cookie, 0, 0, 10), Fx::kTint);
    const Tag<EffectInstance> node(edit->objectStore(), tint.getEffectGraph());
    ASSERT_TRUE(node->setInputTrackId(0, v1) &&
                node->setParameter("opacity", Fx::ParameterValue::ofNumber(0.5)));

    EXPECT_STREQ(seenText(seenAt(edit, 7, {}, {})).c_str(),
                 "FX1  Colour Tint, opacity 0.50  00:00:07:00\n"
                 "  0.50  V1  Dissolve 75 %  00:00:07:00\n"
                 "    0.25  V1  M001V007  00:00:07:00  plays 00:00:17:00\n"
                 "    0.75  V1  E0001000  00:00:07:00  plays 00:00:03:00\n"
                 "      V1  M001U007  00:00:03:00  plays 00:01:43:00\n");
    // Nothing touches the dissolve's start.
    ce_handle(&content, 1).set_edit_time(3.5);
    const SeenReport gap = seenAt(edit, 5, v1, {});
    ASSERT_EQ(gap.nodes.size(), 4u);
    EXPECT_EQ(gap.nodes[1].kind, SeenKind::Black);
}

TEST(SeenReport, EndsWhereAGraphDoesNot) {
    test::RecordingRegistry registry;
    const EditPtr edit = makeEdit(registry, 1);
    const IdStamp v1 = edit->getId(edit->addChan(VideoChan));
    edit->getCel(v1)->appendEventPair(edit->get_cookie(), 0, 0, 10);
    const SeenReport nested = seenAt(edit, 5, v1, {});
    ASSERT_EQ(nested.nodes.size(), kMostSeenLevels + 2);
    EXPECT_EQ(nested.nodes.back().kind, SeenKind::TooDeep);

    const int fx = edit->addChan(VideoChan, nullptr, true, Edit_Chan_SubType::ALIAS);
    const ce_handle key =
        bind(edit, edit->get_edit_cel_p(fx)->appendEventPair(effect_graph_cookie, 0, 0, 10), Fx::kKey);
    const Tag<EffectInstance> node(edit->objectStore(), key.getEffectGraph());
    ASSERT_TRUE(node->setInputTrackId(0, edit->getId(fx)) && node->setInputTrackId(1, edit->getId(fx)));
    const SeenReport looped = seenAt(edit, 5, edit->getId(fx), {});
    EXPECT_FALSE(looped.isWhole);
    EXPECT_EQ(looped.nodes.size(), kMostSeenNodes);
}

} // namespace
