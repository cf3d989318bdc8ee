#pragma once

#include <string_view>

namespace Qx {

/// Takes the next line off the front of `rest`, without its end: LF, CRLF or a lone CR. A last line needs no
/// end.
inline std::string_view takeLine(std::string_view& rest) {
    size_t end = 0;
    while (end < rest.size() && rest[end] != '\n' && rest[end] != '\r') {
        ++end;
    }
    const std::string_view line = rest.substr(0, end);
    if (end == rest.size()) {
        rest = {};
    } else {
        const bool both = rest[end] == '\r' && end + 1 < rest.size() && rest[end + 1] == '\n';
        rest.remove_prefix(end + (both ? 2 : 1));
    }
    return line;
}

/// Calls `use` for each line of a text made here, whose only line end is LF.
template <typename Use>
void forEachLine(std::string_view text, Use use) {
    while (!text.empty()) {
        const size_t end = text.find('\n');
        use(text.substr(0, end));
        text.remove_prefix(end == std::string_view::npos ? text.size() : end + 1);
    }
}

} // namespace Qx
