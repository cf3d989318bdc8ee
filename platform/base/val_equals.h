#pragma once

#include <cmath>

/// True if two times or ratios are equal within 1e-6. Infinities of one sign are equal; what is no number equals
/// nothing.
[[nodiscard]] inline bool valEqualsVal(double a, double b) {
    return a == b || std::abs(a - b) <= 1e-6;
}
