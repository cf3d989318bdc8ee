#include "interchange/edl/edl_export.h"

#include "interchange/edl/detail/edl_clips.h"
#include "interchange/edl/detail/edl_export_notes.h"
#include "interchange/edl/detail/edl_line.h"
#include "interchange/edl/detail/edl_markers.h"
#include "interchange/edl/detail/edl_note.h"
#include "interchange/edl/edl_writer.h"
#include "platform/media/timecode.h"
#include "platform/services/atomic_file.h"
#include "platform/services/current_project.h"
#include "platform/store/configb.h"

#include <algorithm>
#include <cmath>
#include <optional>
#include <unordered_map>

namespace interchange {

namespace {

using detail::EdlSource;
using detail::ExportClip;
using detail::ExportLine;
using detail::kNoRecord;

constexpr size_t kMostThreeDigitEvents = 999;
constexpr size_t kNoClip = SIZE_MAX;
constexpr size_t kLongNumber = 6;

/// What the text of a kept record says of its type. A text that is none is a cut.
struct KeptType {
    EdlType type = EdlType::Cut;
    int wipe = 0;
    int duration = 0; ///< frames
    [[nodiscard]] bool isTransition() const { return type == EdlType::Dissolve || type == EdlType::Wipe; }
    [[nodiscard]] bool isKey() const { return type == EdlType::Key || type == EdlType::KeyOut; }
};

KeptType keptType(const String& text) {
    detail::EdlLine parsed;
    std::vector<std::string_view> fields;
    const String line = "1 X V " + text + " 0 0 0 0";
    KeptType kept;
    if (detail::parseEventLine(line, fields, parsed)) {
        kept = {parsed.event.type, parsed.event.wipe, parsed.event.duration};
    }
    return kept;
}

/// What stands above a clip in one event with it: nothing, a line of no length, or another clip.
struct Lead {
    KeptType type; ///< of the clip below
    bool zeroLength = false;
    bool named = false;     ///< the record before the clip's is that of the line of no length
    bool asWritten = false; ///< which says what it said in the list
    size_t clip = kNoClip;
};

class EdlExporter {
public:
    EdlExporter(const Edit& edit, const EdlExportOptions& options, LossReport& report);
    Qx::Status run(String& text);

private:
    void takeRecords();
    Qx::Status checkProgramme();
    void findLeads();
    void findTransition(size_t clip);
    void findKey(size_t clip, const KeptType& type);
    void dropForeground(ExportClip& clip);
    [[nodiscard]] bool isOutgoingAsWritten(const ExportClip& clip, const EdlRecord& outgoing) const;
    [[nodiscard]] size_t clipOfRecord(size_t record) const;
    void addEvents();
    void addEvent(size_t clip);
    void addLead(std::vector<ExportLine>& lines, const ExportClip& clip, const Lead& lead);
    void addCues();
    [[nodiscard]] bool isAsImported(const ExportClip& clip) const;
    [[nodiscard]] ExportLine lineOf(const ExportClip& clip, const EdlSource& source) const;
    [[nodiscard]] String numberOf(const ExportClip& clip);
    void keepNotes(ExportLine& line, size_t record, bool first);
    void checkSplits();
    void tidyNumbers();

