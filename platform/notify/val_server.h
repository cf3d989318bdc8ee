#pragma once

#include "platform/base/critical_section.h"
#include "platform/notify/notifier.h"

/// A value that observers can follow. Setting it informs them synchronously with the same promises as
/// `Notifier`. Each observer is handed a copy of the value as it was set, so it may set another one
/// meanwhile.
template <typename T>
class ValServer {
public:
    using Listener = std::function<void(const T&)>;

    ValServer() = default;
    explicit ValServer(T value) : m_value(std::move(value)) {}

    [[nodiscard]] T getValue() const {
        const std::lock_guard<criticalSection> hold(m_section);
        return m_value;
    }

    /// Stores the value without telling anybody.
    void setValueSilently(T value) {
        const std::lock_guard<criticalSection> hold(m_section);
        m_value = std::move(value);
    }

    /// Stores the value and informs every observer.
    void setValue(T value) {
        setValueSilently(value);
        Told told{this, &value};
        m_notifier.notify(told);
    }

    /// Hears each value that is set until the guard goes.
    [[nodiscard]] Qx::Ptr<Qx::Guard> addListener(Listener listener) {
        return m_notifier.addListener(NotifyMsgType(),
                                      [listener = std::move(listener)](const NotifyMsg& message) {
                                          listener(*static_cast<const Told&>(message).value);
                                      });
    }

    [[nodiscard]] size_t numListeners() const { return m_notifier.numListeners(); }

private:
    struct Told : NotifyMsg {
        Told(const void*, const T* told) : value(told) {}
        const T* value;
    };

    mutable criticalSection m_section;
    T m_value{};
    Notifier m_notifier;
};
