// Effect nodes: every kind of the table, those that are not in it, and graphs of them.

#include "platform/effects/effect_graph.h"
#include "platform/effects/special_effects.h"
#include "support/memory_meter.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>
#include <random>

namespace {

using Fx::Interpolation;
using Fx::ParameterValue;

const IdStamp kChannel(0x80000000, 0, 77);
const IdStamp kOtherChannel(0x80000000, 0, 78);

IdStamp node(uint32_t n) {
    return {5, 6, n};
}

class EffectNodes : public ::testing::Test {
protected:
    TagBag::OpenResult open(TagBag& bag, eEditOpenBehaviour behaviour = eOpenExisting) {
        return bag.open(cookie(Cookie_Type::Edit, 1, 1), folder.path(), behaviour, ".qme");
    }
    /// Writes what the bag holds and reads it again.
    void again(TagBag& bag) {
        const Qx::Status status = bag.flush();
        ASSERT_TRUE(status) << status.reason();
        ASSERT_EQ(open(bag), TagBag::Opened);
    }
    test::TemporaryFolder folder;
};

EffectInstance& put(TagBag& bag, const IdStamp& id, std::string_view kind) {
    bag.storeObject(id, Fx::makeEffect(kind));
    return *Tag<EffectInstance>(bag, id);
}

std::vector<std::byte> packed(const Streamable& object) {
    PStream stream;
    object.STRM_hierarchyPack(stream);
    return stream.bytes();
}

/// A value within a form's range, `part` of the way through it.
ParameterValue valueOf(const Fx::ParameterForm& form, double part) {
    Fx::Sample its = form.defaultSample();
    its.text = part < 0.5 ? "/titles/first one.icg" : "/titles/second one.icg";
    for (double& number : its.numbers) {
        number = form.least + (std::min(form.greatest, 1e6) - form.least) * part;
    }
    its.numbers[3] = part;
    if (form.kind == Fx::ParameterKind::Choice || form.kind == Fx::ParameterKind::Switch) {
        its.numbers[0] = std::floor(its.numbers[0]);
    }
    return ParameterValue(its);
}

/// Sets every parameter of a node's kind, in keyframes.
void setAll(EffectInstance& effect) {
    const auto set = [&](const Fx::ParameterForm& form) {
        EXPECT_TRUE(effect.setKeyframe(form.name, 0, valueOf(form, 0.9), Interpolation::Smooth)) << form.name;
        EXPECT_TRUE(effect.setKeyframe(form.name, 2, valueOf(form, 0.1), Interpolation::Linear)) << form.name;
        EXPECT_TRUE(effect.setKeyframe(form.name, 3, valueOf(form, 0.4), Interpolation::Hold)) << form.name;
    };
    for (const Fx::ParameterForm& form : effect.kind()->parameters) {
        EXPECT_TRUE(form.kind == Fx::ParameterKind::File ||
                    form.accepts(ParameterValue(form.defaultSample())))
            << form.name;
        set(form);
    }
    for (const Fx::ParameterForm& form : Fx::commonParameters()) {
        set(form);
    }
}

TEST_F(EffectNodes, EveryKindComesBackAsItWas) {
    TagBag bag;
    ASSERT_EQ(open(bag, eOpenNew), TagBag::NewStore);
    uint32_t n = 0;
    std::map<IdStamp, std::vector<std::byte>> before;
    for (const Fx::EffectKind& kind : Fx::kinds()) {
        const String type = String(kind.typeId) + (kind.isFamily ? "\\uk.co.somewhere.blur" : "");
        SCOPED_TRACE(type);
        EXPECT_EQ(Fx::findKind(type), &kind);
        EffectInstance& effect = put(bag, node(++n), type);
        EXPECT_EQ(effect.getName(), kind.isFamily ? "uk.co.somewhere.blur" : String(kind.name));
        setAll(effect);
        EXPECT_TRUE(effect.setInputTrackId(kind.numInputs - 1, kChannel, true));
        EXPECT_FALSE(effect.setInputTrackId(kind.numInputs, kChannel));
        EXPECT_TRUE(effect.setName("my own"));
        before[node(n)] = packed(effect);
    }
    again(bag);
    n = 0;
    for (const Fx::EffectKind& kind : Fx::kinds()) {
        SCOPED_TRACE(String(kind.typeId));
        const Tag<EffectInstance> effect(bag, node(++n));
        ASSERT_TRUE(effect) << bag.objectError();
        EXPECT_EQ(effect->kind(), &kind);
        EXPECT_EQ(effect->hasExplicitInputs(), kind.explicitInputs);
        EXPECT_EQ(effect->getNumTrackInputs(), kind.numInputs);
        EXPECT_EQ(effect->getInputTrackId(kind.numInputs - 1), kChannel);
        EXPECT_EQ(packed(*effect), before[node(n)]);
        const std::unique_ptr<Streamable> copy = effect->clone();
        EXPECT_EQ(packed(*copy), before[node(n)]);
        EXPECT_EQ(typeid(*copy), typeid(*effect));
    }
    ASSERT_TRUE(bag.flush());
    EXPECT_EQ(bag.numPacked(), 0u) << "looking changes nothing";
    EXPECT_EQ(Fx::makeEffect("QxUnheardOf"), nullptr);
    EXPECT_EQ(Fx::makeEffect(Fx::kPlugInPrefix), nullptr);
}

TEST_F(EffectNodes, RefusalChangesNothing) {
    TagBag bag;
    EffectInstance& effect = put(bag, node(1), Fx::kDVE);
    EXPECT_TRUE(effect.setParameter("rotation", ParameterValue::ofNumber(10)));
    const std::vector<std::byte> before = packed(effect);
    EXPECT_FALSE(effect.setParameter("rotation", ParameterValue::ofNumber(1e6)));
    EXPECT_FALSE(effect.setParameter("rotation", ParameterValue::ofNumber(NAN)));
    EXPECT_FALSE(effect.setParameter("rotation", ParameterValue::ofText("10")));
    EXPECT_FALSE(effect.setParameter("unheard of", ParameterValue::ofNumber(1)));
    EXPECT_FALSE(effect.setKeyframe("rotation", 2e9, ParameterValue::ofNumber(1)));
    EXPECT_FALSE(effect.setKeyframe("crop left", NAN, ParameterValue::ofNumber(1)));
    EXPECT_FALSE(effect.removeKeyframe("rotation", 0));
    EXPECT_FALSE(effect.resetParameter("scale"));
    EXPECT_FALSE(effect.setInputTrackId(0, node(1))) << "its own";
    EXPECT_FALSE(effect.setCompoundMembers(std::vector{node(2), node(2)}));
    EXPECT_FALSE(effect.setCompoundMembers(std::vector{node(1)}));
    EXPECT_FALSE(effect.setName("two\nlines"));
    EXPECT_EQ(packed(effect), before);
    // A plug-in's parameters are its own, and each keeps its kind.
    EffectInstance& plugIn = put(bag, node(2), "\\ORV\\VIS\\FX\\PLUGINS\\org.blur");
    EXPECT_TRUE(plugIn.setParameter("radius", ParameterValue::ofNumber(1e9)));
    EXPECT_FALSE(plugIn.setParameter("radius", ParameterValue::ofText("wide")));
    EXPECT_FALSE(plugIn.setParameter("", ParameterValue::ofNumber(1)));
    EXPECT_EQ(dynamic_cast<PlugInEffect&>(plugIn).getPlugInId(), "org.blur");
}

TEST_F(EffectNodes, TransitionsMixTheirInputs) {
    TagBag bag;
    const struct {
        std::string_view kind;
        double time;
        double shares[2];
    } cases[] = {{Fx::kDissolve, -1, {1, 0}},     {Fx::kDissolve, 0.5, {0.75, 0.25}},
                 {Fx::kDissolve, 5, {0, 1}},      {Fx::kDip, 0.5, {0.5, 0}},
                 {Fx::kDip, 1, {0, 0}},           {Fx::kDip, 1.5, {0, 0.5}},
                 {Fx::kCrossFade, 1, {0.5, 0.5}}, {Fx::kKey, 1, {1, 1}}};
    for (const auto& [kind, time, shares] : cases) {
        EffectInstance& effect = put(bag, node(1), kind);
        for (unsigned input = 0; input < 2; ++input) {
            EXPECT_NEAR(effect.getInputShareAt(input, time, 2), shares[input], 1e-12) << kind << " " << time;
        }
        EXPECT_EQ(effect.getInputShareAt(2, time, 2), 0);
    }
    EffectInstance& effect = put(bag, node(1), Fx::kDissolve);
    EXPECT_EQ(effect.getProgressAt(1, 0), 0);
    EXPECT_TRUE(effect.setKeyframe("progress", 0, ParameterValue::ofNumber(0), Interpolation::Smooth));
    EXPECT_TRUE(effect.setKeyframe("progress", 2, ParameterValue::ofNumber(1)));
    EXPECT_NEAR(effect.getProgressAt(0.5, 2), 0.15625, 1e-12);
    const test::MemoryMeter meter;
    EXPECT_EQ(effect.getNumberAt("opacity", 1), 1);
    EXPECT_TRUE(effect.getParameterAt("progress", 1));
    EXPECT_TRUE(Tag<EffectInstance>(bag, node(1)).valid());
    EXPECT_EQ(meter.numAllocations(), 0u);
}

TEST_F(EffectNodes, WipesKeepTheCodeThatTheyWereGiven) {
    TagBag bag;
    auto& wipe = dynamic_cast<TextureWipeEffect&>(put(bag, node(1), Fx::kWipe));
    auto& old = dynamic_cast<DissolveWipeEffect&>(put(bag, node(2), "PixShader:Mixes:wipes.fx"));
    for (const Wipe::Patterns::Info& info : Wipe::Patterns::all()) {
        EXPECT_EQ(Wipe::remapPattern(WipePattern{info.code}), info.code);
        EXPECT_EQ(Wipe::Patterns::name(info.code), info.name);
    }
    for (const uint32_t code : {0u, 9u, 66u, 101u, 999u, UINT32_MAX}) {
        wipe.setPatternCode(code);
        old.setPattern(WipePattern{code});
        EXPECT_EQ(wipe.getPatternCode(), code);
        EXPECT_EQ(old.getPattern(), WipePattern{code});
        EXPECT_EQ(wipe.getPattern(), Wipe::Patterns::isKnown(code) ? code : Wipe::Patterns::BarLeftToRight);
    }
    wipe.setPattern(Wipe::Patterns::IrisDiamond, Wipe_Direction::Reverse);
    EXPECT_EQ(wipe.getDirection(), Wipe_Direction::Reverse);
    auto& title =
        dynamic_cast<InscriberTitleEffect&>(put(bag, node(3), "\\ORV\\VIS\\FX\\GENKEY\\TITLE\\ROLL"));
    EXPECT_TRUE(title.setICGFileName("/titles/end.icg"));
    EXPECT_EQ(title.getICGFileName(), "/titles/end.icg");
    EXPECT_TRUE(title.setKeyframe("file", 1, ParameterValue::ofFile("/titles/other.icg")));
    EXPECT_TRUE(title.setKeyframe("file", 2, ParameterValue::ofFile("/titles/other.icg")));
    Vector<String> files;
    title.listFiles(files);
    EXPECT_EQ(files, Vector<String>{"/titles/other.icg"});
}

/// Bytes of a class from elsewhere, written as they are.
class Foreign : public Streamable {
public:
    Foreign(const char* its, std::vector<std::byte> packedBytes, uint8_t itsMajor = 3)
        : name(its), bytes(std::move(packedBytes)), major(itsMajor) {}
    [[nodiscard]] const char* layerName() const override { return name; }
    [[nodiscard]] const char* shortLayerName() const override { return "future"; }
    [[nodiscard]] uint8_t revisionMajor() const override { return major; }
    [[nodiscard]] uint8_t revisionMinor() const override { return 1; }
    [[nodiscard]] bool isForeign() const override { return true; }
    void revisionMajor(uint8_t) override {}
    void revisionMinor(uint8_t) override {}
    void pack(PStream&) const override {}
    void unpack(PStream&) override {}
    void STRM_hierarchyPack(PStream& stream) const override { stream.setRaw(bytes.data(), bytes.size()); }
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType) const override { return nullptr; }

