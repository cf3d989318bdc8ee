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
constexpr int kLeastNameColumns = 12;
constexpr int kMostReelColumns = 16;
constexpr size_t kMostEvents = 12;

String speedText(double velocity) {
    if (velocity == 0) {
        return "freeze";
    }
    return String::format("%ld%%", std::lround(std::clamp(velocity, -1e6, 1e6) * 100));
}

/// The columns before the name, in their order.
enum Field { Number, Event, RecordIn, RecordOut, SourceIn, SourceOut, Length, Transition, Reel, kNumFields };

constexpr const char* kHeadings[kNumFields] = {
    "#", "event", "record in", "record out", "source in", "source out", "length", "transition", "reel"};
/// What a narrow console does without, the first to go first.
constexpr Field kSpare[] = {Transition, SourceOut, Reel, RecordOut, Event, SourceIn, Length};

bool isRight(int field) {
    return field == Number || field == Length;
}

struct TableLine {
    String cells[kNumFields];
    String name;
    String notes;
    Ink ink = Ink::None;
    bool isDim = false; ///< no event: a gap, or the heading
};

class Table {
public:
    Table(const EditReport& report, const Console& console, bool all)
        : m_report(report), m_console(console), m_all(all) {
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
    [[nodiscard]] TableLine lineOf(const ChannelReport& channel, size_t index) const;
    [[nodiscard]] TableLine gapOf(const PairReport& before, const PairReport& after) const;
    void findWidths(const std::vector<TableLine>& lines);
    [[nodiscard]] int columnsBeforeName() const;
    void addLine(const TableLine& line);
    void addMore(int indent, size_t count);
    [[nodiscard]] Ink inkOf(const SourceReport& source) const;
    [[nodiscard]] size_t shown(size_t count) const { return m_all ? count : std::min(count, kMostEvents); }
    void addCues();
    void addName(String name, const String& notes, int used, Ink ink);

    const EditReport& m_report;
    const Console& m_console;
    bool m_all;
    std::vector<String> m_labels;
    int m_widths[kNumFields] = {}; ///< 0 for a column that is left out
    String m_text;
};

void Table::addName(String name, const String& notes, int used, Ink ink) {
    String rest = notes;
    if (m_console.fitted()) {
        const int room = std::max(m_console.width() - used, 0);
        rest = safe_text::fitted(notes, std::max(room - kLeastNameColumns, 0), m_console.ellipsis());
        name = safe_text::fitted(name, room - safe_text::columns(rest), m_console.ellipsis());
    }
    m_text += m_console.inked(ink, name) + m_console.inked(Ink::Dim, rest) + "\n";
}

Ink Table::inkOf(const SourceReport& source) const {
    return !source.problem.empty() ? Ink::Error : source.kind == SourceKind::Black ? Ink::Dim : Ink::None;
}

TableLine Table::lineOf(const ChannelReport& channel, size_t index) const {
    const PairReport& pair = channel.pairs[index];
    const SourceReport& source = m_report.sources[pair.source];
    TableLine line;
    line.cells[Number] = String::format("%zu", index + 1);
    line.cells[RecordIn] = m_report.recordTimecode(pair.in);
    line.cells[RecordOut] = m_report.recordTimecode(pair.out);
    if (source.kind != SourceKind::Black && source.kind != SourceKind::Effect) {
        line.cells[SourceIn] = m_report.sourceTimecode(source, pair.stripIn);
        line.cells[SourceOut] = m_report.sourceTimecode(source, pair.stripOut);
    }
    line.cells[Length] = shortLength(m_report, pair.out - pair.in);
    if (m_all) {
        line.cells[Event] = m_console.safe(pair.event);
        line.cells[Transition] = transitionText(pair);
        line.cells[Reel] =
            safe_text::fitted(m_console.safe(source.reel), kMostReelColumns, m_console.ellipsis());
    }
    line.name = pair.effect.empty() ? m_labels[pair.source] : effectLabel(pair);
    line.notes = pairNotes(m_report, pair);
    line.ink = inkOf(source);
    return line;
}

TableLine Table::gapOf(const PairReport& before, const PairReport& after) const {
    TableLine line;
    line.cells[RecordIn] = m_report.recordTimecode(before.out);
    line.cells[RecordOut] = m_report.recordTimecode(after.in);
    line.cells[Length] = shortLength(m_report, after.in - before.out);
    line.name = "gap";
    line.isDim = true;
    return line;
}

int Table::columnsBeforeName() const {
    int columns = 1;
    for (const int width : m_widths) {
        columns += width > 0 ? width + 2 : 0;
    }
    return columns;
}

void Table::findWidths(const std::vector<TableLine>& lines) {
    for (int field = 0; field < kNumFields; ++field) {
        int& width = m_widths[field];
        width = 0;
        for (const TableLine& line : lines) {
            width = std::max(width, safe_text::columns(line.cells[field]));
        }
        const bool isTime = field >= RecordIn && field <= SourceOut;
        if (width > 0 || isTime) {
            width = std::max(width, isTime ? kTimecodeColumns : safe_text::columns(kHeadings[field]));
        }
    }
    m_widths[Number] = std::max(m_widths[Number], 2);
    for (const Field field : kSpare) {
        if (m_console.fitted() && columnsBeforeName() + kLeastNameColumns > m_console.width()) {
            m_widths[field] = 0;
        }
    }
}

void Table::addLine(const TableLine& line) {
    String text = " ";
    for (int field = 0; field < kNumFields; ++field) {
        if (m_widths[field] > 0) {
            text += safe_text::padded(line.cells[field], m_widths[field], "", isRight(field)) + "  ";
        }
    }
    if (line.isDim) {
        m_text += m_console.inked(Ink::Dim, text + line.name) + "\n";
    } else {
        m_text += text;
        addName(line.name, line.notes, safe_text::columns(text), line.ink);
    }
}

void Table::addMore(int indent, size_t count) {
    const String text =
        String(static_cast<size_t>(indent), ' ') + String::format("and %zu more; --events shows all", count);
    m_text += m_console.inked(Ink::Dim, text) + "\n";
}

void Table::addChannel(const ChannelReport& channel) {
    const auto& pairs = channel.pairs;
    const String name = m_console.safe(channel.name);
    const String count = String::format("  %zu event%s", pairs.size(), pairs.size() == 1 ? "" : "s");
    m_text += "\n " + m_console.inked(Ink::Bold, name.empty() ? String("?") : name) +
              m_console.inked(Ink::Dim, count) + "\n";
    const size_t last = shown(pairs.size());
    std::vector<TableLine> lines;
    lines.reserve(last);
    for (size_t i = 0; i < last; ++i) {
        if (i > 0 && pairs[i].in > pairs[i - 1].out + kTolerance) {
            lines.push_back(gapOf(pairs[i - 1], pairs[i]));
        }
        lines.push_back(lineOf(channel, i));
    }
    if (lines.empty()) {
        return;
    }
    findWidths(lines);
    TableLine heading;
    std::copy(std::begin(kHeadings), std::end(kHeadings), heading.cells);
    heading.name = "name";
    heading.isDim = true;
    addLine(heading);
    for (const TableLine& line : lines) {
        addLine(line);
    }
    if (last < pairs.size()) {
        addMore(m_widths[Number] + 3, pairs.size() - last);
    }
}

void Table::addCues() {
    if (m_report.cues.empty()) {
        return;
    }
    const size_t count = m_report.cues.size();
    m_text += "\n " + m_console.inked(Ink::Bold, "Markers");
    m_text += m_console.inked(Ink::Dim, String::format("  %zu", count)) + "\n";
    for (size_t i = 0; i < shown(count); ++i) {
        const CueReport& cue = m_report.cues[i];
        m_text += "       " + m_report.recordTimecode(cue.time) + "  ";
        const String colour(interchange::markerColourName(cue.code));
        const String note = colour.empty() ? String() : " (" + colour.lower() + ")";
        addName(m_console.safe(cue.text), note, 20, Ink::None);
    }
    if (shown(count) < count) {
        addMore(7, count - shown(count));
    }
}

} // namespace

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

String eventTable(const EditReport& report, const Console& console, bool all) {
    return Table(report, console, all).text();
}
