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
    if (const std::shared_ptr<Service> carrier = service()) {
        carrier->send(message);
    }
}

std::shared_ptr<Service> setService(std::shared_ptr<Service> replacement) {
    const std::lock_guard hold(state().mutex);
    return std::exchange(state().service, std::move(replacement));
}

std::shared_ptr<Service> service() {
    const std::lock_guard hold(state().mutex);
    return state().service;
}

} // namespace Qx::Network
