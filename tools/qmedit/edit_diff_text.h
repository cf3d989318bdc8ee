#pragma once

#include "edit/inspect/content_diff.h"
#include "edit/inspect/edit_diff.h"
#include "platform/base/num_range.h"
#include "tools/qmedit/event_table.h"

#include <cmath>

class Console;

/// "changed", "added", "removed".
[[nodiscard]] const char* diffKindText(DiffKind kind);
/// A line for each thing that differs, with record timecodes of the second edit.
[[nodiscard]] String diffText(const EditDiff& diff, const EditReport& after);
/// The same with a line for each pair below its channel: '-' before one that is gone, '+' before one that
/// came.
[[nodiscard]] String diffPairsText(const EditDiff& diff, const EditReport& before, const EditReport& after,
                                   const Console& console);
/// A line for each part that differs, and below it one for each thing that is gone ('-') or came ('+'), of
/// which the first few are written and the others counted. Each time is of the edit that has it.
[[nodiscard]] String contentDiffText(const ContentDiff& diff, const EditReport& before,
                                     const EditReport& after, const Console& console);
/// What moved, in words: "the rest, 9996 clips from 01:00:42:00, 3:00 earlier". `kind` names one of them,
/// "clip", and "clips" are several.
template <class Element>
[[nodiscard]] String movedText(const MovedRun<Element>& run, const char* kind, const EditReport& before) {
    const bool isRange = run.to > run.from + Qx::kTimeTolerance && !run.isRest;
    return (run.isRest ? "the rest, " : "") +
           String::format("%zu %s%s", run.count, kind, run.count == 1 ? "" : "s") +
           (run.isRest ? " from " : ", ") + before.recordTimecode(run.from) +
           (isRange ? "-" + before.recordTimecode(run.to) : String()) + ", " +
           shortLength(before, std::abs(run.by)) + (run.by < 0 ? " earlier" : " later");
}
/// The shortest decimal text of a level that reads back as the same.
[[nodiscard]] String levelText(float level);
