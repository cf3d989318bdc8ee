#pragma once

#include "platform/base/critical_section.h"
#include "platform/base/subscriber_list.h"
#include "platform/notify/notifier.h"

/// What ties an observer to the server of a value: the observer hears of values until it goes.
using ValClientBase = Qx::Guard;

/// A value that observers can follow. Setting it informs them synchronously with the same promises as
/// `Notifier`. Each observer is handed a copy of the value as it was set, so it may set another one
/// meanwhile, or destroy the server.
///
/// Every value that is set reaches every observer: none is skipped because a later one was set. Where an
/// observer sets a value while it is told one, the observers after it hear the inner value first; likewise
/// for values that are set on two threads at once. `getValue` gives the latest in any case. `T` is copyable
/// and has a default.
template <typename T>
class ValServer {
public:
    using Listener = std::function<void(const T&)>;

    ValServer() = default;
    explicit ValServer(T value) : m_value(std::move(value)) {}
    ValServer(const ValServer&) = delete;
    ValServer& operator=(const ValServer&) = delete;

    [[nodiscard]] T getValue() const {
        const std::lock_guard<criticalSection> hold(m_section);
        return m_value;
    }

    /// Stores the value without telling anybody.
    void setValueSilently(T value) {
        const std::lock_guard<criticalSection> hold(m_section);
        // The old value is destroyed with the parameter, after the lock is released.
        std::swap(m_value, value);
    }

    /// Stores the value and informs every observer.
    void setValue(T value) {
        setValueSilently(value);
        m_subscribers.tell(value);
    }

    /// Informs every observer of a value that does not become the current one.
    void announce(T value) { m_subscribers.tell(value); }

    /// Hears each value that is set or announced until what is returned goes.
    [[nodiscard]] Qx::Ptr<ValClientBase> addListener(Listener listener) {
        return Qx::guardFor(m_subscribers.add(std::move(listener)));
    }

    [[nodiscard]] size_t numListeners() const { return m_subscribers.size(); }

private:
    mutable criticalSection m_section;
    T m_value{};
    Qx::SubscriberList<const T&> m_subscribers;
};