    const char* name;
    std::vector<std::byte> bytes;
    uint8_t major;
};

/// A node as a later program would write it: another class of a later revision over a base with a longer layer.
std::vector<std::byte> future(const EffectInstance& like, uint8_t effectMajor) {
    const std::vector<std::byte> its = packed(like);
    PStream in(its);
    std::vector<Streamable::PackedLayer> layers;
    EXPECT_TRUE(Streamable::readLayers(in, layers));
    std::vector<std::byte> base(layers[0].bytes.begin(), layers[0].bytes.end());
    base.resize(base.size() + 5, std::byte{9});
    layers[0].bytes = base;
    layers[0].minor = 4;
    layers[1].major = effectMajor;
    const std::array<std::byte, 3> own{std::byte{1}, std::byte{2}, std::byte{3}};
    layers.push_back({"future", 3, 1, own});
    PStream out;
    out.setUnsignedLong(static_cast<uint32_t>(layers.size()));
    for (const Streamable::PackedLayer& layer : layers) {
        Streamable::writeLayer(out, layer);
    }
    return out.bytes();
}

/// An unknown class, a known class of a later revision, and a known class of an unknown kind stay what they are,
/// byte for byte, through saves, copies and cuts, while their inputs can be read and wired.
TEST_F(EffectNodes, NodeOfAnUnknownKindStaysWhatItIs) {
    const std::unique_ptr<EffectInstance> like = Fx::makeEffect("\\ORV\\VIS\\FX\\PLUGINS\\abc");
    setAll(*like);
    EXPECT_TRUE(like->setParameter("radius", ParameterValue::ofNumber(4)));
    EXPECT_TRUE(like->setInputTrackId(0, kChannel));
    std::vector<std::byte> unknownKind = packed(*like);
    const auto letter = std::find(unknownKind.begin(), unknownKind.end(), std::byte{'\\'});
    *letter = std::byte{'?'};
    const struct {
        const char* layer;
        std::vector<std::byte> bytes;
        bool isOpaque;
    } cases[] = {{"FutureEffect", future(*like, 1), true},
                 {"PlugInEffect", future(*like, 7), true},
                 {"PlugInEffect", unknownKind, false}};
    for (const auto& its : cases) {
        SCOPED_TRACE(its.layer);
        TagBag bag;
        ASSERT_EQ(open(bag, eOpenNew), TagBag::NewStore);
        bag.storeObject(node(1), std::make_unique<Foreign>(its.layer, its.bytes));
        again(bag);
        StampMap renamed;
        {
            const Tag<FXGraphNodeBase> found(bag, node(1));
            ASSERT_TRUE(found) << bag.objectError();
            EXPECT_EQ(found->isOpaque(), its.isOpaque);
            EXPECT_EQ(found->getNumTrackInputs(), 1u);
            EXPECT_EQ(found->getInputTrackId(0), kChannel);
            EXPECT_EQ(packed(*found), its.bytes);
            ASSERT_TRUE(Fx::copyGraph(bag, node(1), bag, node(2), renamed));
            if (its.isOpaque) {
                ASSERT_TRUE(Fx::splitGraph(bag, node(1), node(3), 1, 2, renamed));
            }
        }
        again(bag);
        for (const IdStamp& id : {node(1), node(2), its.isOpaque ? node(3) : node(2)}) {
            const Tag<FXGraphNodeBase> found(bag, id);
            ASSERT_TRUE(found) << bag.objectError();
            EXPECT_EQ(packed(*found), its.bytes);
        }
        // An input that moves changes the stamp in the base and nothing else.
        StampMap channels{{kChannel, kOtherChannel}};
        Tag<FXGraphNodeBase>(bag, node(2))->renameReferences(channels);
        again(bag);
        EXPECT_EQ(packed(*Tag<FXGraphNodeBase>(bag, node(1))), its.bytes);
        const Tag<FXGraphNodeBase> moved(bag, node(2));
        EXPECT_EQ(moved->getInputTrackId(0), kOtherChannel);
        std::vector<std::byte> changed = packed(*moved);
        ASSERT_EQ(changed.size(), its.bytes.size());
        int different = 0;
        for (size_t i = 0; i < changed.size(); ++i) {
            different += changed[i] != its.bytes[i] ? 1 : 0;
        }
        EXPECT_EQ(different, 1) << "77 became 78";
    }
}

