#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <stdexcept>

namespace Qx::Exception {

/// A failure at run time, with the place that raised it. The one exception that crosses the library's face
/// (thrown by the multiple-access queue).
class QM_API RuntimeError : public std::runtime_error {
public:
    RuntimeError(const String& text, String source, int line)
        : std::runtime_error(text), m_source(std::move(source)), m_line(line) {}
    ~RuntimeError() override;
    [[nodiscard]] const String& source() const { return m_source; }
    [[nodiscard]] int line() const { return m_line; }

private:
    String m_source;
    int m_line;
};

} // namespace Qx::Exception
