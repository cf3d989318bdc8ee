#pragma once

#include "platform/base/export.h"
#include "platform/base/ptr.h"
#include "platform/notify/notify_msg.h"

#include <functional>
#include <memory>

namespace Qx {

/// Ends a subscription when it is destroyed. Movable through its pointer; safe to destroy on any thread, from
/// inside the listener that it belongs to, and after the notifier is gone.
class QM_API Guard {
public:
    virtual ~Guard();
};

/// A guard that ends a subscription of a `SubscriberList`.
QM_API Ptr<Guard> guardFor(std::shared_ptr<void> subscription);

} // namespace Qx

/// A list of observers. Observers are told synchronously on the thread that calls `notify`, in the order in
/// which they subscribed. An observer may change what it observes, notify again, subscribe and unsubscribe
/// (itself or others) while it is being told: one that was removed is not called any more, one that was added
/// hears from the next message on. Once a guard's destructor returns, its listener is not running on another
/// thread and will never be called again, and what the listener held is let go. A guard's destructor must not
/// be waited for by the listener itself, so do not hold a lock over it that the listener takes. (Where
/// threads, each inside a listener, end each other's subscriptions in a circle, one of them goes on without
/// waiting.)
///
/// The notifier may be destroyed by one of its observers; those that were not told yet are then not told.
/// Observers of one message may hear an inner message, sent by an observer before them, first.
class QM_API Notifier {
public:
    using Listener = std::function<void(const NotifyMsg&)>;

    Notifier();
    virtual ~Notifier();
    Notifier(const Notifier&) = delete;
    Notifier& operator=(const Notifier&) = delete;

    /// Hears messages of one type, or of every type when `type` is not valid, until the guard goes.
    [[nodiscard]] Qx::Ptr<Qx::Guard> addListener(NotifyMsgType type, Listener listener);
    void notify(const NotifyMsg& message);
    [[nodiscard]] size_t numListeners() const;

private:
    class Observers;
    std::unique_ptr<Observers> m_observers;
};
