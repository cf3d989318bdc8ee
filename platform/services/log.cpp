#include "platform/services/log.h"

#include "platform/base/qx_string.h"

#include <atomic>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <utility>

namespace {

/// The two outlets and the lock that guards them. Never destroyed: statics may log while the process ends.
struct Outlets {
    std::mutex mutex;
    Qx::LogSink log;      ///< empty: standard error, for grave news only
    Qx::LogSink standard; ///< empty: standard output
};

Outlets& outlets() {
    static auto& shared = *new Outlets;
    return shared;
}

std::atomic<int> greatestLevel{0};
std::atomic<bool> trace{false};

/// True while this thread is inside a sink: what a sink logs is dropped instead of waiting for itself.
thread_local bool insideSink = false;

class InsideSink {
public:
    InsideSink() { insideSink = true; }
    ~InsideSink() { insideSink = false; }
    InsideSink(const InsideSink&) = delete;
    InsideSink& operator=(const InsideSink&) = delete;
};

void put(std::FILE* stream, std::string_view line) {
    std::fwrite(line.data(), 1, line.size(), stream);
    std::fflush(stream);
}

void hand(const Qx::LogSink& sink, std::FILE* otherwise, const String& line) {
    if (sink) {
        sink(line);
    } else {
        put(otherwise, line);
    }
}

/// True if the environment asks for every line.
bool isAskedFor() {
    static const bool asked = [] {
        const char* const value = std::getenv("QUILLMARCH_LOG");
        return value != nullptr && *value != '\0' && std::string_view(value) != "0";
    }();
    return asked;
}

/// True if a line that is not grave goes nowhere.
bool isUnheard() {
    Outlets& to = outlets();
    const std::lock_guard hold(to.mutex);
    return !to.log && !isAskedFor();
}

void write(bool isGrave, const char* form, va_list arguments) {
    if (insideSink || (!isGrave && isUnheard())) {
        return;
    }
    String line = String::vformat(form, arguments);
    if (line.empty() || line.back() != '\n') {
        line += '\n';
    }
    Outlets& to = outlets();
    const std::lock_guard hold(to.mutex);
    const InsideSink inside;
    hand(to.log, stderr, line);
    if (isGrave) {
        hand(to.standard, stdout, line);
    }
}

} // namespace

void herc_printf(const char* form, ...) {
    va_list arguments;
    va_start(arguments, form);
    write(false, form, arguments);
    va_end(arguments);
}

void herc_printf(int level, const char* form, ...) {
    if (level > 0 && level > Qx::logLevel()) {
        return;
    }
    va_list arguments;
    va_start(arguments, form);
    write(false, form, arguments);
    va_end(arguments);
}

void LogBoth(const char* form, ...) {
    va_list arguments;
    va_start(arguments, form);
    write(true, form, arguments);
    va_end(arguments);
}

namespace Qx {

LogSink setLogSink(LogSink sink) {
    const std::lock_guard hold(outlets().mutex);
    return std::exchange(outlets().log, std::move(sink));
}

LogSink setStandardOutputSink(LogSink sink) {
    const std::lock_guard hold(outlets().mutex);
    return std::exchange(outlets().standard, std::move(sink));
}

LogSink standardErrorSink() {
    return [](std::string_view line) { put(stderr, line); };
}

int logLevel() {
    return greatestLevel.load(std::memory_order_relaxed);
}

void setLogLevel(int level) {
    greatestLevel.store(level, std::memory_order_relaxed);
}

bool traceIsOn() {
    return trace.load(std::memory_order_relaxed);
}

void setTrace(bool on) {
    trace.store(on, std::memory_order_relaxed);
}

} // namespace Qx
