#include "platform/store/streamable.h"

#include "platform/store/detail/layer_revision.h"

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

    /// The revision that a class writes: that of an empty object of it. An object of a class without a
    /// builder speaks for itself.
    Revision current(const Streamable& object) {
        const std::string_view name = object.layerName();
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
};

/// Lives until the process ends: objects that other static objects own are packed up to the last moment.
Registry& registry() {
    static Registry& instance = *new Registry;
    return instance;
}

struct Layer {
    Revision revision;
    std::span<const std::byte> bytes;
};

/// Finds the layer of a short name among those of a packed hierarchy. None, with the error state set, when
/// the stream is short or has no such layer or two of them.
std::optional<Layer> findLayer(PStream& stream, std::string_view shortName) {
    const uint32_t count = stream.getCount(kLeastLayerSize);
    if (count > kMaxLayers) {
        stream.fail();
    }
    std::optional<Layer> found;
    for (uint32_t i = 0; i < count && stream.good(); ++i) {
        const std::span<const std::byte> name = stream.getSpan(stream.getUnsignedLong());
        Layer layer;
        layer.revision.major = stream.getCookedChar();
        layer.revision.minor = stream.getCookedChar();
        layer.bytes = stream.getSpan(stream.getUnsignedLong());
        if (std::string_view(reinterpret_cast<const char*>(name.data()), name.size()) != shortName) {
            continue;
        }
        if (found) {
            stream.fail();
        }
        found = layer;
    }
    if (!found) {
        stream.fail();
    }
    return stream.good() ? found : std::nullopt;
}

} // namespace

Qx::detail::LayerRevision Qx::detail::currentRevision(const Streamable& object) {
    return registry().current(object);
}

Streamable::~Streamable() = default;

void Streamable::STRM_hierarchyPack(PStream& stream) const {
    const Revision current = registry().current(*this);
    stream.setUnsignedLong(1);
    stream.setString(shortLayerName());
    stream.setCookedChar(current.major);
    stream.setCookedChar(current.minor);
    const size_t lengthAt = stream.size();
    stream.setUnsignedLong(0);
    const size_t start = stream.size();
    pack(stream);
    const size_t length = stream.size() - start;
    if (length > UINT32_MAX) {
        stream.fail();
        return;
    }
    stream.patchUnsignedLong(lengthAt, static_cast<uint32_t>(length));
}

bool Streamable::STRM_hierarchyUnpack(PStream& stream) {
    const std::optional<Layer> layer = findLayer(stream, shortLayerName());
    if (!layer) {
        return false;
    }
    const Revision current = registry().current(*this);
    if (layer->revision.major > current.major) {
        stream.fail();
        return false;
    }
    const Revision before{revisionMajor(), revisionMinor()};
    revisionMajor(layer->revision.major);
    revisionMinor(layer->revision.minor);
    PStream own(layer->bytes, stream.keeper());
    unpack(own);
    // A newer minor revision may have added to the end of the layer; any other leaves nothing over.
    const bool newerMinor = layer->revision.major == current.major && layer->revision.minor > current.minor;
    if (!own.good() || (own.remaining() > 0 && !newerMinor)) {
        revisionMajor(before.major);
        revisionMinor(before.minor);
        stream.fail();
        return false;
    }
    return true;
}

void Streamable::registerBuilder(const char* layerName, Builder builder) {
    registry().add(layerName, builder);
}

std::unique_ptr<Streamable> Streamable::build(std::string_view layerName) {
    const Builder make = registry().builder(layerName);
    return make != nullptr ? make() : nullptr;
}
