#include "interchange/edl/detail/edl_export_notes.h"

#include "interchange/edl/detail/edl_line.h"
#include "interchange/edl/detail/edl_note.h"
#include "interchange/edl/edl_writer.h"
#include "platform/base/text_lines.h"

#include <algorithm>
#include <cmath>

namespace interchange::detail {

namespace {

// An import cuts names that are longer than 1000 bytes.
constexpr size_t kLongName = 990;

void append(String& notes, std::string_view line) {
    if (!line.empty()) {
        notes += notes.empty() ? "" : "\n";
        notes += line;
    }
}

const String& firstOf(const String& a, const String& b, const String& c) {
    return !a.empty() ? a : (!b.empty() ? b : c);
}

double velocityOf(const EdlEvent& event, Qx::FrameRate rate) {
    return event.speed ? event.speed->framesPerSecond / rate.nominal() : 1.0;
}

bool sameSpeed(const EdlEvent& read, const EdlEvent& meant, Qx::FrameRate rate) {
    if (!meant.speed) {
        return velocityOf(read, rate) == 1.0;
    }
    const bool same = read.speed && read.speed->digits == meant.speed->digits;
    return same && (read.speed->framesPerSecond >= 0 || read.speed->at == meant.speed->at);
}

bool sameNames(const EdlEvent& read, const ExportLine& meant) {
    // What a line of no length names plays in the event before it.
    if (meant.source == nullptr || meant.source->black || meant.event.recordIn == meant.event.recordOut) {
        return true;
    }
    const String& sourceFile = meant.source->sourceFile;
    const String& name = firstOf(meant.name, sourceFile, meant.event.reel);
    const String& readName = firstOf(read.clipName, read.sourceFile, read.reel);
    const bool same = readName == name || (name.size() > kLongName && readName.starts_with(name));
    return same && read.sourceFile == sourceFile;
}

bool sameLine(const EdlEvent& read, const ExportLine& meant, Qx::FrameRate rate) {
    const EdlEvent& event = meant.event;
    return read.number == event.number && read.reel == event.reel && read.channels == event.channels &&
           read.typeText() == event.typeText() && read.sourceIn == event.sourceIn &&
           read.recordOut - read.recordIn == event.recordOut - event.recordIn &&
           sameSpeed(read, event, rate) && sameNames(read, meant);
}

bool readsAsMeant(const std::vector<ExportLine>& lines, Qx::FrameRate rate) {
    EdlList list;
    list.rate = rate;
    for (const ExportLine& line : lines) {
        list.events.push_back(line.event);
    }
    EdlList read;
    LossReport report;
    if (!readEdl(edlText(list), rate, read, report) || read.events.size() != lines.size()) {
        return false;
    }
    for (size_t i = 0; i < lines.size(); ++i) {
        if (!sameLine(read.events[i], lines[i], rate)) {
            return false;
        }
    }
    return true;
}

void appendNames(String& notes, const ExportLine& line, const char* keyword) {
    if (line.source == nullptr || line.source->black) {
        return;
    }
    if (!line.name.empty()) {
        append(notes, String(keyword) + line.name);
    }
    if (!line.source->sourceFile.empty()) {
        append(notes, "* SOURCE FILE: " + line.source->sourceFile);
    }
}

void appendSpeed(String& notes, const EdlEvent& event, Qx::FrameRate rate) {
    if (event.speed) {
        append(notes, edlSpeedNote(event.reel, event.speed->digits, event.speed->at, rate, event.sourceDrop));
        if (event.freeze) {
            append(notes, "* * FREEZE FRAME");
        }
    }
}

// Notes on what the lines say besides their fields, which stand below the last line.
String statedNotes(const std::vector<ExportLine>& lines, Qx::FrameRate rate) {
    const ExportLine& last = lines.back();
    String notes = edlAudioNote(last.event.channels);
    for (const ExportLine& line : lines) {
        appendSpeed(notes, line.event, rate);
    }
    const char* own = "* FROM CLIP NAME: ";
    if (lines.size() > 1) {
        appendNames(notes, lines.front(), own);
        own = last.event.type == EdlType::Key || last.event.type == EdlType::KeyOut ? "* KEY CLIP NAME: "
                                                                                    : "* TO CLIP NAME: ";
    }
    appendNames(notes, last, own);
    if (last.source != nullptr && !last.source->mediaPath.empty()) {
        append(notes, (lines.size() > 1 ? "* TO FILE: " : "* FROM FILE: ") + last.source->mediaPath);
    }
    return notes;
}

// The notes in two parts: those that stand above the event, and those on things that its lines do not say.
void sortNotes(const String& notes, String& above, String& others) {
    Qx::forEachLine(notes, [&](std::string_view line) {
        const NoteKind kind = parseNote(line).kind;
        if (kind == NoteKind::Split) {
            append(above, line);
        } else if (kind == NoteKind::Other || kind == NoteKind::Marker || kind == NoteKind::EffectName) {
            append(others, line);
        }
    });
}

} // namespace

bool isWritableNote(std::string_view line) {
    const std::string_view text = trimBlanks(line);
    const bool control = std::any_of(line.begin(), line.end(), [](char c) {
        return (static_cast<unsigned char>(c) < 0x20 && c != '\t') || c == 0x7F;
    });
    const size_t digits = std::min(text.find_first_not_of("0123456789"), text.size());
    const bool event = digits > 0 && (digits == text.size() || text[digits] == ' ' || text[digits] == '\t');
    const String start = String(text.substr(0, 6)).upper();
    return !text.empty() && !control && !event && start != "TITLE:" && !start.starts_with("FCM:") &&
           !start.starts_with(">>>");
}

String writableNotes(std::string_view lines) {
    String notes;
    Qx::forEachLine(lines, [&](std::string_view line) {
        if (isWritableNote(line)) {
            append(notes, line);
        }
    });
    return notes;
}

bool speedIs(const String& digits, double velocity, Qx::FrameRate rate) {
    double value = 0;
    std::string_view plain = digits;
    plain.remove_prefix(digits.starts_with('+') ? 1 : 0);
    return Qx::textToDouble(plain, value) && std::abs(value / rate.nominal() - velocity) < 1e-9;
}

bool settleNotes(std::vector<ExportLine>& lines, Qx::FrameRate rate) {
    if (readsAsMeant(lines, rate)) {
        return true;
    }
    const String stated = statedNotes(lines, rate);
    for (ExportLine& line : lines) {
        String above;
        String others;
        sortNotes(line.event.notes, above, others);
        line.event.notes = above;
        if (&line == &lines.back()) {
            append(line.event.notes, stated);
        }
        append(line.event.notes, others);
    }
    return readsAsMeant(lines, rate);
}

} // namespace interchange::detail
