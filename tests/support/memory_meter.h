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

/// While it lives, allocation `n` of this thread (from 1) fails, and with `andAllAfter` each that follows.
class FailingAllocations {
public:
    explicit FailingAllocations(size_t n, bool andAllAfter = false);
    ~FailingAllocations();
    FailingAllocations(const FailingAllocations&) = delete;
    FailingAllocations& operator=(const FailingAllocations&) = delete;
    /// True if one has failed.
    [[nodiscard]] bool hasFailed() const;
};

} // namespace test
