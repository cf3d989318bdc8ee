#include "interchange/edl/detail/edl_line.h"

#include <algorithm>

namespace interchange::detail {

namespace {

using Fields = std::vector<std::string_view>;

constexpr size_t kLeastFields = 8;
constexpr int kMostDuration = 999'999;

bool isBlank(char c) {
    return c == ' ' || c == '\t' || c == '\v' || c == '\f';
}

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

bool allDigits(std::string_view text) {
    return !text.empty() && std::all_of(text.begin(), text.end(), isDigit);
}

// Loose on purpose: a field of this look is meant as a timecode, and what is wrong with it is said later.
bool looksLikeTime(std::string_view text) {
    return !text.empty() && text.size() <= 16 && isDigit(text.front()) &&
           std::all_of(text.begin(), text.end(),
                       [](char c) { return isDigit(c) || c == ':' || c == ';' || c == '.' || c == ','; });
}

// One letter group of a channel text: a letter with the digits behind it.
struct ChannelReader {
    std::string_view text;
    size_t at = 0;
    int bareAudio = 0;
    EdlChannels channels = 0;

    std::string_view digits() {
        const size_t first = at;
        while (at < text.size() && isDigit(text[at])) {
            ++at;
        }
        return text.substr(first, at - first);
    }
    bool addAudio(std::string_view numbers) {
        for (const char c : numbers) {
            if (c < '1' || c > '0' + kMaxEdlAudio) {
                return false;
            }
            channels |= edlAudio(c - '0');
        }
        return true;
    }
    bool picture() {
        const std::string_view numbers = digits();
        if (numbers.size() > 1) { // "V12" is picture with A1 and A2
            channels |= kEdlPicture;
            return addAudio(numbers);
        }
        if (!numbers.empty() && numbers != "1" && numbers != "2") {
            return false;
        }
        channels |= numbers == "2" ? kEdlPicture2 : kEdlPicture;
        return true;
    }
    bool audio() {
        const std::string_view numbers = digits();
        if (!numbers.empty()) {
            return addAudio(numbers);
        }
        if (++bareAudio > kMaxEdlAudio) {
            return false;
        }
        channels |= edlAudio(bareAudio);
        return true;
    }
    bool read() {
        while (at < text.size()) {
            const char c = text[at];
            if (isDigit(c)) {
                if (!addAudio(digits())) {
                    return false;
                }
                continue;
            }
            ++at;
            if (c == '/') {
                continue;
            }
            if ((c != 'V' && c != 'A') || !(c == 'V' ? picture() : audio())) {
                return false;
            }
        }
        return channels != 0;
    }
};

// The duration of a type, if there is one left among the fields.
bool takeDuration(const String* fields, size_t count, size_t& at, int& duration, bool required) {
    if (at < count && allDigits(fields[at])) {
        const int value = digitsValue(fields[at]);
        if (value < 0 || value > kMostDuration) {
            return false;
        }
        duration = value;
        ++at;
        return true;
    }
    return !required;
}

bool takeKey(const String* fields, size_t count, size_t& at, EdlEvent& event) {
    String kind = fields[0].substr(1);
    if (kind.empty() && at < count && (fields[at] == "B" || fields[at] == "O")) {
        kind = fields[at++];
    }
    if (kind == "B") {
        event.type = EdlType::KeyBackground;
    } else if (kind == "O") {
        event.type = EdlType::KeyOut;
    } else if (kind.empty()) {
        event.type = EdlType::Key;
    } else {
        return false;
    }
    return takeDuration(fields, count, at, event.duration, event.type == EdlType::KeyOut);
}

bool takeWipe(const String* fields, size_t count, size_t& at, EdlEvent& event) {
    event.type = EdlType::Wipe;
    event.wipe = digitsValue(std::string_view(fields[0]).substr(1));
    return fields[0].size() <= 4 && event.wipe >= 0 && takeDuration(fields, count, at, event.duration, true);
}

// Type and duration from the fields between channel and timecodes.
bool parseType(const std::string_view* first, const std::string_view* last, EdlEvent& event) {
    String fields[4];
    size_t count = 0;
    event.fade = false;
    event.duration = 0;
    for (; first != last; ++first) {
        if (*first == "(F)" || *first == "(f)") {
            event.fade = true;
        } else if (count == 4 || first->size() > 16) {
            return false;
        } else {
            fields[count++] = String(*first).upper();
        }
    }
    if (count == 0) {
        return false;
    }
    size_t at = 1;
    bool good = false;
    if (fields[0] == "C") {
        event.type = EdlType::Cut;
        int none = 0;
        good = takeDuration(fields, count, at, none, false);
    } else if (fields[0] == "D") {
        event.type = EdlType::Dissolve;
        good = takeDuration(fields, count, at, event.duration, true);
    } else if (fields[0].front() == 'W') {
        good = takeWipe(fields, count, at, event);
    } else if (fields[0].front() == 'K') {
        good = takeKey(fields, count, at, event);
    }
    return good && at == count;
}

bool takeTimes(const Fields& fields, EdlLine& parsed) {
    const size_t first = fields.size() - 4;
    for (size_t i = 0; i < 4; ++i) {
        parsed.times[i] = fields[first + i];
        if (!looksLikeTime(parsed.times[i])) {
            return false;
        }
    }
    return true;
}

Qx::Status parseByFields(const Fields& fields, EdlLine& parsed) {
    if (fields.size() < kLeastFields) {
        return Qx::Status::failure(String::format(
            "the event line has %zu fields instead of at least 8 (number, reel, channel, type, "
            "four timecodes); complete or delete it",
            fields.size()));
    }
    if (!takeTimes(fields, parsed)) {
        return Qx::Status::failure("the event line does not end with four timecodes; complete or delete it");
    }
    if (!parseChannels(fields[2], parsed.event.channels)) {
        return Qx::Status::failure("channel " + quotedText(fields[2]) +
                                   " is none; write V, A, A2, AA, B, A2/V, AA/V or NONE");
    }
    const std::string_view* const middle = fields.data() + 3;
    const std::string_view* const end = fields.data() + fields.size() - 4;
    if (!parseType(middle, end, parsed.event)) {
        return Qx::Status::failure(
            "edit type " +
            quotedText({middle->data(), size_t(end[-1].data() - middle->data()) + end[-1].size()}) +
            " is not known or lacks its duration; write C, D, Wnnn or K O with a number of "
            "frames, K or K B");
    }
    parsed.event.reel = fields[1];
    return {};
}

// The columns of a strict list.
bool parseByColumns(std::string_view line, EdlLine& parsed) {
    if (line.size() < 76 || line.find('\t') != std::string_view::npos) {
        return false;
    }
    const auto column = [&](size_t from, size_t to) {
        return trimBlanks(line.substr(from - 1, to - from + 1));
    };
    for (size_t i = 0; i < 4; ++i) {
        parsed.times[i] = column(30 + 12 * i, 40 + 12 * i);
        if (!looksLikeTime(parsed.times[i])) {
            return false;
        }
    }
    Fields type;
    splitFields(line.substr(20, 8), type);
    parsed.event.reel = column(6, 13);
    return allDigits(column(1, 4)) && !parsed.event.reel.empty() && trimBlanks(line.substr(76)).empty() &&
           parseChannels(column(15, 19), parsed.event.channels) &&
           parseType(type.data(), type.data() + type.size(), parsed.event);
}

// From the right: timecodes, the shortest run of fields that is a type, a channel; the rest is the reel.
bool parseFromRight(const Fields& fields, EdlLine& parsed) {
    if (fields.size() <= kLeastFields || !takeTimes(fields, parsed)) {
        return false;
    }
    const size_t end = fields.size() - 4;
    for (size_t type = end - 1; type >= 3 && type + 5 > end; --type) {
        if (parseType(fields.data() + type, fields.data() + end, parsed.event) &&
            parseChannels(fields[type - 1], parsed.event.channels)) {
            const std::string_view last = fields[type - 2];
            const char* const start = fields[1].data();
            parsed.event.reel = std::string_view(start, size_t(last.data() - start) + last.size());
            return true;
        }
    }
    return false;
}

} // namespace

void splitFields(std::string_view line, std::vector<std::string_view>& fields) {
    fields.clear();
    size_t at = 0;
    while (at < line.size()) {
        if (isBlank(line[at])) {
            ++at;
            continue;
        }
        const size_t first = at;
        while (at < line.size() && !isBlank(line[at])) {
            ++at;
        }
        fields.push_back(line.substr(first, at - first));
    }
}

bool parseChannels(std::string_view text, EdlChannels& channels) {
    if (text.empty() || text.size() > 24) {
        return false;
    }
    const String upper = String(text).upper();
    if (upper == "NONE") {
        channels = 0;
        return true;
    }
    if (upper == "B") {
        channels = kEdlPicture | edlAudio(1);
        return true;
    }
    ChannelReader reader{upper};
    if (!reader.read()) {
        return false;
    }
    channels = reader.channels;
    return true;
}

int digitsValue(std::string_view text) {
    if (!allDigits(text) || text.size() > 9) {
        return -1;
    }
    int value = 0;
    for (const char c : text) {
        value = value * 10 + (c - '0');
    }
    return value;
}

std::string_view trimBlanks(std::string_view text) {
    while (!text.empty() && isBlank(text.front())) {
        text.remove_prefix(1);
    }
    while (!text.empty() && isBlank(text.back())) {
        text.remove_suffix(1);
    }
    return text;
}

String quotedText(std::string_view text) {
    String shown = "\"";
    for (const char c : text.substr(0, 40)) {
        shown += c >= ' ' && c <= '~' ? c : '?';
    }
    return shown + (text.size() > 40 ? "...\"" : "\"");
}

String utf8Name(std::string_view text, bool& replaced) {
    if (Qx::isUtf8(text)) {
        return text;
    }
    WString wide = Qx::widen(text);
    for (wchar_t& c : wide) {
        if (c >= 0xDC80 && c <= 0xDCFF) {
            c = 0xFFFD;
        }
    }
    replaced = true;
    return Qx::narrow(wide);
}

Qx::Status parseEventLine(std::string_view line, std::vector<std::string_view>& fields, EdlLine& parsed) {
    splitFields(line, fields);
    Qx::Status status = parseByFields(fields, parsed);
    if (!status && !parseByColumns(line, parsed) && !parseFromRight(fields, parsed)) {
        return status;
    }
    parsed.event.number = fields[0];
    return {};
}

} // namespace interchange::detail
