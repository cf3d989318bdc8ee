#pragma once

#include "platform/base/export.h"

/// Reports a programming error (depth exceeded, too many pops, an object that is not controlled) to the
/// process-wide handler and returns: the caller goes on by doing nothing. Safe on any thread.
QM_API void ole_splat(const char* form, ...) __attribute__((format(printf, 1, 2)));

namespace Qx {

/// Takes the message of a programming error.
using SplatHandler = void (*)(const char* message);

/// Installs the handler and returns the one before. Null restores the default, which writes the message to
/// standard error.
QM_API SplatHandler setSplatHandler(SplatHandler handler);

} // namespace Qx
