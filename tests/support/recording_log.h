#pragma once

#include "platform/base/qx_string.h"
#include "platform/services/log.h"

#include <mutex>
#include <utility>

namespace test {

/// Takes the place of the log and of standard output while it lives, and keeps what they are told.
class RecordingLog {
public:
    RecordingLog()
        : m_logBefore(Qx::setLogSink([this](std::string_view line) { add(m_log, line); })),
          m_outBefore(Qx::setStandardOutputSink([this](std::string_view line) { add(m_out, line); })) {}
    ~RecordingLog() {
        Qx::setLogSink(std::move(m_logBefore));
        Qx::setStandardOutputSink(std::move(m_outBefore));
    }
    RecordingLog(const RecordingLog&) = delete;
    RecordingLog& operator=(const RecordingLog&) = delete;

    /// All that was logged, and all that went to standard output, line after line.
    [[nodiscard]] String log() const { return copy(m_log); }
    [[nodiscard]] String standardOutput() const { return copy(m_out); }
    [[nodiscard]] bool contains(std::string_view text) const { return log().find(text) != String::npos; }
    void clear() {
        const std::lock_guard hold(m_mutex);
        m_log.clear();
        m_out.clear();
    }

private:
    void add(String& to, std::string_view line) {
        const std::lock_guard hold(m_mutex);
        to += line;
    }
    [[nodiscard]] String copy(const String& text) const {
        const std::lock_guard hold(m_mutex);
        return text;
    }

    mutable std::mutex m_mutex;
    String m_log;
    String m_out;
    Qx::LogSink m_logBefore;
    Qx::LogSink m_outBefore;
};

} // namespace test
