#pragma once

#include <cstddef>

namespace test {

/// Measures what is taken from the heap through `operator new`. A program that uses it lists
/// support/memory_meter.cpp among its sources.
class MemoryMeter {
public:
    /// Measures from here.
    MemoryMeter();
    /// The most that all threads held at once since then, in bytes beyond what was held before.
    [[nodiscard]] size_t peak() const;
    /// How often this thread has asked for memory since then.
    [[nodiscard]] size_t numAllocations() const;

private:
    size_t m_before;
    size_t m_allocationsBefore;
};

/// While it lives, the `n`-th allocation of this thread from here on fails, as it does when there is no
/// memory left.
class FailingAllocation {
public:
    explicit FailingAllocation(size_t n);
    ~FailingAllocation();
    FailingAllocation(const FailingAllocation&) = delete;
    FailingAllocation& operator=(const FailingAllocation&) = delete;
    [[nodiscard]] bool cameToIt() const;

private:
    size_t m_at;
};

} // namespace test
