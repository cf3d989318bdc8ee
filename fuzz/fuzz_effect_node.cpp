// A packed effect node, as it lies in a store. It is refused, or makes a node that packs and reads back as the
// same bytes, also after it was cut; one of an unknown class keeps its bytes.

#include "platform/effects/effect_graph.h"

#include <cmath>
#include <cstdlib>

namespace {

void require(bool holds) {
    if (!holds) {
        std::abort();
    }
}

std::vector<std::byte> packed(const Streamable& object) {
    PStream stream;
    object.STRM_hierarchyPack(stream);
    require(stream.good());
    return stream.bytes();
}

/// Reads what a node packed.
void checkAgain(const Streamable& node) {
    const std::vector<std::byte> bytes = packed(node);
    PStream stream(bytes);
    const std::unique_ptr<Streamable> read = Streamable::build(node.layerName());
    require(read->STRM_hierarchyUnpack(stream) && packed(*read) == bytes);
}

void checkEffect(EffectInstance& effect) {
    checkAgain(effect);
    for (const double time : {-1e12, -1.0, 0.0, 0.25, 3.0, 1e12}) {
        for (const Fx::EffectParameter& parameter : effect.parameters()) {
            for (const double number : parameter.at(time).numbers) {
                require(std::isfinite(number));
            }
        }
        const double alpha = effect.getAlphaAt(time);
        const double progress = effect.getProgressAt(time, 3);
        require(alpha >= 0 && alpha <= 1 && progress >= 0 && progress <= 1);
    }
    const std::unique_ptr<Streamable> copy = effect.clone();
    require(packed(*copy) == packed(effect));
    effect.keepSpan(0.25, 1.5, 3);
    checkAgain(effect);
    effect.keepSpan(-9e8, 9e8, 3);
    checkAgain(effect);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const auto bytes = std::as_bytes(std::span(data, size));
    for (const char* name : {"EffectInstance", "TextureWipeEffect", "PlugInEffect"}) {
        PStream stream(bytes);
        const std::unique_ptr<Streamable> node = Streamable::build(name);
        if (node->STRM_hierarchyUnpack(stream)) {
            checkEffect(dynamic_cast<EffectInstance&>(*node));
        }
    }
    const std::unique_ptr<Streamable> opaque = Streamable::buildFallback("Elsewhere", bytes);
    PStream stream(bytes);
    if (opaque == nullptr || !opaque->STRM_hierarchyUnpack(stream)) {
        return 0;
    }
    const std::vector<std::byte> kept = packed(*opaque);
    require(kept.size() == bytes.size() && std::equal(kept.begin(), kept.end(), bytes.begin()));
    auto& base = dynamic_cast<FXGraphNodeBase&>(*opaque);
    if (base.setInputTrackId(0, IdStamp(1, 2, 3))) {
        const std::vector<std::byte> changed = packed(*opaque);
        require(changed.size() == kept.size());
        PStream reread(changed);
        const std::unique_ptr<Streamable> twin = Streamable::buildFallback("Elsewhere", changed);
        require(twin != nullptr && twin->STRM_hierarchyUnpack(reread));
        require(dynamic_cast<FXGraphNodeBase&>(*twin).getInputTrackId(0) == IdStamp(1, 2, 3));
    }
    return 0;
}