    const Edit& m_edit;
    const EdlExportOptions& m_options;
    LossReport& m_report;
    Qx::FrameRate m_rate;
    bool m_drop = false;
    int64_t m_start = 0;
    std::vector<EdlRecord> m_records;
    std::vector<ExportClip> m_clips;
    detail::EdlSources m_sources;
    std::optional<detail::EdlMarkers> m_markers;
    std::vector<Lead> m_leads;                           ///< of each clip
    std::vector<bool> m_isLead;                          ///< clips that stand above another one
    std::vector<size_t> m_firstOfRecord;                 ///< the first clip of each record
    std::unordered_multimap<int64_t, size_t> m_byEnd;    ///< clips by their record out
    std::vector<bool> m_recordUsed;                      ///< records whose number and markers were given back
    std::vector<size_t> m_eventRecord;                   ///< the record of each line of the list
    std::vector<std::pair<size_t, int64_t>> m_cuesBelow; ///< lines, and the time before which cues are theirs
    size_t m_numEvents = 0;
    int m_greatestNumber = 0;
    EdlList m_list;
};

EdlExporter::EdlExporter(const Edit& edit, const EdlExportOptions& options, LossReport& report)
    : m_edit(edit), m_options(options), m_report(report), m_rate(edit.getFrameRate()),
      m_sources(edit, m_rate, options, report) {
    m_drop = edit.isDropFrame(Qx::currentProject().dropFrame);
    const int64_t day = Qx::framesPerDay(m_rate, m_drop);
    m_start = edit.getStartTimecode();
    m_start = day > 0 ? ((m_start % day) + day) % day : 0;
}

// Texts in a header may come from anywhere: numbers are digits, and a reel is one word.
void EdlExporter::takeRecords() {
    m_records = unpackEdlRecords(m_edit.Opts().getString(EdlKey::kEvents));
    for (EdlRecord& record : m_records) {
        const int number = record.number.size() <= kLongNumber ? detail::digitsValue(record.number) : -1;
        if (number < 0) {
            record.number.clear();
        }
        m_greatestNumber = std::max(m_greatestNumber, number);
        record.reel = detail::oneLine(record.reel);
    }
    m_recordUsed.assign(m_records.size(), false);
}

Qx::Status EdlExporter::checkProgramme() {
    const String name = m_edit.get_cookie_str();
    if (m_clips.empty()) {
        return Qx::Status::failure("edit " + name +
                                   " has no clip that a list can hold, and a list without events cannot be "
                                   "read; there is nothing to export");
    }
    int64_t end = 0;
    for (const ExportClip& clip : m_clips) {
        end = std::max(end, clip.recordOut);
    }
    if (m_clips.front().recordIn < 0 || end > Qx::framesPerDay(m_rate, m_drop)) {
        return Qx::Status::failure("edit " + name +
                                   (m_clips.front().recordIn < 0
                                        ? " begins before its time 0"
                                        : " is longer than the 24 hours of timecode") +
                                   "; export it in parts");
    }
    if (m_clips.size() > kMaxEdlEvents) {
        return Qx::Status::failure("edit " + name + " has more than 999999 events; export it in parts");
    }
    if (m_clips.front().recordIn > 0) {
        m_report.addLoss(0, String::format("the programme begins with a gap of %lld frames; a list begins "
                                           "with its first event",
                                           static_cast<long long>(m_clips.front().recordIn)));
    }
    return {};
}

// The first clip that came from a record, unless it stands above another one already.
size_t EdlExporter::clipOfRecord(size_t record) const {
    const size_t clip = m_firstOfRecord[record];
    return clip == kNoClip || m_isLead[clip] ? kNoClip : clip;
}

// True if the line of no length above a transition says what gives way to it. It may name a frame that a clip which
// plays as it was imported does not quite reach.
bool EdlExporter::isOutgoingAsWritten(const ExportClip& clip, const EdlRecord& outgoing) const {
    const detail::ExportTransition& transition = clip.transition;
    if (transition.outgoing == detail::kNoSource) {
        return outgoing.reel == "BL" || outgoing.reel == "BLACK";
    }
    if (m_sources[transition.outgoing].reel != outgoing.reel || !outgoing.times) {
        return false;
    }
    if (outgoing.times->shown == transition.outgoingFrame) {
        return true;
    }
    const auto [first, last] = m_byEnd.equal_range(clip.recordIn);
    return std::any_of(first, last, [&](const auto& place) {
        const ExportClip& before = m_clips[place.second];
        return (before.channels & clip.channels) != 0 && before.source == transition.outgoing &&
               before.sourceNext() == transition.outgoingFrame && isAsImported(before);
    });
}

void EdlExporter::findTransition(size_t index) {
    const ExportClip& clip = m_clips[index];
    const detail::ExportTransition& transition = clip.transition;
    const size_t record = clip.record;
    Lead& lead = m_leads[index];
    lead.type = {transition.type, transition.wipe, static_cast<int>(transition.length)};
    lead.zeroLength = true;
    const bool isPair = record != kNoRecord && record > 0 && m_firstOfRecord[record] == index &&
                        keptType(m_records[record].typeText).isTransition() &&
                        m_records[record - 1].number == m_records[record].number &&
                        m_records[record - 1].typeText == "C";
    if (!isPair) {
        return;
    }
    if (m_records[record - 1].events.empty()) {
        lead.named = true;
        lead.asWritten = isOutgoingAsWritten(clip, m_records[record - 1]);
        return;
    }
    const size_t above = clipOfRecord(record - 1);
    if (above != kNoClip && m_clips[above].recordOut == clip.recordIn &&
        m_clips[above].source == transition.outgoing &&
        m_clips[above].sourceNext() == transition.outgoingFrame) {
        lead.zeroLength = false;
        lead.clip = above;
        m_isLead[above] = true;
    }
}

void EdlExporter::findKey(size_t index, const KeptType& type) {
    ExportClip& clip = m_clips[index];
    if ((clip.channels & kEdlPicture2) == 0) {
        return;
    }
    const size_t background = clipOfRecord(clip.record - 1);
    if (background == kNoClip || (m_clips[background].channels & kEdlPicture) == 0) {
        dropForeground(clip);
        return;
    }
    clip.channels = (clip.channels & ~kEdlPicture2) | kEdlPicture;
    m_isLead[background] = true;
    m_leads[index].type = type;
    m_leads[index].clip = background;
}

void EdlExporter::dropForeground(ExportClip& clip) {
    if ((clip.channels & kEdlPicture2) != 0) {
        m_report.addLoss(0, "the foreground of a key at " +
                                Qx::timecodeText(m_start + clip.recordIn, m_rate, m_drop) +
                                " is left out, as it or its background has changed");
        clip.channels &= ~kEdlPicture2;
    }
}

void EdlExporter::findLeads() {
    m_leads.assign(m_clips.size(), {});
    m_isLead.assign(m_clips.size(), false);
    m_firstOfRecord.assign(m_records.size(), kNoClip);
    for (size_t i = 0; i < m_clips.size(); ++i) {
        m_byEnd.emplace(m_clips[i].recordOut, i);
        if (m_clips[i].record != kNoRecord && m_firstOfRecord[m_clips[i].record] == kNoClip) {
            m_firstOfRecord[m_clips[i].record] = i;
        }
    }
    for (size_t i = 0; i < m_clips.size(); ++i) {
        if (m_clips[i].transition.type != EdlType::Cut) {
            findTransition(i);
            continue;
        }
        const size_t record = m_clips[i].record;
        if (record == kNoRecord || m_firstOfRecord[record] != i) {
            dropForeground(m_clips[i]);
            continue;
        }
        if (const KeptType type = keptType(m_records[record].typeText); type.isKey()) {
            findKey(i, type);
        }
    }
}

// True for the clip of a record that plays what the record says, at its speed and as long.
bool EdlExporter::isAsImported(const ExportClip& clip) const {
    if (clip.record == kNoRecord || !m_records[clip.record].times) {
        return false;
    }
    const EdlRecord& record = m_records[clip.record];
    const bool isBlack = m_sources[clip.source].black;
    const bool sameSpeed =
        isBlack || (record.speedDigits.empty() ? clip.velocity == 1.0
                                               : detail::speedIs(record.speedDigits, clip.velocity, m_rate));
    return sameSpeed && clip.recordOut - clip.recordIn == record.times->length &&
           (isBlack || clip.sourceIn == record.times->shown);
}

ExportLine EdlExporter::lineOf(const ExportClip& clip, const EdlSource& source) const {
    ExportLine line;
    EdlEvent& event = line.event;
    line.source = &source;
    line.name = source.name;
    event.reel = source.reel;
    event.channels = clip.channels;
    event.recordIn = m_start + clip.recordIn;
    event.recordOut = m_start + clip.recordOut;
    event.recordDrop = m_drop;
    event.sourceDrop = source.black ? m_drop : source.drop;
    const int64_t length = clip.recordOut - clip.recordIn;
    event.sourceIn = clip.sourceIn;
    event.sourceOut = clip.sourceIn + length;
    const bool asImported = isAsImported(clip);
    if (asImported) {
        event.sourceIn = m_records[clip.record].times->sourceIn;
        event.sourceOut = m_records[clip.record].times->sourceOut;
    }
    if (clip.velocity == 1.0 || source.black) {
        return line;
    }
    const int64_t span =
        std::max<int64_t>(1, std::llround(std::abs(clip.velocity) * static_cast<double>(length)));
    if (!asImported) {
        event.sourceOut = clip.sourceIn + span;
    }
    if (clip.velocity < 0 && !asImported) {
        event.sourceIn = std::max<int64_t>(0, clip.sourceIn + 1 - span);
        event.sourceOut = clip.sourceIn + 1;
    }
    EdlSpeed speed;
    speed.reel = source.reel;
    speed.digits = edlSpeedDigits(clip.velocity, m_rate);
    speed.at = clip.sourceIn;
    if (clip.record != kNoRecord &&
        detail::speedIs(m_records[clip.record].speedDigits, clip.velocity, m_rate)) {
        speed.digits = m_records[clip.record].speedDigits;
    }
    event.speed = speed;
    event.freeze = clip.velocity == 0.0;
    return line;
}

String EdlExporter::numberOf(const ExportClip& clip) {
    if (clip.record != kNoRecord && !m_recordUsed[clip.record] && !m_records[clip.record].number.empty()) {
        return m_records[clip.record].number;
    }
    return String::format("%03d", ++m_greatestNumber);
}

void EdlExporter::keepNotes(ExportLine& line, size_t record, bool first) {
    if (record == kNoRecord) {
        return;
    }
    // What a transition was called says nothing of the cut in its place.
    const bool wasTransition =
        line.event.type == EdlType::Cut && keptType(m_records[record].typeText).isTransition();
    std::string_view rest = m_records[record].notes;
    while (!rest.empty()) {
        const size_t end = rest.find('\n');
        const std::string_view note = rest.substr(0, end);
        rest.remove_prefix(end == std::string_view::npos ? rest.size() : end + 1);
        const detail::NoteKind kind = detail::parseNote(note).kind;
        const bool once = kind == detail::NoteKind::Marker || kind == detail::NoteKind::Split;
        const bool isStale = wasTransition && kind == detail::NoteKind::EffectName;
        if (!isStale && detail::isWritableNote(note) && (first || !once) && m_markers->keeps(note)) {
            line.event.notes += (line.event.notes.empty() ? "" : "\n") + String(note);
        }
    }
}

void EdlExporter::addLead(std::vector<ExportLine>& lines, const ExportClip& clip, const Lead& lead) {
    if (lead.clip != kNoClip) {
        const ExportClip& above = m_clips[lead.clip];
        ExportLine& line = lines.emplace_back(lineOf(above, m_sources[above.source]));
        line.event.type = lead.type.isKey() ? EdlType::KeyBackground : EdlType::Cut;
        keepNotes(line, above.record, true);
        m_recordUsed[above.record] = true;
        m_eventRecord.push_back(above.record);
        return;
    }
    const detail::ExportTransition& transition = clip.transition;
    ExportLine& line = lines.emplace_back();
    EdlEvent& event = line.event;
    event.reel = "BL";
    event.channels = clip.channels;
    event.sourceIn = event.sourceOut = transition.outgoingFrame;
    event.recordIn = event.recordOut = m_start + clip.recordIn;
    event.recordDrop = m_drop;
    event.sourceDrop = m_drop;
    if (transition.outgoing != detail::kNoSource) {
        line.source = &m_sources[transition.outgoing];
        line.name = line.source->name;
        event.reel = line.source->reel;
        event.sourceDrop = line.source->drop;
    }
    if (lead.asWritten) {
        const EdlRecord& written = m_records[clip.record - 1];
        event.reel = written.reel;
        if (written.times) {
            event.sourceIn = written.times->sourceIn;
            event.sourceOut = written.times->sourceOut;
        }
    }
    keepNotes(line, lead.named ? clip.record - 1 : kNoRecord, true);
    m_eventRecord.push_back(clip.record);
}

void EdlExporter::addEvent(size_t index) {
    const Lead& lead = m_leads[index];
    const ExportClip& clip = m_clips[index];
    std::vector<ExportLine> lines;
    const bool first = clip.record == kNoRecord || !m_recordUsed[clip.record];
    const String number = numberOf(clip);
    if (lead.zeroLength || lead.clip != kNoClip) {
        addLead(lines, clip, lead);
        lines.back().event.role = EdlRole::Outgoing;
    }
    ExportLine& line = lines.emplace_back(lineOf(clip, m_sources[clip.source]));
    line.event.type = lead.type.type;
    line.event.wipe = lead.type.wipe;
    line.event.duration = lead.type.duration;
    keepNotes(line, clip.record, first);
    if (clip.record != kNoRecord) {
        m_recordUsed[clip.record] = true;
    }
    m_eventRecord.push_back(first ? clip.record : kNoRecord);
    for (ExportLine& each : lines) {
        each.event.number = number;
    }
    if (line.event.speed && !detail::speedIs(line.event.speed->digits, clip.velocity, m_rate)) {
        m_report.addLoss(0, "event " + number + ": a speed of x" + Qx::doubleToText(clip.velocity) +
                                " is written as " + line.event.speed->digits + " frames a second");
    }
    if (!detail::settleNotes(lines, m_rate)) {
        m_report.addLoss(0,
                         "event " + number +
                             ": what its lines say reads otherwise than the edit has it; look at its names "
                             "and tracks");
    }
    for (ExportLine& each : lines) {
        m_list.events.push_back(std::move(each.event));
    }
}

void EdlExporter::addEvents() {
    std::vector<size_t> below(m_clips.size(), kNoClip);
    for (size_t i = 0; i < m_clips.size(); ++i) {
        if (m_leads[i].clip != kNoClip) {
            below[m_leads[i].clip] = i;
        }
    }
    for (size_t i = 0; i < m_clips.size(); ++i) {
        // A pair stands where its first line does.
        if (m_leads[i].clip != kNoClip || m_clips[i].channels == 0) {
            continue;
        }
        if (!m_cuesBelow.empty()) {
            m_cuesBelow.back().second = m_clips[i].recordIn;
        }
        addEvent(m_isLead[i] ? below[i] : i);
        m_cuesBelow.emplace_back(m_list.events.size() - 1, INT64_MAX);
        ++m_numEvents;
    }
}

// Cues that no imported line stands for go below the last event that starts at or before them.
void EdlExporter::addCues() {
    for (const auto& [line, until] : m_cuesBelow) {
        const String cues = m_markers->takeBefore(until);
        if (!cues.empty()) {
            String& notes = m_list.events[line].notes;
            notes += (notes.empty() ? "" : "\n") + cues;
        }
    }
}

// A SPLIT tells how much later the second of two lines of one number starts.
void EdlExporter::checkSplits() {
    for (size_t i = 0; i < m_list.events.size(); ++i) {
        EdlEvent& event = m_list.events[i];
        if (!event.notes.starts_with("SPLIT")) {
            continue;
        }
        const size_t end = event.notes.find('\n');
        const size_t equals = event.notes.find('=');
        Qx::TimecodeFields fields;
        bool good =
            i + 1 < m_list.events.size() && m_list.events[i + 1].number == event.number && equals < end;
        if (good) {
            const String value = String(event.notes.substr(equals + 1, end - equals - 1)).trimmed();
            good = Qx::parseTimecode(value, m_rate, fields).isOk() &&
                   m_list.events[i + 1].recordIn - event.recordIn ==
                       Qx::timecodeFrames(fields, m_rate, event.recordDrop);
        }
        if (!good) {
            event.notes.erase(0, end == String::npos ? end : end + 1);
        }
    }
}

// Numbers of an imported list stay as they were written there, unless all become long.
void EdlExporter::tidyNumbers() {
    const bool longNumbers = m_numEvents > kMostThreeDigitEvents;
    size_t width = longNumbers ? kLongNumber : 0;
    for (const EdlEvent& event : m_list.events) {
        width = std::max(width, event.number.size());
    }
    for (size_t i = 0; i < m_list.events.size(); ++i) {
        String& number = m_list.events[i].number;
        if ((m_eventRecord[i] == kNoRecord || longNumbers) && number.size() < width) {
            number.insert(0, width - number.size(), '0');
        }
    }
}

Qx::Status EdlExporter::run(String& text) {
    if (!m_rate.valid()) {
        return Qx::Status::failure("edit " + m_edit.get_cookie_str() +
                                   " has no frame rate; give it one, as timecode needs it");
    }
    takeRecords();
    detail::EdlClips clips(m_edit, m_rate, m_drop, m_start, m_report);
    m_clips = clips.collect(m_records, m_sources);
    if (Qx::Status status = checkProgramme(); !status) {
        return status;
    }
    std::unordered_set<std::string> kept;
    for (const EdlRecord& record : m_records) {
        kept.insert(record.reel);
    }
    m_sources.nameReels(kept);
    m_markers.emplace(m_edit, m_rate, m_drop, m_start, m_report);
    findLeads();
    m_list.rate = m_rate;
    m_list.title = detail::oneLine(m_edit.getName());
    m_list.notes = detail::writableNotes(m_edit.Opts().getString(EdlKey::kNotes));
    addEvents();
    addCues();
    checkSplits();
    tidyNumbers();
    const size_t losses = m_report.losses().size();
    if (m_options.strict && m_numEvents > kMostThreeDigitEvents) {
        return Qx::Status::failure(String::format("the edit has %zu events and a strict list holds 999; "
                                                  "export it in parts or without the strict mode",
                                                  m_numEvents));
    }
    if (m_options.strict && losses > 0) {
        return Qx::Status::failure(
            String::format("%zu loss%s; without the strict mode the list is made all the same", losses,
                           losses == 1 ? "" : "es"));
    }
    text = edlText(m_list, {m_options.crlf});
    return {};
}

} // namespace

Qx::Status exportEdl(const Edit& edit, const EdlExportOptions& options, String& text, LossReport& report) {
    return EdlExporter(edit, options, report).run(text);
}

Qx::Status exportEdlFile(const Edit& edit, const EdlExportOptions& options, const String& path,
                         LossReport& report) {
    String text;
    if (Qx::Status status = exportEdl(edit, options, text, report); !status) {
        return status;
    }
    Qx::AtomicFile file(path);
    Qx::FileError error = file.write(text);
    if (!error) {
        error = file.commit();
    }
    return error.status();
}

} // namespace interchange
