#include "tools/qmedit/safe_text.h"

#include <algorithm>
#include <iterator>

namespace {

struct CodePointRange {
    char32_t first;
    char32_t last;
};

/// Characters that a terminal obeys rather than shows, or that are not seen at all: C1 controls, the soft
/// hyphen, joiners, direction controls, line and paragraph separators, byte order mark, tags.
constexpr CodePointRange kUnseen[] = {
    {0x7F, 0x9F},     {0xAD, 0xAD},       {0x61C, 0x61C},      {0x180E, 0x180E}, {0x200B, 0x200F},
    {0x2028, 0x202E}, {0x2060, 0x206F},   {0xFEFF, 0xFEFF},    {0xFFF0, 0xFFFB}, {0xE000, 0xF8FF},
    {0xFFFE, 0xFFFF}, {0xE0000, 0xE0FFF}, {0xF0000, 0x10FFFF},
};

/// Combining marks of the common scripts: they take no column.
constexpr CodePointRange kCombining[] = {
    {0x300, 0x36F},   {0x483, 0x489},   {0x591, 0x5BD},   {0x610, 0x61A},   {0x64B, 0x65F},
    {0x6D6, 0x6DC},   {0x900, 0x902},   {0x93C, 0x93C},   {0x941, 0x948},   {0x94D, 0x94D},
    {0xE31, 0xE31},   {0xE34, 0xE3A},   {0xE47, 0xE4E},   {0x1AB0, 0x1AFF}, {0x1DC0, 0x1DFF},
    {0x20D0, 0x20FF}, {0x3099, 0x309A}, {0xFE00, 0xFE0F}, {0xFE20, 0xFE2F}, {0xE0100, 0xE01EF},
};

/// Characters of two columns (Unicode Standard Annex 11: wide and full width).
constexpr CodePointRange kWide[] = {
    {0x1100, 0x115F},   {0x231A, 0x231B},   {0x23E9, 0x23EC},   {0x2E80, 0x303E}, {0x3041, 0x33FF},
    {0x3400, 0x4DBF},   {0x4E00, 0x9FFF},   {0xA000, 0xA4CF},   {0xA960, 0xA97F}, {0xAC00, 0xD7A3},
    {0xF900, 0xFAFF},   {0xFE30, 0xFE6F},   {0xFF01, 0xFF60},   {0xFFE0, 0xFFE6}, {0x1F300, 0x1F64F},
    {0x1F680, 0x1F6FF}, {0x1F900, 0x1FAFF}, {0x20000, 0x3FFFD},
};

template <size_t N>
bool contains(const CodePointRange (&ranges)[N], char32_t point) {
    return std::any_of(std::begin(ranges), std::end(ranges), [point](const CodePointRange& range) {
        return point >= range.first && point <= range.last;
    });
}

/// Bytes of the well-formed character at the start of `text`, and its code point; 0 if there is none.
size_t decode(std::string_view text, char32_t& point) {
    const auto lead = static_cast<unsigned char>(text[0]);
    const size_t length = lead < 0x80   ? 1
                          : lead < 0xC2 ? 0
                          : lead < 0xE0 ? 2
                          : lead < 0xF0 ? 3
                          : lead < 0xF5 ? 4
                                        : 0;
    if (length == 0 || text.size() < length || !Qx::isUtf8(text.substr(0, length))) {
        return 0;
    }
    point = length == 1 ? lead : lead & (0x7Fu >> length);
    for (size_t i = 1; i < length; ++i) {
        point = point << 6 | (static_cast<unsigned char>(text[i]) & 0x3Fu);
    }
    return length;
}

int columnsOf(char32_t point) {
    if (point < 0x300) {
        return 1;
    }
    return contains(kCombining, point) ? 0 : contains(kWide, point) ? 2 : 1;
}

} // namespace

namespace safe_text {

String escaped(std::string_view text, bool asciiOnly) {
    String out;
    out.reserve(text.size());
    while (!text.empty()) {
        char32_t point = 0;
        const size_t length = decode(text, point);
        if (length == 0) {
            out += String::format("\\x%02x", static_cast<unsigned>(static_cast<unsigned char>(text[0])));
        } else if (point < 0x20 || point == 0x7F) {
            out += String::format("\\x%02x", static_cast<unsigned>(point));
        } else if (point > 0x7F && (asciiOnly || contains(kUnseen, point))) {
            out += String::format("\\u{%x}", static_cast<unsigned>(point));
        } else {
            out.append(text.substr(0, length));
        }
        text.remove_prefix(std::max<size_t>(length, 1));
    }
    return out;
}

int columns(std::string_view utf8) {
    int width = 0;
    while (!utf8.empty()) {
        char32_t point = 0;
        const size_t length = decode(utf8, point);
        width += length == 0 ? 1 : columnsOf(point);
        utf8.remove_prefix(std::max<size_t>(length, 1));
    }
    return width;
}

String fitted(std::string_view utf8, int width, std::string_view ellipsis) {
    if (width <= 0) {
        return {};
    }
    size_t fits = 0;     // bytes that leave the ellipsis its column
    size_t position = 0; // bytes that fit without one
    int used = 0;
    while (position < utf8.size()) {
        char32_t point = 0;
        const size_t length = std::max<size_t>(decode(utf8.substr(position), point), 1);
        const int wide = columnsOf(point);
        if (used + wide > width) {
            return String(utf8.substr(0, fits)) + String(ellipsis);
        }
        used += wide;
        position += length;
        if (used < width || ellipsis.empty()) {
            fits = position;
        }
    }
    return String(utf8);
}

String padded(std::string_view utf8, int width, std::string_view ellipsis, bool right) {
    String text = fitted(utf8, width, ellipsis);
    const int missing = width - columns(text);
    if (missing > 0) {
        text.insert(right ? 0 : text.size(), static_cast<size_t>(missing), ' ');
    }
    return text;
}

String wrapped(std::string_view utf8, int width, int used, int indent) {
    String out;
    bool isFirstOfLine = true;
    while (!utf8.empty()) {
        const size_t blank = std::min(utf8.find(' '), utf8.size());
        const std::string_view word = utf8.substr(0, blank);
        const int wide = columns(word);
        if (!isFirstOfLine && used + 1 + wide > width) {
            out += "\n" + String(static_cast<size_t>(indent), ' ');
            used = indent;
            isFirstOfLine = true;
        }
        used += wide + (isFirstOfLine ? 0 : 1);
        out += (isFirstOfLine ? "" : " ") + String(word);
        isFirstOfLine = false;
        utf8.remove_prefix(std::min(blank + 1, utf8.size()));
    }
    return out;
}

} // namespace safe_text
