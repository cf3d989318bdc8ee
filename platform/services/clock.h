#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <cstdint>
#include <functional>

namespace Qx {

/// Tells the time, in whole seconds since 1970-01-01 00:00 UTC.
using Clock = std::function<int64_t()>;

/// The time by the clock in use, at first the machine's: seconds since 1970, UTC, in 64 bits. Safe on any
/// thread.
QM_API int64_t nowSeconds();

/// Puts another clock in place and returns the one before; an empty one restores the machine's. A clock is
/// called under a lock: it must not ask for the time itself.
QM_API Clock setClock(Clock clock);

/// "2026-11-21T11:30:00Z" for seconds since 1970, UTC; empty for a time that has no date.
QM_API String isoTimeText(int64_t seconds);

} // namespace Qx
