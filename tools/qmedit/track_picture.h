#pragma once

#include "edit/inspect/edit_report.h"
#include "tools/qmedit/console.h"

/// The tracks of an edit drawn to scale in the columns of a console: a timecode ruler, a row of markers where
/// there are any, and for each channel one row of pairs between two rules.
///
///         ╷01:00:00:00      ╷01:00:10:00      ╷01:00:20:00
///         ┌─────────┬───────┬────────┐        ┌──────────┐
///     V1  │ square  │ stalls│░░░░░░░░│        │╱╱ bread  │
///         ├─────────┴───────┼────────┴────────┴──────────┤
///     A1  │ square          │ atmosphere                 │
///         └─────────────────┴────────────────────────────┘
///
/// A transition is slanted from where it begins to where it ends. A cut is an upright line at its place, to the nearest column; a heavy one stands for pairs that are
/// narrower than a column. A gap is blank, black is shaded, a fade is slanted, a pair whose shot is missing
/// says so.
[[nodiscard]] String trackPicture(const EditReport& report, const Console& console);

/// One or two lines on the edit as a whole: name, cookie, type, rate, span, channels.
[[nodiscard]] String editSummary(const EditReport& report, const Console& console);

/// What stands for a pair that shows an effect whose kind is known: "dissolve", "wipe 201", "chromakey".
[[nodiscard]] String effectLabel(const PairReport& pair);

/// What stands for a source on a console: its name made fit to show, "black", or "missing E0001005".
[[nodiscard]] String sourceLabel(const SourceReport& source, const Console& console);
