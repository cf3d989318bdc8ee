#include "platform/services/local_service.h"

#include "platform/base/subscriber_list.h"

namespace Qx::Network {

class LocalService::Net {
public:
    /// Told the seat that sends and the message.
    SubscriberList<const LocalService*, const Message&> subscribers;
};

LocalService::LocalService(std::shared_ptr<Net> net) : m_net(std::move(net)) {}

LocalService::~LocalService() = default;

std::shared_ptr<LocalService> LocalService::firstSeat() {
    return std::shared_ptr<LocalService>(new LocalService(std::make_shared<Net>()));
}

std::shared_ptr<LocalService> LocalService::anotherSeat() const {
    return std::shared_ptr<LocalService>(new LocalService(m_net));
}

void LocalService::send(const Message& message) {
    // Kept alive: a listener may drop the last seat.
    const std::shared_ptr<Net> net = m_net;
    net->subscribers.tell(this, message);
}

std::shared_ptr<void> LocalService::listen(Listener listener) {
    return m_net->subscribers.add(
        [own = this, listener = std::move(listener)](const LocalService* sender, const Message& message) {
            if (sender != own) {
                listener(message);
            }
        });
}

} // namespace Qx::Network
