#pragma once

#include "bench/report/judging.h"

#include <string>

namespace report {

/// The goals as a drawing (SVG, UTF-8): a bar for the ratio of each on a logarithmic axis and a tick where
/// its goal is, green for one that is met and red for one that is missed. It stands alone, without scripts,
/// fonts or pictures from elsewhere, and is the same for the same rows.
[[nodiscard]] std::string chartSvg(const Judgement& judgement, uint64_t clips);

} // namespace report
