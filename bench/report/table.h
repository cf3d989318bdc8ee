#pragma once

#include "bench/report/judging.h"

#include <string>

namespace report {

/// The whole report as text, at most 110 columns wide: each measure against its limit and its goal, how many
/// goals are met, a sentence for each that is not, each measure at the three sizes, and what else the results
/// hold, so that nothing of them is lost.
[[nodiscard]] std::string reportText(const Results& results, const Judgement& judgement, uint64_t clips);

} // namespace report
