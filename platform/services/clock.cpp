#include "platform/services/clock.h"

#include <chrono>
#include <ctime>
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

String isoTimeText(int64_t seconds) {
    const auto time = static_cast<std::time_t>(seconds);
    std::tm fields{};
    char text[32];
    if (gmtime_r(&time, &fields) == nullptr ||
        std::strftime(text, sizeof text, "%Y-%m-%dT%H:%M:%SZ", &fields) == 0) {
        return {};
    }
    return text;
}

} // namespace Qx
