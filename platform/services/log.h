#pragma once

#include "platform/base/export.h"

#include <functional>
#include <string_view>

/// \file
/// The log: lines for whoever looks after a program, not for its user.
///
/// A library does not talk on the standard error of the program that uses it. Without a sink the lines of
/// `herc_printf` go nowhere; only grave news is written: what `LogBoth` tells, when edits or changes are lost
/// or no backup of a damaged one can be used, and programming errors (`ole_splat`). A program asks for all of
/// it with a sink of its own or with `Qx::setLogSink(Qx::standardErrorSink())`. The environment variable
/// QUILLMARCH_LOG, set to anything but "" and "0" when the first line is logged, asks for that in a program
/// without a sink.

/// Writes a printf-style line to the log. Safe on any thread.
QM_API void herc_printf(const char* form, ...) __attribute__((format(printf, 1, 2)));
/// The same at a level: lines above `Qx::logLevel()` are dropped. Level 0 is always written.
QM_API void herc_printf(int level, const char* form, ...) __attribute__((format(printf, 2, 3)));
/// Writes a line to the log and to standard output: for the gravest news. Without a sink for the log it goes
/// to standard error.
QM_API void LogBoth(const char* form, ...) __attribute__((format(printf, 1, 2)));

namespace Qx {

/// Takes every log line, with its line end. Called under the log's own lock: it must not log.
using LogSink = std::function<void(std::string_view line)>;

/// Installs the sink and returns the one before. An empty sink restores the default: grave news to standard
/// error, nothing else (see above).
QM_API LogSink setLogSink(LogSink sink);
/// A sink that writes every line to standard error.
QM_API LogSink standardErrorSink();
/// Where `LogBoth` writes besides the log; an empty sink restores standard output. Returns the one before.
QM_API LogSink setStandardOutputSink(LogSink sink);

/// The greatest level that is written, 0 at first.
QM_API int logLevel();
QM_API void setLogLevel(int level);

/// The process-wide switch for trace lines, off at first.
QM_API bool traceIsOn();
QM_API void setTrace(bool on);

} // namespace Qx