TEST_F(EffectNodes, DamagedNodeIsNoNode) {
    const std::unique_ptr<EffectInstance> like = Fx::makeEffect(Fx::kTint);
    EXPECT_TRUE(like->setKeyframe("amount", 1, ParameterValue::ofNumber(0.5)));
    EXPECT_TRUE(like->setCompoundMembers(std::vector{node(8), node(9)}));
    const std::vector<std::byte> whole = packed(*like);
    // Without any of its bytes it cannot be read, and with any one of them changed it is refused or reads as
    // what it then says.
    for (size_t size = 0; size < whole.size(); ++size) {
        PStream stream(std::span<const std::byte>(whole).first(size));
        EXPECT_FALSE(Streamable::build("EffectInstance")->STRM_hierarchyUnpack(stream)) << size;
    }
    for (size_t at = 0; at < whole.size(); ++at) {
        std::vector<std::byte> bytes = whole;
        bytes[at] ^= std::byte{0x41};
        PStream stream(bytes);
        const std::unique_ptr<Streamable> read = Streamable::build("EffectInstance");
        if (read->STRM_hierarchyUnpack(stream)) {
            const std::vector<std::byte> again = packed(*read);
            EXPECT_TRUE(again == bytes || again == whole) << at; // a revision below is written as the current
        }
    }
    TagBag bag;
    ASSERT_EQ(open(bag, eOpenNew), TagBag::NewStore);
    std::vector<std::byte> broken = whole;
    broken.back() = std::byte{0x7F}; // a number that is none
    broken[broken.size() - 2] = std::byte{0xF8};
    bag.storeObject(node(1), std::make_unique<Foreign>("EffectInstance", broken, 1));
    again(bag);
    EXPECT_FALSE(Tag<FXGraphNodeBase>(bag, node(1)).valid());
    EXPECT_EQ(bag.objectStatus().code(), Qx::StatusCode::Damaged);
}

