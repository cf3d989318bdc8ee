#pragma once

#include "platform/base/export.h"

/// Non-zero once the application knows that it is going down after a crash: then what is in memory is saved
/// rather than left. Safe on any thread and in a signal handler.
QM_API int get_crash_flag();

namespace Qx {

QM_API void setCrashFlag(int flag);

} // namespace Qx
