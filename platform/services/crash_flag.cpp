#include "platform/services/crash_flag.h"

#include <atomic>

namespace {

std::atomic<int> crashFlag{0};

} // namespace

int get_crash_flag() {
    return crashFlag.load();
}

namespace Qx {

void setCrashFlag(int flag) {
    crashFlag.store(flag);
}

} // namespace Qx
