#include "support/memory_meter.h"

#include <atomic>
#include <cstdint>
#include <cstdlib>
#include <malloc.h>
#include <new>

namespace {

std::atomic<size_t> held{0};
std::atomic<size_t> most{0};
thread_local size_t allocations = 0;

/// How many allocations of this thread succeed until one fails; none does without a plan.
thread_local size_t untilFailure = SIZE_MAX;
thread_local bool failsForGood = false;
thread_local bool hasFailedOnce = false;

bool mustFail() {
    if (untilFailure == SIZE_MAX || --untilFailure != 0) {
        return false;
    }
    hasFailedOnce = true;
    untilFailure = failsForGood ? 1 : SIZE_MAX;
    return true;
}

void* take(size_t size) noexcept {
    if (mustFail()) {
        return nullptr;
    }
    void* const memory = std::malloc(size == 0 ? 1 : size);
    if (memory == nullptr) {
        return nullptr;
    }
    ++allocations;
    const size_t now = held += malloc_usable_size(memory);
    size_t before = most;
    while (before < now && !most.compare_exchange_weak(before, now)) {
    }
    return memory;
}

void* takeOrThrow(size_t size) {
    void* const memory = take(size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}

void giveBack(void* memory) noexcept {
    if (memory != nullptr) {
        held -= malloc_usable_size(memory);
        std::free(memory);
    }
}

} // namespace

void* operator new(size_t size) {
    return takeOrThrow(size);
}
void* operator new[](size_t size) {
    return takeOrThrow(size);
}
void* operator new(size_t size, const std::nothrow_t&) noexcept {
    return take(size);
}
void* operator new[](size_t size, const std::nothrow_t&) noexcept {
    return take(size);
}
void operator delete(void* memory) noexcept {
    giveBack(memory);
}
void operator delete[](void* memory) noexcept {
    giveBack(memory);
}
void operator delete(void* memory, const std::nothrow_t&) noexcept {
    giveBack(memory);
}
void operator delete[](void* memory, const std::nothrow_t&) noexcept {
    giveBack(memory);
}
void operator delete(void* memory, size_t) noexcept {
    giveBack(memory);
}
void operator delete[](void* memory, size_t) noexcept {
    giveBack(memory);
}

namespace test {

MemoryMeter::MemoryMeter() : m_before(held), m_allocationsBefore(allocations) {
    most = m_before;
}

size_t MemoryMeter::peak() const {
    return most - m_before;
}

FailingAllocations::FailingAllocations(size_t n, bool andAllAfter) {
    hasFailedOnce = false;
    failsForGood = andAllAfter;
    untilFailure = n;
}

FailingAllocations::~FailingAllocations() {
    untilFailure = SIZE_MAX;
}

bool FailingAllocations::hasFailed() const {
    return hasFailedOnce;
}

size_t MemoryMeter::numAllocations() const {
    return allocations - m_allocationsBefore;
}

} // namespace test
