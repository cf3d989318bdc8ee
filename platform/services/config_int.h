#pragma once

#include "platform/base/export.h"

/// A setting of the application by name, or `defaultValue` when it is not set. Names are matched without
/// regard to case. Safe on any thread.
QM_API int config_int(const char* name, int defaultValue);

namespace Qx {

/// Sets a setting for the process. The environment variable QUILLMARCH_<NAME> (upper case) gives a setting
/// that was not set so.
QM_API void setConfigInt(const char* name, int value);
/// Forgets a setting made with `setConfigInt`.
QM_API void clearConfigInt(const char* name);

} // namespace Qx
