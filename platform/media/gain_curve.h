#pragma once

#include <cstdint>

namespace Aud::GainCurve {

/// Shape of a fade. The numbers live in files: do not change them.
enum eCurveType : uint8_t {
    Linear = 0,
    ConstantPower = 1, ///< -3 dB at the middle
    SCurve = 2,
    Logarithmic = 3
};

} // namespace Aud::GainCurve
