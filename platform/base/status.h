#pragma once

#include "platform/base/qx_string.h"

#include <optional>

namespace Qx {

/// The outcome of an operation that can fail for a reason its caller may want to act on or show. A failure
/// carries one sentence that names the thing, the place and, where there is one, the remedy.
class [[nodiscard]] Status {
public:
    /// Success.
    Status() = default;
    [[nodiscard]] static Status failure(String reason) {
        Status status;
        status.m_reason = std::move(reason);
        return status;
    }

    [[nodiscard]] bool isOk() const { return !m_reason.has_value(); }
    explicit operator bool() const { return isOk(); }
    /// Why it failed; empty on success.
    [[nodiscard]] String reason() const { return m_reason.value_or(String()); }

private:
    std::optional<String> m_reason;
};

} // namespace Qx
