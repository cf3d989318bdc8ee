#pragma once

#include "platform/base/num_range.h"

#include <vector>

/// Walks two rows in order of time and adds what only the first or only the second has. `same` compares two
/// elements, `timeOf` gives an element's time in seconds.
template <class Element, class Same, class TimeOf>
void walkDifference(const std::vector<Element>& was, const std::vector<Element>& now, const Same& same,
                    const TimeOf& timeOf, std::vector<Element>& removed, std::vector<Element>& added) {
    size_t i = 0;
    size_t j = 0;
    while (i < was.size() || j < now.size()) {
        const bool both = i < was.size() && j < now.size();
        if (both && same(was[i], now[j])) {
            ++i;
            ++j;
        } else if (j == now.size() || (both && timeOf(was[i]) <= timeOf(now[j]) + Qx::kTimeTolerance)) {
            removed.push_back(was[i++]);
        } else {
            added.push_back(now[j++]);
        }
    }
}
