#pragma once

#include "edit/inspect/edit_report.h"
#include "tools/qmedit/console.h"

/// The events of each channel, a line an event: number, record in and out, source in and out, length, name,
/// and in brackets what is special; a line for each gap; then the markers. Without `all` the first twelve of
/// each channel, and the others are counted. With it each line also tells the event's number in an imported
/// list and the reel, where any is known, and the transition. On a console that is fitted a line is no longer
/// than its width: names are cut, and where that leaves them no room, columns are left out.
[[nodiscard]] String eventTable(const EditReport& report, const Console& console, bool all);

/// A length without the hours and minutes that it does not reach: "4:12", "1:04:12".
[[nodiscard]] String shortLength(const EditReport& report, double seconds);

/// What is special about a pair: " (200%) (fade in 0:12)"; empty for most.
[[nodiscard]] String pairNotes(const EditReport& report, const PairReport& pair);
