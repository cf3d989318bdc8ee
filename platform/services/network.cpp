#include "platform/services/network.h"

#include <atomic>
#include <mutex>
#include <utility>

namespace Qx::Network {

namespace {

struct NetworkState {
    std::mutex mutex;
    std::shared_ptr<Service> service;
    std::atomic<bool> mode{false};
};

NetworkState& networkState() {
    static auto& shared = *new NetworkState;
    return shared;
}

} // namespace

Service::~Service() = default;

bool networkMode() {
    return networkState().mode.load();
}

void setNetworkMode(bool on) {
    networkState().mode.store(on);
}

void send(const Message& message) {
    if (!networkMode()) {
        return;
    }
    if (const std::shared_ptr<Service> carrier = service()) {
        carrier->send(message);
    }
}

std::shared_ptr<Service> setService(std::shared_ptr<Service> replacement) {
    const std::lock_guard hold(networkState().mutex);
    return std::exchange(networkState().service, std::move(replacement));
}

std::shared_ptr<Service> service() {
    const std::lock_guard hold(networkState().mutex);
    return networkState().service;
}

} // namespace Qx::Network
