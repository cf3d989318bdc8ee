#pragma once

#include "platform/base/num_range.h"

/// What everything with a span of time answers.
namespace Editable {

/// Which part of the content counts as the occupied span.
enum ExtentType {
    Everything = 0,  ///< from the first event to the last, black included
    MaterialOnly = 1 ///< from the first to the last pair that is not black
};

/// The span of something that has none: both ends unset.
constexpr NumRange<double, Ordered> invalidRange() {
    return {Qx::kNoTime, Qx::kNoTime};
}

} // namespace Editable

/// What `simplify` merges.
namespace Simplification {
enum Type {
    MergeBlack = 1,   ///< adjacent pairs of black become one
    MergeThrough = 2, ///< adjacent pairs that play on through the cut become one
    MergeAll = 3
};

[[nodiscard]] constexpr Type operator|(Type a, Type b) {
    return static_cast<Type>(int{a} | int{b});
}
} // namespace Simplification
