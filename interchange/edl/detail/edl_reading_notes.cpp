#include "interchange/edl/detail/edl_reading.h"
#include "platform/media/timecode.h"

#include <algorithm>
#include <cmath>

// What the lines between the events say of them.
namespace interchange::detail {

namespace {

constexpr double kGreatestSpeed = 99'999; // frames a second

} // namespace

void EdlReader::readNote(std::string_view line) {
    const Note note = parseNote(line);
    if (note.kind == NoteKind::Split) {
        // It belongs to the two event lines below.
        m_splits.push_back({m_line, m_list.events.size(), String(line)});
        return;
    }
    keepNote(line);
    if (!m_list.events.empty()) {
        applyNote(note);
    }
}

void EdlReader::keepNote(std::string_view line) {
    String& notes = m_list.events.empty() ? m_list.notes : last().notes;
    if (!notes.empty()) {
        notes += '\n';
    }
    notes += line;
}

void EdlReader::applyNote(const Note& note) {
    switch (note.kind) {
    case NoteKind::FromClipName:
        nameFrom(note.value);
        break;
    case NoteKind::ToClipName:
    case NoteKind::KeyClipName:
        nameTo(note.value);
        break;
    case NoteKind::MediaFrom:
        (paired() && !outgoing().isBlack() ? outgoing() : last()).mediaPath = note.value;
        break;
    case NoteKind::MediaTo:
        last().mediaPath = note.value;
        break;
    case NoteKind::SourceFile:
        applySourceFile(note.value);
        break;
    case NoteKind::FullReel:
        applyFullReel(note.value);
        break;
    case NoteKind::Marker:
        applyMarker(note.value);
        break;
    case NoteKind::FreezeFrame:
        last().freeze = true;
        break;
    case NoteKind::Audio:
        applyAudio(note.value);
        break;
    case NoteKind::Speed:
        applySpeed(note.value);
        break;
    case NoteKind::EffectName:
        last().effectName = note.value;
        break;
    case NoteKind::Split:
    case NoteKind::Other:
        break;
    }
}

// Below a transition the name of a FROM note is the outgoing side's; black has no clip, so there it can only
// mean the other side.
void EdlReader::nameFrom(std::string_view text) {
    m_sourceForIncoming = false;
    if (paired() && !outgoing().isBlack()) {
        if (outgoing().clipName.empty()) {
            outgoing().clipName = text;
        }
        return;
    }
    m_sourceForIncoming = true;
    if (last().clipName.empty()) {
        last().clipName = text;
        m_nameIsFrom = true;
    }
}

void EdlReader::nameTo(std::string_view text) {
    m_sourceForIncoming = true;
    if (last().clipName.empty() || (m_nameIsFrom && last().type != EdlType::Cut)) {
        last().clipName = text;
        m_nameIsFrom = false;
    }
}

void EdlReader::applySourceFile(std::string_view text) {
    const bool toOutgoing = paired() && !m_sourceForIncoming && !outgoing().isBlack();
    EdlEvent& side = toOutgoing && outgoing().sourceFile.empty() ? outgoing() : last();
    if (side.sourceFile.empty()) {
        side.sourceFile = text;
    }
    m_sourceForIncoming = true;
}

void EdlReader::applyFullReel(std::string_view value) {
    constexpr std::string_view replaced = "REPLACED BY:";
    const size_t at = value.find(replaced);
    if (at == std::string_view::npos) {
        return;
    }
    const String shortName = String(trimBlanks(value.substr(at + replaced.size())));
    const String longName = String(trimBlanks(value.substr(0, at)));
    EdlEvent* sides[] = {&last(), paired() ? &outgoing() : nullptr};
    for (EdlEvent* side : sides) {
        if (side != nullptr && side->reel == shortName && side->sourceFile.empty()) {
            side->sourceFile = longName;
        }
    }
}

void EdlReader::applyAudio(std::string_view value) {
    EdlChannels channels = 0;
    while (!value.empty()) {
        const std::string_view word = takeWord(value);
        const int number = digitsValue(word);
        if (number < 1 || number > kMaxEdlAudio) {
            m_report.addWarning(m_line, "AUD names channel " + quotedText(word) + ", which is left out");
            continue;
        }
        channels |= edlAudio(number);
    }
    last().channels |= channels;
    if (paired()) {
        outgoing().channels |= channels;
    }
}

void EdlReader::applySpeed(std::string_view value) {
    splitFields(value, m_fields);
    EdlSpeed speed;
    speed.line = m_line;
    const size_t count = m_fields.size();
    std::string_view digits = count >= 3 ? m_fields[count - 2] : std::string_view();
    if (digits.starts_with('+')) {
        digits.remove_prefix(1);
    }
    const bool plain = digits.find_first_not_of("0123456789.-") == std::string_view::npos;
    Qx::TimecodeFields fields;
    if (!plain || digits.size() > 16 || !Qx::textToDouble(digits, speed.framesPerSecond) ||
        std::abs(speed.framesPerSecond) > kGreatestSpeed ||
        !Qx::parseTimecode(m_fields[count - 1], m_list.rate, fields)) {
        m_report.addWarning(m_line, "M2 does not read as reel, frames a second and timecode; normal speed is "
                                    "taken");
        return;
    }
    speed.digits = m_fields[count - 2];
    const char* const start = m_fields[0].data();
    speed.reel =
        std::string_view(start, size_t(m_fields[count - 3].data() - start) + m_fields[count - 3].size());
    const bool drop = !fields.dropSeparator && !fields.nonDropSeparator
                          ? last().sourceDrop
                          : resolveDrop(fields.dropSeparator, fields.nonDropSeparator);
    speed.at = Qx::timecodeFrames(fields, m_list.rate, drop);
    m_speeds.push_back(std::move(speed));
}

void EdlReader::giveSpeed(EdlEvent& event, EdlSpeed speed) {
    if (event.speed) {
        m_report.addWarning(speed.line, "a second M2 for one event is not used");
    } else {
        event.speed = std::move(speed);
    }
}

// The sides of a transition take the speeds by reel; where both are of one reel, by order. A single one is
// then the incoming side's if only that side can have a speed: the other has no length, or the durations of
// this one differ.
void EdlReader::placeSpeeds() {
    for (size_t i = 0; i < m_speeds.size(); ++i) {
        EdlSpeed& speed = m_speeds[i];
        bool toOutgoing = false;
        if (paired()) {
            const EdlEvent& from = outgoing();
            const EdlEvent& to = last();
            if (from.reel != to.reel) {
                toOutgoing = speed.reel == from.reel;
            } else if (m_speeds.size() > 1) {
                toOutgoing = i == 0;
            } else {
                toOutgoing = from.recordIn != from.recordOut &&
                             to.sourceOut - to.sourceIn == to.recordOut - to.recordIn;
            }
        }
        giveSpeed(toOutgoing ? outgoing() : last(), std::move(speed));
    }
    m_speeds.clear();
}

void EdlReader::applyMarker(std::string_view value) {
    const std::string_view time = takeWord(value);
    Qx::TimecodeFields fields;
    if (Qx::Status status = Qx::parseTimecode(time, m_list.rate, fields); !status) {
        m_report.addWarning(m_line, "LOC is kept as text: " + status.reason());
        return;
    }
    EdlMarker marker;
    marker.line = m_line;
    marker.event = m_list.events.size() - 1;
    const bool drop = !fields.dropSeparator && !fields.nonDropSeparator
                          ? last().recordDrop
                          : resolveDrop(fields.dropSeparator, fields.nonDropSeparator);
    marker.at = Qx::timecodeFrames(fields, m_list.rate, drop);
    std::string_view rest = value;
    const std::string_view colour = takeWord(rest);
    const bool isColour = !colour.empty() && std::all_of(colour.begin(), colour.end(),
                                                         [](char c) { return c >= 'A' && c <= 'Z'; });
    marker.colour = isColour ? colour : std::string_view();
    marker.text = isColour ? rest : value;
    m_list.markers.push_back(std::move(marker));
}

} // namespace interchange::detail
