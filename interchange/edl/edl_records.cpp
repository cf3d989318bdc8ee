#include "interchange/edl/edl_records.h"

#include "platform/base/text_lines.h"

#include <charconv>

namespace interchange {

namespace {

void appendLine(String& text, char tag, std::string_view line) {
    text += tag;
    text += line;
    text += '\n';
}

/// Nothing for a text that is not four whole numbers.
std::optional<EdlRecord::Times> timesOf(std::string_view text) {
    EdlRecord::Times times;
    const char* at = text.data();
    const char* const end = at + text.size();
    for (int64_t* const number : {&times.sourceIn, &times.sourceOut, &times.length, &times.shown}) {
        const auto [next, error] = std::from_chars(at, end, *number);
        if (error != std::errc()) {
            return std::nullopt;
        }
        at = next != end && *next == ' ' ? next + 1 : next;
    }
    return at == end ? std::optional(times) : std::nullopt;
}

void readField(EdlRecord& record, char tag, std::string_view value) {
    switch (tag) {
    case 'R':
        record.reel = value;
        break;
    case 'S':
        if (const IdStamp stamp(value); stamp.valid()) {
            record.events.push_back(stamp);
        }
        break;
    case 'V':
        record.speedDigits = value;
        break;
    case 'T':
        record.times = timesOf(value);
        break;
    case 'N':
        record.notes += record.notes.empty() ? "" : "\n";
        record.notes += value;
        break;
    default:
        break;
    }
}

} // namespace

String packEdlRecords(const std::vector<EdlRecord>& records) {
    String text;
    for (const EdlRecord& record : records) {
        appendLine(text, 'E', record.number + " " + record.typeText);
        appendLine(text, 'R', record.reel);
        for (const IdStamp& stamp : record.events) {
            appendLine(text, 'S', stamp.asString());
        }
        if (!record.speedDigits.empty()) {
            appendLine(text, 'V', record.speedDigits);
        }
        if (record.times) {
            const EdlRecord::Times& times = *record.times;
            appendLine(text, 'T',
                       std::to_string(times.sourceIn) + " " + std::to_string(times.sourceOut) + " " +
                           std::to_string(times.length) + " " + std::to_string(times.shown));
        }
        Qx::forEachLine(record.notes, [&](std::string_view line) { appendLine(text, 'N', line); });
    }
    return text;
}

std::vector<EdlRecord> unpackEdlRecords(std::string_view text) {
    std::vector<EdlRecord> records;
    Qx::forEachLine(text, [&](std::string_view line) {
        if (line.empty()) {
            return;
        }
        const std::string_view value = line.substr(1);
        if (line.front() == 'E') {
            const size_t blank = value.find(' ');
            EdlRecord& record = records.emplace_back();
            record.number = value.substr(0, blank);
            record.typeText = blank == std::string_view::npos ? std::string_view() : value.substr(blank + 1);
        } else if (!records.empty()) {
            readField(records.back(), line.front(), value);
        }
    });
    return records;
}

} // namespace interchange
