#include "interchange/edl/edl_tracks.h"

#include "interchange/edl/detail/edl_bad_lines.h"
#include "platform/media/timecode.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <map>

namespace interchange {

namespace {

int64_t recordLength(const EdlEvent& event) {
    return event.recordOut - event.recordIn;
}

// Source frames a record frame. The speed counts the labels of a second, as timecode does: 24 at 23.976.
double velocityOf(const EdlEvent& event, Qx::FrameRate rate) {
    return event.speed ? event.speed->framesPerSecond / rate.nominal() : 1.0;
}

bool isTransition(const EdlEvent& event) {
    return event.type == EdlType::Dissolve || event.type == EdlType::Wipe;
}

// True if an outgoing side names the source of what plays before it. It need not repeat the name.
bool isSourceOf(const EdlEvent& outgoing, const EdlEvent& before) {
    return outgoing.reel == before.reel &&
           (outgoing.clipName.empty() || before.clipName.empty() || outgoing.clipName == before.clipName);
}

String transitionName(const EdlEvent& event) {
    return event.type == EdlType::Wipe
               ? String::format("the wipe of pattern %03d and %d frames", event.wipe, event.duration)
               : String::format("the dissolve of %d frames", event.duration);
}

// The source frame that an event shows first. At a speed the M2 names it where it names one of the span.
// Failing that, in reverse it is the highest of the span.
int64_t firstFrameOf(const EdlEvent& event, Qx::FrameRate rate) {
    if (!event.speed || event.speed->framesPerSecond > 0) {
        return event.sourceIn;
    }
    const int64_t low = std::min(event.sourceIn, event.sourceOut);
    const int64_t high = std::max(event.sourceIn, event.sourceOut);
    const int64_t at = event.speed->at;
    if (event.speed->framesPerSecond == 0) {
        return at >= low && at < high ? at : event.sourceIn;
    }
    const auto played = static_cast<double>(recordLength(event)) * std::abs(velocityOf(event, rate));
    // What begins with the lowest frame plays what lies below, if there is that much.
    const bool hasRoom = at > low || std::llround(played) <= low + 1;
    if (at >= low && at <= high && hasRoom) {
        return at;
    }
    return event.sourceIn > event.sourceOut ? event.sourceIn : std::max(low, high - 1);
}

// One track while it is laid: clips by record in, none overlapping.
class Lane {
public:
    /// Lays a clip; what it covers goes. Answers an event that lost a part, or its own when none did.
    size_t lay(const EdlClip& clip) {
        size_t covered = clip.event;
        auto next = m_clips.lower_bound(clip.recordIn);
        if (next != m_clips.begin()) {
            auto before = std::prev(next);
            EdlClip& earlier = before->second;
            if (earlier.recordOut > clip.recordIn) {
                covered = earlier.event;
                if (earlier.recordOut > clip.recordOut) {
                    next = m_clips.emplace_hint(next, clip.recordOut, tailOf(earlier, clip.recordOut));
                }
                earlier.recordOut = clip.recordIn;
            }
        }
        while (next != m_clips.end() && next->first < clip.recordOut) {
            covered = next->second.event;
            if (next->second.recordOut > clip.recordOut) {
                m_clips.emplace(clip.recordOut, tailOf(next->second, clip.recordOut));
            }
            next = m_clips.erase(next);
        }
        m_clips.emplace_hint(next, clip.recordIn, clip);
        return covered;
    }
    [[nodiscard]] bool empty() const { return m_clips.empty(); }
    /// The last clip; null for none.
    [[nodiscard]] const EdlClip* last() const {
        return m_clips.empty() ? nullptr : &m_clips.rbegin()->second;
    }
    [[nodiscard]] std::vector<EdlClip> clips() const {
        std::vector<EdlClip> result;
        result.reserve(m_clips.size());
        for (const auto& [in, clip] : m_clips) {
            result.push_back(clip);
        }
        return result;
    }

private:
    static EdlClip tailOf(EdlClip clip, int64_t from) {
        clip.sourceIn += clip.velocity * static_cast<double>(from - clip.recordIn);
        clip.recordIn = from;
        clip.transition = 0;
        return clip;
    }

    std::map<int64_t, EdlClip> m_clips;
};

class TrackBuilder {
public:
    TrackBuilder(const EdlList& list, bool strict, LossReport& report)
        : m_list(list), m_strict(strict), m_report(report) {}

