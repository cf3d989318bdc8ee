#include "interchange/edl/edl_import.h"

#include "edit/model/cel.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "interchange/edl/edl_records.h"
#include "interchange/marker_colour.h"
#include "platform/effects/special_effects.h"
#include "platform/services/files.h"
#include "platform/store/tag_bag.h"

#include <cmath>
#include <unordered_map>

namespace interchange {

namespace {

/// The span used of one source on each track, in source frames.
struct Source {
    size_t event = 0; ///< the first that plays it
    EdlChannels channels = 0;
    double in = 0;
    double out = 0;
};

constexpr size_t kNoSource = SIZE_MAX;

class EdlImporter {
public:
    EdlImporter(const EdlList& list, const EdlProgramme& programme, Import& result)
        : m_list(list), m_programme(programme), m_result(result) {}

    void build(const String& name);

private:
    void findSources();
    /// Notes that so many record frames of the source of an event are played on a track.
    void useSource(size_t event, EdlChannels channel, double from, double velocity, int64_t length);
    [[nodiscard]] std::string keyOf(size_t index) const;
    size_t sourceOf(size_t event);
    void buildShot(size_t index);
    void buildSequence(const String& name);
    void buildChannels(Edit& edit);
    [[nodiscard]] Qx::Ptr<cel> buildCel(Edit& edit, const EdlTrack* track);
    void addTransition(Edit& edit, cel& content, EdlChannels channel, const EdlClip& clip);
    void addCues(Edit& edit);
    String shownName(const String& name, int line);
    [[nodiscard]] EditPtr newEdit(const cookie& item, bool original) const;
    [[nodiscard]] double seconds(double frames) const {
        return frames * m_list.rate.denominator() / m_list.rate.numerator();
    }

