#pragma once

#include "platform/base/export.h"
#include "platform/store/pstream.h"

#include <memory>
#include <span>
#include <vector>

/// An object that packs itself into a stream, layer by layer: each class of its hierarchy writes one layer
/// with its own name and revision, base first. A reader passes over the layers that it does not know.
///
/// Packed hierarchy: an unsigned 32-bit layer count, then per layer its short name (string), major and minor
/// revision (one byte each), an unsigned 32-bit length and that many bytes.
///
/// A class of one layer says what that is by `layerName` and its like, `pack` and `unpack`
/// (`StreamableLayer` helps). A class derived from one that has a layer adds to those `subLayers`,
/// `STRM_layerPack` and `STRM_layerUnpack`.
class QM_API Streamable {
public:
    /// What a class writes. All of it lives in files: names stay, and a form that earlier readers cannot read
    /// has a new major revision.
    struct Form {
        const char* name;
        const char* shortName;
        uint8_t major = 1;
        uint8_t minor = 0;
    };

    /// What a copy made by `clone` shall be good for.
    enum class BuilderType {
        Copy,  ///< an object of its own
        Stream ///< an object that is only packed
    };

    virtual ~Streamable();

    /// The full name of the object's most derived layer, by which a builder is found, and its short form.
    [[nodiscard]] virtual const char* layerName() const = 0;
    [[nodiscard]] virtual const char* shortLayerName() const = 0;
    /// The revision of the most derived layer: of the object last unpacked, else the current one.
    [[nodiscard]] virtual uint8_t revisionMajor() const = 0;
    [[nodiscard]] virtual uint8_t revisionMinor() const = 0;
    virtual void revisionMajor(uint8_t major) = 0;
    virtual void revisionMinor(uint8_t minor) = 0;

    /// Writes the object's own layer. It may refer to bytes of the object (`PStream::setLasting`), which is
    /// not changed before the stream is done with.
    virtual void pack(PStream& stream) const = 0;
    /// Reads the object's own layer, written with the revision that was set before the call. On a bad stream
    /// the stream is in its error state and the object is as it was made or as it was before, never half
    /// read.
    virtual void unpack(PStream& stream) = 0;

    /// The layers of the classes that this one is derived from, base first, without its own: none by default.
    [[nodiscard]] virtual std::span<const Form* const> subLayers() const { return {}; }
    /// Writes the layer with that index in `subLayers`, or with the index behind them the object's own.
    virtual void STRM_layerPack(size_t layer, PStream& stream) const;
    /// Reads such a layer, written with the given revision; `unpack` says how.
    virtual void STRM_layerUnpack(size_t layer, uint8_t major, uint8_t minor, PStream& stream);
    /// The full names of all layers, base first, joined by colons; and the same without the object's own.
    [[nodiscard]] String hierarchyName() const;
    [[nodiscard]] String subHierarchyName() const;
    /// True for an object that stands for bytes of a class or a revision that this program does not know: its
    /// revision is that of those bytes, whatever class has its layer's name here.
    [[nodiscard]] virtual bool isForeign() const { return false; }

    [[nodiscard]] virtual std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const = 0;

    /// Writes every layer. The revision written is the class's current one (that of an empty object made by
    /// its builder, or of this object when the class has none), whatever revision was last unpacked: `pack`
    /// always writes the current form.
    virtual void STRM_hierarchyPack(PStream& stream) const;
    /// Reads what `STRM_hierarchyPack` wrote; layers of other names are passed over. A layer of a newer major
    /// revision is refused; of a newer minor revision it is read, and what its writer added behind is passed
    /// over. False, with the stream in its error state, when the stream is short, lacks a layer of the object
    /// or has it twice, when a revision is refused, or when a layer of a known revision holds more than was
    /// taken (the object then holds what was read up to there; of several layers, perhaps some).
    virtual bool STRM_hierarchyUnpack(PStream& stream);

    /// Makes an empty object of a class.
    using Builder = std::unique_ptr<Streamable> (*)();
    /// Registers the builder for a layer name; the same name again replaces it. Safe on any thread.
    static void registerBuilder(const char* layerName, Builder builder);
    /// An empty object of the class with that layer name; null when none is registered.
    [[nodiscard]] static std::unique_ptr<Streamable> build(std::string_view layerName);

    /// Makes an empty object that can stand for one of a class that is not known, or of a revision that is
    /// not. `layerName` is what the object shall name itself.
    using FallbackBuilder = std::unique_ptr<Streamable> (*)(std::string_view layerName);
    /// Registers what stands for objects of unknown classes that have a layer of a known base class.
    static void registerFallback(const char* shortLayerName, FallbackBuilder builder);
    /// An empty object that can stand for the packed one: that of the most derived layer that has a fallback.
    /// Null when none has, or the bytes are no packed hierarchy.
    [[nodiscard]] static std::unique_ptr<Streamable> buildFallback(std::string_view layerName,
                                                                   std::span<const std::byte> packed);

    /// One layer of a packed hierarchy. The name and bytes point into what was read.
    struct PackedLayer {
        std::string_view shortName;
        uint8_t major = 0;
        uint8_t minor = 0;
        std::span<const std::byte> bytes;
    };
    /// Reads the layers of a packed hierarchy. False, with the stream in its error state, when it is none.
    static bool readLayers(PStream& stream, std::vector<PackedLayer>& layers);
    /// Writes a layer that another program packed, or the head of one; see the class's text for its form.
    static void writeLayer(PStream& stream, const PackedLayer& layer);
};
