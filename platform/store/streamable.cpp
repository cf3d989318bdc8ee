#include "platform/store/streamable.h"

#include "platform/store/detail/layer_revision.h"

#include <algorithm>
#include <array>
#include <map>
#include <mutex>
#include <optional>

namespace {

/// No class has more layers than this; a count above it is damage.
constexpr uint32_t kMaxLayers = 64;
/// An empty short name, two revision bytes and a length.
constexpr size_t kLeastLayerSize = 4 + 2 + 4;

using Revision = Qx::detail::LayerRevision;

/// The builders by layer name, each with the revision that its class writes once somebody asked for it.
class Registry {
public:
    void add(const char* layerName, Streamable::Builder make) {
        const std::lock_guard lock(m_mutex);
        m_classes.insert_or_assign(layerName, Class{make, std::nullopt});
    }

    Streamable::Builder builder(std::string_view layerName) {
        const std::lock_guard lock(m_mutex);
        const auto found = m_classes.find(layerName);
        return found == m_classes.end() ? nullptr : found->second.builder;
    }

    void addFallback(const char* shortName, Streamable::FallbackBuilder make) {
        const std::lock_guard lock(m_mutex);
        m_fallbacks.insert_or_assign(shortName, make);
    }

    Streamable::FallbackBuilder fallback(std::string_view shortName) {
        const std::lock_guard lock(m_mutex);
        const auto found = m_fallbacks.find(shortName);
        return found == m_fallbacks.end() ? nullptr : found->second;
    }

    /// The revision that a class writes: that of an empty object of it. An object of a class without a
    /// builder, and one that stands for another, speaks for itself.
    Revision current(const Streamable& object) {
        const std::string_view name = object.layerName();
        if (object.isForeign()) {
            return {object.revisionMajor(), object.revisionMinor()};
        }
        {
            const std::lock_guard lock(m_mutex);
            const auto found = m_classes.find(name);
            if (found != m_classes.end() && found->second.revision) {
                return *found->second.revision;
            }
        }
        // Made outside the lock: a constructor may register or build in turn.
        const Streamable::Builder make = builder(name);
        const std::unique_ptr<Streamable> empty = make != nullptr ? make() : nullptr;
        const Streamable& model = empty != nullptr ? *empty : object;
        const Revision revision{model.revisionMajor(), model.revisionMinor()};
        const std::lock_guard lock(m_mutex);
        const auto found = m_classes.find(name);
        if (found != m_classes.end() && found->second.builder == make) {
            found->second.revision = revision;
        }
        return revision;
    }

private:
    struct Class {
        Streamable::Builder builder;
        std::optional<Revision> revision;
    };
    std::mutex m_mutex;
    std::map<String, Class, std::less<>> m_classes;
    std::map<String, Streamable::FallbackBuilder, std::less<>> m_fallbacks;
};

/// Lives until the process ends: objects that other static objects own are packed up to the last moment.
Registry& registry() {
    static Registry& instance = *new Registry;
    return instance;
}

/// The layers of a packed hierarchy, where they were read.
class Layers {
public:
    /// Sets the stream's error state when it is none.
    explicit Layers(PStream& stream) : m_count(stream.getCount(kLeastLayerSize)) {
        if (m_count > kMaxLayers) {
            stream.fail();
        }
        for (uint32_t i = 0; i < m_count && stream.good(); ++i) {
            const std::span<const std::byte> name = stream.getSpan(stream.getUnsignedLong());
            Streamable::PackedLayer& layer = m_layers[i];
            layer.shortName = {reinterpret_cast<const char*>(name.data()), name.size()};
            layer.major = stream.getCookedChar();
            layer.minor = stream.getCookedChar();
            layer.bytes = stream.getSpan(stream.getUnsignedLong());
        }
        m_count = stream.good() ? m_count : 0;
    }

