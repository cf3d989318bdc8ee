#include "edit/model/cel.h"
#include "platform/base/scanned_number.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <optional>

// The lines of a cel in a legacy text. They live in files: do not change them. A fixed number of words a
// line, each value after its name, so that a person can read them.
//
//     CEL_RESOLUTION 0.04                               left out when it is 0
//     CEL_MATERIAL_INFO text                            left out when it is empty
//     CEL_EVENTS 2
//     IN 0 STRIP V0001000 12.5 SPEED 1 LEVEL 1 FADE 0 CURVE 0 CODE 0 ID 40000000-00000001-00000002
//     OUT 2.5 STRIP V0001000 15 SPEED 1 LEVEL 1 FADE 0 CURVE 0 CODE 0 ID ...

namespace {

constexpr std::string_view kResolution = "CEL_RESOLUTION ";
constexpr std::string_view kMaterialInfo = "CEL_MATERIAL_INFO ";
constexpr std::string_view kEvents = "CEL_EVENTS ";
constexpr size_t kWordsOfAnEvent = 17;
constexpr size_t kUsualLineSize = 128;

template <typename Number>
bool textToNumber(std::string_view text, Number& value) {
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, value);
    return error == std::errc() && stop == end;
}

// Appends the shortest text that reads back as the same number.
template <typename Number>
void appendNumber(String& line, Number value) {
    char text[64];
    const auto result = std::to_chars(text, text + sizeof text, value);
    line.append(text, result.ptr);
}

// Appends a cookie's text, or its words for one whose text would not hold all of it.
void appendCookie(String& line, const cookie& item) {
    if (item.isStorable() || item == invalid_cookie) {
        line += cookie_string(item).c_str();
        return;
    }
    for (int i = 0; i < 3; ++i) {
        line += i == 0 ? "" : ".";
        appendNumber(line, item.word(i));
    }
}

bool textToCookie(std::string_view text, cookie& item) {
    if (text.find('.') == std::string_view::npos) {
        item = cookie(text);
        return cookie_string(item).c_str() == text;
    }
    uint32_t word[3];
    for (size_t i = 0; i < 3; ++i) {
        const size_t dot = text.find('.');
        if ((dot == std::string_view::npos) != (i == 2) || !textToNumber(text.substr(0, dot), word[i])) {
            return false;
        }
        text.remove_prefix(i == 2 ? 0 : dot + 1);
    }
    item = cookie::fromWords(word[0], word[1], word[2]);
    return item.word(0) == word[0] && item.word(1) == word[1] && item.word(2) == word[2];
}

// Line ends, control characters and backslashes of a text as escapes that configuration texts use too.
String escapeLine(std::string_view text) {
    String result;
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if (c == '\\') {
            result += "\\\\";
        } else if (byte < 0x20 || byte == 0x7F) {
            result += String::format("\\x%02X", static_cast<unsigned>(byte));
        } else {
            result += c;
        }
    }
    return result;
}

bool unescapeLine(std::string_view text, String& result) {
    result.clear();
    for (size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '\\') {
            result += text[i];
            continue;
        }
        uint8_t byte = 0;
        if (i + 1 < text.size() && text[i + 1] == '\\') {
            result += '\\';
            ++i;
        } else if (i + 3 < text.size() && text[i + 1] == 'x' &&
                   std::from_chars(&text[i + 2], &text[i + 2] + 2, byte, 16).ptr == &text[i + 2] + 2) {
            result += static_cast<char>(byte);
            i += 3;
        } else {
            return false;
        }
    }
    return true;
}

String eventLine(const channel_event& event) {
    String line;
    line.reserve(kUsualLineSize);
    line += event.kind == CE_IN_POINT ? "IN " : "OUT ";
    appendNumber(line, event.editTime);
    line += " STRIP ";
    appendCookie(line, event.strip);
    line += ' ';
    appendNumber(line, event.stripTime);
    line += " SPEED ";
    appendNumber(line, event.velocity);
    line += " LEVEL ";
    appendNumber(line, event.level);
    line += " FADE ";
    appendNumber(line, event.rampQFrames);
    line += " CURVE ";
    appendNumber(line, unsigned{event.rampCurve});
    line += " CODE ";
    appendNumber(line, event.code);
    line += " ID ";
    line += event.id.asString();
    return line;
}

