#include "interchange/edl/detail/edl_clips.h"

#include "edit/model/aud_levels_cel.h"
#include "edit/model/cel.h"
#include "edit/model/managed_cel.h"
#include "interchange/edl/detail/edl_line.h"
#include "platform/effects/special_effects.h"
#include "platform/media/timecode.h"
#include "platform/store/tag.h"
#include "platform/store/tag_bag.h"

#include <algorithm>
#include <cmath>
#include <tuple>

namespace interchange::detail {

namespace {

// Of a frame: what the rounding of times in seconds may leave.
constexpr double kFrameTolerance = 1e-3;
constexpr int kWrittenAudio = 4;
constexpr int64_t kLongestTransition = 999;
constexpr uint32_t kGreatestWipe = 999;

} // namespace

int64_t ExportClip::sourceNext() const {
    return sourceIn + std::llround(velocity * static_cast<double>(recordOut - recordIn));
}

EdlClips::EdlClips(const Edit& edit, Qx::FrameRate rate, bool drop, int64_t start, LossReport& report)
    : m_edit(edit), m_rate(rate), m_drop(drop), m_start(start), m_report(report) {}

String EdlClips::timeText(int64_t position) const {
    return Qx::timecodeText(m_start + position, m_rate, m_drop);
}

int64_t EdlClips::frames(double seconds, const String& where, const char* what) {
    const double exact = seconds * m_rate.numerator() / m_rate.denominator();
    const auto whole = static_cast<int64_t>(std::llround(exact));
    if (std::abs(exact - static_cast<double>(whole)) > kFrameTolerance) {
        m_report.addLoss(0, where + ": its " + what + " lies between two frames and is rounded");
    }
    return whole;
}

bool EdlClips::canShow(const channel_event& in, const String& where) {
    const char* what = nullptr;
    if (in.strip.isEffectGraph()) {
        what = "an effect";
    } else if (in.strip.isAlias() || in.id.getMagicType() == IdStampMagic::Channel) {
        what = "an event that shows another channel";
    } else if (!in.strip.is_valid()) {
        what = "an event without a source";
    }
    if (what != nullptr) {
        m_report.addLoss(0, where + ": " + what + " is left out");
    }
    return what == nullptr;
}

void EdlClips::reportEvent(const channel_event& in, const channel_event& out, const String& where) {
    if (in.strip.isBlack()) {
        return;
    }
    if (in.level != 1.0F || out.level != 1.0F) {
        m_report.addLoss(0, where + ": a level of " + Qx::doubleToText(static_cast<double>(in.level)) +
                                (in.level == out.level
                                     ? String()
                                     : " to " + Qx::doubleToText(static_cast<double>(out.level))) +
                                " is not written");
    }
    if (in.rampQFrames > 0 || out.rampQFrames > 0) {
        m_report.addLoss(0, where + ": a fade is not written");
    }
    if (m_edit.getNumStoredObjects() > 0 &&
        const_cast<Edit&>(m_edit).objectStore().contains(in.id.asString())) {
        m_report.addLoss(0, where + ": an effect on it is not written");
    }
}

String EdlClips::whereIs(int chan, const channel_event& in) const {
    return m_edit.getChanDisplayName(m_edit.getId(chan)) + " at " + timeText(m_rate.toFrames(in.editTime));
}

// What a list can say of the transition of a pair. Nothing for an effect that is none.
std::optional<EdlClips::Waiting> EdlClips::takeTransition(int chan, const channel_event& in,
                                                          const channel_event& out) {
    const String where = whereIs(chan, in);
    const Tag<EffectInstance> effect = m_edit.openObject<EffectInstance>(in.id);
    if (!effect || !effect->isTransition()) {
        return std::nullopt;
    }
    Waiting waiting;
    waiting.recordIn = frames(in.editTime, where, "start");
    waiting.recordOut = frames(out.editTime, where, "end");
    waiting.seconds = out.editTime - in.editTime;
    ExportTransition& transition = waiting.transition;
    transition.length = waiting.recordOut - waiting.recordIn;
    if (transition.length <= 0 || transition.length > kLongestTransition) {
        m_report.addLoss(0, where +
                                String::format(": a transition of %lld frames is written as a cut, as a list "
                                               "holds 1 to 999",
                                               static_cast<long long>(transition.length)));
        transition.length = 0;
        return waiting;
    }
    transition.type = EdlType::Dissolve;
    const std::string_view kind = effect->kind()->typeId;
    size_t said = 0; // of the parameters that were set
    if (const auto* const wipe = dynamic_cast<const TextureWipeEffect*>(&*effect)) {
        const uint32_t code = wipe->getPatternCode();
        transition.type = EdlType::Wipe;
        transition.wipe = static_cast<int>(std::min(code, kGreatestWipe));
        said = wipe->findParameter("pattern") != nullptr ? 1 : 0;
        if (code > kGreatestWipe) {
            m_report.addLoss(0, where + ": a wipe's pattern is beyond the codes of a list; 999 is written");
        }
    } else if (kind != Fx::kDissolve && kind != Fx::kCrossFade) {
        m_report.addLoss(0, where + ": a transition \"" + String(effect->kind()->name) +
                                "\" is written as a dissolve");
    }
    if (effect->parameters().size() > said) {
        m_report.addLoss(0, where + ": the settings of a transition are not written");
    }
    return waiting;
}

bool EdlClips::takePair(int chan, const channel_event& in, const channel_event& out, ExportClip& clip,
                        EdlSources& sources, const Waiting* waiting) {
    const String where = whereIs(chan, in);
    if (!canShow(in, where)) {
        return false;
    }
    reportEvent(in, out, where);
    clip.recordIn = waiting != nullptr ? waiting->recordIn : frames(in.editTime, where, "start");
    clip.recordOut = frames(out.editTime, where, "end");
    clip.transition = waiting != nullptr ? waiting->transition : ExportTransition();
    if (clip.recordOut <= clip.recordIn) {
        m_report.addLoss(0, where + ": a clip of less than a frame is left out");
        return false;
    }
    clip.source = sources.find(in.strip);
    if (!in.strip.isBlack()) {
        const int64_t day = Qx::framesPerDay(m_rate, sources[clip.source].drop);
        const double under = waiting != nullptr ? waiting->seconds : 0.0;
        clip.sourceIn = frames(in.stripTime - in.velocity * under, where, "source in");
        clip.velocity = in.velocity;
        if (clip.sourceIn < 0 || clip.sourceIn >= day) {
            m_report.addLoss(0, where + ": its source in lies outside the 24 hours of timecode");
            clip.sourceIn = ((clip.sourceIn % day) + day) % day;
        }
    }
    const auto record = m_recordOf.find(in.id);
    clip.record = record == m_recordOf.end() ? kNoRecord : record->second;
    return true;
}

// True for an event that begins a pair of no length from which a transition leads.
bool EdlClips::leadsFrom(const cel& content, int event) const {
    if (event + 2 >= content.numEvents()) {
        return false;
    }
    const double in = content.getChanEventPtr(event)->editTime;
    const channel_event& next = *content.getChanEventPtr(event + 2);
    return m_rate.toFrames(in) == m_rate.toFrames(content.getChanEventPtr(event + 1)->editTime) &&
           m_rate.toFrames(next.editTime) == m_rate.toFrames(in) && next.strip.isEffectGraph();
}

// A transition to which nothing follows leads to black.
void EdlClips::toBlack(const Waiting& waiting, EdlChannels channel, EdlSources& sources) {
    ExportClip clip;
    clip.channels = channel;
    clip.recordIn = waiting.recordIn;
    clip.recordOut = waiting.recordOut;
    clip.transition = waiting.transition;
    clip.source = sources.find(black_cookie);
    m_clips.push_back(clip);
}

// Sound has no wipes: one that came from a list, as long as it was, is what the list calls it.
void EdlClips::sayAsListed(ExportClip& clip) const {
    ExportTransition& transition = clip.transition;
    if (clip.record == kNoRecord || transition.type != EdlType::Dissolve ||
        (clip.channels & (kEdlPicture | kEdlPicture2)) != 0) {
        return;
    }
    const std::string_view text = (*m_records)[clip.record].typeText;
    const size_t blank = text.find(' ');
    if (text.starts_with('W') && blank != std::string_view::npos &&
        digitsValue(text.substr(blank + 1)) == transition.length) {
        transition.type = EdlType::Wipe;
        transition.wipe = std::max(0, digitsValue(text.substr(1, blank - 1)));
    }
}

void EdlClips::collectChannel(int chan, EdlChannels channel, EdlSources& sources) {
    const cel* const content = m_edit.get_edit_cel_p(chan);
    std::optional<Waiting> waiting;
    std::optional<ExportClip> before; // what a transition that follows leads from
    for (int i = 0; content != nullptr && i + 1 < content->numEvents(); i += 2) {
        const channel_event& in = *content->getChanEventPtr(i);
        const channel_event& out = *content->getChanEventPtr(i + 1);
        if (waiting && m_rate.toFrames(in.editTime) != waiting->recordOut) {
            toBlack(*waiting, channel, sources);
            waiting.reset();
        }
        ExportClip clip;
        clip.channels = channel;
        if (!waiting && leadsFrom(*content, i) && canShow(in, whereIs(chan, in))) {
            clip.source = sources.find(in.strip);
            clip.recordIn = clip.recordOut = m_rate.toFrames(in.editTime);
            clip.sourceIn = frames(in.stripTime, whereIs(chan, in), "source in");
            before = clip;
            continue;
        }
        std::optional<Waiting> transition;
        if (in.strip.isEffectGraph() && !waiting) {
            transition = takeTransition(chan, in, out);
        }
        if (transition) {
            if (before && before->recordOut == transition->recordIn && !sources[before->source].black) {
                transition->transition.outgoing = before->source;
                transition->transition.outgoingFrame = before->sourceNext();
            }
            waiting = transition;
        } else if (takePair(chan, in, out, clip, sources, waiting ? &*waiting : nullptr)) {
            sayAsListed(clip);
            m_clips.push_back(clip);
            before = clip;
            waiting.reset();
        }
    }
    if (waiting) {
        toBlack(*waiting, channel, sources);
    }
}

// Copies of one line become one: they agree in span and source, and none comes from another line than the
// others. A copy of no line joins the first that lacks its track.
void EdlClips::merge() {
    const auto span = [](const ExportClip& clip) {
        return std::make_tuple(clip.recordIn, clip.recordOut, clip.source, clip.sourceIn, clip.velocity,
                               clip.transition);
    };
    std::sort(m_clips.begin(), m_clips.end(), [&](const ExportClip& a, const ExportClip& b) {
        return std::make_tuple(span(a), a.record, a.channels) <
               std::make_tuple(span(b), b.record, b.channels);
    });
    std::vector<ExportClip> merged;
    size_t first = 0; // of those with the span of the last one
    for (const ExportClip& clip : m_clips) {
        if (merged.empty() || span(merged.back()) != span(clip)) {
            first = merged.size();
        }
        const auto same = std::find_if(merged.begin() + static_cast<std::ptrdiff_t>(first), merged.end(),
                                       [&](const ExportClip& other) {
                                           return (other.channels & clip.channels) == 0 &&
                                                  (clip.record == other.record || clip.record == kNoRecord);
                                       });
        if (same == merged.end()) {
            merged.push_back(clip);
        } else {
            same->channels |= clip.channels;
        }
    }
    std::sort(merged.begin(), merged.end(), [](const ExportClip& a, const ExportClip& b) {
        const auto lowest = [](EdlChannels bits) { return bits & ~(bits - 1); };
        return std::make_tuple(a.recordIn, a.record, lowest(a.channels)) <
               std::make_tuple(b.recordIn, b.record, lowest(b.channels));
    });
    m_clips = std::move(merged);
}

std::vector<ExportClip> EdlClips::collect(const std::vector<EdlRecord>& records, EdlSources& sources) {
    m_records = &records;
    for (size_t i = 0; i < records.size(); ++i) {
        for (const IdStamp& stamp : records[i].events) {
            m_recordOf.emplace(stamp, i);
        }
    }
    Vector<int> chans;
    m_edit.getChans(chans, VideoChan, Edit_Chan_SubType::NONE);
    std::vector<int> written;
    if (!chans.empty()) {
        written.push_back(chans.front());
        collectChannel(chans.front(), kEdlPicture, sources);
    }
    // The second picture track counts only if it is made of the foregrounds of an imported list's keys.
    if (chans.size() > 1) {
        const cel* const content = m_edit.get_edit_cel_p(chans[1]);
        bool keys = content != nullptr && content->numEvents() > 0;
        for (int i = 0; keys && i < content->numEvents(); i += 2) {
            const auto record = m_recordOf.find(content->getChanEventPtr(i)->id);
            keys = record != m_recordOf.end() && record->second > 0 &&
                   records[record->second].typeText.starts_with('K') &&
                   records[record->second - 1].typeText == "K B";
        }
        if (keys) {
            written.push_back(chans[1]);
            collectChannel(chans[1], kEdlPicture2, sources);
        }
    }
    chans.clear();
    m_edit.getChans(chans, AudioChan);
    for (int i = 0; i < static_cast<int>(chans.size()) && i < kWrittenAudio; ++i) {
        written.push_back(chans[static_cast<size_t>(i)]);
        collectChannel(chans[static_cast<size_t>(i)], edlAudio(i + 1), sources);
    }
    reportOtherChannels(written);
    reportGroups();
    merge();
    return std::move(m_clips);
}

// Other channels are left out whole; of those that are written, what belongs to the channel itself.
void EdlClips::reportOtherChannels(const std::vector<int>& written) {
    for (int chan = 0; chan < m_edit.getNumChans(); ++chan) {
        const IdStamp id = m_edit.getId(chan);
        if (std::find(written.begin(), written.end(), chan) == written.end()) {
            reportChannel(chan);
            continue;
        }
        const String shown = m_edit.getChanDisplayName(id);
        if (!m_edit.getChanName(id).empty()) {
            m_report.addLoss(0, "channel " + shown + ": its name is not written");
        }
        if (const AudCel audio = m_edit.getAudCel(id); audio.valid() && !audio.getSoundOutputEnabled()) {
            m_report.addLoss(0, "channel " + shown + ": that it is not heard is not written");
        }
    }
}

void EdlClips::reportChannel(int chan) {
    const IdStamp id = m_edit.getId(chan);
    const String shown = "channel " + m_edit.getChanDisplayName(id);
    if (const AudLevelsCel levels = m_edit.getLevelsCel(id); levels.valid()) {
        if (const size_t nodes = levels.getNodeStore().nodes().size(); nodes > 0) {
            m_report.addLoss(0, shown + String::format(": levels of %zu nodes are not written", nodes));
        }
        return;
    }
    const cel* const content = m_edit.get_edit_cel_p(chan);
    const int clips = content == nullptr ? 0 : content->numPairs();
    const char* why = "a list holds one picture track";
    if (m_edit.getChanSubtype(chan) != Edit_Chan_SubType::NONE) {
        why = "a list holds no effects";
    } else if (m_edit.getChanType(chan) == AudioChan) {
        why = "a list holds four audio channels";
    }
    if (clips > 0) {
        m_report.addLoss(
            0, shown + String::format(" with %d clip%s is left out: ", clips, clips == 1 ? "" : "s") + why);
    }
}

void EdlClips::reportGroups() {
    for (unsigned i = 0; i < m_edit.numGroups(); ++i) {
        const ChannelGroup* const group = m_edit.getTrackGroup(i);
        if (group != nullptr && group->size() > 0) {
            m_report.addLoss(0, "channel group " + m_edit.getGroupDisplayName(group->getChans()[0], true) +
                                    " is not written");
        }
    }
}

} // namespace interchange::detail