    [[nodiscard]] std::span<const Streamable::PackedLayer> all() const {
        return std::span(m_layers).first(m_count);
    }
    /// Null where there is none of that name, or more than one.
    [[nodiscard]] const Streamable::PackedLayer* find(std::string_view shortName) const {
        const auto isIt = [&](const Streamable::PackedLayer& layer) { return layer.shortName == shortName; };
        const auto found = std::find_if(all().begin(), all().end(), isIt);
        return std::count_if(found, all().end(), isIt) == 1 ? &*found : nullptr;
    }

private:
    uint32_t m_count;
    std::array<Streamable::PackedLayer, kMaxLayers> m_layers;
};

/// Writes the head of a layer and what `content` writes as its content.
template <typename Content>
void writeLayerOf(PStream& stream, std::string_view shortName, Revision revision, Content&& content) {
    stream.setString(shortName);
    stream.setCookedChar(revision.major);
    stream.setCookedChar(revision.minor);
    const size_t lengthAt = stream.size();
    stream.setUnsignedLong(0);
    const size_t start = stream.size();
    content();
    const size_t length = stream.size() - start;
    if (length > UINT32_MAX) {
        stream.fail();
        return;
    }
    stream.patchUnsignedLong(lengthAt, static_cast<uint32_t>(length));
}

/// Reads a layer with `content`, which takes a stream of its bytes. False when it is not there or refused.
template <typename Content>
bool readLayerOf(const Streamable::PackedLayer* layer, Revision current, const PStream& stream,
                 Content&& content) {
    if (layer == nullptr || layer->major > current.major) {
        return false;
    }
    PStream own(layer->bytes, stream.keeper());
    content(own);
    // A newer minor revision may have added to the end of the layer; any other leaves nothing over.
    const bool newerMinor = layer->major == current.major && layer->minor > current.minor;
    return own.good() && (own.remaining() == 0 || newerMinor);
}

} // namespace

Qx::detail::LayerRevision Qx::detail::currentRevision(const Streamable& object) {
    return registry().current(object);
}

Streamable::~Streamable() = default;

void Streamable::STRM_layerPack(size_t, PStream& stream) const {
    pack(stream);
}

void Streamable::STRM_layerUnpack(size_t, uint8_t, uint8_t, PStream& stream) {
    unpack(stream);
}

String Streamable::subHierarchyName() const {
    String name;
    for (const Form* form : subLayers()) {
        name += (name.empty() ? "" : ":") + String(form->name);
    }
    return name;
}

String Streamable::hierarchyName() const {
    const String below = subHierarchyName();
    return below.empty() ? String(layerName()) : below + ":" + layerName();
}

void Streamable::STRM_hierarchyPack(PStream& stream) const {
    const std::span<const Form* const> below = subLayers();
    stream.setUnsignedLong(static_cast<uint32_t>(below.size() + 1));
    for (size_t i = 0; i < below.size(); ++i) {
        writeLayerOf(stream, below[i]->shortName, {below[i]->major, below[i]->minor},
                     [&] { STRM_layerPack(i, stream); });
    }
    writeLayerOf(stream, shortLayerName(), registry().current(*this),
                 [&] { STRM_layerPack(below.size(), stream); });
}

bool Streamable::STRM_hierarchyUnpack(PStream& stream) {
    const Layers layers(stream);
    const std::span<const Form* const> below = subLayers();
    bool read = stream.good();
    for (size_t i = 0; i < below.size() && read; ++i) {
        const PackedLayer* const layer = layers.find(below[i]->shortName);
        read = readLayerOf(layer, {below[i]->major, below[i]->minor}, stream,
                           [&](PStream& own) { STRM_layerUnpack(i, layer->major, layer->minor, own); });
    }
    const Revision before{revisionMajor(), revisionMinor()};
    const PackedLayer* const layer = layers.find(shortLayerName());
    read = read && readLayerOf(layer, registry().current(*this), stream, [&](PStream& own) {
               revisionMajor(layer->major);
               revisionMinor(layer->minor);
               STRM_layerUnpack(below.size(), layer->major, layer->minor, own);
           });
    if (!read) {
        revisionMajor(before.major);
        revisionMinor(before.minor);
        stream.fail();
    }
    return read;
}

bool Streamable::readLayers(PStream& stream, std::vector<PackedLayer>& layers) {
    const Layers read(stream);
    layers.assign(read.all().begin(), read.all().end());
    return stream.good();
}

void Streamable::writeLayer(PStream& stream, const PackedLayer& layer) {
    writeLayerOf(stream, layer.shortName, {layer.major, layer.minor},
                 [&] { stream.setRaw(layer.bytes.data(), layer.bytes.size()); });
}

void Streamable::registerFallback(const char* shortName, FallbackBuilder builder) {
    registry().addFallback(shortName, builder);
}

std::unique_ptr<Streamable> Streamable::buildFallback(std::string_view name,
                                                      std::span<const std::byte> packed) {
    PStream stream(packed);
    const Layers layers(stream);
    for (size_t i = layers.all().size(); i > 0; --i) {
        if (const FallbackBuilder make = registry().fallback(layers.all()[i - 1].shortName)) {
            return make(name);
        }
    }
    return nullptr;
}

void Streamable::registerBuilder(const char* layerName, Builder builder) {
    registry().add(layerName, builder);
}

std::unique_ptr<Streamable> Streamable::build(std::string_view layerName) {
    const Builder make = registry().builder(layerName);
    return make != nullptr ? make() : nullptr;
}
