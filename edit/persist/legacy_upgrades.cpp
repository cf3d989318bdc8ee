#include "edit/persist/detail/legacy_upgrades.h"
#include "edit/persist/detail/ed2_names.h"

#include "edit/model/aud_levels_cel.h"
#include "edit/model/ce_handle.h"
#include "edit/model/cel.h"
#include "edit/model/edit.h"
#include "edit/model/event_objects.h"
#include "edit/model/managed_cel.h"
#include "edit/persist/detail/edit_file.h"
#include "platform/media/edit_label.h"
#include "platform/media/picture_format.h"
#include "platform/services/log.h"

#include <bit>
#include <map>
#include <set>
#include <vector>

namespace {

bool showsEffects(Edit& edit) {
    bool found = false;
    forEachCel(edit, AnyChan, [&found](const IdStamp&, const cel& content) {
        for (int i = 0; i < content.numEvents() && !found; ++i) {
            found = content.get_event(i).strip.isEffectGraph();
        }
    });
    return found;
}

/// Stamps that were met: a table of twice their number, of which the null stamp marks a free place.
class SeenStamps {
public:
    /// Room for so many.
    explicit SeenStamps(size_t count) : m_slots(std::bit_ceil(2 * count + 16)) {}

    /// False if a stamp, which is not null, was added before.
    bool add(const IdStamp& id) {
        constexpr uint64_t kOdd = 0x9E3779B97F4A7C15u;
        size_t at = static_cast<size_t>(std::hash<IdStamp>()(id) * kOdd >> 32);
        for (at &= m_slots.size() - 1; m_slots[at].valid(); at = (at + 1) & (m_slots.size() - 1)) {
            if (m_slots[at] == id) {
                return false;
            }
        }
        m_slots[at] = id;
        return true;
    }

private:
    std::vector<IdStamp> m_slots;
};

} // namespace

String countedText(int count, const char* noun, const char* what) {
    return String::format("%d %s%s", count, noun, count == 1 ? "" : "s") + what;
}

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
    if (get_log_type() != kLogShot) {
        return;
    }
    const LineStructure lines = Qx::projectLineStructure();
    for (const Qx::OutputFormat& format : Qx::outputFormats()) {
        if (format.formatCode == standard.formatCode && format.lines == lines) {
            setShotVideoMetadata({format.width, format.height, lines, ShotVideoMetadata::kPixelYUY2});
            noteUpgrade("its pictures are " + getShotVideoMetadata().asString());
            return;
        }
    }
}

