#pragma once

#include "platform/base/qx_string.h"

class TextFile;

/// How texts of any kind stand in the lines of a legacy text, which ends lines at line ends and splits fields
/// at blanks.
namespace Ed2Names {

/// `text` with '%', blanks and control characters as "%" and two hexadecimal digits.
[[nodiscard]] String escaped(std::string_view text);
/// The inverse. What follows no such form stays as it is.
[[nodiscard]] String unescaped(std::string_view text);

/// The name field of an audio channel. Its first letter tells the channel's type, so a name that does not
/// begin with 'A' follows the mark "A%_".
[[nodiscard]] String channelField(std::string_view name);
/// The name that a field stands for.
[[nodiscard]] String channelName(std::string_view field);

/// The line that ends the header; -1 without one. The lines before it hold texts of any kind.
[[nodiscard]] int headerEnd(const TextFile& file);

/// The line of a cue's name: the name as it is, or escaped when it holds control characters. The line before
/// it tells the name's length, so an escaped name is known by being longer.
[[nodiscard]] String cueLine(std::string_view name);
[[nodiscard]] String cueName(std::string_view line, size_t length);

} // namespace Ed2Names
