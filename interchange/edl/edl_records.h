#pragma once

#include "edit/model/edit_keys.h"
#include "interchange/export.h"
#include "platform/base/id_stamp.h"
#include "platform/base/qx_string.h"

#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

/// What an edit decision list says that an edit has no place for, kept in the header of the sequence so that
/// an export can give it back.
namespace interchange {

/// Header keys of an imported sequence that only a list knows.
namespace EdlKey {
inline constexpr const char* kEvents = "EDL_EVENTS"; ///< string: `packEdlRecords`
inline constexpr const char* kNotes = "EDL_NOTES";   ///< string: the notes above the first event
// Of an imported shot.
inline constexpr const char* kReel = EditKeys::kReel;         ///< string
inline constexpr const char* kSourceFile = "EDL_SOURCE_FILE"; ///< string: the full name behind the reel
inline constexpr const char* kMediaPath = "EDL_MEDIA_PATH";   ///< string: text, never opened
} // namespace EdlKey

/// One event line of a list. The events of the sequence that came from it are known by their stamps, which
/// stay with them through trims and moves.
struct EdlRecord {
    String number;   ///< as written
    String typeText; ///< `EdlEvent::typeText`
    String reel;
    String speedDigits; ///< of its M2; empty for none
    String notes;       ///< `EdlEvent::notes`
    std::vector<IdStamp> events;
    /// What the list said in times, for an event that is still as it was. Frames, those of the source from
    /// midnight.
    struct Times {
        int64_t sourceIn = 0;
        int64_t sourceOut = 0;
        int64_t length = 0; ///< of the record side
        int64_t shown = 0;  ///< the source frame that is shown first
        bool operator==(const Times&) const = default;
    };
    std::optional<Times> times;
    bool operator==(const EdlRecord&) const = default;
};

/// The records as one text, a line a field, whose first letter is a tag (do not change them):
///
///     E002 D 024                          begins a record: number, blank, type
///     RA013C001                           reel
///     S00000000-00000000-00000000         an event's stamp, in any number
///     V047.6                              the digits of its speed
///     T90000 90025 25 90000               source in, source out, record length, first frame shown
///     N* FROM CLIP NAME: x                a note line, in any number
QM_INTERCHANGE_API String packEdlRecords(const std::vector<EdlRecord>& records);

/// Reads that text. Lines of other tags and lines before the first record are passed over.
QM_INTERCHANGE_API std::vector<EdlRecord> unpackEdlRecords(std::string_view text);

} // namespace interchange
