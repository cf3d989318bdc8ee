#include "support/memory_meter.h"

#include <atomic>
#include <cstdlib>
#include <malloc.h>
#include <new>

namespace {

std::atomic<size_t> held{0};
std::atomic<size_t> most{0};
thread_local size_t allocations = 0;
thread_local size_t failing = 0; ///< the number of the allocation that fails; 0 for none

void* take(size_t size) noexcept {
    ++allocations;
    void* const memory = allocations == failing ? nullptr : std::malloc(size == 0 ? 1 : size);
    if (memory == nullptr) {
        return nullptr;
    }
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

size_t MemoryMeter::numAllocations() const {
    return allocations - m_allocationsBefore;
}

FailingAllocation::FailingAllocation(size_t n) : m_at(allocations + n) {
    failing = m_at;
}

FailingAllocation::~FailingAllocation() {
    failing = 0;
}

bool FailingAllocation::cameToIt() const {
    return allocations >= m_at;
}

} // namespace test
