#include "platform/base/exception.h"

namespace Qx::Exception {

RuntimeError::~RuntimeError() = default;

} // namespace Qx::Exception
