#pragma once

#include <cstddef>

namespace test {

/// How often this thread has called the global `operator new`.
size_t allocations();

} // namespace test
