#pragma once

#include "interchange/edl/edl_tracks.h"
#include "interchange/export.h"
#include "interchange/import.h"

namespace interchange {

/// Reads a CMX 3600 list and builds a sequence and its shots in memory; nothing of the project is touched.
/// `options.rate` must be set: a list does not state its rate. On failure `result` is as it was but for its
/// report, which is that of this import in any case.
///
/// The sequence (an edit of log type 2) bears the title, or the file's name where the list has none. It has a
/// channel for each track up to the last one used, the first frame of the programme at 0; what was there is
/// kept in the header (`EdlKey`), with each event's number, reel, type, speed and notes. Markers are cues
/// that are kept in the file and follow the clip that they lie on, of several the one of the first channel; a cue's code is its colour (marker_colour.h), an unknown colour stays in the
/// text. Black is pairs of the black cookie, gaps are gaps.
///
/// Each source is a shot (log type 1) that holds the span used of it, with what runs on under a transition, on the tracks used, at the source
/// timecode in seconds from midnight. Two events have one source if reel, clip name and source file all
/// agree; events of the reel "AX" without either name have a source each.
QM_INTERCHANGE_API Qx::Status importEdl(const String& path, const ImportOptions& options, Import& result);

/// The same from a list that was read. `name` is used where it has no title.
QM_INTERCHANGE_API Qx::Status importEdlList(const EdlList& list, const String& name,
                                            const ImportOptions& options, Import& result);

} // namespace interchange
