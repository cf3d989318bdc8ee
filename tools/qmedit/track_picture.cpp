#include "tools/qmedit/track_picture.h"

#include "tools/qmedit/safe_text.h"
#include "tools/qmedit/time_ruler.h"

#include <algorithm>
#include <cmath>

namespace {

using Ink = Console::Ink;

constexpr int kWidestChannelName = 10;
constexpr int kRoomForEllipsis = 6;

/// The signs of the picture, in the two sets that terminals show.
struct Signs {
    const char* cut;
    const char* denseCut;
    const char* black;
    const char* fadeIn;
    const char* fadeOut;
    const char* cue;
    const char* rules[16]; ///< by the sum of kUp, kDown, kLeft, kRight
};

constexpr unsigned kUp = 1;
constexpr unsigned kDown = 2;
constexpr unsigned kLeft = 4;
constexpr unsigned kRight = 8;

constexpr Signs kUtf8Signs = {
    "│",
    "┃",
    "░",
    "╱",
    "╲",
    "▼",
    {" ", "╵", "╷", "│", "╴", "┘", "┐", "┤", "╶", "└", "┌", "├", "─", "┴", "┬", "┼"}};
constexpr Signs kAsciiSigns = {
    "|",
    "#",
    ".",
    "/",
    "\\",
    "v",
    {" ", "+", "+", "|", "-", "+", "+", "+", "-", "+", "+", "+", "-", "+", "+", "+"}};

/// A row of cells; runs of one colour are joined when it is written.
class Row {
public:
    explicit Row(int columns) : m_cells(static_cast<size_t>(columns)) {}

    void set(int column, std::string_view sign, Ink ink) {
        if (column >= 0 && column < static_cast<int>(m_cells.size())) {
            m_cells[static_cast<size_t>(column)] = {String(sign), ink};
        }
    }
    /// Lays text over cells, a cell a column; a wide character empties the cell after it.
    void setText(int column, std::string_view text, Ink ink) {
        while (!text.empty()) {
            const size_t length = firstCharacter(text);
            const int wide = safe_text::columns(text.substr(0, length));
            if (wide == 0 && column > 0) {
                m_cells[static_cast<size_t>(column - 1)].sign.append(text.substr(0, length));
            } else {
                set(column, text.substr(0, length), ink);
            }
            if (wide == 2) {
                set(column + 1, "", ink);
            }
            column += wide;
            text.remove_prefix(length);
        }
    }
    [[nodiscard]] bool blank(int from, int to) const {
        for (int i = std::max(from, 0); i < to && i < static_cast<int>(m_cells.size()); ++i) {
            if (m_cells[static_cast<size_t>(i)].sign != " ") {
                return false;
            }
        }
        return to <= static_cast<int>(m_cells.size());
    }
    [[nodiscard]] String text(const Console& console) const {
        size_t end = m_cells.size();
        while (end > 0 && m_cells[end - 1].sign == " " && m_cells[end - 1].ink == Ink::None) {
            --end;
        }
        String out;
        for (size_t i = 0; i < end;) {
            size_t next = i;
            String run;
            for (; next < end && m_cells[next].ink == m_cells[i].ink; ++next) {
                run += m_cells[next].sign;
            }
            out += console.inked(m_cells[i].ink, run);
            i = next;
        }
        return out;
    }

private:
    struct Cell {
        String sign = " ";
        Ink ink = Ink::None;
    };
    static size_t firstCharacter(std::string_view text) {
        size_t length = 1;
        while (length < text.size() && (static_cast<unsigned char>(text[length]) & 0xC0u) == 0x80u) {
            ++length;
        }
        return length;
    }
    std::vector<Cell> m_cells;
};

/// Where the pairs of one channel fall on the columns.
struct Lanes {
    explicit Lanes(size_t columns) : edge(columns), stem(columns), covered(columns) {}
    std::vector<bool> edge;    ///< a pair begins or ends in the column
    std::vector<bool> stem;    ///< and the rules beside the channel meet it there
    std::vector<bool> covered; ///< a pair reaches from the column into the next
};

class Picture {
public:
    Picture(const EditReport& report, const Console& console);
    [[nodiscard]] String text();

private:
    [[nodiscard]] int columnOf(double time) const;
    [[nodiscard]] String gutter(std::string_view name) const;
    void addLine(std::string_view name, const Row& row);
    void addRuler();
    void addCues();
    void addRule(const Lanes* above, const Lanes* below);
    Lanes addChannel(const ChannelReport& channel);
    void drawPair(const ChannelReport& channel, size_t index, Row& row, Lanes& lanes);
    void drawTransition(const PairReport& pair, Row& row, Lanes& lanes);
    void drawFill(const PairReport& pair, int from, int to, Ink ink, Row& row);
    [[nodiscard]] Ink inkOf(const ChannelReport& channel, const SourceReport& source, size_t index) const;
    void addLegend();

