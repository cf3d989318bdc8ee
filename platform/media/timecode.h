#pragma once

#include "platform/base/export.h"
#include "platform/base/status.h"
#include "platform/media/frame_rate.h"

namespace Qx {

/// Timecode text of a frame count from midnight (SMPTE ST 12-1): "hh:mm:ss:ff", with ';' before the frames
/// for drop frame. Counts of 24 hours and more wrap, negative ones too.
QM_API String timecodeText(int64_t frames, FrameRate rate, bool dropFrame);

/// The same for a length: no wrap at 24 hours, a leading '-' for a negative count.
QM_API String durationText(int64_t frames, FrameRate rate, bool dropFrame);

/// The separators and digits of one timecode text.
struct TimecodeFields {
    int hours = 0;
    int minutes = 0;
    int seconds = 0;
    int frames = 0;
    bool dropSeparator = false;    ///< the text used ';' or ',' before the frames
    bool nonDropSeparator = false; ///< the text used '.' before the frames
};

/// Reads "hh:mm:ss:ff" (also with ';', ',' and '.' as separators). A failure names what is wrong with the
/// text: its form, or a field out of range for the rate ("frame 25 at 25 frames a second"), which alone is of
/// kind `Unsupported`: another rate may have that frame.
QM_API Status parseTimecode(std::string_view text, FrameRate rate, TimecodeFields& fields);

/// Reads what `durationText` writes, in which the hours have any number of digits and a '-' may stand in
/// front, as frames; so a timecode text, too. A failure names what is wrong and leaves `frames`.
QM_API Status parseDuration(std::string_view text, FrameRate rate, bool dropFrame, int64_t& frames);

/// Frames from midnight of a label. With `dropFrame`, for 29.97: frames = ((60 m + ss) 30 + ff) -
/// 2 (m - floor(m / 10)), m = 60 hh + mm; for 59.94 with 60 and 4. A label that drop frame skips moves up to
/// the next label that exists, and `*skipped` (if given) is set.
QM_API int64_t timecodeFrames(const TimecodeFields& fields, FrameRate rate, bool dropFrame,
                              bool* skipped = nullptr);

/// Frames in 24 hours of timecode.
QM_API int64_t framesPerDay(FrameRate rate, bool dropFrame);

} // namespace Qx
