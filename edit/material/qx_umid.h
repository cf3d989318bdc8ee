#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <array>
#include <compare>
#include <cstddef>
#include <cstdint>
#include <span>

namespace QxUMIDDefs {

struct Type {
    enum eType : int { eBasic = 0, eExtended = 1, eInvalid = 2 };
};

/// What the material is (SMPTE 330M), as byte 10 has it.
struct MaterialType {
    enum eMaterialTypes : int { ePicture = 1, eSound = 2, eData = 3, eOther = 4, eUnknown = 255 };
};

/// The number that all copies and versions of one material share.
using MaterialNumber = std::array<uint8_t, 16>;

} // namespace QxUMIDDefs

namespace QxUniversalLabelDefs {

/// How a material number was made, the high four bits of byte 11.
struct MaterialNumberGenerationMethod {
    enum eMaterialNumberGenerationMethods : int {
        eNone = 0,
        eSMPTE = 1,
        eUUID = 2,
        eMasked = 3,
        eIEEE1394 = 4
    };
};

/// How an instance number was made, the low four bits of byte 11.
struct InstanceNumberGenerationMethod {
    enum eInstanceNumberGenerationMethods : int { eNone = 0, eLocal = 1, eRandomAndMAC = 2 };
};

} // namespace QxUniversalLabelDefs

/// A unique material identifier (SMPTE 330M), basic (32 bytes) or extended (64). A plain value; new ones are
/// all zero, which is not valid.
///
/// Its universal label is not the standard's: a value is valid only if it begins with the ten bytes
/// 06 00 00 00 0A 00 00 00 2B 00 and byte 12 is 0x13 (basic) or 0x33 (extended). These bytes live in edit
/// files: do not change them.
///
///     0-9 label   10 material type   11 generation methods   12 length   13-15 instance   16-31 material
///     32-63 extended part: time, place, organisation
class QM_API QxUMID {
public:
    static constexpr size_t kSize = 64;
    static constexpr size_t kBasicSize = 32;

    QxUMID() = default;
    /// As `setFromString`; zero when the text is none.
    explicit QxUMID(const String& text);

    /// A basic identifier for new material, its material number a random UUID (RFC 4122, version 4) from the
    /// machine's random source, its instance 0: the original. Zero if that source gives nothing.
    [[nodiscard]] static QxUMID create(QxUMIDDefs::MaterialType::eMaterialTypes type);

    /// Reads pairs of hexadecimal digits of either case, at most 64; a last lone digit is ignored. False,
    /// leaving zero, for another character and for what is neither 32 nor 64 bytes.
    bool setFromString(const String& text);
    /// 64 or 128 lower-case hexadecimal digits; empty for what is not valid.
    [[nodiscard]] String getAsString() const;

    [[nodiscard]] bool valid() const;
    [[nodiscard]] QxUMIDDefs::Type::eType getType() const;
    /// `eUnknown` for a byte that is none of the four types.
    [[nodiscard]] QxUMIDDefs::MaterialType::eMaterialTypes getMaterialType() const;
    [[nodiscard]] QxUniversalLabelDefs::MaterialNumberGenerationMethod::eMaterialNumberGenerationMethods
    getMaterialNumberGenerationMethod() const;
    [[nodiscard]] QxUniversalLabelDefs::InstanceNumberGenerationMethod::eInstanceNumberGenerationMethods
    getInstanceNumberGenerationMethod() const;
    /// 24 bits, byte 13 the least significant.
    [[nodiscard]] uint32_t getInstanceNumber() const;
    [[nodiscard]] QxUMIDDefs::MaterialNumber getMaterialNumber() const;
    [[nodiscard]] const std::array<uint8_t, kSize>& getData() const { return m_bytes; }

    /// Byte by byte, all 64.
    auto operator<=>(const QxUMID&) const = default;

private:
    std::array<uint8_t, kSize> m_bytes{};
};
