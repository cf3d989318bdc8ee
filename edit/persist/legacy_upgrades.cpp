#include "edit/persist/detail/legacy_upgrades.h"
#include "edit/persist/detail/ed2_names.h"

#include "edit/model/aud_levels_cel.h"
#include "edit/model/edit.h"
#include "edit/model/event_objects.h"
#include "edit/model/managed_cel.h"
#include "edit/persist/detail/edit_file.h"
#include "platform/services/current_project.h"
#include "platform/services/log.h"

#include <set>

namespace {

constexpr int kMediumRateWith1001 = 3;
constexpr int kMediumRateWhole = 2;

// One line for a step that cannot act on what it found.
void notDone(const Edit& edit, const char* step, const char* what) {
    herc_printf("Edit::%s( %s ) - %s\n", step, edit.get_cookie_str().c_str(), what);
}

template <typename Visit>
void forEachCel(Edit& edit, Edit_Chan_Type type, Visit visit) {
    Vector<IdStamp> chans;
    edit.getChans(chans, type);
    for (const IdStamp& chan : chans) {
        if (cel* content = edit.getCel(chan)) {
            visit(chan, *content);
        }
    }
}

bool showsEffects(Edit& edit) {
    bool found = false;
    forEachCel(edit, AnyChan, [&found](const IdStamp&, const cel& content) {
        for (int i = 0; i < content.numEvents() && !found; ++i) {
            found = content.get_event(i).strip.isEffectGraph();
        }
    });
    return found;
}

// Every event's times are multiplied by `factor` and the cel becomes one of whole frames of `frame` seconds.
Qx::Ptr<cel> scaled(const cel& from, double factor, double frame) {
    cel result;
    result.reserve(from.numPairs());
    for (int i = 0; i < from.numEvents(); ++i) {
        channel_event event = from.get_event(i);
        event.editTime *= factor;
        event.stripTime *= factor;
        if (!result.add_event(event)) {
            return nullptr;
        }
    }
    result.set_resolution(frame);
    Qx::Ptr<cel> whole = result.quantise();
    if (whole != nullptr) {
        whole->editChannelInfo(from.editChannelName(), from.editChannelId(), from.editChannelSubType(),
                               from.editChannelMaterialInfo());
        whole->setChanged(true);
    }
    return whole;
}

void scaleTimes(Edit& edit, double factor, double frame) {
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const IdStamp chan = edit.getId(i);
        if (const cel* content = edit.get_edit_cel_p(i)) {
            if (const Qx::Ptr<cel> whole = scaled(*content, factor, frame)) {
                edit.set_edit_cel_p(i, whole->copy().release());
            } else {
                notDone(edit, "updateLegacyFrameRate", "a channel's times do not map; they stay");
            }
        } else if (AudLevelsCel levels = edit.getLevelsCel(chan); levels.valid()) {
            AudLevelsCel::Store nodes;
            for (const auto& node : levels.getNodeStore().nodes()) {
                nodes.insertNode(node.time * factor, node.level);
            }
            levels.changeNodeStore() = nodes;
        }
    }
    edit.get_cues().rescale(factor, factor);
    edit.convertCues();
}

} // namespace

Qx::Ed2Support::TVStd getNamedStandard(const TextFile& file) {
    // Only the header's own lines count: a text further on may begin with anything.
    const int end = Ed2Names::headerEnd(file);
    const auto valueOf = [&](const String& start) {
        const int at = file.find(start, 0, true);
        return at >= 0 && at < end ? String(file[static_cast<unsigned>(at)].substr(start.size())).trimmed()
                                   : String();
    };
    int code = 0;
    static_cast<void>(Qx::textToInt(valueOf(String(EditKeys::kFrameRate) + ":int "), code));
    return Qx::Ed2Support::getTvStandard(valueOf(String(EditKeys::kTvType) + ":textdata "), code);
}

RememberedFlags::RememberedFlags(const Edit& edit)
    : m_hadSequence(edit.Opts().contains(EditKeys::kSequence)),
      m_hadFrameBased(edit.Opts().contains(EditKeys::kFrameBased)),
      m_hadTransfer(edit.Opts().contains(EditKeys::kTransfer)),
      m_sequence(EditKeys::kSequence.get(edit.Opts())), m_frameBased(EditKeys::kFrameBased.get(edit.Opts())),
      m_transfer(EditKeys::kTransfer.get(edit.Opts())) {}

void RememberedFlags::restore(Edit& edit) const {
    const auto put = [&edit](bool had, std::string_view key, int value) {
        if (had) {
            edit.Opts().setInt(key, value);
        } else {
            edit.Opts().remove(key);
        }
    };
    put(m_hadSequence, EditKeys::kSequence, m_sequence);
    put(m_hadFrameBased, EditKeys::kFrameBased, m_frameBased);
    put(m_hadTransfer, EditKeys::kTransfer, m_transfer);
}

void Edit::updateLegacyFormat(const Qx::Ed2Support::TVStd& standard) {
    if (get_log_type() == kLogShot && standard.known()) {
        notDone(*this, "updateLegacyFormat", "no table of picture formats; the shot's format stays as it is");
    }
}

