#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

/// How the report writes numbers and texts. Nothing here depends on the locale.
namespace report {

/// A number that is not negative, with three significant digits but at most six decimals and no exponent
/// below a billion: "0.0123", "1.30", "12.5", "1234".
[[nodiscard]] std::string threeDigits(double value);
/// A number in as few digits as tell it from all others, without an exponent: "1.3", "10000".
[[nodiscard]] std::string numberText(double value);
/// A time in nanoseconds, in the unit that suits it: "850 ns", "12.3 µs", "4.00 ms", "1.25 s".
[[nodiscard]] std::string timeText(double nanoseconds);
/// A count in groups of three digits: "10 000".
[[nodiscard]] std::string countText(uint64_t count);

/// Text from outside, made fit for a terminal and a drawing: every byte that is not a printable ASCII
/// character becomes "?", and what is longer than `most` ends in "...".
[[nodiscard]] std::string plain(std::string_view text, size_t most = 80);
/// Text in UTF-8 with the characters escaped that mean something in XML, in an attribute too.
[[nodiscard]] std::string xmlText(std::string_view text);

/// The characters of `utf8`: its columns, since the report writes no wide ones.
[[nodiscard]] size_t columns(std::string_view utf8);
/// `utf8` with blanks up to `width` columns, before it when `right`.
[[nodiscard]] std::string padded(std::string_view utf8, size_t width, bool right = false);
/// Words laid in lines of at most `width` columns, each ended; the first line begins with `lead`, the others
/// with as many blanks.
[[nodiscard]] std::string wrapped(std::string_view lead, std::string_view words, size_t width = 100);

} // namespace report
