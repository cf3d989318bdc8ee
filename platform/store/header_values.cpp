#include "platform/store/detail/header_values.h"

#include <algorithm>
#include <array>
#include <bit>
#include <iterator>
#include <limits>

namespace Qx::detail {

namespace {

constexpr size_t kLongestQuote = 60;

bool isControl(char c) {
    const auto byte = static_cast<unsigned char>(c);
    return byte < 0x20 || byte == 0x7F;
}

String escaped(std::string_view text) {
    constexpr std::string_view digits = "0123456789abcdef";
    String out;
    out.reserve(text.size());
    for (const char c : text) {
        if (c == '\\') {
            out += "\\\\";
        } else if (c == '\n') {
            out += "\\n";
        } else if (c == '\r') {
            out += "\\r";
        } else if (isControl(c)) {
            const auto byte = static_cast<unsigned char>(c);
            out += "\\x";
            out += digits[byte >> 4];
            out += digits[byte & 15u];
        } else {
            out += c;
        }
    }
    return out;
}

int hexDigit(char c) {
    if (c >= '0' && c <= '9') {
        return c - '0';
    }
    if (c >= 'a' && c <= 'f') {
        return c - 'a' + 10;
    }
    return c >= 'A' && c <= 'F' ? c - 'A' + 10 : -1;
}

/// Reads the escape behind a backslash at the front of `rest` and takes it off. False if it is none.
bool unescape(std::string_view& rest, char& c) {
    if (rest.empty()) {
        return false;
    }
    const char kind = rest.front();
    rest.remove_prefix(1);
    if (kind == '\\' || kind == 'n' || kind == 'r') {
        c = kind == 'n' ? '\n' : (kind == 'r' ? '\r' : '\\');
        return true;
    }
    if (kind != 'x' || rest.size() < 2) {
        return false;
    }
    const int high = hexDigit(rest[0]);
    const int low = hexDigit(rest[1]);
    rest.remove_prefix(2);
    c = static_cast<char>(high * 16 + low);
    return high >= 0 && low >= 0;
}

bool readString(std::string_view text, configb::Value& value) {
    String out;
    out.reserve(text.size());
    while (!text.empty()) {
        char c = text.front();
        text.remove_prefix(1);
        if (c == '\\' && !unescape(text, c)) {
            return false;
        }
        out += c;
    }
    value = std::move(out);
    return true;
}

String doubleText(double real) {
    String text = doubleToText(real);
    double back = 0;
    if (textToDouble(text, back) && std::bit_cast<uint64_t>(back) == std::bit_cast<uint64_t>(real)) {
        return text;
    }
    return "bits " + std::to_string(std::bit_cast<uint64_t>(real));
}

/// Reads an unsigned decimal number that fills the whole text.
bool readUnsigned(std::string_view text, uint64_t& value) {
    if (text.empty() || text.size() > 20) {
        return false;
    }
    uint64_t number = 0;
    for (const char c : text) {
        const auto digit = static_cast<uint64_t>(c - '0');
        if (c < '0' || c > '9' || number > (std::numeric_limits<uint64_t>::max() - digit) / 10) {
            return false;
        }
        number = number * 10 + digit;
    }
    value = number;
    return true;
}

bool readDouble(std::string_view text, configb::Value& value) {
    double real = 0;
    uint64_t bits = 0;
    if (text.starts_with("bits ")) {
        if (!readUnsigned(text.substr(5), bits)) {
            return false;
        }
        real = std::bit_cast<double>(bits);
    } else if (!textToDouble(text, real)) {
        return false;
    }
    value = real;
    return true;
}

String cookieText(const cookie& item) {
    if (item.isStorable() || !item.is_valid()) {
        return item.asString();
    }
    return String::format("words %u %u %u", item.word(0), item.word(1), item.word(2));
}

bool readCookie(std::string_view text, configb::Value& value) {
    cookie item(text);
    if (text.starts_with("words ")) {
        const std::vector<String> parts = String(text.substr(6)).split(' ');
        std::array<uint64_t, 3> words{};
        for (size_t i = 0; i < words.size(); ++i) {
            if (parts.size() != words.size() || !readUnsigned(parts[i], words[i]) || words[i] > UINT32_MAX) {
                return false;
            }
        }
        item = cookie::fromWords(static_cast<uint32_t>(words[0]), static_cast<uint32_t>(words[1]),
                                 static_cast<uint32_t>(words[2]));
    }
    if (!item.is_valid() && text != invalid_cookie.asString()) {
        return false;
    }
    value = item;
    return true;
}

bool readBool(std::string_view text, configb::Value& value) {
    const bool yes = text == "true" || text == "1";
    if (!yes && text != "false" && text != "0") {
        return false;
    }
    value = yes;
    return true;
}

bool readWhole(size_t type, std::string_view text, configb::Value& value) {
    long long number = 0;
    text.remove_prefix(text.starts_with('+') && !text.starts_with("+-") ? 1 : 0);
    if (!textToInt(text, number)) {
        return false;
    }
    if (type == 1) {
        value = static_cast<int64_t>(number);
        return true;
    }
    if (number < std::numeric_limits<int32_t>::min() || number > std::numeric_limits<int32_t>::max()) {
        return false;
    }
    value = static_cast<int32_t>(number);
    return true;
}

struct ValueWriter {
    String operator()(int32_t number) const { return std::to_string(number); }
    String operator()(int64_t number) const { return std::to_string(number); }
    String operator()(double real) const { return doubleText(real); }
    String operator()(const String& text) const { return escaped(text); }
    String operator()(const cookie& item) const { return cookieText(item); }
    String operator()(bool flag) const { return flag ? "true" : "false"; }
};

} // namespace

bool isOneLine(std::string_view text) {
    return text.find_first_of("\r\n") == std::string_view::npos;
}

bool isHeaderKey(std::string_view key) {
    return !key.empty() &&
           std::none_of(key.begin(), key.end(), [](char c) { return c == ':' || isControl(c); });
}

bool isForeignType(std::string_view type) {
    return !type.empty() &&
           std::none_of(type.begin(), type.end(), [](char c) { return c == ' ' || isControl(c); }) &&
           std::find(std::begin(kHeaderTypeNames), std::end(kHeaderTypeNames), type) ==
               std::end(kHeaderTypeNames);
}

String headerValueText(const configb::Value& value) {
    return std::visit(ValueWriter{}, value);
}

bool readHeaderValue(size_t type, std::string_view text, configb::Value& value) {
    // Blanks around anything but a string mean nothing; an editor may have left them.
    const String bare = String(text).trimmed();
    switch (type) {
    case 0:
    case 1:
        return readWhole(type, bare, value);
    case 2:
        return readDouble(bare, value);
    case 3:
        return readString(text, value);
    case 4:
        return readCookie(bare, value);
    default:
        return readBool(bare, value);
    }
}

String quoted(std::string_view text) {
    const bool cut = text.size() > kLongestQuote;
    return "\"" + escaped(text.substr(0, kLongestQuote)) + (cut ? "...\"" : "\"");
}

} // namespace Qx::detail
