#pragma once

#include "platform/base/qx_string.h"

namespace Qx {

/// An attribute and its value as one text, "attribute=value". The attribute may hold anything but '=' and
/// must not be empty; the value may hold anything.
class QM_API AttribValuePair {
public:
    AttribValuePair() = default;
    AttribValuePair(String attrib, String value) : m_attrib(std::move(attrib)), m_value(std::move(value)) {}
    /// Reads the text form. A text without '=', or with nothing before it, gives a pair that is not valid.
    explicit AttribValuePair(std::string_view text);

    [[nodiscard]] bool valid() const { return !m_attrib.empty() && m_attrib.find('=') == String::npos; }
    [[nodiscard]] const String& attrib() const { return m_attrib; }
    [[nodiscard]] const String& value() const { return m_value; }
    /// The text form; empty for a pair that is not valid.
    [[nodiscard]] String asString() const;
    bool operator==(const AttribValuePair&) const = default;

private:
    String m_attrib;
    String m_value;
};

} // namespace Qx
