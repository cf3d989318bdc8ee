#include "tools/qmedit/event_table.h"

#include "interchange/marker_colour.h"
#include "tools/qmedit/safe_text.h"
#include "tools/qmedit/track_picture.h"

#include <algorithm>
#include <cmath>

namespace {

using Ink = Console::Ink;

constexpr double kTolerance = 1e-6;
constexpr int kTimecodeColumns = 11;
constexpr int kLeastNameColumns = 8;

/// A length without the hours and minutes that it does not reach: "4:12", "1:04:12".
String shortLength(const EditReport& report, double seconds) {
    String text = report.lengthText(seconds);
    const size_t sign = text.starts_with('-') ? 1 : 0;
    const size_t frames = text.find_last_of(":;");
    const size_t digit = text.find_first_not_of("0:;", sign);
    if (frames != String::npos && frames > sign) {
        text.erase(sign, std::min(digit, frames - 1) - sign);
    }
    return text;
}

String speedText(double velocity) {
    if (velocity == 0) {
        return "freeze";
    }
    return String::format("%ld%%", std::lround(std::clamp(velocity, -1e6, 1e6) * 100));
}

class Table {
public:
    Table(const EditReport& report, const Console& console, const EventTableOptions& options)
        : m_report(report), m_console(console), m_options(options) {
        for (const SourceReport& source : report.sources) {
            m_labels.push_back(sourceLabel(source, console));
        }
    }

    [[nodiscard]] String text() {
        for (const ChannelReport& channel : m_report.channels) {
            if (!channel.isLevels()) {
                addChannel(channel);
            }
        }
        addCues();
        return std::move(m_text);
    }

private:
    void addChannel(const ChannelReport& channel);
    void addEvent(const ChannelReport& channel, size_t index, const String& length);
    [[nodiscard]] Ink inkOf(const SourceReport& source) const;
    void addCues();
    void addName(String name, const String& notes, int used, Ink ink);

    const EditReport& m_report;
    const Console& m_console;
    const EventTableOptions& m_options;
    std::vector<String> m_labels;
    int m_numberColumns = 0;
    int m_lengthColumns = 0;
    String m_text;
};

void Table::addName(String name, const String& notes, int used, Ink ink) {
    const int room = m_console.width() - used - safe_text::columns(notes);
    if (m_options.fitToWidth) {
        name = safe_text::fitted(name, std::max(room, kLeastNameColumns), m_console.ellipsis());
    }
    m_text += m_console.inked(ink, name) + m_console.inked(Ink::Dim, notes) + "\n";
}

Ink Table::inkOf(const SourceReport& source) const {
    return !source.problem.empty() ? Ink::Error : source.kind == SourceKind::Black ? Ink::Dim : Ink::None;
}

void Table::addEvent(const ChannelReport& channel, size_t index, const String& length) {
    const PairReport& pair = channel.pairs[index];
    const SourceReport& source = m_report.sources[pair.source];
    m_text += " " + safe_text::padded(String::format("%zu", index + 1), m_numberColumns, "", true);
    m_text += "  " + m_report.recordTimecode(pair.in) + "  " + m_report.recordTimecode(pair.out);
    const bool sourceTimes = source.kind != SourceKind::Black;
    const String none(kTimecodeColumns, ' ');
    m_text += "  " + (sourceTimes ? m_report.sourceTimecode(source, pair.stripIn) : none);
    m_text += "  " + (sourceTimes ? m_report.sourceTimecode(source, pair.stripOut) : none);
    m_text += "  " + safe_text::padded(length, m_lengthColumns, "", true) + "  ";
    addName(m_labels[pair.source], pairNotes(m_report, pair),
            1 + m_numberColumns + 4 * (kTimecodeColumns + 2) + m_lengthColumns + 4, inkOf(source));
}

void Table::addChannel(const ChannelReport& channel) {
    const auto& pairs = channel.pairs;
    const size_t shown = std::min(pairs.size(), m_options.eventsPerChannel);
    std::vector<String> lengths;
    m_lengthColumns = static_cast<int>(std::string_view("length").size());
    for (size_t i = 0; i < shown; ++i) {
        lengths.push_back(shortLength(m_report, pairs[i].out - pairs[i].in));
        m_lengthColumns = std::max(m_lengthColumns, static_cast<int>(lengths.back().size()));
    }
    m_numberColumns = std::max(2, static_cast<int>(std::to_string(shown).size()));

    const String name = m_console.safe(channel.name);
    m_text += "\n " + m_console.inked(Ink::Bold, name.empty() ? String("?") : name);
    m_text += m_console.inked(Ink::Dim,
                              String::format("  %zu event%s", pairs.size(), pairs.size() == 1 ? "" : "s"));
    m_text += "\n";
    if (shown == 0) {
        return;
    }
    String heading = " " + String(static_cast<size_t>(m_numberColumns - 1), ' ') +
                     "#  record in    record out   source in    source out   ";
    heading += safe_text::padded("length", m_lengthColumns, "", true) + "  name";
    m_text += m_console.inked(Ink::Dim, heading) + "\n";
    for (size_t i = 0; i < shown; ++i) {
        if (i > 0 && pairs[i].in > pairs[i - 1].out + kTolerance) {
            String gap(static_cast<size_t>(m_numberColumns + 3), ' ');
            gap += m_report.recordTimecode(pairs[i - 1].out) + "  " + m_report.recordTimecode(pairs[i].in);
            gap += String(2 * (kTimecodeColumns + 2) + 2, ' ');
            gap += safe_text::padded(shortLength(m_report, pairs[i].in - pairs[i - 1].out), m_lengthColumns,
                                     "", true);
            m_text += m_console.inked(Ink::Dim, gap + "  gap") + "\n";
        }
        addEvent(channel, i, lengths[i]);
    }
    if (shown < pairs.size()) {
        m_text += m_console.inked(Ink::Dim, String(static_cast<size_t>(m_numberColumns + 3), ' ') +
                                                String::format("and %zu more; --events shows all",
                                                               pairs.size() - shown)) +
                  "\n";
    }
}

void Table::addCues() {
    if (m_report.cues.empty()) {
        return;
    }
    const size_t count = m_report.cues.size();
    const size_t shown = std::min(count, m_options.eventsPerChannel);
    m_text += "\n " + m_console.inked(Ink::Bold, "Markers");
    m_text += m_console.inked(Ink::Dim, String::format("  %zu", count)) + "\n";
    for (size_t i = 0; i < shown; ++i) {
        const CueReport& cue = m_report.cues[i];
        m_text += "       " + m_report.recordTimecode(cue.time) + "  ";
        const String colour(interchange::markerColourName(cue.code));
        const String note = colour.empty() ? String() : " (" + colour.lower() + ")";
        addName(m_console.safe(cue.text), note, 20, Ink::None);
    }
    if (shown < count) {
        m_text += m_console.inked(Ink::Dim,
                                  String::format("       and %zu more; --events shows all", count - shown)) +
                  "\n";
    }
}

} // namespace

String pairNotes(const EditReport& report, const PairReport& pair) {
    String notes;
    if (pair.velocity != 1) {
        notes += " (" + speedText(pair.velocity) + ")";
    }
    if (pair.fadeIn > 0) {
        notes += " (fade in " + shortLength(report, pair.fadeIn) + ")";
    }
    if (pair.fadeOut > 0) {
        notes += " (fade out " + shortLength(report, pair.fadeOut) + ")";
    }
    return notes;
}

String eventTable(const EditReport& report, const Console& console, const EventTableOptions& options) {
    return Table(report, console, options).text();
}