    const EditReport& m_report;
    const Console& m_console;
    const Signs& m_signs;
    std::vector<String> m_labels; ///< of the sources
    int m_nameColumns = 2;
    int m_columns = 0; ///< of the body
    bool m_showsCut = false;
    bool m_showsDense = false;
    bool m_showsBlack = false;
    bool m_showsFade = false;
    bool m_showsGap = false;
    String m_text;
};

Picture::Picture(const EditReport& report, const Console& console)
    : m_report(report), m_console(console), m_signs(console.utf8() ? kUtf8Signs : kAsciiSigns) {
    for (const SourceReport& source : report.sources) {
        m_labels.push_back(sourceLabel(source, console));
    }
    for (const ChannelReport& channel : report.channels) {
        if (!channel.isLevels()) {
            m_nameColumns = std::max(m_nameColumns, safe_text::columns(console.safe(channel.name)));
        }
    }
    m_nameColumns = std::min(m_nameColumns, kWidestChannelName);
    m_columns = console.width() - m_nameColumns - 3;
}

int Picture::columnOf(double time) const {
    const double place = (time - m_report.start) / m_report.duration();
    return std::clamp(static_cast<int>(std::lround(place * (m_columns - 1))), 0, m_columns - 1);
}

String Picture::gutter(std::string_view name) const {
    const String text = safe_text::padded(m_console.safe(name), m_nameColumns, m_console.ellipsis());
    return " " + (name.empty() ? text : m_console.inked(Ink::Bold, text)) + "  ";
}

void Picture::addLine(std::string_view name, const Row& row) {
    const String body = row.text(m_console);
    if (name.empty() && body.empty()) {
        return;
    }
    m_text += gutter(name) + body + "\n";
}

void Picture::addRuler() {
    Row row(m_columns);
    for (const RulerMark& mark : rulerMarks(m_report, m_columns)) {
        const int column = columnOf(mark.time);
        row.set(column, m_signs.rules[kDown], Ink::Dim);
        row.setText(column + 1, mark.label, Ink::Dim);
    }
    addLine("", row);
}

void Picture::addCues() {
    if (m_report.cues.empty()) {
        return;
    }
    Row row(m_columns);
    for (const CueReport& cue : m_report.cues) {
        if (cue.time >= m_report.start && cue.time <= m_report.end) {
            row.set(columnOf(cue.time), m_signs.cue, Ink::Cue);
        }
    }
    for (const CueReport& cue : m_report.cues) {
        // A marker's text stands beside it only where it is whole and touches no other.
        const String label = m_console.safe(cue.text);
        const int room = safe_text::columns(label) + 2;
        const int column = columnOf(cue.time);
        if (row.blank(column + 1, column + room)) {
            row.setText(column + 2, label, Ink::Cue);
        } else if (column >= room && row.blank(column - room, column)) {
            row.setText(column - room + 1, label, Ink::Cue);
        }
    }
    addLine("", row);
}

void Picture::addRule(const Lanes* above, const Lanes* below) {
    Row row(m_columns);
    const auto has = [](const Lanes* lanes, std::vector<bool> Lanes::*which, int column) {
        return lanes != nullptr && column >= 0 && (lanes->*which)[static_cast<size_t>(column)];
    };
    for (int i = 0; i < m_columns; ++i) {
        unsigned sign = 0;
        sign += has(above, &Lanes::stem, i) ? kUp : 0;
        sign += has(below, &Lanes::stem, i) ? kDown : 0;
        sign += has(above, &Lanes::covered, i - 1) || has(below, &Lanes::covered, i - 1) ? kLeft : 0;
        sign += has(above, &Lanes::covered, i) || has(below, &Lanes::covered, i) ? kRight : 0;
        if (sign != 0) {
            row.set(i, m_signs.rules[sign], Ink::Dim);
        }
    }
    addLine("", row);
}

Ink Picture::inkOf(const ChannelReport& channel, const SourceReport& source, size_t index) const {
    if (source.kind == SourceKind::Black) {
        return Ink::Black;
    }
    if (!source.problem.empty()) {
        return Ink::Error;
    }
    if (channel.type == AudioChan) {
        return index % 2 == 0 ? Ink::Audio : Ink::AudioOther;
    }
    if (channel.subtype == Edit_Chan_SubType::ALIAS || source.kind == SourceKind::Effect) {
        return Ink::Effect;
    }
    return index % 2 == 0 ? Ink::Video : Ink::VideoOther;
}

void Picture::drawFill(const PairReport& pair, int from, int to, Ink ink, Row& row) {
    for (int i = from; i < to; ++i) {
        row.set(i, ink == Ink::Black ? m_signs.black : " ", ink);
    }
    int first = from;
    int last = to;
    if (pair.fadeIn > 0) {
        first = std::clamp(columnOf(pair.in + pair.fadeIn), from + 1, to);
    }
    if (pair.fadeOut > 0) {
        last = std::clamp(columnOf(pair.out - pair.fadeOut), first, std::max(first, to - 1));
    }
    for (int i = from; i < first; ++i) {
        row.set(i, m_signs.fadeIn, ink);
    }
    for (int i = last; i < to; ++i) {
        row.set(i, m_signs.fadeOut, ink);
    }
    m_showsFade = m_showsFade || first > from || last < to;
    m_showsBlack = m_showsBlack || ink == Ink::Black;
    const String label = pair.effect.empty() ? m_labels[pair.source] : effectLabel(pair);
    const int room = last - first;
    // Black is known by its shade; a part of the word would hide it.
    if (ink == Ink::Black && safe_text::columns(label) > room) {
        return;
    }
    const bool spaced = room > safe_text::columns(label) + 1;
    // In a narrow pair every column is worth a letter.
    row.setText(first + (spaced ? 1 : 0),
                safe_text::fitted(label, room, room < kRoomForEllipsis ? "" : m_console.ellipsis()), ink);
}

// Its ends are the clips' too: they bear its sign, so that it is seen however short it is.
void Picture::drawTransition(const PairReport& pair, Row& row, Lanes& lanes) {
    const int in = columnOf(pair.in);
    const int out = columnOf(pair.out);
    for (int i = in; i <= out; ++i) {
        row.set(i, m_signs.fadeIn, Ink::Effect);
        lanes.covered[static_cast<size_t>(i)] = lanes.covered[static_cast<size_t>(i)] || i < out;
    }
    for (const int column : {in, out}) {
        lanes.edge[static_cast<size_t>(column)] = lanes.stem[static_cast<size_t>(column)] = true;
    }
    const String label = " " + transitionText(pair) + " ";
    if (const int room = out - in - 1; safe_text::columns(label) <= room) {
        row.setText(in + 1 + (room - safe_text::columns(label)) / 2, label, Ink::Effect);
    }
    m_showsFade = true;
}

void Picture::drawPair(const ChannelReport& channel, size_t index, Row& row, Lanes& lanes) {
    const PairReport& pair = channel.pairs[index];
    if (pair.isTransition) {
        drawTransition(pair, row, lanes);
        return;
    }
    if (m_report.frames(pair.in) == m_report.frames(pair.out)) {
        return; // seen under transitions only
    }
    const int in = columnOf(pair.in);
    const int out = columnOf(pair.out);
    const bool narrow = in == out;
    for (int i = in; i < out; ++i) {
        lanes.covered[static_cast<size_t>(i)] = true;
    }
    for (const int column : {in, out}) {
        const bool dense = narrow && lanes.edge[static_cast<size_t>(column)];
        if (dense || !lanes.edge[static_cast<size_t>(column)]) {
            row.set(column, dense ? m_signs.denseCut : m_signs.cut, Ink::Dim);
        }
        m_showsDense = m_showsDense || dense;
        lanes.edge[static_cast<size_t>(column)] = true;
        lanes.stem[static_cast<size_t>(column)] = !dense;
    }
    m_showsCut = true;
    m_showsGap = m_showsGap || (index > 0 && channel.pairs[index - 1].out + 1e-6 < pair.in);
    const Ink ink = inkOf(channel, m_report.sources[pair.source], index);
    if (out > in + 1) {
        drawFill(pair, in + 1, out, ink, row);
    } else if (ink == Ink::Black) {
        // Black is never too short to be seen: it takes the place of its cut.
        row.set(in, m_signs.black, ink);
        m_showsBlack = true;
    }
}

Lanes Picture::addChannel(const ChannelReport& channel) {
    Lanes lanes(static_cast<size_t>(m_columns));
    Row row(m_columns);
    for (size_t i = 0; i < channel.pairs.size(); ++i) {
        drawPair(channel, i, row, lanes);
    }
    addLine(channel.name.empty() ? "?" : channel.name, row);
    return lanes;
}

void Picture::addLegend() {
    std::vector<String> parts;
    const auto add = [&](bool shown, const char* sign, const char* meaning) {
        if (shown) {
            parts.push_back(String(sign) + " " + meaning);
        }
    };
    add(m_showsCut, m_signs.cut, "cut");
    add(m_showsDense, m_signs.denseCut, "several cuts");
    add(m_showsBlack, m_signs.black, "black");
    add(m_showsFade, m_signs.fadeIn, "fade or transition");
    add(m_showsGap, "blank", "gap");
    add(!m_report.cues.empty(), m_signs.cue, "marker");
    String line;
    const auto finish = [&] {
        m_text += gutter("") + m_console.inked(Ink::Dim, line) + "\n";
        line.clear();
    };
    for (const String& part : parts) {
        if (!line.empty() && safe_text::columns(line) + 3 + safe_text::columns(part) > m_columns) {
            finish();
        }
        line += (line.empty() ? "" : "   ") + part;
    }
    finish();
}

String Picture::text() {
    addRuler();
    addCues();
    Lanes above(0);
    bool first = true;
    String rows;
    for (const ChannelReport& channel : m_report.channels) {
        if (channel.isLevels()) {
            continue;
        }
        // The rule between two channels depends on both, so the lower one is drawn before it.
        rows.swap(m_text);
        m_text.clear();
        Lanes lanes = addChannel(channel);
        rows.swap(m_text);
        addRule(first ? nullptr : &above, &lanes);
        m_text += rows;
        rows.clear();
        above = std::move(lanes);
        first = false;
    }
    addRule(&above, nullptr);
    addLegend();
    return std::move(m_text);
}

/// The parts that are not empty, joined into lines of at most `width` columns.
String joined(const std::vector<String>& parts, const char* separator, int width) {
    String lines;
    String line;
    for (const String& part : parts) {
        if (part.empty()) {
            continue;
        }
        const String longer = line.empty() ? " " + part : line + separator + part;
        if (!line.empty() && safe_text::columns(longer) > width) {
            lines += line + "\n";
            line = " " + part;
        } else {
            line = longer;
        }
    }
    return lines + line + "\n";
}

} // namespace

