#pragma once

#include "platform/services/network.h"

namespace Qx::Network {

/// Carries messages between seats inside one process: each object is a seat, and hears what the other seats
/// of its net send, never what it sends itself. Messages are delivered on the sender's thread before `send`
/// returns. A listener may send, listen and stop listening while it is told; once what `listen` returned is
/// destroyed, the listener is not running on another thread and will not be called again. Thread-safe.
class QM_API LocalService : public Service {
public:
    /// The first seat of a net of its own.
    [[nodiscard]] static std::shared_ptr<LocalService> firstSeat();
    /// One more seat of this seat's net. It lives on when this one goes.
    [[nodiscard]] std::shared_ptr<LocalService> anotherSeat() const;

    ~LocalService() override;
    void send(const Message& message) override;
    [[nodiscard]] std::shared_ptr<void> listen(Listener listener) override;

private:
    class Net;
    explicit LocalService(std::shared_ptr<Net> net);

    std::shared_ptr<Net> m_net;
};

} // namespace Qx::Network