void Edit::removeHiddenFXTracks() {
    Vector<IdStamp> chans;
    int removed = 0;
    getChans(chans, VideoChan, Edit_Chan_SubType::ALIAS);
    for (const IdStamp& chan : chans) {
        if (getChanSubtype(chan) == Edit_Chan_SubType::ALIAS && isEmpty(chan)) {
            removed += removeChan(chan, false) ? 1 : 0;
        }
    }
    if (removed > 0) {
        noteUpgrade(countedText(removed, "hidden effects channel", " without an effect went"));
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
    noteUpgrade(countedText(static_cast<int>(renamed.size()), "channel", " got a stamp of a channel"));
}

void Edit::makeMaterialNodesTransient() {
    // Few objects are stored under stamps, so these are looked for among the events and not the other way.
    std::map<IdStamp, bool> isMaterial;
    for (const String& name : m_store.names()) {
        if (const IdStamp id{std::string_view(name)}; id.valid() && getIdx(id) == NO_CHAN) {
            isMaterial.emplace(id, false);
        }
    }
    if (isMaterial.empty()) {
        return;
    }
    std::set<IdStamp> others; // of what is no material
    forEachCel(*this, AnyChan, [&](const IdStamp&, const cel& content) {
        for (int i = 0; i < content.numEvents(); ++i) {
            const auto found = isMaterial.find(content.getChanEventPtr(i)->id);
            if (found == isMaterial.end()) {
                continue;
            }
            found->second = true;
            if (const cookie& strip = content.getChanEventPtr(i & ~1)->strip;
                strip.isMagic() || strip.isAlias()) {
                others.insert(found->first);
            }
        }
    });
    int removed = 0;
    for (const auto& [id, plays] : isMaterial) {
        if (plays && !others.contains(id)) {
            removed += m_store.removeObject(id.asString()) ? 1 : 0;
        }
    }
    if (removed > 0) {
        noteUpgrade(countedText(removed, "stored node", " of material went: it is made from its event"));
    }
}

void Edit::validateUTRIDs() {
    size_t events = 0;
    forEachCel(*this, VideoChan | AudioChan, [&events](const IdStamp&, const cel& content) {
        events += static_cast<size_t>(content.numEvents());
    });
    SeenStamps seen(events);
    int fixed = 0;
    forEachCel(*this, VideoChan | AudioChan, [&](const IdStamp&, cel& content) {
        for (int i = 0; i < content.numEvents(); ++i) {
            const IdStamp id = content.getChanEventPtr(i)->id;
            const bool wrongKind = !content.getChanEventPtr(i & ~1)->strip.isMagic() &&
                                   id.getMagicType() != IdStampMagic::Material;
            if (id.valid() && !wrongKind && seen.add(id)) {
                continue;
            }
            channel_event event = content.get_event(i);
            event.id = channel_event::newId();
            fixed += content.setEvent(i, event) ? 1 : 0;
            seen.add(event.id);
        }
    });
    if (fixed > 0) {
        init_dirty();
        herc_printf("Edit::validateUTRIDs() : Fixed %d invalid IDs in '%s' (%s)\n", fixed, getName().c_str(),
                    get_cookie_str().c_str());
        noteUpgrade(countedText(fixed, "event", " got an identity of its own"));
    }
}

void Edit::initialiseAudioVarispeeds() {
    int changed = 0;
    forEachCel(*this, AudioChan, [&changed](const IdStamp&, cel& content) {
        for (int i = 0; i < content.numEvents(); ++i) {
            if (content.get_event(i).velocity != 1.0) {
                ce_handle(&content, i).set_strip_velocity(1.0);
                ++changed;
            }
        }
    });
    if (changed > 0) {
        noteUpgrade(countedText(changed, "sound event", " plays at speed 1"));
    }
}

void Edit::updateLegacyFileLabels() {
    constexpr MediumRollIdent primary{kPrimaryMedium, 2};
    constexpr MediumRollIdent second{kSoundMedium, 2};
    constexpr MediumRollIdent third{kSoundMedium, 3};
    const auto timecodeOf = [this](const MediumRollIdent& roll) {
        for (const edit_label& label : labels()) {
            if (label.get_MediumRoll() == roll && label.user_type() == kTimecodeLabelType) {
                return label;
            }
        }
        return edit_label();
    };
    if (edit_label sound = timecodeOf(third); !timecodeOf(primary).is_valid() && sound.is_valid()) {
        sound.set_MediumRoll(second);
        sound.set_channels(edit_label::kAllChannels);
        setLabel(sound);
        const String reelId = get_reelid(third);
        if (!reelId.empty() && set_reelid(second, reelId)) {
            set_reelid(third, String());
        }
        removeLabel(kTimecodeLabelType, third);
        noteUpgrade("the timecode of sound roll 3 became that of sound roll 2");
    }
    const edit_log_type_t type = get_log_type();
    if (const edit_label own = timecodeOf({kEditMedium, 1});
        type == kLogEdit && own.is_valid() && own.first().scale().rate.nominal() == own.rate().nominal() &&
        !m_header.contains(EditKeys::kStartTimecode)) {
        const label start = own.labelAt(0);
        EditKeys::kStartTimecode.set(m_header, start.frames());
        EditKeys::kDropFrame.set(m_header, start.scale().dropFrame);
        noteUpgrade("its start timecode is that of its label, " + start.asString());
    }
    if ((type == kLogEdit || type == kLogGhost3 || type == kLogGhost5) && give_new_edit_all_its_labels()) {
        noteUpgrade("it got the labels of its own timecode, in its frames and in 24");
    }
}

void Edit::replaceLegacyEffects() {
    if (showsEffects(*this)) {
        noteNotUpgraded("replaceLegacyEffects", "effects of this revision are kept as they are");
    }
}
