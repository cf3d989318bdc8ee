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

} // namespace Qx

/// A list of observers. Observers are told synchronously on the thread that calls `notify`, in the order in
/// which they subscribed. An observer may change what it observes, notify again, subscribe and unsubscribe
/// (itself or others) while it is being told: one that was removed is not called any more, one that was added
/// hears from the next message on. Once a guard's destructor returns, its listener is not running on another
/// thread and will never be called again. The notifier may be destroyed by one of its observers.
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
    std::shared_ptr<Observers> m_observers;
};
