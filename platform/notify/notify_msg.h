#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <cstdint>

/// A message type, interned by name in the process-wide dictionary: equal names give equal types. Zero is no
/// type. Safe on any thread.
class QM_API NotifyMsgType {
public:
    constexpr NotifyMsgType() = default;
    explicit NotifyMsgType(std::string_view name);
    [[nodiscard]] bool valid() const { return m_number != 0; }
    [[nodiscard]] String name() const;
    auto operator<=>(const NotifyMsgType&) const = default;

private:
    uint32_t m_number = 0;
};

/// A notification: its type and a text.
class QM_API NotifyMsg {
public:
    NotifyMsg() = default;
    NotifyMsg(NotifyMsgType type, String text) : m_type(type), m_text(std::move(text)) {}
    [[nodiscard]] NotifyMsgType type() const { return m_type; }
    [[nodiscard]] const String& text() const { return m_text; }

private:
    NotifyMsgType m_type;
    String m_text;
};