TEST_F(EffectNodes, GraphsAreCopiedCutAndRemoved) {
    TagBag bag;
    EffectInstance& head = put(bag, node(1), Fx::kDVE);
    EffectInstance& second = put(bag, node(2), Fx::kTint);
    EXPECT_TRUE(head.setInputTrackId(0, node(2)));
    EXPECT_TRUE(head.setInputTrackId(1, nextInputId));
    EXPECT_TRUE(head.setCompoundMembers(std::vector{node(2), node(3)}));
    EXPECT_TRUE(head.setKeyframe("rotation", 0, ParameterValue::ofNumber(0), Interpolation::Smooth));
    EXPECT_TRUE(head.setKeyframe("rotation", 10, ParameterValue::ofNumber(90)));
    EXPECT_TRUE(second.setInputTrackId(0, kChannel));
    EXPECT_TRUE(second.setKeyframe("amount", 5, ParameterValue::ofNumber(0.2)));
    EXPECT_TRUE(second.setKeyframe("amount", 7, ParameterValue::ofNumber(0.6)));
    put(bag, node(3), Fx::kMosaic).setInputTrackId(0, node(1)); // a loop
    put(bag, node(4), Fx::kDissolve);

    StampMap renamed{{kChannel, kOtherChannel}};
    ASSERT_TRUE(Fx::splitGraph(bag, node(1), node(10), 6, 10, renamed));
    Vector<Tag<FXGraphNodeBase>> nodes;
    Fx::listGraph(bag, node(10), nodes);
    ASSERT_EQ(nodes.size(), 3u);
    EXPECT_EQ(nodes[0].id(), node(10));
    EXPECT_EQ(nodes[1].id(), renamed[node(2)]);
    EXPECT_EQ(nodes[1]->getInputTrackId(0), kOtherChannel);
    EXPECT_EQ(nodes[0]->getInputTrackId(1), nextInputId);
    EXPECT_EQ(nodes[0]->getCompoundMembers()[1], nodes[2].id());
    EXPECT_EQ(nodes[2]->getInputTrackId(0), node(10));
    const Tag<EffectInstance> tint(nodes[1]);
    const Tag<EffectInstance> dve(nodes[0]);
    const std::unique_ptr<EffectInstance> whole = Fx::makeEffect(Fx::kDVE);
    EXPECT_TRUE(whole->setKeyframe("rotation", 0, ParameterValue::ofNumber(0), Interpolation::Smooth));
    EXPECT_TRUE(whole->setKeyframe("rotation", 10, ParameterValue::ofNumber(90)));
    for (double t = 0; t < 10; t += 0.5) {
        const bool isFirst = t < 6;
        EXPECT_NEAR((isFirst ? head : *dve).getNumberAt("rotation", isFirst ? t : t - 6),
                    whole->getNumberAt("rotation", t), 1e-9);
    }
    EXPECT_NEAR(tint->getNumberAt("amount", 0), 0.4, 1e-9);

    // A transition that is cut goes on from where it was.
    ASSERT_TRUE(Fx::splitGraph(bag, node(4), node(11), 0.5, 2, renamed));
    EXPECT_NEAR(Tag<EffectInstance>(bag, node(4))->getProgressAt(0.25, 0.5), 0.125, 1e-12);
    EXPECT_NEAR(Tag<EffectInstance>(bag, node(11))->getProgressAt(0.5, 1.5), 0.5, 1e-12);

    const size_t held = bag.getNumObjects();
    EXPECT_FALSE(Fx::splitGraph(bag, node(4), node(12), 2, 2, renamed));
    EXPECT_FALSE(Fx::copyGraph(bag, node(99), bag, node(12), renamed));
    EXPECT_EQ(bag.getNumObjects(), held);
    const std::vector<IdStamp> kept{node(2)};
    EXPECT_EQ(Fx::removeGraph(bag, node(1), kept), 2u);
    EXPECT_TRUE(bag.contains(node(2)));
    EXPECT_EQ(Fx::removeGraph(bag, node(10)), 3u);
    EXPECT_EQ(bag.getNumObjects(), held - 5);
}

TEST_F(EffectNodes, NodeTakesLessThanAKibibyte) {
    constexpr uint32_t kCount = 1000;
    TagBag bag;
    const test::MemoryMeter meter;
    for (uint32_t i = 0; i < kCount; ++i) {
        EffectInstance& effect = put(bag, node(i + 1), i % 2 == 0 ? Fx::kDissolve : Fx::kColourCorrection);
        if (i % 2 != 0) {
            effect.setInputTrackId(0, kChannel);
            effect.setParameter("saturation", ParameterValue::ofNumber(0.5));
            effect.setKeyframe("opacity", 0, ParameterValue::ofNumber(0));
            effect.setKeyframe("opacity", 1, ParameterValue::ofNumber(1));
        }
    }
    RecordProperty("bytes", std::to_string(meter.peak() / kCount));
    EXPECT_LE(meter.peak() / kCount, 1024u);
}

} // namespace
