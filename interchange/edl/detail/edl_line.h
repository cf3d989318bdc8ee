#pragma once

#include "interchange/edl/edl_reader.h"

namespace interchange::detail {

/// The fields of one event line, before its timecodes are understood.
struct EdlLine {
    EdlEvent event;
    std::string_view times[4]; ///< source in, source out, record in, record out
};

/// Takes an event line apart: by blank-separated fields; failing that by the fixed columns; failing that from
/// the right, so that a reel may contain blanks. A failure says what is wrong, without file and line.
Qx::Status parseEventLine(std::string_view line, std::vector<std::string_view>& fields, EdlLine& parsed);

/// Blank-separated fields; `fields` is a buffer that is used again from line to line.
void splitFields(std::string_view line, std::vector<std::string_view>& fields);

/// Every spelling of a set of channels: "V", "B", "AA/V", "NONE", "VA12", "12V". False for a text that is
/// none.
bool parseChannels(std::string_view text, EdlChannels& channels);

/// The value of one to nine digits; -1 for any other text.
int digitsValue(std::string_view text);

std::string_view trimBlanks(std::string_view text);

/// Text from outside for a message of one line: quoted, cut after 40 bytes, other than ASCII shown as '?'.
String quotedText(std::string_view text);

/// The text with U+FFFD for each byte that is not UTF-8; `replaced` is set if there was any.
String utf8Name(std::string_view text, bool& replaced);

} // namespace interchange::detail
