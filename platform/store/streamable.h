#pragma once

#include "platform/base/export.h"
#include "platform/store/pstream.h"

#include <memory>

/// An object that packs itself into a stream, layer by layer: each class of its hierarchy writes one layer
/// with its own name and revision, base first. A reader passes over the layers that it does not know.
///
/// Packed hierarchy: an unsigned 32-bit layer count, then per layer its short name (string), major and minor
/// revision (one byte each), an unsigned 32-bit length and that many bytes.
class QM_API Streamable {
public:
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

    [[nodiscard]] virtual std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const = 0;

    /// Writes every layer. The revision written is the class's current one (that of an empty object made by
    /// its builder, or of this object when the class has none), whatever revision was last unpacked: `pack`
    /// always writes the current form.
    virtual void STRM_hierarchyPack(PStream& stream) const;
    /// Reads what `STRM_hierarchyPack` wrote; layers of other names are passed over. A layer of a newer major
    /// revision is refused; of a newer minor revision it is read, and what its writer added behind is passed
    /// over. False, with the stream in its error state, when the stream is short, lacks the object's layer or
    /// has it twice, when the revision is refused, or when a layer of a known revision holds more than
    /// `unpack` took (the object then holds what was read).
    virtual bool STRM_hierarchyUnpack(PStream& stream);

    /// Makes an empty object of a class.
    using Builder = std::unique_ptr<Streamable> (*)();
    /// Registers the builder for a layer name; the same name again replaces it. Safe on any thread.
    static void registerBuilder(const char* layerName, Builder builder);
    /// An empty object of the class with that layer name; null when none is registered.
    [[nodiscard]] static std::unique_ptr<Streamable> build(std::string_view layerName);
};
