#include "platform/base/cookie.h"

#include <cstring>

namespace {

constexpr uint32_t firstWordLimit = 36u * 36u * 36u * 36u;
constexpr uint32_t secondWordLimit = 36u * 36u * 36u;

bool readBase36(std::string_view digits, bool anyCase, uint32_t& value) {
    value = 0;
    for (const char c : digits) {
        uint32_t digit = 0;
        if (c >= '0' && c <= '9') {
            digit = static_cast<uint32_t>(c - '0');
        } else if (c >= 'A' && c <= 'Z') {
            digit = static_cast<uint32_t>(c - 'A') + 10;
        } else if (anyCase && c >= 'a' && c <= 'z') {
            digit = static_cast<uint32_t>(c - 'a') + 10;
        } else {
            return false;
        }
        value = value * 36 + digit;
    }
    return true;
}

void writeBase36(char* to, int digits, uint32_t value) {
    for (int i = digits - 1; i >= 0; --i) {
        to[i] = "0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZ"[value % 36];
        value /= 36;
    }
}

} // namespace

cookie::cookie(std::string_view text, bool anyCase) {
    if (text.size() != 8) {
        return;
    }
    const char letter =
        anyCase && text[0] >= 'a' && text[0] <= 'z' ? static_cast<char>(text[0] - 32) : text[0];
    const Cookie_Type kind = type_from_char(letter);
    uint32_t first = 0;
    uint32_t second = 0;
    if (kind == Cookie_Type::Invalid || !readBase36(text.substr(1, 4), anyCase, first) ||
        !readBase36(text.substr(5, 3), anyCase, second)) {
        return;
    }
    m_words = {first, second, static_cast<uint32_t>(kind)};
}

cookie::cookie(std::wstring_view text, bool anyCase) : cookie(std::string_view(Qx::narrow(text)), anyCase) {}

cookie cookie::fromWords(uint32_t first, uint32_t second, uint32_t third) {
    cookie item;
    const bool letter = third < 128 && type_from_char(static_cast<char>(third)) != Cookie_Type::Invalid;
    if (letter) {
        item.m_words = {first, second, third};
    }
    return item;
}

Cookie_Type cookie::type_from_char(char letter) {
    switch (letter) {
    case 'C':
    case 'E':
    case 'F':
    case 'M':
    case 'P':
    case 'S':
    case 'T':
    case 'V':
    case 'X':
        return static_cast<Cookie_Type>(letter);
    default:
        return Cookie_Type::Invalid;
    }
}

bool cookie::isStorable() const {
    return is_valid() && m_words[0] < firstWordLimit && m_words[1] < secondWordLimit;
}

String cookie::asString() const {
    return cookie_string(*this).c_str();
}

WString cookie::asWString() const {
    return Qx::widen(asString());
}

cookie_string::cookie_string(const cookie& item) {
    // Digits that the text cannot hold are cut; callers that form names ask isStorable() first.
    m_text[0] = item.typeChar();
    writeBase36(m_text + 1, 4, item.word(0));
    writeBase36(m_text + 5, 3, item.word(1));
    m_text[8] = '\0';
}
