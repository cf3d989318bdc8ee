#pragma once

#include "interchange/export.h"
#include "interchange/loss_report.h"
#include "platform/base/status.h"
#include "platform/media/frame_rate.h"

#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

/// Reads the text of a CMX 3600 edit decision list. This header knows what the lines say; where the events
/// come to lie on tracks is the business of edl_tracks.h, and what becomes of them in a project that of
/// edl_import.h.
namespace interchange {

/// The tracks of an event, as bits.
using EdlChannels = uint32_t;
inline constexpr int kMaxEdlAudio = 8;
inline constexpr EdlChannels kEdlPicture = 1;
inline constexpr EdlChannels kEdlPicture2 = 2;
/// The bit of an audio channel, `number` from 1 to `kMaxEdlAudio`.
constexpr EdlChannels edlAudio(int number) {
    return EdlChannels{128} << number;
}

enum class EdlType { Cut, Dissolve, Wipe, KeyBackground, Key, KeyOut };

/// Which line of a two-line event this is.
enum class EdlRole {
    Alone,
    Outgoing, ///< the first line of a transition or key
    Incoming  ///< the second
};

/// An `M2` line. The speed factor is its speed by the labels of a second (30 at 29.97, 24 at 23.976), so that
/// "030.0" is normal speed there.
struct EdlSpeed {
    String reel;
    String digits;              ///< as written, so that an export returns the same
    double framesPerSecond = 0; ///< below 0 in reverse, 0 for a freeze
    int64_t at = 0;             ///< the source frame, from midnight, at which it applies
    int line = 0;
};

/// One event line with what the notes below it say. Times are frames from midnight, half open. A record out
/// that lay before its in was on the next day and has 24 hours added; a source out likewise, unless the event
/// plays in reverse.
struct QM_INTERCHANGE_API EdlEvent {
    int line = 0;
    String number; ///< the digits as written
    String reel;
    EdlChannels channels = 0;
    EdlType type = EdlType::Cut;
    EdlRole role = EdlRole::Alone;
    int wipe = 0;      ///< SMPTE pattern number of a wipe
    int duration = 0;  ///< frames of a transition or key fade
    bool fade = false; ///< "(F)"
    int64_t sourceIn = 0;
    int64_t sourceOut = 0;
    int64_t recordIn = 0;
    int64_t recordOut = 0;
    bool sourceDrop = false;
    bool recordDrop = false;
    bool freeze = false;
    String clipName;   ///< UTF-8
    String sourceFile; ///< the full name behind a shortened reel, UTF-8
    String mediaPath;  ///< text only: nothing ever opens it
    String effectName; ///< of its transition, or of an effect on it, UTF-8
    std::optional<EdlSpeed> speed;
    /// The note lines below the event, as written without the blanks at their ends, joined by line feeds. A
    /// first line that begins with "SPLIT" stood above it.
    String notes;

    [[nodiscard]] bool isBlack() const;
    /// Type and duration as a list writes them: "C", "D 024", "W001 030", "K B", "K O 010".
    [[nodiscard]] String typeText() const;
};

/// A `LOC` note.
struct EdlMarker {
    int line = 0;
    size_t event = 0; ///< index of the event that it stands below
    int64_t at = 0;   ///< record time, frames from midnight
    String colour;    ///< one word, may be empty
    String text;      ///< UTF-8, may be empty
};

struct EdlList {
    String title; ///< UTF-8
    Qx::FrameRate rate;
    std::vector<EdlEvent> events; ///< in the order of the file
    std::vector<EdlMarker> markers;
    String notes; ///< what stood above the first event, as `EdlEvent::notes`
};

/// The most bytes of a list, and the most event lines: what six digits can number.
inline constexpr uint64_t kMaxEdlBytes = uint64_t{64} << 20;
inline constexpr size_t kMaxEdlEvents = 999'999;

/// What becomes of event lines that cannot be read.
enum class BadLines {
    Refuse, ///< the list is refused
    Skip    ///< the list is read without them
};

/// Reads a list of a frame rate, which the text does not state. `report` names the file in messages and
/// receives warnings. A failure is one sentence that names file, line and remedy; `list` is then as it was.
///
/// Lines that cannot be read are all met before the first is told of: a failure has each as an error in
/// `report`. With `BadLines::Skip` each is a loss, what stands below it up to the next event goes with it, and
/// only a list of which nothing is left is refused.
///
/// What is decided here: a line that is not UTF-8 is read as Windows-1252. A drop-frame label that does not exist moves up to the next that does. A list that says drop
/// frame at a rate which has none is read as non-drop. The lines of a source table (">>>") are skipped. All
/// four draw a warning.
QM_INTERCHANGE_API Qx::Status readEdl(std::string_view text, Qx::FrameRate rate, EdlList& list,
                                      LossReport& report, BadLines bad = BadLines::Refuse);

/// The same for a file of at most `kMaxEdlBytes`, refused unread when it is larger. Sets the report's file
/// name, without its folder.
QM_INTERCHANGE_API Qx::Status readEdlFile(const String& path, Qx::FrameRate rate, EdlList& list,
                                          LossReport& report, BadLines bad = BadLines::Refuse);

} // namespace interchange
