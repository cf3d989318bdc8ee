#pragma once

#include <memory>

namespace Qx {

/// A counted handle to a shared object of the platform. The count is atomic; one handle must not be assigned
/// on one thread while another reads it.
template <typename T>
using Ptr = std::shared_ptr<T>;

} // namespace Qx
