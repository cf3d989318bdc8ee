#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <array>
#include <compare>
#include <cstdint>
#include <string_view>

class PStream;

/// What an `IdStamp` identifies. The value is part of the stamp, so it survives text, packing and
/// comparison. The numbers live in files: do not change them.
namespace IdStampMagic {
enum MagicType : uint32_t {
    EffectNode = 0, ///< a node of an effect graph
    Material = 1,   ///< an event that shows material
    Channel = 2,    ///< a channel of an edit
    ChannelNode = 3 ///< an effect node that stands for its channel
};
}

/// Identity of a channel, a cel, an event or an object bound to an edit: three unsigned 32-bit words.
///
/// All words zero is the null stamp. The top two bits of the first word hold the magic type; a fresh stamp's
/// other 94 bits are a random prefix drawn per thread and a counter, so that stamps made on any thread,
/// process or machine differ. A plain value: copy freely, no thread rules.
class QM_API IdStamp {
public:
    constexpr IdStamp() = default;
    constexpr IdStamp(uint32_t first, uint32_t second, uint32_t third) : m_words{first, second, third} {}

    /// Reads the text form: three groups of eight hexadecimal digits joined by '-'. Any other text gives the
    /// null stamp.
    explicit IdStamp(std::string_view text);

    /// A stamp that nothing else bears, of the given magic type. Safe on any thread; allocates nothing.
    [[nodiscard]] static IdStamp fresh(IdStampMagic::MagicType type);

    [[nodiscard]] constexpr bool valid() const { return (m_words[0] | m_words[1] | m_words[2]) != 0; }
    constexpr void invalidate() { m_words = {}; }

    /// Below, equal to or above zero as this stamp orders before, with or after `other`, word by word.
    [[nodiscard]] constexpr int compare(const IdStamp& other) const {
        return *this == other ? 0 : (*this < other ? -1 : 1);
    }
    constexpr auto operator<=>(const IdStamp&) const = default;

    [[nodiscard]] constexpr IdStampMagic::MagicType getMagicType() const {
        return static_cast<IdStampMagic::MagicType>(m_words[0] >> 30);
    }
    constexpr void setMagicType(IdStampMagic::MagicType type) {
        m_words[0] = (m_words[0] & 0x3FFFFFFFu) | (static_cast<uint32_t>(type) << 30);
    }

    /// The text form. It has no blank, comma or equals sign.
    [[nodiscard]] String asString() const;
    /// The same without memory of its own, for look-ups.
    struct Text {
        std::array<char, 26> letters;
        operator std::string_view() const { return {letters.data(), letters.size()}; }
    };
    [[nodiscard]] Text asText() const;

    /// One of the three words, `i` from 0 to 2.
    [[nodiscard]] constexpr uint32_t word(int i) const { return m_words[static_cast<size_t>(i)]; }

    /// Packed form: the three words, little-endian, in order.
    void pack(PStream& stream) const;
    /// Reads the packed form. `revision` is that of the object which holds the stamp; every revision so far
    /// has the one form. On a short stream the stamp becomes null and the stream is in its error state.
    void unpack(PStream& stream, unsigned revision = 2);

private:
    std::array<uint32_t, 3> m_words{};
};

template <>
struct std::hash<IdStamp> {
    size_t operator()(const IdStamp& id) const noexcept {
        return id.word(2) * size_t{0x9E3779B97F4A7C15u} ^ (size_t{id.word(1)} << 32 | id.word(0));
    }
};