// The words of an event's line; false if they are not so many.
bool wordsOf(std::string_view line, std::array<std::string_view, kWordsOfAnEvent>& words) {
    size_t count = 0;
    while (!line.empty()) {
        const std::string_view word = line.substr(0, line.find(' '));
        line.remove_prefix(std::min(word.size() + 1, line.size()));
        if (word.empty()) {
            continue;
        }
        if (count == words.size()) {
            return false;
        }
        words[count++] = word;
    }
    return count == words.size();
}

// What is wrong with the line of an event; null if nothing is.
const char* readEvent(std::string_view line, channel_event& event) {
    std::array<std::string_view, kWordsOfAnEvent> word;
    if (!wordsOf(line, word)) {
        return "an event has 17 words";
    }
    static constexpr std::pair<size_t, std::string_view> kNames[] = {
        {2, "STRIP"}, {5, "SPEED"}, {7, "LEVEL"}, {9, "FADE"}, {11, "CURVE"}, {13, "CODE"}, {15, "ID"}};
    for (const auto& [place, name] : kNames) {
        if (word[place] != name) {
            return "a word of the event is missing (IN STRIP SPEED LEVEL FADE CURVE CODE ID)";
        }
    }
    if (word[0] != "IN" && word[0] != "OUT") {
        return "an event begins with IN or OUT";
    }
    event.kind = word[0] == "IN" ? CE_IN_POINT : CE_OUT_POINT;
    event.id = IdStamp(word[16]);
    if (!Qx::textToDouble(word[1], event.editTime) || !Qx::textToDouble(word[4], event.stripTime) ||
        !Qx::textToDouble(word[6], event.velocity) || !textToNumber(word[8], event.level)) {
        return "a number of the event is none";
    }
    if (!textToCookie(word[3], event.strip)) {
        return "the strip is no cookie";
    }
    if (!textToNumber(word[10], event.rampQFrames) || !textToNumber(word[12], event.rampCurve) ||
        !Qx::textToInt(word[14], event.code)) {
        return "FADE, CURVE and CODE are whole numbers in range";
    }
    return event.id.asString() == word[16] ? nullptr : "the stamp is none";
}

Qx::Status badLine(unsigned line, const char* what) {
    return Qx::Status::failure(String::format("line %u: %s", line + 1, what));
}

} // namespace

void cel::writeToED2(TextFile& file, Qx::Ed2Support::TVStd /*standard*/) const {
    if (m_resolution != 0) {
        file.appendLine(String(kResolution) + Qx::doubleToText(m_resolution));
    }
    if (!m_materialInfo.empty()) {
        file.appendLine(String(kMaterialInfo) + escapeLine(m_materialInfo));
    }
    file.appendLine(String(kEvents) + std::to_string(numEvents()));
    for (const channel_event& event : m_events) {
        file.appendLine(eventLine(event));
    }
}

Qx::Status cel::buildFrom(const TextFile& file, unsigned first, unsigned* after) {
    cel built;
    unsigned line = first;
    if (file[line].starts_with(kResolution)) {
        double resolution = 0;
        if (!Qx::scanDouble(std::string_view(file[line]).substr(kResolution.size()), resolution) ||
            !std::isfinite(resolution) || resolution <= 0) {
            return badLine(line, "the resolution is no length in seconds");
        }
        built.m_resolution = resolution;
        ++line;
    }
    if (file[line].starts_with(kMaterialInfo)) {
        if (!unescapeLine(std::string_view(file[line]).substr(kMaterialInfo.size()), built.m_materialInfo)) {
            return badLine(line, "a backslash in the material text begins no escape");
        }
        ++line;
    }
    int count = 0;
    if (!file[line].starts_with(kEvents) ||
        !Qx::scanInt(std::string_view(file[line]).substr(kEvents.size()), count) || count < 0 ||
        count % 2 != 0) {
        return badLine(line, "CEL_EVENTS and an even number are expected");
    }
    if (static_cast<unsigned>(count) > file.numLines() - line - 1) {
        return badLine(line, "there are fewer lines than events");
    }
    built.reserve(count / 2);
    for (int i = 0; i < count; ++i) {
        channel_event event;
        const char* wrong = readEvent(file[++line], event);
        if (wrong == nullptr && !built.add_event(event)) {
            wrong = "the event does not follow on the one before";
        }
        if (wrong != nullptr) {
            return badLine(line, wrong);
        }
    }
    if (built.is_good_cel() == 0) {
        return badLine(line, "the events of the channel contradict each other");
    }
    m_events.swap(built.m_events);
    m_resolution = built.m_resolution;
    m_materialInfo.swap(built.m_materialInfo);
    changedNow();
    if (after != nullptr) {
        *after = line + 1;
    }
    return {};
}
