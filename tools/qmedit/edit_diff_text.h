#pragma once

#include "edit/inspect/content_diff.h"
#include "edit/inspect/edit_diff.h"

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
/// The shortest decimal text of a level that reads back as the same.
[[nodiscard]] String levelText(float level);