    const EdlList& m_list;
    const EdlProgramme& m_programme;
    Import& m_result;
    std::vector<Source> m_sources;
    std::vector<size_t> m_sourceOfEvent;
    std::vector<EdlRecord> m_records;
    std::unordered_map<std::string, size_t> m_byName;
};

void addPair(cel& content, const cookie& strip, double editIn, double editOut, double stripIn,
             double velocity) {
    channel_event in(editIn, stripIn, strip, 1.0F, CE_IN_POINT, channel_event::newId(), 0);
    in.velocity = velocity;
    channel_event out(editOut, stripIn + velocity * (editOut - editIn), strip, 1.0F, CE_OUT_POINT,
                      channel_event::newId(), 0);
    out.velocity = velocity;
    content.add_event(in);
    content.add_event(out);
}

// How many audio channels an edit needs so that the last one used has its own number.
int lastAudio(EdlChannels channels) {
    int last = 0;
    for (int number = 1; number <= kMaxEdlAudio; ++number) {
        if ((channels & edlAudio(number)) != 0) {
            last = number;
        }
    }
    return last;
}

// The channel bits of the tracks up to the last one of each kind that is used, in order.
std::vector<EdlChannels> tracksUpTo(EdlChannels used) {
    std::vector<EdlChannels> tracks;
    if ((used & (kEdlPicture | kEdlPicture2)) != 0) {
        tracks.push_back(kEdlPicture);
    }
    if ((used & kEdlPicture2) != 0) {
        tracks.push_back(kEdlPicture2);
    }
    for (int number = 1; number <= lastAudio(used); ++number) {
        tracks.push_back(edlAudio(number));
    }
    return tracks;
}

bool isPicture(EdlChannels channel) {
    return channel == kEdlPicture || channel == kEdlPicture2;
}

// A name that a project can show. The notes keep the whole of it.
String EdlImporter::shownName(const String& name, int line) {
    constexpr size_t most = 1000;
    if (name.size() <= most) {
        return name;
    }
    size_t end = most;
    while ((static_cast<unsigned char>(name[end]) & 0xC0) == 0x80) {
        --end; // inside a character
    }
    m_result.report.addLoss(line, String::format("a name of %zu bytes is cut to %zu", name.size(), end));
    return name.substr(0, end);
}

EditPtr EdlImporter::newEdit(const cookie& item, bool original) const {
    EditPtr edit(new Edit);
    edit->setCreationDetails();
    // Dirty from the start, so that no header change below announces an item that no project has.
    edit->init_dirty();
    edit->set_cookie(item);
    edit->setFrameRate(m_list.rate);
    // Not through the accessor, which records an owner with the project.
    EditKeys::kOriginalMaterial.set(edit->Opts(), original ? 1 : 0);
    return edit;
}

// What tells the source of an event.
std::string EdlImporter::keyOf(size_t index) const {
    const EdlEvent& event = m_list.events[index];
    // Line feeds cannot occur in the names.
    std::string key = event.reel + "\n" + event.clipName + "\n" + event.sourceFile;
    const bool nameless = event.clipName.empty() && event.sourceFile.empty();
    if (nameless && String::equalNoCase(event.reel, "AX")) {
        key += "\n" + std::to_string(index);
    }
    return key;
}

// The number of the source that an event plays.
size_t EdlImporter::sourceOf(size_t event) {
    size_t& known = m_sourceOfEvent[event];
    if (known != kNoSource) {
        return known;
    }
    known = m_byName.try_emplace(keyOf(event), m_sources.size()).first->second;
    if (known == m_sources.size()) {
        m_sources.push_back({event, 0, INFINITY, -INFINITY});
    }
    return known;
}

void EdlImporter::useSource(size_t event, EdlChannels channel, double from, double velocity, int64_t length) {
    Source& source = m_sources[sourceOf(event)];
    source.channels |= channel == kEdlPicture2 ? kEdlPicture : channel;
    // A freeze shows one frame. In reverse the time runs down to the start of the last frame and a frame beyond it.
    const double last = from + velocity * static_cast<double>(length);
    source.in = std::min({source.in, from, std::max(0.0, last)});
    source.out = std::max({source.out, from + (velocity > 0 ? 0.0 : 1.0), last});
}

void EdlImporter::findSources() {
    m_sourceOfEvent.assign(m_list.events.size(), kNoSource);
    for (const EdlTrack& track : m_programme.tracks) {
        const EdlClip* before = nullptr;
        for (const EdlClip& clip : track.clips) {
            if (!clip.black) {
                useSource(clip.event, track.channel, clip.sourceIn, clip.velocity,
                          clip.recordOut - clip.recordIn);
            }
            // What gives way in a transition plays on under it.
            const bool isBefore = before != nullptr && before->recordOut == clip.recordIn && !before->black;
            if (clip.outgoing && !clip.outgoing->black) {
                useSource(clip.outgoing->event, track.channel, clip.outgoing->frame, clip.outgoing->velocity,
                          clip.transition);
            } else if (clip.transition > 0 && !clip.outgoing && isBefore) {
                useSource(before->event, track.channel, before->sourceIn, before->velocity,
                          before->recordOut - before->recordIn + clip.transition);
            }
            before = &clip;
        }
    }
}

void EdlImporter::buildShot(size_t index) {
    const Source& source = m_sources[index];
    const EdlEvent& event = m_list.events[source.event];
    const cookie item = provisionalCookie(index);
    EditPtr shot = newEdit(item, true);
    const String& name = !event.clipName.empty()     ? event.clipName
                         : !event.sourceFile.empty() ? event.sourceFile
                                                     : event.reel;
    EditKeys::kName.set(shot.Opts(), shownName(name, event.line));
    shot.Opts().setString(EdlKey::kReel, event.reel);
    EditKeys::kReelId.set(shot.Opts(), event.reel);
    EditKeys::kDropFrame.set(shot.Opts(), event.sourceDrop);
    if (!event.sourceFile.empty()) {
        shot.Opts().setString(EdlKey::kSourceFile, event.sourceFile);
    }
    if (!event.mediaPath.empty()) {
        shot.Opts().setString(EdlKey::kMediaPath, event.mediaPath);
    }
    const double in = seconds(source.in);
    const double out = seconds(source.out);
    for (const EdlChannels channel : tracksUpTo(source.channels)) {
        auto content = std::make_unique<cel>();
        const bool picture = isPicture(channel);
        if ((source.channels & channel) != 0) {
            const Cookie_Type kind = picture ? Cookie_Type::Video : Cookie_Type::Sound;
            addPair(*content, cookie::fromWords(item.word(0), item.word(1), static_cast<uint32_t>(kind)), in,
                    out, in, 1.0);
        }
        shot->addChan(picture ? VideoChan : AudioChan, content.release(), false);
    }
    shot->setSourceMediumDuration(out);
    m_result.shots.push_back(std::move(shot));
}

// The transition at the start of a clip: an event pair between those that it joins.
void EdlImporter::addTransition(Edit& edit, cel& content, EdlChannels channel, const EdlClip& clip) {
    const EdlEvent& event = m_list.events[clip.event];
    const double from = m_list.rate.toSeconds(clip.recordIn);
    const double to = m_list.rate.toSeconds(clip.recordIn + clip.transition);
    if (clip.outgoing) {
        // Of no length: it plays under the transition only.
        const EdlOutgoing& outgoing = *clip.outgoing;
        addPair(content, outgoing.black ? black_cookie : provisionalCookie(m_sourceOfEvent[outgoing.event]),
                from, from, outgoing.black ? 0.0 : seconds(outgoing.frame), outgoing.velocity);
    }
    const bool isWipe = event.type == EdlType::Wipe;
    std::unique_ptr<EffectInstance> effect =
        Fx::makeEffect(!isPicture(channel) ? Fx::kCrossFade : (isWipe ? Fx::kWipe : Fx::kDissolve));
    if (auto* const wipe = dynamic_cast<TextureWipeEffect*>(effect.get())) {
        wipe->setPatternCode(static_cast<uint32_t>(event.wipe));
    }
    const IdStamp id = IdStamp::fresh(IdStampMagic::EffectNode);
    edit.objectStore().storeObject(id, std::move(effect));
    content.add_event({from, 0, effect_graph_cookie, 1.0F, CE_IN_POINT, id, 0});
    content.add_event({to, to - from, effect_graph_cookie, 1.0F, CE_OUT_POINT, channel_event::newId(), 0});
}

Qx::Ptr<cel> EdlImporter::buildCel(Edit& edit, const EdlTrack* track) {
    auto content = std::make_shared<cel>();
    if (track == nullptr) {
        return content;
    }
    content->reserve(static_cast<int>(track->clips.size()));
    for (const EdlClip& clip : track->clips) {
        if (clip.transition > 0) {
            addTransition(edit, *content, track->channel, clip);
        }
        const cookie strip = clip.black ? black_cookie : provisionalCookie(m_sourceOfEvent[clip.event]);
        const double shown = clip.sourceIn + clip.velocity * static_cast<double>(clip.transition);
        addPair(*content, strip, m_list.rate.toSeconds(clip.recordIn + clip.transition),
                m_list.rate.toSeconds(clip.recordOut), clip.black ? 0.0 : seconds(shown), clip.velocity);
        const channel_event in = content->get_event(content->numEvents() - 2);
        m_records[clip.event].events.push_back(in.id);
    }
    return content;
}

void EdlImporter::buildChannels(Edit& edit) {
    EdlChannels used = 0;
    for (const EdlTrack& track : m_programme.tracks) {
        used |= track.channel;
    }
    for (const EdlChannels channel : tracksUpTo(used)) {
        const EdlTrack* found = nullptr;
        for (const EdlTrack& track : m_programme.tracks) {
            if (track.channel == channel) {
                found = &track;
            }
        }
        const Edit::ChanType type{isPicture(channel) ? VideoChan : AudioChan, Edit_Chan_SubType::NONE};
        edit.setupEditChannel(type, buildCel(edit, found));
    }
}

void EdlImporter::addCues(Edit& edit) {
    Vector<cel*> cels;
    for (int chan = 0; chan < edit.getNumChans(); ++chan) {
        cels.push_back(edit.get_edit_cel_p(chan));
    }
    for (const EdlMarker& marker : m_list.markers) {
        const int64_t position = markerPosition(m_list, m_programme, marker);
        if (position < 0) {
            m_result.report.addLoss(marker.line, "the marker lies before the programme and is left out");
            continue;
        }
        const int colour = markerColourCode(marker.colour);
        String text = marker.text;
        if (colour == 0 && !marker.colour.empty()) {
            text = marker.colour + (text.empty() ? "" : " ") + text;
        }
        edit.get_cues().add_cue_point(
            cue_point(text.c_str(), m_list.rate.toSeconds(position), kAnyCueChan, colour, cels, true));
    }
    edit.get_cues().sort();
}

void EdlImporter::buildSequence(const String& name) {
    m_records.resize(m_list.events.size());
    for (size_t i = 0; i < m_records.size(); ++i) {
        const EdlEvent& event = m_list.events[i];
        m_records[i].number = event.number;
        m_records[i].typeText = event.typeText();
        m_records[i].reel = event.reel;
        m_records[i].speedDigits = event.speed ? event.speed->digits : String();
        m_records[i].notes = event.notes;
        m_records[i].times = {event.sourceIn, event.sourceOut, event.recordOut - event.recordIn,
                              m_programme.firstFrames[i]};
    }
    EditPtr sequence = newEdit(provisionalCookie(m_sources.size()), false);
    buildChannels(*sequence);
    addCues(*sequence);
    configb& header = sequence.Opts();
    EditKeys::kName.set(header, shownName(m_list.title.empty() ? name : m_list.title, 0));
    EditKeys::kStartTimecode.set(header, m_programme.start);
    EditKeys::kDropFrame.set(header, m_programme.dropFrame);
    header.setString(EdlKey::kEvents, packEdlRecords(m_records));
    if (!m_list.notes.empty()) {
        header.setString(EdlKey::kNotes, m_list.notes);
    }
    m_result.sequence = std::move(sequence);
}

void EdlImporter::build(const String& name) {
    findSources();
    m_result.shots.reserve(m_sources.size());
    for (size_t i = 0; i < m_sources.size(); ++i) {
        buildShot(i);
    }
    buildSequence(name);
}

} // namespace

Qx::Status importEdlList(const EdlList& list, const String& name, const ImportOptions& options,
                         Import& result) {
    Import built;
    built.report = result.report;
    EdlProgramme programme;
    if (Qx::Status status = layTracks(list, options.strict, programme, built.report); !status) {
        result.report = std::move(built.report);
        return status;
    }
    EdlImporter(list, programme, built).build(name);
    result = std::move(built);
    return {};
}

Qx::Status importEdl(const String& path, const ImportOptions& options, Import& result) {
    Import built;
    EdlList list;
    const BadLines bad = options.skipBad ? BadLines::Skip : BadLines::Refuse;
    if (Qx::Status status = readEdlFile(path, options.rate, list, built.report, bad); !status) {
        result.report = std::move(built.report);
        return status;
    }
    const String name = Qx::withoutExtension(Qx::fileNameOf(path));
    if (Qx::Status status = importEdlList(list, name, options, built); !status) {
        result.report = std::move(built.report);
        return status;
    }
    result = std::move(built);
    return {};
}

} // namespace interchange
