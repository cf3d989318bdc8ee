#include "interchange/marker_colour.h"

#include "platform/base/qx_string.h"

#include <iterator>

namespace interchange {

namespace {

// By code less 1. The codes live in files: do not change the order.
constexpr std::string_view kColours[] = {"PINK", "RED",    "ORANGE",  "YELLOW", "GREEN", "CYAN",
                                         "BLUE", "PURPLE", "MAGENTA", "BLACK",  "WHITE"};

} // namespace

int markerColourCode(std::string_view name) {
    for (size_t i = 0; i < std::size(kColours); ++i) {
        if (String::equalNoCase(kColours[i], name)) {
            return static_cast<int>(i) + 1;
        }
    }
    return 0;
}

std::string_view markerColourName(int code) {
    return code >= 1 && code <= static_cast<int>(std::size(kColours)) ? kColours[code - 1]
                                                                      : std::string_view();
}

} // namespace interchange
