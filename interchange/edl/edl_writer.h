#pragma once

#include "interchange/edl/edl_reader.h"
#include "interchange/export.h"

/// Writes the text of a CMX 3600 edit decision list: the inverse of edl_reader.h. It knows what the lines
/// look like; which events a list has and what their notes say is the business of edl_export.h.
namespace interchange {

struct EdlTextOptions {
    bool crlf = false; ///< lines end with CR and LF instead of LF
};

/// The list as text, in the fixed columns of the form; a number of more than three digits and a reel of more
/// than eight characters move the columns to the right of them. The events stand in the order of the list,
/// each with its notes below it; note lines that begin with "SPLIT" stand above it.
///
///     TITLE: Reel one
///     FCM: NON-DROP FRAME
///     001  A012C004 V     C        01:00:04:05 01:00:05:12 00:59:53:11 00:59:54:18
///     * FROM CLIP NAME: street
///
/// FCM tells the mode of the record side and stands again where that changes. Drop-frame labels have ';'
/// before the frames; where the source side is non-drop while the record side is not, it has '.'. Channels
/// are written by `edlChannelText`; what that cannot say must be in a note (`edlAudioNote`).
///
/// Reading the text gives the list again, but for times beyond 24 hours, which wrap.
QM_INTERCHANGE_API String edlText(const EdlList& list, const EdlTextOptions& options = {});

/// The channel field: "V", "A", "A2", "AA", "B", "A2/V", "AA/V"; "NONE" for none of picture, A1 and A2.
QM_INTERCHANGE_API std::string_view edlChannelText(EdlChannels channels);

/// The note that adds the channels 3 and up: "AUD  3    4". Empty when there are none.
QM_INTERCHANGE_API String edlAudioNote(EdlChannels channels);

/// The note of a speed, `digits` as `edlSpeedDigits` gives them: reel, digits, and the source frame at which
/// it applies.
QM_INTERCHANGE_API String edlSpeedNote(const String& reel, const String& digits, int64_t at,
                                       Qx::FrameRate rate, bool drop);

/// Frames a second of a speed factor, with one decimal: "047.6", "-024.0", "000.0". The factor counts the
/// labels of a second (`EdlSpeed`).
QM_INTERCHANGE_API String edlSpeedDigits(double velocity, Qx::FrameRate rate);

} // namespace interchange
