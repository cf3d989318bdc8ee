#include "edit/persist/detail/ed2_names.h"
#include "edit/persist/detail/edit_file.h"
#include "platform/store/text_file.h"

#include <algorithm>

namespace Ed2Names {

namespace {

constexpr std::string_view kForeignName = "A%_";

bool isControl(char c) {
    const auto byte = static_cast<unsigned char>(c);
    return byte < 0x20 || byte == 0x7F;
}

int hexDigit(char c) {
    if (c >= '0' && c <= '9') {
        return c - '0';
    }
    return c >= 'A' && c <= 'F' ? c - 'A' + 10 : -1;
}

} // namespace

String escaped(std::string_view text) {
    String result;
    for (const char c : text) {
        if (c == '%' || c == ' ' || isControl(c)) {
            result += String::format("%%%02X", static_cast<unsigned>(static_cast<unsigned char>(c)));
        } else {
            result += c;
        }
    }
    return result;
}

String unescaped(std::string_view text) {
    String result;
    for (size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '%' && i + 2 < text.size()) {
            const int high = hexDigit(text[i + 1]);
            const int low = hexDigit(text[i + 2]);
            if (high >= 0 && low >= 0) {
                result += static_cast<char>(high * 16 + low);
                i += 2;
                continue;
            }
        }
        result += text[i];
    }
    return result;
}

String channelField(std::string_view name) {
    String field(name.starts_with('A') ? std::string_view() : kForeignName);
    return field += escaped(name);
}

String channelName(std::string_view field) {
    if (field.starts_with(kForeignName)) {
        field.remove_prefix(kForeignName.size());
    }
    return unescaped(field);
}

int headerEnd(const TextFile& file) {
    int at = file.find(EditKeys::kHeaderEnd);
    while (at >= 0 && file[static_cast<unsigned>(at)].trimmed() != EditKeys::kHeaderEnd) {
        at = file.find(EditKeys::kHeaderEnd, static_cast<unsigned>(at) + 1);
    }
    return at;
}

String cueLine(std::string_view name) {
    return std::any_of(name.begin(), name.end(), isControl) ? escaped(name) : String(name);
}

String cueName(std::string_view line, size_t length) {
    if (line.size() > length) {
        String name = unescaped(line);
        if (name.size() == length) {
            return name;
        }
    }
    return String(line);
}

} // namespace Ed2Names
