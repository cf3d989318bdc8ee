#pragma once

#include "edit/inspect/edit_report.h"
#include "tools/qmedit/console.h"

/// How much of the table is written.
struct EventTableOptions {
    size_t eventsPerChannel = 12; ///< at most so many of each channel; what is left out is counted
    bool fitToWidth = false;      ///< names are cut at the console's width
};

/// The events of each channel, a line an event: number, record in and out, source in and out, length, speed
/// where it is not 1, name; a line for each gap; then the markers.
[[nodiscard]] String eventTable(const EditReport& report, const Console& console,
                                const EventTableOptions& options);

/// What is special about a pair: " (200%) (fade in 0:12)"; empty for most.
[[nodiscard]] String pairNotes(const EditReport& report, const PairReport& pair);
