#include "edit/inspect/edit_report.h"

#include "edit/model/cel.h"
#include "edit/model/channel_event.h"
#include "edit/model/cue_list.h"
#include "edit/model/managed_cel.h"
#include "platform/effects/special_effects.h"
#include "platform/media/timecode.h"
#include "platform/services/current_project.h"
#include "platform/store/tag.h"

#include <algorithm>
#include <cmath>
#include <map>
#include <unordered_map>

namespace {

/// Numbers the sources of one edit in the order in which they are met.
class SourceTable {
public:
    SourceTable(const Edit& edit, EditReport& report, const std::vector<String>& places,
                const SourceNamer& namer)
        : m_edit(edit), m_sources(report.sources), m_places(places), m_namer(namer),
          m_dropFrame(report.dropFrame) {}

    size_t indexOf(const channel_event& event) {
        // An event whose stamp is a channel's shows that channel.
        if (event.strip.isAlias() || event.id.getMagicType() == IdStampMagic::Channel) {
            return indexOfAlias(event);
        }
        if (m_lastValid && event.strip == m_lastStrip) {
            return m_lastIndex;
        }
        const auto [place, added] = m_strips.try_emplace(event.strip, m_sources.size());
        if (added) {
            m_sources.push_back({event.strip, sourceKindOf(event.strip), {}, {}, m_dropFrame, {}, {}});
            if (m_namer && m_sources.back().kind == SourceKind::Shot) {
                m_namer(m_sources.back());
            }
        }
        m_lastStrip = event.strip;
        m_lastValid = true;
        m_lastIndex = place->second;
        return m_lastIndex;
    }

private:
    size_t indexOfAlias(const channel_event& event) {
        const auto [place, added] = m_channels.try_emplace(event.id, m_sources.size());
        if (added) {
            const int index = m_edit.getIdx(event.id);
            m_sources.push_back({event.strip,
                                 SourceKind::Alias,
                                 m_edit.getChanDisplayName(event.id),
                                 {},
                                 m_dropFrame,
                                 {},
                                 index != NO_CHAN ? m_places[static_cast<size_t>(index)] : String()});
        }
        return place->second;
    }

    const Edit& m_edit;
    std::vector<SourceReport>& m_sources;
    const std::vector<String>& m_places;
    const SourceNamer& m_namer;
    bool m_dropFrame;
    std::unordered_map<cookie, size_t> m_strips;
    std::unordered_map<IdStamp, size_t> m_channels;
    cookie m_lastStrip;
    size_t m_lastIndex = 0;
    bool m_lastValid = false;
};

TransitionKind kindOf(const Fx::EffectKind& kind) {
    if (kind.effectClass == Fx::EffectClass::TextureWipe ||
        kind.effectClass == Fx::EffectClass::DissolveWipe) {
        return TransitionKind::Wipe;
    }
    return kind.typeId == Fx::kDissolve    ? TransitionKind::Dissolve
           : kind.typeId == Fx::kDip       ? TransitionKind::Dip
           : kind.typeId == Fx::kCrossFade ? TransitionKind::CrossFade
                                           : TransitionKind::Other;
}

/// What an edit says of the effect that a pair shows.
void takeEffect(const Edit& edit, PairReport& pair) {
    const Tag<EffectInstance> effect = edit.openObject<EffectInstance>(pair.id);
    if (!effect || effect->kind() == nullptr) {
        return;
    }
    pair.effect = String(effect->kind()->name);
    pair.isTransition = effect->isTransition();
    if (!pair.isTransition) {
        return;
    }
    pair.transition = kindOf(*effect->kind());
    if (const auto* const wipe = dynamic_cast<const TextureWipeEffect*>(&*effect)) {
        pair.wipe = wipe->getPatternCode();
    } else if (const auto* const legacy = dynamic_cast<const DissolveWipeEffect*>(&*effect)) {
        pair.wipe = static_cast<unsigned>(legacy->getPattern());
    }
}

void takePairs(const Edit& edit, const cel& content, double quarterFrame, SourceTable& table,
               std::vector<PairReport>& pairs) {
    pairs.reserve(static_cast<size_t>(content.numPairs()));
    for (int i = 0; i + 1 < content.numEvents(); i += 2) {
        const channel_event* in = content.getChanEventPtr(i);
        const channel_event* out = content.getChanEventPtr(i + 1);
        if (in == nullptr || out == nullptr) {
            return;
        }
        pairs.push_back({in->editTime,
                         out->editTime,
                         in->stripTime,
                         out->stripTime,
                         in->velocity,
                         in->rampQFrames * quarterFrame,
                         out->rampQFrames * quarterFrame,
                         table.indexOf(*in),
                         {in->level, in->code, in->rampCurve},
                         {out->level, out->code, out->rampCurve},
                         in->id,
                         TransitionKind::Cut,
                         0,
                         false,
                         {},
                         {}});
        PairReport& pair = pairs.back();
        if (in->strip.isEffectGraph()) {
            takeEffect(edit, pair);
        } else if (pairs.size() > 1 && pairs[pairs.size() - 2].isTransition) {
            const PairReport& before = pairs[pairs.size() - 2];
            const bool meets = std::abs(before.out - pair.in) <= Qx::kTimeTolerance;
            pair.transition = meets ? before.transition : TransitionKind::Cut;
            pair.wipe = meets ? before.wipe : 0;
        }
    }
}

/// The timecode of edit time 0: what an import found, else the elapsed time's origin.
void takeTimecode(const Edit& edit, EditReport& report) {
    report.dropFrame = edit.isDropFrame(Qx::currentProject().dropFrame);
    report.origin = edit.getTimecodeOrigin();
}

void takeCues(const Edit& edit, std::vector<CueReport>& cues) {
    const cue_list& list = edit.get_cues();
    const size_t count = list.get_num_cue_points(0);
    cues.reserve(count);
    for (size_t i = 0; i < count; ++i) {
        if (const cue_point* cue = list.get_cue_point(i, 0); cue != nullptr) {
            cues.push_back({cue->editTime(), cue->secondTime() - cue->editTime(), cue->text(), cue->code(),
                            cue->channel() == kAnyCueChan ? -1 : cue->channel(), cue->attached()});
        }
    }
    std::stable_sort(cues.begin(), cues.end(),
                     [](const CueReport& a, const CueReport& b) { return a.time < b.time; });
}

void takeGroups(const Edit& edit, std::vector<GroupReport>& groups) {
    for (unsigned i = 0; i < edit.numGroups(); ++i) {
        if (const ChannelGroup* group = edit.getTrackGroup(i); group != nullptr) {
            groups.push_back({group->getType(), {group->getChans().begin(), group->getChans().end()}});
        }
    }
}

} // namespace

