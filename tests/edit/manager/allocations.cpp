#include "tests/edit/manager/allocations.h"

#include <cstdlib>
#include <new>

namespace {

thread_local size_t numAllocations = 0;

} // namespace

size_t test::allocations() {
    return numAllocations;
}

void* operator new(size_t size) {
    ++numAllocations;
    if (void* const memory = std::malloc(size == 0 ? 1 : size)) {
        return memory;
    }
    throw std::bad_alloc();
}

void operator delete(void* memory) noexcept {
    std::free(memory);
}

void operator delete(void* memory, size_t) noexcept {
    std::free(memory);
}
