#include "platform/base/attrib_value_pair.h"

namespace Qx {

AttribValuePair::AttribValuePair(std::string_view text) {
    const size_t equals = text.find('=');
    if (equals != std::string_view::npos && equals > 0) {
        m_attrib = String(text.substr(0, equals));
        m_value = String(text.substr(equals + 1));
    }
}

String AttribValuePair::asString() const {
    return valid() ? String(m_attrib + "=" + m_value) : String();
}

} // namespace Qx