SourceKind sourceKindOf(const cookie& strip) {
    if (strip.isBlack()) {
        return SourceKind::Black;
    }
    if (strip.isEffectGraph()) {
        return SourceKind::Effect;
    }
    if (strip.isInput()) {
        return SourceKind::Input;
    }
    if (strip.isMagic()) {
        return SourceKind::Magic;
    }
    const bool media = strip.type() == Cookie_Type::Video || strip.type() == Cookie_Type::Sound;
    return media ? SourceKind::Media : SourceKind::Shot;
}

std::vector<String> placesOf(const Edit& edit) {
    std::vector<String> places(static_cast<size_t>(edit.getNumChans()));
    std::map<String, int> count;
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const Edit_Chan_Type type = edit.getChanType(i);
        if (type == NoChan) {
            continue;
        }
        const Edit_Chan_SubType subtype = edit.getChanSubtype(i);
        const auto letter = static_cast<char>(Edit::edit_chan_letter_from_type(type, subtype));
        const String kind = subtype == Edit_Chan_SubType::ALIAS ? String("FX") : String(1, letter);
        String& place = places[static_cast<size_t>(i)];
        place = kind + std::to_string(++count[kind]);
        const int levels = type == AudioChan ? edit.getIdx(edit.getAudCel(edit.getId(i)).getLevelsChanID())
                                             : static_cast<int>(NO_CHAN);
        if (levels != NO_CHAN) {
            places[static_cast<size_t>(levels)] = place + " levels";
        }
    }
    for (String& place : places) {
        if (place.empty()) {
            place = "levels " + std::to_string(++count["levels"]); // of no audio channel
        }
    }
    return places;
}

char ChannelReport::letter() const {
    return static_cast<char>(Edit::edit_chan_letter_from_type(type, subtype));
}

int64_t EditReport::frames(double seconds) const {
    return std::isfinite(seconds) ? rate.toFrames(seconds) : 0;
}

String EditReport::recordTimecode(double editTime) const {
    return Qx::timecodeText(frames(origin) + frames(editTime), rate, dropFrame);
}

String EditReport::sourceTimecode(const SourceReport& source, double stripTime) const {
    return Qx::timecodeText(frames(stripTime), rate, source.dropFrame);
}

String EditReport::lengthText(double seconds) const {
    return Qx::durationText(frames(seconds), rate, dropFrame);
}

EditReport reportOf(const Edit& edit, const SourceNamer& namer) {
    EditReport report;
    report.item = edit.get_cookie();
    report.name = edit.getName();
    report.type = edit.get_log_type();
    report.rate = edit.getFrameRate();
    takeTimecode(edit, report);
    report.start = edit.getStartTime();
    report.end = edit.getEndTime();
    report.modified = edit.getModificationTime();

    const double quarterFrame = report.rate.frameDuration() / 4;
    const std::vector<String> places = placesOf(edit);
    SourceTable table(edit, report, places, namer);
    const int count = edit.getNumChans();
    report.channels.reserve(static_cast<size_t>(count));
    for (int i = 0; i < count; ++i) {
        ChannelReport channel;
        channel.id = edit.getId(i);
        channel.name = edit.getChanDisplayName(channel.id);
        channel.place = places[static_cast<size_t>(i)];
        channel.type = edit.getChanType(i);
        channel.subtype = edit.getChanSubtype(i);
        if (const cel* content = edit.get_edit_cel_p(i); content != nullptr) {
            takePairs(edit, *content, quarterFrame, table, channel.pairs);
        }
        report.channels.push_back(std::move(channel));
    }
    takeCues(edit, report.cues);
    takeGroups(edit, report.groups);
    return report;
}

String transitionText(const PairReport& pair) {
    switch (pair.transition) {
    case TransitionKind::Cut:
        return "cut";
    case TransitionKind::Dissolve:
        return "dissolve";
    case TransitionKind::Wipe:
        return String::format("wipe %u", pair.wipe);
    case TransitionKind::Dip:
        return "dip";
    case TransitionKind::CrossFade:
        return "cross-fade";
    case TransitionKind::Other:
        return "transition";
    }
    return "cut";
}

const char* sourceKindText(SourceKind kind) {
    switch (kind) {
    case SourceKind::Shot:
        return "shot";
    case SourceKind::Media:
        return "media";
    case SourceKind::Black:
        return "black";
    case SourceKind::Effect:
        return "effect";
    case SourceKind::Alias:
        return "alias";
    case SourceKind::Input:
        return "input";
    case SourceKind::Magic:
        return "magic";
    }
    return "shot";
}
