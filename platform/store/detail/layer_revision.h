#pragma once

#include "platform/store/streamable.h"

namespace Qx::detail {

struct LayerRevision {
    uint8_t major = 0;
    uint8_t minor = 0;
};

/// The revision that the class of an object writes: that of an empty object made by its builder, or of the
/// object itself when the class has no builder.
LayerRevision currentRevision(const Streamable& object);

} // namespace Qx::detail
