#pragma once

#include "platform/base/qx_string.h"

#include <string_view>

/// Text from edits, files and the system made fit for a terminal. An edit is written by others; nothing in it
/// may move the cursor, colour the screen, change the order of reading or end a line.
namespace safe_text {

/// `text` with every control character, line end, text-direction control and invisible character written as
/// an escape (\x1b, \u{202e}) and every byte that is not UTF-8 as \xNN. With `asciiOnly` every other
/// character beyond ASCII is escaped too.
[[nodiscard]] String escaped(std::string_view text, bool asciiOnly = false);

/// Columns that well-formed UTF-8 takes in a terminal: 2 for wide characters (East Asian, emoji), 0 for
/// combining ones.
[[nodiscard]] int columns(std::string_view utf8);

/// `utf8` cut to at most `width` columns; where something was cut its last column is `ellipsis` (one column
/// wide), and the text is never cut inside a character.
[[nodiscard]] String fitted(std::string_view utf8, int width, std::string_view ellipsis);

/// `fitted`, and blanks up to `width`, before the text when `right`.
[[nodiscard]] String padded(std::string_view utf8, int width, std::string_view ellipsis, bool right = false);

/// `utf8` on lines of at most `width` columns, broken at blanks; a longer word stands on a line of its own.
/// `used` columns of the first line are taken already, and every other line is indented by `indent`. Without
/// a line end behind the last line.
[[nodiscard]] String wrapped(std::string_view utf8, int width, int used, int indent);

} // namespace safe_text
