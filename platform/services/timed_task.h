#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <atomic>
#include <chrono>
#include <cstdint>
#include <vector>

namespace Qx {

/// How often the sections of a task ran and how long they took, for finding out where time goes. A section is
/// timed by a `Section` on the stack, which costs two readings of the clock and two atomic additions. Safe on
/// any thread; times of threads add up.
class QM_API TimedTask {
public:
    /// The counters of one section.
    class Counter {
    public:
        void add(std::chrono::nanoseconds time) {
            m_calls.fetch_add(1, std::memory_order_relaxed);
            m_nanoseconds.fetch_add(time.count(), std::memory_order_relaxed);
        }
        [[nodiscard]] uint64_t calls() const { return m_calls.load(std::memory_order_relaxed); }
        [[nodiscard]] std::chrono::nanoseconds time() const {
            return std::chrono::nanoseconds(m_nanoseconds.load(std::memory_order_relaxed));
        }

    private:
        std::atomic<uint64_t> m_calls{0};
        std::atomic<int64_t> m_nanoseconds{0};
    };

    /// Times a scope, however it is left.
    class Section {
    public:
        Section(TimedTask& task, const char* name) : Section(task.section(name)) {}
        explicit Section(Counter& counter) : m_counter(counter), m_start(std::chrono::steady_clock::now()) {}
        ~Section() { m_counter.add(std::chrono::steady_clock::now() - m_start); }
        Section(const Section&) = delete;
        Section& operator=(const Section&) = delete;

    private:
        Counter& m_counter;
        std::chrono::steady_clock::time_point m_start;
    };

    struct Times {
        String section;
        uint64_t calls;
        std::chrono::nanoseconds time;
    };

    /// The task of a name, made on first use; it lives as long as the process.
    [[nodiscard]] static TimedTask& named(const char* name);
    /// The counter of a section, made on first use; it lives as long as the process. A hot path keeps it.
    [[nodiscard]] Counter& section(const char* name);
    /// What was counted so far, by the sections' names.
    [[nodiscard]] std::vector<Times> times() const;

    TimedTask(const TimedTask&) = delete;
    TimedTask& operator=(const TimedTask&) = delete;

private:
    struct Sections;
    TimedTask();
    ~TimedTask();

    Sections* m_sections;
};

} // namespace Qx
