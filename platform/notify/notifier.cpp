#include "platform/notify/notifier.h"

#include "platform/base/subscriber_list.h"

namespace Qx {

Guard::~Guard() = default;

namespace {

class SubscriptionGuard : public Guard {
public:
    explicit SubscriptionGuard(std::shared_ptr<void> subscription)
        : m_subscription(std::move(subscription)) {}

private:
    std::shared_ptr<void> m_subscription;
};

} // namespace

Ptr<Guard> guardFor(std::shared_ptr<void> subscription) {
    return std::make_shared<SubscriptionGuard>(std::move(subscription));
}

} // namespace Qx

class Notifier::Observers {
public:
    Qx::SubscriberList<const NotifyMsg&> subscribers;
};

Notifier::Notifier() : m_observers(std::make_unique<Observers>()) {}

Notifier::~Notifier() = default;

Qx::Ptr<Qx::Guard> Notifier::addListener(NotifyMsgType type, Listener listener) {
    return Qx::guardFor(
        m_observers->subscribers.add([type, listener = std::move(listener)](const NotifyMsg& message) {
            if (!type.valid() || type == message.type()) {
                listener(message);
            }
        }));
}

void Notifier::notify(const NotifyMsg& message) {
    m_observers->subscribers.tell(message);
}

size_t Notifier::numListeners() const {
    return m_observers->subscribers.size();
}