String sourceLabel(const SourceReport& source, const Console& console) {
    if (!source.problem.empty()) {
        return "missing " + source.strip.asString();
    }
    if (source.kind != SourceKind::Black && source.kind != SourceKind::Effect &&
        source.kind != SourceKind::Input) {
        return source.name.empty() ? source.strip.asString() : console.safe(source.name);
    }
    return sourceKindText(source.kind);
}

String effectLabel(const PairReport& pair) {
    return pair.isTransition ? transitionText(pair) : pair.effect.lower();
}

String trackPicture(const EditReport& report, const Console& console) {
    if (!(report.duration() > 0)) {
        return " The edit has no events.\n";
    }
    return Picture(report, console).text();
}

String editSummary(const EditReport& report, const Console& console) {
    size_t video = 0;
    size_t audio = 0;
    size_t effects = 0;
    for (const ChannelReport& channel : report.channels) {
        audio += channel.type == AudioChan;
        effects += channel.type == VideoChan && channel.subtype == Edit_Chan_SubType::ALIAS;
        video += channel.type == VideoChan && channel.subtype != Edit_Chan_SubType::ALIAS;
    }
    std::vector<String> parts = {report.item.asString(), Edit::log_type_string_get_ms(report.type),
                                 report.rate.asString() + " fps",
                                 report.recordTimecode(report.start) + (console.utf8() ? " – " : " to ") +
                                     report.recordTimecode(report.end),
                                 report.lengthText(report.duration()) + " long"};
    const auto add = [&](size_t count, const char* kind) {
        if (count > 0) {
            parts.push_back(String::format("%zu %s", count, kind));
        }
    };
    add(effects, "effects");
    add(video, "video");
    add(audio, "audio");
    if (report.channels.empty()) {
        parts.push_back("no channels");
    }
    const String lines = joined(parts, console.utf8() ? " · " : ", ", console.width() - 1);
    String name = report.name.empty() ? String("(no name)") : console.safe(report.name);
    if (console.fitted()) {
        name = safe_text::fitted(name, console.width() - 1, console.ellipsis());
    }
    return " " + console.inked(Ink::Bold, name) + "\n" + lines;
}
