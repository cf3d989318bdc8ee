#pragma once

#include <charconv>
#include <cstdint>
#include <limits>
#include <string_view>

namespace Qx {

/// Where a number may begin: behind white space.
inline std::string_view withoutLeadingSpace(std::string_view text) {
    const size_t first = text.find_first_not_of(" \t\v\f\r\n");
    return text.substr(first == std::string_view::npos ? text.size() : first);
}

/// The decimal integer at the front of a text that other programs write, too: white space before it, a sign
/// of either kind and anything behind it are no fault (`%d`). One out of range becomes the nearest in range.
/// False, leaving `value`, where no number begins.
[[nodiscard]] inline bool scanInt(std::string_view text, int& value) {
    text = withoutLeadingSpace(text);
    const bool negative = text.starts_with('-');
    text.remove_prefix(negative || text.starts_with('+') ? 1 : 0);
    int64_t number = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    if (error == std::errc::invalid_argument || text.starts_with('-')) {
        return false;
    }
    constexpr auto greatest = int64_t{std::numeric_limits<int>::max()};
    const bool outside = error == std::errc::result_out_of_range || number > greatest;
    value = static_cast<int>(outside ? (negative ? -greatest - 1 : greatest) : (negative ? -number : number));
    return true;
}

/// The same for hexadecimal digits, with or without "0x" (`%x`). A word of more than 32 bits is none.
[[nodiscard]] inline bool scanHex(std::string_view text, uint32_t& value) {
    text = withoutLeadingSpace(text);
    text.remove_prefix(text.starts_with("0x") || text.starts_with("0X") ? 2 : 0);
    return std::from_chars(text.data(), text.data() + text.size(), value, 16).ec == std::errc();
}

/// The same for a number with a fraction.
[[nodiscard]] inline bool scanDouble(std::string_view text, double& value) {
    text = withoutLeadingSpace(text);
    text.remove_prefix(text.starts_with('+') ? 1 : 0);
    return !text.starts_with("+") &&
           std::from_chars(text.data(), text.data() + text.size(), value).ec == std::errc();
}

} // namespace Qx
