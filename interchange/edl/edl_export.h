#pragma once

#include "edit/model/edit.h"
#include "interchange/export.h"
#include "interchange/loss_report.h"

#include <functional>

namespace interchange {

struct EdlExportOptions {
    bool strict = false; ///< any loss is a failure, and so are more than 999 events
    bool crlf = false;   ///< lines end with CR and LF instead of LF
    /// The edit of a source, for its reel and names; a null handle for one that cannot be read. Each source
    /// is asked for once. Without it the sources are read from the current project.
    std::function<EditPtr(const cookie&)> source;
};

/// Makes a CMX 3600 list of an edit: the first picture track, the first four audio channels and the cues.
/// The edit is not changed. On failure, also in strict mode after losses, `text` is as it was; `report` has
/// what was found until then. It is not reset, and its file is not set.
///
/// Tracks and times. Copies of a clip on several tracks (of one event of an imported list, or of equal record
/// span, source and speed) become one event. Events stand in the order of their record ins. Gaps are holes,
/// black is "BL", cues are "LOC" notes in record time below the last event that starts at or before them. The
/// first frame is at "EDIT_START", else at the elapsed time's origin; labels are drop frame by "DROP_FRAME",
/// else by the project. A speed is written as M2 in frames a second; source out is source in plus the record
/// duration times the factor, in reverse the span from its lowest frame.
///
/// What an imported list said (`EdlKey::kEvents`, `kNotes`) is given back for every event that is still
/// there, known by its stamp: its number, its reel, its notes in their order, the digits of its speed, and,
/// where it plays what it played, its source times as they were written. Notes
/// are written as they were if the event then reads as the edit has it; else its names, tracks and speed are
/// noted afresh, and notes of other kinds stay. Number and markers are given back once: a piece that was cut
/// off is an event with a number of its own. Fresh events are numbered on from the greatest number. More than
/// 999 events have numbers of six digits.
///
/// Transitions and keys, which an import turns into cuts and clips on a second track, are given back as well:
/// a transition where its event is at least as long as it and what ends where it starts is the side that the
/// list named; a key where its background and foreground are still there. Otherwise they are reported.
///
/// Reels. A source keeps the reel that an imported list used, and one of at most 8 letters A-Z and digits.
/// Any other is made of the first such characters of its reel, or name, with a number in the place of the
/// last ones where two would be alike; the full name goes to a "SOURCE FILE" note.
///
/// Losses: each track, channel group, level, fade, effect, nested edit, and time between frames that a list
/// cannot hold is one line of the report.
QM_INTERCHANGE_API Qx::Status exportEdl(const Edit& edit, const EdlExportOptions& options, String& text,
                                        LossReport& report);

/// The same to a file, replaced atomically. A folder, link, FIFO or device in its place is refused.
QM_INTERCHANGE_API Qx::Status exportEdlFile(const Edit& edit, const EdlExportOptions& options,
                                            const String& path, LossReport& report);

} // namespace interchange
