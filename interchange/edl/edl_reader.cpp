#include "interchange/edl/edl_reader.h"

#include "interchange/edl/detail/edl_reading.h"
#include "interchange/text_encoding.h"
#include "platform/base/text_lines.h"
#include "platform/media/timecode.h"
#include "platform/services/files.h"

#include <cerrno>
#include <cstdlib>

namespace interchange {

bool EdlEvent::isBlack() const {
    return String::equalNoCase(reel, "BL") || String::equalNoCase(reel, "BLACK");
}

String EdlEvent::typeText() const {
    switch (type) {
    case EdlType::Cut:
        return "C";
    case EdlType::Dissolve:
        return String::format("D %03d", duration);
    case EdlType::Wipe:
        return String::format("W%03d %03d", wipe, duration);
    case EdlType::KeyBackground:
        return "K B";
    case EdlType::Key:
        return String::format("K %03d", duration);
    case EdlType::KeyOut:
        return String::format("K O %03d", duration);
    }
    return {};
}

Qx::Status readEdl(std::string_view text, Qx::FrameRate rate, EdlList& list, LossReport& report,
                   BadLines bad) {
    detail::EdlReader reading(rate, report, bad);
    Qx::Status status = reading.read(text);
    if (status) {
        list = std::move(reading.list());
    }
    return status;
}

Qx::Status readEdlFile(const String& path, Qx::FrameRate rate, EdlList& list, LossReport& report,
                       BadLines bad) {
    report.setFile(path);
    String text;
    if (const Qx::FileError error = Qx::readWholeFile(path, text, kMaxEdlBytes)) {
        if (error.code == EFBIG) {
            return Qx::Status::failure(path +
                                       ": larger than 64 MiB, which no edit list is; check that this is "
                                       "the right file");
        }
        return error.status();
    }
    return readEdl(text, rate, list, report, bad);
}

namespace detail {

namespace {

bool beginsNoCase(std::string_view text, std::string_view prefix) {
    return text.size() >= prefix.size() && String::equalNoCase(text.substr(0, prefix.size()), prefix);
}

bool isTransition(const EdlEvent& event) {
    return event.type != EdlType::Cut && event.type != EdlType::KeyBackground;
}

} // namespace

Qx::Status EdlReader::failure(int line, const String& what) const {
    return Qx::Status::failure(m_report.file() + ":" + std::to_string(line) + ": " + what);
}

void EdlReader::warnOnce(Once once, const String& what) {
    if (!m_warned[once]) {
        m_warned[once] = true;
        m_report.addWarning(m_line, what);
    }
}

bool EdlReader::paired() const {
    return !m_list.events.empty() && m_list.events.back().role == EdlRole::Incoming;
}

Qx::Status EdlReader::read(std::string_view text) {
    if (!m_list.rate.valid()) {
        return failure(1, "a list does not state its frame rate; give one");
    }
    if (text.find('\0') != std::string_view::npos) {
        return failure(1, "the file holds NUL bytes and is no edit list; export it as plain CMX 3600 text");
    }
    if (text.starts_with("\xEF\xBB\xBF")) {
        text.remove_prefix(3);
    }
    const bool isUtf8 = Qx::isUtf8(text);
    while (!text.empty()) {
        ++m_line;
        std::string_view line = Qx::takeLine(text);
        if (!isUtf8 && !Qx::isUtf8(line)) {
            warnOnce(kNotUtf8, "the list is not UTF-8 here; such lines are read as Windows-1252");
            m_converted = utf8OfWindows1252(line);
            line = m_converted;
        }
        if (Qx::Status status = readLine(line); !status) {
            m_badLines.add(m_line, status.reason());
            m_skipsNotes = true;
        }
        if (m_list.events.size() > kMaxEdlEvents) {
            return failure(m_line, "a list holds at most 999999 event lines; split it");
        }
    }
    return finish();
}

Qx::Status EdlReader::readLine(std::string_view whole) {
    const std::string_view line = trimBlanks(whole);
    if (line.empty()) {
        return {};
    }
    if (line.starts_with(">>>")) {
        m_inSourceTable = true;
        warnOnce(kSourceTable, "the source table is skipped");
        return {};
    }
    if (line.front() >= '0' && line.front() <= '9') {
        const size_t end = line.find_first_not_of("0123456789");
        if (end != std::string_view::npos && (line[end] == ' ' || line[end] == '\t')) {
            return readEvent(whole);
        }
        if (end == std::string_view::npos && !m_inSourceTable) {
            return Qx::Status::failure("the event line has a number only; complete or delete it");
        }
    }
    if (!m_inSourceTable && !readStatement(line) && !m_skipsNotes) {
        readNote(line);
    }
    return {};
}

bool EdlReader::readStatement(std::string_view line) {
    if (beginsNoCase(line, "TITLE:")) {
        if (!m_titleSeen) {
            m_list.title = trimBlanks(line.substr(6));
            m_titleSeen = true;
        } else {
            m_report.addWarning(m_line, "a second TITLE is not used");
        }
        return true;
    }
    if (beginsNoCase(line, "FCM:")) {
        const String mode = String(trimBlanks(line.substr(4))).upper();
        if (mode.starts_with("NON")) {
            m_dropFrame = false;
        } else if (mode.starts_with("DROP")) {
            m_dropFrame = true;
        } else {
            m_report.addWarning(m_line, "FCM " + quotedText(mode) +
                                            " is neither DROP FRAME nor NON-DROP "
                                            "FRAME and changes nothing");
        }
        return true;
    }
    return false;
}

Qx::Status EdlReader::readEvent(std::string_view line) {
    EdlLine parsed;
    if (Qx::Status status = parseEventLine(line, m_fields, parsed); !status) {
        // In a source table a line that begins with digits is a row of it.
        return m_inSourceTable ? Qx::Status() : status;
    }
    m_inSourceTable = false;
    EdlEvent& event = parsed.event;
    event.line = m_line;
    if (Qx::Status status = readTimes(parsed, event); !status) {
        return status;
    }
    placeSpeeds();
    pairWithLineBefore(event);
    m_skipsNotes = false;
    m_nameIsFrom = false;
    m_sourceForIncoming = event.role == EdlRole::Incoming && !m_list.events.empty() &&
                          m_list.events.back().recordIn == m_list.events.back().recordOut;
    for (; m_splitsPlaced < m_splits.size(); ++m_splitsPlaced) {
        event.notes += (event.notes.empty() ? "" : "\n") + m_splits[m_splitsPlaced].value;
    }
    m_list.events.push_back(std::move(event));
    return {};
}

void EdlReader::pairWithLineBefore(EdlEvent& event) {
    if (!isTransition(event)) {
        return;
    }
    if (!m_list.events.empty()) {
        EdlEvent& before = m_list.events.back();
        const bool sameTrack = before.channels == 0 || (before.channels & event.channels) != 0;
        if (before.number == event.number && sameTrack && before.role == EdlRole::Alone &&
            !isTransition(before)) {
            before.role = EdlRole::Outgoing;
            event.role = EdlRole::Incoming;
            return;
        }
    }
    m_report.addWarning(m_line, event.type == EdlType::Key || event.type == EdlType::KeyOut
                                    ? "the key has no line for its background"
                                    : "the transition has no line for its outgoing side, which is taken as "
                                      "black");
}

bool EdlReader::resolveDrop(bool dropSeparator, bool nonDropSeparator) {
    const bool drop = dropSeparator || (!nonDropSeparator && m_dropFrame);
    if (drop && !m_list.rate.hasDropFrame()) {
        warnOnce(kNoDropFrame, "the list says drop frame, which " + m_list.rate.asString() +
                                   " frames a second does not have; read as non-drop");
        return false;
    }
    return drop;
}

// Leaves `count` at -1 for a timecode of four fields.
Qx::Status EdlReader::readTime(std::string_view text, Qx::TimecodeFields& fields, int64_t& count) {
    count = -1;
    if (text.find_first_of(":;,.") == std::string_view::npos) {
        count = digitsValue(text);
        return count >= 0 ? Qx::Status()
                          : Qx::Status::failure("frame count " + quotedText(text) +
                                                " has more than nine digits; correct it");
    }
    if (Qx::Status status = Qx::parseTimecode(text, m_list.rate, fields); !status) {
        const bool frame = status.code() == Qx::StatusCode::Unsupported;
        return Qx::Status::failure(
            status.reason() + (frame ? "; give the frame rate that the list was made at" : "; correct it"));
    }
    return {};
}

Qx::Status EdlReader::readTimes(const EdlLine& parsed, EdlEvent& event) {
    int64_t* const results[] = {&event.sourceIn, &event.sourceOut, &event.recordIn, &event.recordOut};
    for (size_t side = 0; side < 4; side += 2) {
        Qx::TimecodeFields fields[2];
        int64_t counts[2];
        for (size_t i = 0; i < 2; ++i) {
            if (Qx::Status status = readTime(parsed.times[side + i], fields[i], counts[i]); !status) {
                return status;
            }
        }
        const bool drop = resolveDrop(fields[0].dropSeparator || fields[1].dropSeparator,
                                      fields[0].nonDropSeparator || fields[1].nonDropSeparator);
        for (size_t i = 0; i < 2; ++i) {
            bool skipped = false;
            *results[side + i] =
                counts[i] >= 0 ? counts[i] : Qx::timecodeFrames(fields[i], m_list.rate, drop, &skipped);
            if (skipped) {
                m_report.addWarning(m_line, quotedText(parsed.times[side + i]) +
                                                " does not exist in drop frame; moved up to the next label");
            }
        }
        (side == 0 ? event.sourceDrop : event.recordDrop) = drop;
    }
    return {};
}

Qx::Status EdlReader::finish() {
    placeSpeeds();
    std::vector<bool> isBad(m_list.events.size());
    bool anyBad = false;
    for (size_t i = 0; i < isBad.size(); ++i) {
        if (Qx::Status status = finishEvent(m_list.events[i]); !status) {
            m_badLines.add(m_list.events[i].line, status.reason());
            isBad[i] = anyBad = true;
        }
    }
    if (!m_badLines.empty() && m_bad == BadLines::Refuse) {
        return m_badLines.refuse(m_report);
    }
    checkSplits();
    if (anyBad) {
        dropEvents(isBad);
    }
    if (m_list.events.empty()) {
        return failure(std::max(m_line, 1), m_badLines.empty()
                                                ? "the list has no events; export it again from its source"
                                                : "no event of the list can be read; export it again from "
                                                  "its source");
    }
    m_badLines.leaveOut(m_report);
    return {};
}

// What stands with a line that goes, its markers and the other line of its event, is none of its own.
void EdlReader::dropEvents(const std::vector<bool>& isBad) {
    std::vector<EdlEvent> kept;
    std::vector<size_t> placeOf(isBad.size(), SIZE_MAX);
    for (size_t i = 0; i < isBad.size(); ++i) {
        EdlEvent& event = m_list.events[i];
        if (isBad[i]) {
            continue;
        }
        const bool losesPair = (event.role == EdlRole::Incoming && i > 0 && isBad[i - 1]) ||
                               (event.role == EdlRole::Outgoing && i + 1 < isBad.size() && isBad[i + 1]);
        event.role = losesPair ? EdlRole::Alone : event.role;
        placeOf[i] = kept.size();
        kept.push_back(std::move(event));
    }
    m_list.events = std::move(kept);
    std::erase_if(m_list.markers, [&](const EdlMarker& marker) { return isBad[marker.event]; });
    for (EdlMarker& marker : m_list.markers) {
        marker.event = placeOf[marker.event];
    }
}

Qx::Status EdlReader::finishEvent(EdlEvent& event) {
    const bool reverse = event.speed && event.speed->framesPerSecond < 0;
    if (event.sourceOut < event.sourceIn && !reverse) {
        event.sourceOut += Qx::framesPerDay(m_list.rate, event.sourceDrop);
    }
    if (event.recordOut < event.recordIn) {
        const int64_t out = event.recordOut + Qx::framesPerDay(m_list.rate, event.recordDrop);
        const int64_t hour = int64_t{3600} * m_list.rate.nominal();
        const int64_t length = out - event.recordIn;
        if (length <= 0 || std::abs(length - std::abs(event.sourceOut - event.sourceIn)) > hour) {
            return Qx::Status::failure(
                "record out " + Qx::timecodeText(event.recordOut, m_list.rate, event.recordDrop) +
                " lies before record in " + Qx::timecodeText(event.recordIn, m_list.rate, event.recordDrop) +
                "; correct one of them");
        }
        event.recordOut = out;
    }
    if (event.sourceOut < event.sourceIn && !reverse) {
        return Qx::Status::failure("source out lies before source in; correct one of them");
    }
    if (event.freeze && !event.speed) {
        event.speed = EdlSpeed{event.reel, "000.0", 0.0, event.sourceIn, event.line};
    }
    return {};
}

void EdlReader::checkSplits() {
    for (const Split& split : m_splits) {
        if (split.event + 1 >= m_list.events.size()) {
            m_report.addWarning(split.line, "SPLIT has no two event lines below it and changes nothing");
            continue;
        }
        std::string_view value = split.value;
        value.remove_prefix(
            std::min(value.size(), value.find('=') == String::npos ? value.size() : value.find('=') + 1));
        const EdlEvent& first = m_list.events[split.event];
        const EdlEvent& second = m_list.events[split.event + 1];
        Qx::TimecodeFields fields;
        if (first.number != second.number || !Qx::parseTimecode(trimBlanks(value), m_list.rate, fields) ||
            second.recordIn - first.recordIn != Qx::timecodeFrames(fields, m_list.rate, first.recordDrop)) {
            m_report.addWarning(split.line, "the two lines below SPLIT do not start its delay apart; their "
                                            "record times are trusted");
        }
    }
}

} // namespace detail

} // namespace interchange
