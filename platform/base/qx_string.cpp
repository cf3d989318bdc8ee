#include "platform/base/qx_string.h"

#include <charconv>
#include <cstdio>

namespace {

char upperAscii(char c) {
    return c >= 'a' && c <= 'z' ? static_cast<char>(c - 'a' + 'A') : c;
}

char lowerAscii(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

bool isSpaceAscii(char c) {
    return c == ' ' || (c >= '\t' && c <= '\r');
}

/// Length of the well-formed UTF-8 sequence at the start of `text` and its code point; 0 if there is none.
size_t decode(std::string_view text, char32_t& code) {
    const auto byte = [&](size_t i) { return static_cast<unsigned char>(text[i]); };
    const unsigned lead = byte(0);
    if (lead < 0x80) {
        code = lead;
        return 1;
    }
    size_t length = 0;
    char32_t least = 0;
    if (lead >= 0xC2 && lead <= 0xDF) {
        length = 2, least = 0x80, code = lead & 0x1F;
    } else if (lead >= 0xE0 && lead <= 0xEF) {
        length = 3, least = 0x800, code = lead & 0x0F;
    } else if (lead >= 0xF0 && lead <= 0xF4) {
        length = 4, least = 0x10000, code = lead & 0x07;
    } else {
        return 0;
    }
    if (text.size() < length) {
        return 0;
    }
    for (size_t i = 1; i < length; ++i) {
        if ((byte(i) & 0xC0) != 0x80) {
            return 0;
        }
        code = (code << 6) | (byte(i) & 0x3Fu);
    }
    const bool surrogate = code >= 0xD800 && code <= 0xDFFF;
    return code < least || surrogate || code > 0x10FFFF ? 0 : length;
}

void append(String& text, char32_t code) {
    const auto add = [&](char32_t byte) { text.push_back(static_cast<char>(byte)); };
    if (code < 0x80) {
        add(code);
    } else if (code < 0x800) {
        add(0xC0 | (code >> 6));
        add(0x80 | (code & 0x3F));
    } else if (code < 0x10000) {
        add(0xE0 | (code >> 12));
        add(0x80 | ((code >> 6) & 0x3F));
        add(0x80 | (code & 0x3F));
    } else {
        add(0xF0 | (code >> 18));
        add(0x80 | ((code >> 12) & 0x3F));
        add(0x80 | ((code >> 6) & 0x3F));
        add(0x80 | (code & 0x3F));
    }
}

template <typename Number>
bool parseWhole(std::string_view text, Number& value) {
    Number parsed{};
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, parsed);
    if (error != std::errc() || stop != end) {
        return false;
    }
    value = parsed;
    return true;
}

} // namespace

int String::nthIndex(int nth, char c) const {
    for (size_t i = 0; nth >= 1 && i < size(); ++i) {
        if ((*this)[i] == c && --nth == 0) {
            return static_cast<int>(i);
        }
    }
    return -1;
}

String String::upper() const {
    String result = *this;
    for (char& c : result) {
        c = upperAscii(c);
    }
    return result;
}

String String::lower() const {
    String result = *this;
    for (char& c : result) {
        c = lowerAscii(c);
    }
    return result;
}

String String::trimmed() const {
    size_t from = 0;
    size_t to = size();
    while (from < to && isSpaceAscii((*this)[from])) {
        ++from;
    }
    while (to > from && isSpaceAscii((*this)[to - 1])) {
        --to;
    }
    return substr(from, to - from);
}

std::vector<String> String::split(char separator, bool skipEmpty) const {
    std::vector<String> pieces;
    size_t from = 0;
    while (true) {
        const size_t at = find(separator, from);
        const size_t length = (at == npos ? size() : at) - from;
        if (length > 0 || !skipEmpty) {
            pieces.emplace_back(substr(from, length));
        }
        if (at == npos) {
            return pieces;
        }
        from = at + 1;
    }
}

bool String::equalNoCase(std::string_view a, std::string_view b) {
    if (a.size() != b.size()) {
        return false;
    }
    for (size_t i = 0; i < a.size(); ++i) {
        if (lowerAscii(a[i]) != lowerAscii(b[i])) {
            return false;
        }
    }
    return true;
}

String String::format(const char* form, ...) {
    va_list arguments;
    va_start(arguments, form);
    String text = vformat(form, arguments);
    va_end(arguments);
    return text;
}

String String::vformat(const char* form, va_list arguments) {
    va_list measured;
    va_copy(measured, arguments);
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-nonliteral"
    const int length = std::vsnprintf(nullptr, 0, form, measured);
    va_end(measured);
    if (length < 0) {
        return {};
    }
    String text(static_cast<size_t>(length), '\0');
    std::vsnprintf(text.data(), text.size() + 1, form, arguments);
#pragma GCC diagnostic pop
    return text;
}

namespace Qx {

WString widen(std::string_view text) {
    WString wide;
    wide.reserve(text.size());
    while (!text.empty()) {
        char32_t code = 0;
        const size_t length = decode(text, code);
        if (length == 0) {
            code = 0xDC00u + static_cast<unsigned char>(text[0]);
        }
        wide.push_back(static_cast<wchar_t>(code));
        text.remove_prefix(length == 0 ? 1 : length);
    }
    return wide;
}

String narrow(std::wstring_view text) {
    String bytes;
    bytes.reserve(text.size());
    for (const wchar_t c : text) {
        const auto code = static_cast<char32_t>(c);
        if (code >= 0xDC80 && code <= 0xDCFF) {
            bytes.push_back(static_cast<char>(code - 0xDC00));
        } else if (code > 0x10FFFF || (code >= 0xD800 && code <= 0xDFFF)) {
            append(bytes, 0xFFFD);
        } else {
            append(bytes, code);
        }
    }
    return bytes;
}

bool isUtf8(std::string_view text) {
    while (!text.empty()) {
        char32_t code = 0;
        const size_t length = decode(text, code);
        if (length == 0) {
            return false;
        }
        text.remove_prefix(length);
    }
    return true;
}

String doubleToText(double value) {
    char buffer[32];
    const auto [end, error] = std::to_chars(buffer, buffer + sizeof buffer, value);
    return error == std::errc() ? String(buffer, end) : String();
}

bool textToDouble(std::string_view text, double& value) {
    return parseWhole(text, value);
}

bool textToInt(std::string_view text, long long& value) {
    return parseWhole(text, value);
}

bool textToInt(std::string_view text, int& value) {
    return parseWhole(text, value);
}

} // namespace Qx
