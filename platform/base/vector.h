#pragma once

#include <vector>

/// The sequence container of the library's face.
template <typename T>
using Vector = std::vector<T>;
