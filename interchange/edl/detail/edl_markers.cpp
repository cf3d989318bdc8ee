#include "interchange/edl/detail/edl_markers.h"

#include "interchange/edl/detail/edl_line.h"
#include "interchange/edl/detail/edl_note.h"
#include "interchange/edl/detail/edl_sources.h"
#include "interchange/marker_colour.h"
#include "platform/media/timecode.h"

#include <algorithm>
#include <cmath>

namespace interchange::detail {

namespace {

bool isColourWord(std::string_view word) {
    return !word.empty() &&
           std::all_of(word.begin(), word.end(), [](char c) { return c >= 'A' && c <= 'Z'; });
}

} // namespace

EdlMarkers::EdlMarkers(const Edit& edit, Qx::FrameRate rate, bool drop, int64_t start, LossReport& report)
    : m_rate(rate), m_drop(drop), m_start(start), m_report(report) {
    const cue_list& cues = edit.get_cues();
    const size_t count = cues.get_num_cue_points(CueFlag::kKept);
    for (size_t i = 0; i < count; ++i) {
        add(*cues.get_cue_point(i, CueFlag::kKept));
    }
    std::stable_sort(m_markers.begin(), m_markers.end(),
                     [](const Marker& a, const Marker& b) { return a.position < b.position; });
}

void EdlMarkers::add(const cue_point& cue) {
    Marker marker;
    marker.position = m_rate.toFrames(cue.editTime());
    marker.code = cue.code();
    marker.text = oneLine(cue.text());
    const String where = "cue at " + Qx::timecodeText(m_start + marker.position, m_rate, m_drop);
    // A label of the next day is told from one before the programme by less than half a day.
    const int64_t day = Qx::framesPerDay(m_rate, m_drop);
    if (marker.position < 0 || (m_start + marker.position >= day && marker.position >= day / 2)) {
        m_report.addLoss(0, where + " lies too far from the programme's start and is left out");
        return;
    }
    const double exact = cue.editTime() * m_rate.numerator() / m_rate.denominator();
    if (std::abs(exact - static_cast<double>(marker.position)) > 1e-3) {
        m_report.addLoss(0, where + ": its time lies between two frames and is rounded");
    }
    if (cue.channel() != kAnyCueChan) {
        m_report.addLoss(0, where + ": the channel that it is on is not written");
    }
    std::string_view rest = marker.text;
    const std::string_view first = takeWord(rest);
    if (marker.code != 0 && markerColourName(marker.code).empty()) {
        m_report.addLoss(0, where +
                                String::format(": its code %d is no colour and is not written", marker.code));
        marker.code = 0;
    }
    if (marker.code == 0 && isColourWord(first) && markerColourCode(first) != 0) {
        m_report.addLoss(0, where + ": the first word of its text will be read as its colour");
    }
    if (marker.text != cue.text()) {
        m_report.addLoss(0, where + ": line ends and other control characters of its text become blanks");
    }
    m_markers.push_back(std::move(marker));
}

String EdlMarkers::noteOf(const Marker& marker) const {
    const String colour(markerColourName(marker.code));
    String note = "* LOC: " + Qx::timecodeText(m_start + marker.position, m_rate, m_drop);
    if (!colour.empty() || !marker.text.empty()) {
        note += " ";
        note += marker.text.empty() ? colour : String(String::format("%-7s ", colour.c_str()) + marker.text);
    }
    return note;
}

bool EdlMarkers::keeps(std::string_view line) {
    const Note note = parseNote(line);
    if (note.kind != NoteKind::Marker) {
        return true;
    }
    std::string_view rest = note.value;
    const std::string_view time = takeWord(rest);
    Qx::TimecodeFields fields;
    if (!Qx::parseTimecode(time, m_rate, fields)) {
        return true;
    }
    const bool drop = (m_drop || fields.dropSeparator) && !fields.nonDropSeparator && m_rate.hasDropFrame();
    int64_t position = Qx::timecodeFrames(fields, m_rate, drop) - m_start;
    const int64_t day = Qx::framesPerDay(m_rate, m_drop);
    position += position < -day / 2 ? day : 0;
    if (position < 0) {
        return true;
    }
    bool replaced = false;
    String text = utf8Name(rest, replaced);
    std::string_view after = rest;
    const std::string_view colour = takeWord(after);
    const int code = isColourWord(colour) ? markerColourCode(colour) : 0;
    if (code != 0) {
        text = utf8Name(after, replaced);
    }
    auto marker = std::lower_bound(m_markers.begin(), m_markers.end(), position,
                                   [](const Marker& m, int64_t at) { return m.position < at; });
    for (; marker != m_markers.end() && marker->position == position; ++marker) {
        if (!marker->written && marker->code == code &&
            (marker->text == text || (code == 0 && isColourWord(colour) &&
                                      marker->text == String(colour) + " " + utf8Name(after, replaced)))) {
            marker->written = true;
            return true;
        }
    }
    return false;
}

String EdlMarkers::takeBefore(int64_t until) {
    String notes;
    for (; m_next < m_markers.size() && m_markers[m_next].position < until; ++m_next) {
        if (!m_markers[m_next].written) {
            notes += (notes.empty() ? "" : "\n") + noteOf(m_markers[m_next]);
        }
    }
    return notes;
}

} // namespace interchange::detail
