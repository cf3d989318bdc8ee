#include "platform/services/network.h"

#include <atomic>
#include <mutex>
#include <utility>

namespace Qx::Network {

namespace {

struct State {
    std::mutex mutex;
    std::shared_ptr<Service> service;
    std::atomic<bool> mode{false};
};

State& state() {
    static auto& shared = *new State;
    return shared;
}

} // namespace

Service::~Service() = default;

bool networkMode() {
    return state().mode.load();
}

void setNetworkMode(bool on) {
    state().mode.store(on);
}

void send(const Message& message) {
    if (!networkMode()) {
        return;
    }
    std::shared_ptr<Service> service;
    {
        const std::lock_guard hold(state().mutex);
        service = state().service;
    }
    if (service) {
        service->send(message);
    }
}

std::shared_ptr<Service> setService(std::shared_ptr<Service> service) {
    const std::lock_guard hold(state().mutex);
    return std::exchange(state().service, std::move(service));
}

} // namespace Qx::Network
