#include "platform/services/clock.h"

#include <chrono>
#include <mutex>
#include <utility>

namespace Qx {

namespace {

struct ClockState {
    std::mutex mutex;
    Clock clock; ///< empty: the machine's
};

ClockState& clockState() {
    static auto& shared = *new ClockState;
    return shared;
}

} // namespace

int64_t nowSeconds() {
    {
        const std::lock_guard hold(clockState().mutex);
        if (clockState().clock) {
            return clockState().clock();
        }
    }
    const auto since = std::chrono::system_clock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::seconds>(since).count();
}

Clock setClock(Clock clock) {
    const std::lock_guard hold(clockState().mutex);
    return std::exchange(clockState().clock, std::move(clock));
}

} // namespace Qx