    Qx::Status lay(EdlProgramme& programme);

private:
    void findPositions();
    [[nodiscard]] bool runsOverMidnight();
    [[nodiscard]] int64_t startOfDay() const;
    void layEvent(size_t index);
    void layOn(EdlChannels channel, const EdlClip& clip);
    void checkTransition(size_t index);
    void reportKey(const EdlEvent& event);
    void holdTransitions(std::vector<EdlClip>& clips, std::vector<int>& numHeld);
    void reportUnheld(const std::vector<int>& numHeld);
    [[nodiscard]] bool joins(const EdlClip* before, const EdlEvent& outgoing) const;
    [[nodiscard]] std::optional<EdlOutgoing> ownOutgoing(const EdlClip& clip, const EdlClip* before) const;
    void checkDurations(const EdlEvent& event);
    void checkJoin(size_t index, EdlChannels channels);
    [[nodiscard]] EdlClip clipOf(size_t index) const;
    const EdlList& m_list;
    bool m_strict;
    LossReport& m_report;
    detail::EdlBadLines m_badLines;
    EdlProgramme m_programme;
    std::map<EdlChannels, Lane> m_lanes; // by bit, so in the order of the tracks
};

bool TrackBuilder::runsOverMidnight() {
    const auto& events = m_list.events;
    bool crosses = false;
    size_t back = 0;
    for (size_t i = 0; i < events.size(); ++i) {
        const int64_t day = Qx::framesPerDay(m_list.rate, events[i].recordDrop);
        if (events[i].recordIn >= day) {
            return false; // frame counts that go on beyond a day
        }
        crosses = crosses || events[i].recordOut >= day;
        if (back == 0 && i > 0 && events[i - 1].recordIn - events[i].recordIn > day / 2) {
            back = i;
        }
    }
    if (!crosses && back > 0) {
        m_report.addWarning(events[back].line,
                            "record time steps back by more than 12 hours; taken as running over midnight");
    }
    return crosses || back > 0;
}

// The record in after the longest pause on the circle of a day.
int64_t TrackBuilder::startOfDay() const {
    std::vector<std::pair<int64_t, int64_t>> spans;
    spans.reserve(m_list.events.size());
    int64_t day = 0;
    for (const EdlEvent& event : m_list.events) {
        spans.emplace_back(event.recordIn, event.recordOut);
        day = std::max(day, Qx::framesPerDay(m_list.rate, event.recordDrop));
    }
    std::sort(spans.begin(), spans.end());
    int64_t end = 0;
    for (const auto& [in, out] : spans) {
        end = std::max(end, out);
    }
    int64_t start = spans.front().first;
    int64_t longest = start + day - end;
    end = spans.front().second;
    for (const auto& [in, out] : spans) {
        if (in - end > longest) {
            longest = in - end;
            start = in;
        }
        end = std::max(end, out);
    }
    return start;
}

void TrackBuilder::findPositions() {
    const auto& events = m_list.events;
    auto& positions = m_programme.positions;
    positions.resize(events.size());
    const bool overMidnight = runsOverMidnight();
    const int64_t dayStart = overMidnight ? startOfDay() : 0;
    size_t first = 0;
    bool mixed = false;
    for (size_t i = 0; i < events.size(); ++i) {
        positions[i] = events[i].recordIn;
        if (positions[i] < dayStart) {
            positions[i] += Qx::framesPerDay(m_list.rate, events[i].recordDrop);
        }
        if (positions[i] < positions[first]) {
            first = i;
        }
        if (!mixed && events[i].recordDrop != events[0].recordDrop) {
            mixed = true;
            m_report.addWarning(events[i].line, "the record side changes between drop and non-drop frame; "
                                                "each label is counted in its own mode");
        }
    }
    m_programme.start = positions[first];
    m_programme.dropFrame = events[first].recordDrop;
    for (int64_t& position : positions) {
        position -= m_programme.start;
    }
}

EdlClip TrackBuilder::clipOf(size_t index) const {
    const EdlEvent& event = m_list.events[index];
    EdlClip clip;
    clip.event = index;
    clip.recordIn = m_programme.positions[index];
    clip.recordOut = clip.recordIn + recordLength(event);
    clip.black = event.isBlack();
    clip.velocity = clip.black ? 1.0 : velocityOf(event, m_list.rate);
    clip.transition = isTransition(event) ? event.duration : 0;
    clip.sourceIn = static_cast<double>(event.sourceIn);
    if (!clip.black) {
        clip.sourceIn = static_cast<double>(firstFrameOf(event, m_list.rate));
    }
    return clip;
}

void TrackBuilder::checkDurations(const EdlEvent& event) {
    if (event.role == EdlRole::Outgoing && recordLength(event) == 0) {
        return;
    }
    const int64_t record = recordLength(event);
    const int64_t source = std::abs(event.sourceOut - event.sourceIn);
    const String durations = "source duration " + Qx::durationText(source, m_list.rate, event.sourceDrop) +
                             " and record duration " +
                             Qx::durationText(record, m_list.rate, event.recordDrop);
    if (event.isBlack() || source == record) {
        return; // with an M2 too: some writers give the source span as at normal speed
    }
    if (!event.speed) {
        m_report.addWarning(event.line, durations + " differ without M2; the record side is trusted");
        return;
    }
    const double scaled = static_cast<double>(record) * std::abs(velocityOf(event, m_list.rate));
    const bool freeze = event.speed->framesPerSecond == 0 && source <= 1;
    if (!freeze && std::abs(static_cast<double>(source) - scaled) > 1.0) {
        m_report.addWarning(event.line, durations + " do not agree with the M2 speed " + event.speed->digits +
                                            "; the speed and the record side are trusted");
    }
}

void TrackBuilder::reportKey(const EdlEvent& event) {
    if (event.type == EdlType::Key || event.type == EdlType::KeyOut) {
        m_report.addLoss(event.line,
                         String::format("a key %s with a fade of %d frames became a clip on the "
                                        "second picture track",
                                        event.type == EdlType::Key ? "in" : "out", event.duration));
    }
}

// True if an outgoing side goes on where a clip ends: at the frame that it reaches, or that its line names. At
// a speed the two may be a frame apart.
bool TrackBuilder::joins(const EdlClip* before, const EdlEvent& outgoing) const {
    if (outgoing.isBlack() || before == nullptr || before->black) {
        return outgoing.isBlack() && (before == nullptr || before->black);
    }
    const EdlEvent& event = m_list.events[before->event];
    const auto frame = static_cast<double>(outgoing.sourceIn);
    const double tolerance = before->velocity == 1.0 ? 0.0 : 1.0;
    const bool isWhole = before->recordOut == m_programme.positions[before->event] + recordLength(event);
    return isSourceOf(outgoing, event) && (std::abs(frame - before->sourceOut()) <= tolerance ||
                                           (isWhole && outgoing.sourceIn == event.sourceOut));
}

// What gives way to a clip where it is not what plays before it on the track.
std::optional<EdlOutgoing> TrackBuilder::ownOutgoing(const EdlClip& clip, const EdlClip* before) const {
    const bool isPaired = m_list.events[clip.event].role == EdlRole::Incoming;
    if (!isPaired) {
        return before == nullptr || before->black ? std::nullopt : std::optional(EdlOutgoing());
    }
    const size_t index = clip.event - 1;
    const EdlEvent& outgoing = m_list.events[index];
    const bool isLine = recordLength(outgoing) > 0; // plays by itself, up to the transition
    if (isLine ? before != nullptr && before->event == index : joins(before, outgoing)) {
        return std::nullopt;
    }
    EdlOutgoing own;
    own.black = outgoing.isBlack();
    own.event = before != nullptr && !before->black && isSourceOf(outgoing, m_list.events[before->event])
                    ? before->event
                    : index;
    own.velocity = own.black ? 1.0 : velocityOf(outgoing, m_list.rate);
    own.frame = static_cast<double>(isLine ? outgoing.sourceOut : firstFrameOf(outgoing, m_list.rate));
    return own;
}

// `numHeld` counts for each event the tracks on which its transition is held.
void TrackBuilder::holdTransitions(std::vector<EdlClip>& clips, std::vector<int>& numHeld) {
    for (size_t i = 0; i < clips.size(); ++i) {
        EdlClip& clip = clips[i];
        if (clip.transition == 0) {
            continue;
        }
        const EdlEvent& event = m_list.events[clip.event];
        const EdlClip* const before =
            i > 0 && clips[i - 1].recordOut == clip.recordIn ? &clips[i - 1] : nullptr;
        const int64_t length = clip.recordOut - clip.recordIn;
        if (clip.transition > length && numHeld[clip.event] == 0) {
            m_report.addLoss(event.line,
                             transitionName(event) + String::format(" is shortened to %lld, as its "
                                                                    "clip is no longer",
                                                                    static_cast<long long>(length)));
        }
        clip.transition = std::min(clip.transition, length);
        clip.outgoing = ownOutgoing(clip, before);
        ++numHeld[clip.event];
    }
}

void TrackBuilder::reportUnheld(const std::vector<int>& numHeld) {
    for (size_t i = 0; i < numHeld.size(); ++i) {
        const EdlEvent& event = m_list.events[i];
        if (isTransition(event) && event.duration > 0 && recordLength(event) > 0 &&
            numHeld[i] < std::popcount(event.channels)) {
            m_report.addLoss(event.line,
                             transitionName(event) + " is left out where another event covers its start");
        }
    }
}

void TrackBuilder::checkTransition(size_t index) {
    const EdlEvent& event = m_list.events[index];
    if (event.duration <= recordLength(event)) {
        return;
    }
    if (m_strict) {
        m_badLines.add(event.line,
                       String::format("the transition of %d frames is longer than its clip; shorten it or "
                                      "import without the strict mode",
                                      event.duration));
    }
}

// A line of no length says what goes on under the transition: that should be what ends there.
void TrackBuilder::checkJoin(size_t index, EdlChannels channels) {
    const EdlEvent& event = m_list.events[index];
    for (EdlChannels bits = channels; bits != 0 && !event.isBlack(); bits &= bits - 1) {
        const auto lane = m_lanes.find(bits & ~(bits - 1));
        const EdlClip* const last = lane == m_lanes.end() ? nullptr : lane->second.last();
        const bool meets = last != nullptr && last->recordOut == m_programme.positions[index];
        if (!meets || m_list.events[last->event].reel != event.reel) {
            m_report.addWarning(event.line,
                                meets ? "the outgoing side is of another reel than what plays before it"
                                      : "the outgoing side does not start where the event before it ends");
            return;
        }
    }
}

void TrackBuilder::layOn(EdlChannels channel, const EdlClip& clip) {
    const size_t covered = m_lanes[channel].lay(clip);
    const EdlEvent& event = m_list.events[clip.event];
    const EdlEvent& below = m_list.events[covered];
    const bool ownOutgoing = event.role == EdlRole::Incoming && covered + 1 == clip.event;
    if (covered == clip.event || ownOutgoing) {
        return;
    }
    const String lines = String::format("the event overlaps the one at line %d", below.line);
    if (m_strict) {
        m_badLines.add(event.line, lines + "; correct the record times or import without the strict mode");
    } else {
        m_report.addWarning(event.line, lines + ", which is trimmed");
    }
}

void TrackBuilder::layEvent(size_t index) {
    const EdlEvent& event = m_list.events[index];
    if (event.role == EdlRole::Outgoing && recordLength(event) == 0) {
        checkJoin(index, event.channels);
        return;
    }
    checkDurations(event);
    checkTransition(index);
    reportKey(event);
    if (event.channels == 0) {
        m_report.addLoss(event.line, "the event is on no track and is left out");
        return;
    }
    if (recordLength(event) == 0) {
        m_report.addLoss(event.line, "the event has no length and is left out");
        return;
    }
    const bool foreground = event.type == EdlType::Key || event.type == EdlType::KeyOut;
    const EdlClip clip = clipOf(index);
    for (EdlChannels bits = event.channels; bits != 0; bits &= bits - 1) {
        EdlChannels channel = bits & ~(bits - 1);
        if (foreground && channel == kEdlPicture) {
            channel = kEdlPicture2;
        }
        layOn(channel, clip);
    }
}

Qx::Status TrackBuilder::lay(EdlProgramme& programme) {
    findPositions();
    for (const EdlEvent& event : m_list.events) {
        m_programme.firstFrames.push_back(firstFrameOf(event, m_list.rate));
    }
    std::vector<size_t> order(m_list.events.size());
    for (size_t i = 0; i < order.size(); ++i) {
        order[i] = i;
    }
    const auto& positions = m_programme.positions;
    std::stable_sort(order.begin(), order.end(),
                     [&](size_t a, size_t b) { return positions[a] < positions[b]; });
    for (const size_t index : order) {
        layEvent(index);
    }
    if (!m_badLines.empty()) {
        return m_badLines.refuse(m_report);
    }
    std::vector<int> numHeld(m_list.events.size(), 0);
    for (const auto& [channel, lane] : m_lanes) {
        if (!lane.empty()) {
            m_programme.tracks.push_back({channel, lane.clips()});
            holdTransitions(m_programme.tracks.back().clips, numHeld);
        }
    }
    reportUnheld(numHeld);
    programme = std::move(m_programme);
    return {};
}

} // namespace

Qx::Status layTracks(const EdlList& list, bool strict, EdlProgramme& programme, LossReport& report) {
    return TrackBuilder(list, strict, report).lay(programme);
}

int64_t markerPosition(const EdlList& list, const EdlProgramme& programme, const EdlMarker& marker) {
    int64_t position = marker.at - programme.start;
    const int64_t day = Qx::framesPerDay(list.rate, programme.dropFrame);
    if (position < -day / 2) {
        position += day;
    }
    return position;
}

} // namespace interchange
