#pragma once

#include "interchange/edl/edl_reader.h"
#include "interchange/export.h"

#include <optional>

/// Lays the events of a list on tracks.
namespace interchange {

/// What gives way in a transition where it is not what ends there on the track.
struct EdlOutgoing {
    bool black = true;
    size_t event = 0; ///< index of one that plays its source; none for black
    double frame = 0; ///< the source frame at which the transition begins
    double velocity = 1;
};

/// A span of one track that plays a part of one event. Record times are frames from the programme's start,
/// source times frames from midnight.
struct EdlClip {
    size_t event = 0; ///< index in the list
    int64_t recordIn = 0;
    int64_t recordOut = 0;
    double sourceIn = 0; ///< the source frame shown at `recordIn`; between frames where a speed trims it so
    double velocity = 1; ///< source frames a record frame
    bool black = false;
    /// Record frames at its start over which what plays before it on the track, or black, gives way to it. At
    /// most its length; 0 for a cut.
    int64_t transition = 0;
    std::optional<EdlOutgoing> outgoing; ///< of the transition

    [[nodiscard]] double sourceOut() const {
        return sourceIn + velocity * static_cast<double>(recordOut - recordIn);
    }
};

struct EdlTrack {
    EdlChannels channel = 0;    ///< one bit
    std::vector<EdlClip> clips; ///< in record order, none overlapping; a hole is a gap
};

struct EdlProgramme {
    int64_t start = 0; ///< record time of the first frame, frames from midnight
    bool dropFrame = false;
    std::vector<EdlTrack> tracks; ///< V, V2, A1 and on; no track is empty
    /// For each event of the list its record in, in frames from the start.
    std::vector<int64_t> positions;
    /// Likewise the source frame that is shown first.
    std::vector<int64_t> firstFrames;
};

/// Lays every event on its tracks in record order.
///
/// Overlaps: an event over-records what starts before it, which is trimmed, or split where the event lies
/// inside; of two that start together the later line wins. With `strict`, an overlap or a transition longer
/// than its clip is a failure that names both lines.
///
///     laid        aaaaaaaa
///     over it        bb
///     result      aaabbaaa
///
/// A transition lies at the start of its incoming side. Where the outgoing side is not what ends there, the clip
/// says what it is. A transition that another event cuts short, or that is longer than its clip, is held as far
/// as its clip goes: a loss in the report, as is one whose start is covered. A key's foreground goes to the second
/// picture track. Durations that do not agree, transitions that do not meet and events without length draw warnings; the record side
/// is trusted for the position and the source side for its in point.
///
/// Programmes that run over midnight: where an event does, or where the list steps back by more than 12 hours
/// from one event to the next, the day is taken to begin after the longest pause.
///
/// Takes n log n steps for n events. On failure `programme` is as it was.
QM_INTERCHANGE_API Qx::Status layTracks(const EdlList& list, bool strict, EdlProgramme& programme,
                                        LossReport& report);

/// The record time of a marker in frames from the programme's start; markers of the next day are after it.
QM_INTERCHANGE_API int64_t markerPosition(const EdlList& list, const EdlProgramme& programme,
                                          const EdlMarker& marker);

} // namespace interchange