void Edit::removeHiddenFXTracks() {
    Vector<IdStamp> chans;
    getChans(chans, VideoChan, Edit_Chan_SubType::ALIAS);
    for (const IdStamp& chan : chans) {
        if (getChanSubtype(chan) == Edit_Chan_SubType::ALIAS && isEmpty(chan)) {
            removeChan(chan, false);
        }
    }
}

void Edit::utilizeMagicIdStampsForChannelIds() {
    std::map<IdStamp, IdStamp> renamed;
    for (int i = 0; i < getNumChans(); ++i) {
        const IdStamp old = getId(i);
        if (old.getMagicType() == IdStampMagic::Channel) {
            continue;
        }
        IdStamp wanted = old;
        wanted.setMagicType(IdStampMagic::Channel);
        if (getIdx(wanted) != NO_CHAN) {
            wanted = IdStamp::fresh(IdStampMagic::Channel);
        }
        if (setChannelID(old, wanted)) {
            renamed.emplace(old, wanted);
        }
    }
    if (renamed.empty()) {
        return;
    }
    forEachCel(*this, AudioChan, [&](const IdStamp& chan, const cel&) {
        AudCel audio = getAudCel(chan);
        if (const auto found = renamed.find(audio.getLevelsChanID()); found != renamed.end()) {
            audio.setLevelsChanID(found->second);
            setAudCel(audio);
        }
    });
    EventObjects::renameChannels(*this, renamed);
    init_dirty();
}

void Edit::makeMaterialNodesTransient() {
    if (showsEffects(*this)) {
        notDone(*this, "makeMaterialNodesTransient", "effect graphs of this revision are kept as they are");
    }
}

void Edit::validateUTRIDs() {
    std::set<IdStamp> seen;
    int fixed = 0;
    forEachCel(*this, VideoChan | AudioChan, [&](const IdStamp&, cel& content) {
        for (int i = 0; i < content.numEvents(); ++i) {
            channel_event event = content.get_event(i);
            const cookie strip = content.get_event(i & ~1).strip;
            const bool wrongKind = !strip.isMagic() && event.id.getMagicType() != IdStampMagic::Material;
            if (!event.id.valid() || wrongKind || seen.contains(event.id)) {
                event.id = channel_event::newId();
                fixed += content.setEvent(i, event) ? 1 : 0;
            }
            seen.insert(event.id);
        }
    });
    if (fixed > 0) {
        init_dirty();
        herc_printf("Edit::validateUTRIDs() : Fixed %d invalid IDs in '%s' (%s)\n", fixed, getName().c_str(),
                    get_cookie_str().c_str());
    }
}

void Edit::initialiseAudioVarispeeds() {
    forEachCel(*this, AudioChan, [](const IdStamp&, cel& content) {
        for (int i = 0; i < content.numEvents(); ++i) {
            if (content.get_event(i).velocity != 1.0) {
                ce_handle(&content, i).set_strip_velocity(1.0);
            }
        }
    });
}

void Edit::updateLegacyFileLabels() {
    if (m_header.contains(EditKeys::kNumLabels) ||
        m_header.contains(EditKeys::numbered(EditKeys::kLabel, 0))) {
        notDone(*this, "updateLegacyFileLabels", "labels are kept as the texts that they are");
    }
}

void Edit::updateLegacyFrameRate(const Qx::Ed2Support::TVStd& standard) {
    Qx::FrameRate to(standard.frameRateCode);
    if (standard.frameRateCode == Qx::FrameRate::Fps23_976) {
        to = Qx::FrameRate(Qx::FrameRate::Fps24);
    } else if (standard.frameRateCode == Qx::FrameRate::Fps30) {
        to = Qx::FrameRate(Qx::FrameRate::Fps29_97);
    }
    if (!to.valid()) {
        notDone(*this, "updateLegacyFrameRate", "the edit names no frame rate; its times stay as they are");
        return;
    }
    if (to.code() != standard.frameRateCode) {
        const double factor = to.frameDuration() / Qx::FrameRate(standard.frameRateCode).frameDuration();
        scaleTimes(*this, factor, to.frameDuration());
        setFrameRate(to);
    }
    const edit_log_type_t type = get_log_type();
    if (type == kLogShot) {
        if (const cel* first = get_edit_cel_p(0)) {
            setSourceMediumDuration(first->get_end_time());
        }
        setSourceMedium(standard.mediumCode);
        EditKeys::kTransferAudioMedium.set(m_header,
                                           to.denominator() == 1001 ? kMediumRateWith1001 : kMediumRateWhole);
        notDone(*this, "updateLegacyFrameRate", "no film-sync playback factor is derived for the shot");
        return;
    }
    setSourceMedium(Qx::currentProject().defaultEditMedium);
    if (type != kLogGhost3 && type != kLogGhost5) {
        return;
    }
    forEachCel(*this, AnyChan, [](const IdStamp&, cel& content) {
        for (int i = 0; i + 1 < content.numEvents(); i += 2) {
            const channel_event in = content.get_event(i);
            if (!in.strip.isMagic() && content.get_event(i + 1).level != in.level) {
                ce_handle(&content, i + 1).set_strip_level(in.level);
            }
        }
    });
}

void Edit::replaceLegacyEffects() {
    if (showsEffects(*this)) {
        notDone(*this, "replaceLegacyEffects", "effects of this revision are kept as they are");
    }
}
