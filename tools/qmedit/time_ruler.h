#pragma once

#include "edit/inspect/edit_report.h"

/// One mark of a timecode ruler.
struct RulerMark {
    double time = 0; ///< edit time, seconds
    String label;    ///< its timecode
};

/// Marks for a ruler of `columns` columns over the whole edit: at whole frames, seconds, minutes or hours of
/// its timecode, as close as their labels allow with two columns between them.
[[nodiscard]] std::vector<RulerMark> rulerMarks(const EditReport& report, int columns);
