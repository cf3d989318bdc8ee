#pragma once

#include "platform/base/export.h"

#include <functional>
#include <string_view>

/// Writes a printf-style line to the log. Safe on any thread.
QM_API void herc_printf(const char* form, ...) __attribute__((format(printf, 1, 2)));
/// The same at a level: lines above `Qx::logLevel()` are dropped. Level 0 is always written.
QM_API void herc_printf(int level, const char* form, ...) __attribute__((format(printf, 2, 3)));
/// Writes a line to the log and to standard output: for the gravest news.
QM_API void LogBoth(const char* form, ...) __attribute__((format(printf, 1, 2)));

namespace Qx {

/// Takes every log line, with its line end. Called under the log's own lock: it must not log.
using LogSink = std::function<void(std::string_view line)>;

/// Installs the sink and returns the one before. An empty sink restores the default, standard error.
QM_API LogSink setLogSink(LogSink sink);
/// Where `LogBoth` writes besides the log; an empty sink restores standard output. Returns the one before.
QM_API LogSink setStandardOutputSink(LogSink sink);

/// The greatest level that is written, 0 at first.
QM_API int logLevel();
QM_API void setLogLevel(int level);

/// The process-wide switch for trace lines, off at first.
QM_API bool traceIsOn();
QM_API void setTrace(bool on);

} // namespace Qx
