#include "platform/effects/fx_graph_node_base.h"

namespace {

/// A node of which this program can read the base only: its class is not known here, or a layer of it is of a
/// revision from the future. It keeps every byte; when an input or member changes, the base's layer is written
/// afresh and the others stay as they are.
class OpaqueNode : public FXGraphNodeBase {
public:
    explicit OpaqueNode(std::string_view layerName) : FXGraphNodeBase(kForms), m_layerName(layerName) {}

    [[nodiscard]] bool isOpaque() const override { return true; }
    [[nodiscard]] bool isForeign() const override { return true; }
    [[nodiscard]] const char* layerName() const override { return m_layerName.c_str(); }
    [[nodiscard]] const char* shortLayerName() const override { return m_shortName.c_str(); }

    void STRM_hierarchyPack(PStream& stream) const override {
        PStream base;
        STRM_layerPack(0, base);
        PStream its(m_bytes);
        std::vector<PackedLayer> layers;
        readLayers(its, layers);
        stream.setUnsignedLong(static_cast<uint32_t>(layers.size()));
        for (PackedLayer layer : layers) {
            std::vector<std::byte> bytes;
            if (layer.shortName == kNodeForm.shortName) {
                // What a later writer added behind the known fields stays there.
                bytes = base.bytes();
                const std::span<const std::byte> added = layer.bytes.subspan(m_baseLength);
                bytes.insert(bytes.end(), added.begin(), added.end());
                layer.bytes = bytes;
            }
            writeLayer(stream, layer);
        }
    }

    bool STRM_hierarchyUnpack(PStream& stream) override {
        const std::span<const std::byte> all = stream.getSpan(stream.remaining());
        PStream its(all);
        std::vector<PackedLayer> layers;
        size_t baseLength = 0;
        unsigned numBases = 0;
        bool read = stream.good() && readLayers(its, layers) && its.remaining() == 0;
        for (const PackedLayer& layer : layers) {
            if (layer.shortName == kNodeForm.shortName && read) {
                PStream base(layer.bytes);
                STRM_layerUnpack(0, layer.major, layer.minor, base);
                baseLength = layer.bytes.size() - base.remaining();
                const bool isKnown = layer.major == kNodeForm.major &&
                                     (base.remaining() == 0 || layer.minor > kNodeForm.minor);
                read = ++numBases == 1 && isKnown && base.good();
            }
        }
        if (!read || numBases != 1) {
            stream.fail();
            return false;
        }
        m_baseLength = baseLength;
        m_shortName = String(layers.back().shortName);
        revisionMajor(layers.back().major);
        revisionMinor(layers.back().minor);
        m_bytes.assign(all.begin(), all.end());
        return true;
    }

    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType) const override {
        return std::make_unique<OpaqueNode>(*this);
    }

private:
    static constexpr std::array<const Form*, 1> kForms{&kNodeForm};
    static const bool kRegistered;

    String m_layerName;
    String m_shortName;
    std::vector<std::byte> m_bytes;
    size_t m_baseLength = 0;
};

const bool OpaqueNode::kRegistered = [] {
    registerFallback(kNodeForm.shortName, [](std::string_view layerName) -> std::unique_ptr<Streamable> {
        return std::make_unique<OpaqueNode>(layerName);
    });
    return true;
}();

} // namespace
