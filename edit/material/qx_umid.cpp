#include "edit/material/qx_umid.h"

#include <algorithm>
#include <exception>
#include <random>
#include <string_view>

namespace {

/// The first ten bytes of a valid value.
constexpr std::array<uint8_t, 10> kLabel = {0x06, 0, 0, 0, 0x0A, 0, 0, 0, 0x2B, 0};
constexpr uint8_t kBasicLength = 0x13;
constexpr uint8_t kExtendedLength = 0x33;
constexpr size_t kMaterialType = 10;
constexpr size_t kMethods = 11;
constexpr size_t kLength = 12;
constexpr size_t kInstance = 13;
constexpr size_t kMaterial = 16;

int digitOf(char c) {
    if (c >= '0' && c <= '9') {
        return c - '0';
    }
    const char lower = c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
    return lower >= 'a' && lower <= 'f' ? lower - 'a' + 10 : -1;
}

} // namespace

QxUMID::QxUMID(const String& text) {
    setFromString(text);
}

QxUMID QxUMID::create(QxUMIDDefs::MaterialType::eMaterialTypes type) {
    QxUMIDDefs::MaterialNumber number{};
    try {
        std::random_device source;
        for (uint8_t& byte : number) {
            byte = static_cast<uint8_t>(source());
        }
    } catch (const std::exception&) {
        return {};
    }
    number[6] = static_cast<uint8_t>((number[6] & 0x0F) | 0x40); // version 4
    number[8] = static_cast<uint8_t>((number[8] & 0x3F) | 0x80); // the variant of RFC 4122

    QxUMID made;
    std::copy(kLabel.begin(), kLabel.end(), made.m_bytes.begin());
    made.m_bytes[kMaterialType] = static_cast<uint8_t>(type);
    made.m_bytes[kMethods] =
        static_cast<uint8_t>(QxUniversalLabelDefs::MaterialNumberGenerationMethod::eUUID << 4);
    made.m_bytes[kLength] = kBasicLength;
    std::copy(number.begin(), number.end(), made.m_bytes.begin() + kMaterial);
    return made;
}

bool QxUMID::setFromString(const String& text) {
    m_bytes = {};
    std::array<uint8_t, kSize> read{};
    const size_t count = std::min(text.size() / 2, kSize);
    for (size_t i = 0; i < count; ++i) {
        const int high = digitOf(text[2 * i]);
        const int low = digitOf(text[2 * i + 1]);
        if (high < 0 || low < 0) {
            return false;
        }
        read[i] = static_cast<uint8_t>(16 * high + low);
    }
    if (count != kBasicSize && count != kSize) {
        return false;
    }
    m_bytes = read;
    return true;
}

String QxUMID::getAsString() const {
    String text;
    if (!valid()) {
        return text;
    }
    constexpr std::string_view digits = "0123456789abcdef";
    const size_t size = getType() == QxUMIDDefs::Type::eBasic ? kBasicSize : kSize;
    text.reserve(2 * size);
    for (size_t i = 0; i < size; ++i) {
        text += digits[m_bytes[i] >> 4];
        text += digits[m_bytes[i] & 0x0F];
    }
    return text;
}

bool QxUMID::valid() const {
    return (m_bytes[kLength] == kBasicLength || m_bytes[kLength] == kExtendedLength) &&
           std::equal(kLabel.begin(), kLabel.end(), m_bytes.begin());
}

QxUMIDDefs::Type::eType QxUMID::getType() const {
    if (!valid()) {
        return QxUMIDDefs::Type::eInvalid;
    }
    return m_bytes[kLength] == kBasicLength ? QxUMIDDefs::Type::eBasic : QxUMIDDefs::Type::eExtended;
}

QxUMIDDefs::MaterialType::eMaterialTypes QxUMID::getMaterialType() const {
    using Material = QxUMIDDefs::MaterialType;
    const uint8_t type = m_bytes[kMaterialType];
    return type >= 1 && type <= 4 ? static_cast<Material::eMaterialTypes>(type) : Material::eUnknown;
}

QxUniversalLabelDefs::MaterialNumberGenerationMethod::eMaterialNumberGenerationMethods
QxUMID::getMaterialNumberGenerationMethod() const {
    using Method = QxUniversalLabelDefs::MaterialNumberGenerationMethod;
    return static_cast<Method::eMaterialNumberGenerationMethods>(m_bytes[kMethods] >> 4);
}

QxUniversalLabelDefs::InstanceNumberGenerationMethod::eInstanceNumberGenerationMethods
QxUMID::getInstanceNumberGenerationMethod() const {
    using Method = QxUniversalLabelDefs::InstanceNumberGenerationMethod;
    return static_cast<Method::eInstanceNumberGenerationMethods>(m_bytes[kMethods] & 0x0F);
}

uint32_t QxUMID::getInstanceNumber() const {
    return uint32_t{m_bytes[kInstance]} | uint32_t{m_bytes[kInstance + 1]} << 8 |
           uint32_t{m_bytes[kInstance + 2]} << 16;
}

QxUMIDDefs::MaterialNumber QxUMID::getMaterialNumber() const {
    QxUMIDDefs::MaterialNumber number;
    std::copy_n(m_bytes.begin() + kMaterial, number.size(), number.begin());
    return number;
}
