#pragma once

#include <cstddef>

/// Things that stand in a row of one edit and, each later or earlier by the same time, in the same row of
/// another. Times are seconds.
template <class Element>
struct MovedRun {
    Element first; ///< as the first edit has it
    size_t count = 0;
    double from = 0;     ///< of the first edit: where the first of them begins
    double to = 0;       ///< and where the last ends
    double by = 0;       ///< later by so much in the second edit; below 0 earlier
    bool isRest = false; ///< everything from the first of them to the end of both rows
};
