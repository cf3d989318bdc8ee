#include "edit/persist/detail/legacy_upgrades.h"

#include "edit/model/aud_levels_cel.h"
#include "edit/model/ce_handle.h"
#include "edit/model/cel.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit_keys.h"
#include "edit/persist/detail/edit_file.h"
#include "platform/media/edit_label.h"
#include "platform/media/film_sync.h"
#include "platform/services/current_project.h"
#include "platform/services/log.h"

namespace {

// What "TRANSFER_AUDIO_MEDIUM" says of the rate of the medium: with a factor of 1000/1001, or without.
constexpr int kMediumRateWith1001 = 3;
constexpr int kMediumRateWhole = 2;

/// The rate that the edit of a standard is counted in: the two of which one was taken for the other.
Qx::FrameRate rateOf(const Qx::Ed2Support::TVStd& standard) {
    switch (standard.frameRateCode) {
    case Qx::FrameRate::Fps23_976:
        return Qx::FrameRate(Qx::FrameRate::Fps24);
    case Qx::FrameRate::Fps30:
        return Qx::FrameRate(Qx::FrameRate::Fps29_97);
    default:
        return Qx::FrameRate(standard.frameRateCode);
    }
}

/// The channel with every event's times multiplied by `factor` and laid onto frames of `frame` seconds; null
/// when they do not map.
std::unique_ptr<cel> scaled(const cel& from, double factor, double frame) {
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
    std::unique_ptr<cel> whole = result.quantise();
    if (whole != nullptr) {
        whole->editChannelInfo(from.editChannelName(), from.editChannelId(), from.editChannelSubType(),
                               from.editChannelMaterialInfo());
        whole->setChanged(true);
    }
    return whole;
}

/// All times of the edit, or none.
bool scaleTimes(Edit& edit, double factor, double frame) {
    std::vector<std::pair<int, std::unique_ptr<cel>>> contents;
    for (int i = 0; i < edit.getNumChans(); ++i) {
        if (const cel* const content = edit.get_edit_cel_p(i)) {
            contents.emplace_back(i, scaled(*content, factor, frame));
            if (contents.back().second == nullptr) {
                return false;
            }
        }
    }
    for (auto& [index, content] : contents) {
        edit.set_edit_cel_p(index, content.release());
    }
    for (int i = 0; i < edit.getNumChans(); ++i) {
        if (AudLevelsCel levels = edit.getLevelsCel(edit.getId(i)); levels.valid()) {
            AudLevelsCel::Store nodes;
            for (const auto& node : levels.getNodeStore().nodes()) {
                nodes.insertNode(node.time * factor, node.level);
            }
            levels.changeNodeStore() = nodes;
        }
    }
    edit.get_cues().rescale(factor, factor);
    edit.convertCues();
    return true;
}

/// The labels that count the frames of one rate count those of another, from the same frame on.
void moveLabels(Edit& edit, Qx::FrameRate from, Qx::FrameRate to) {
    const double factor = to.frameDuration() / from.frameDuration();
    const std::vector<edit_label> before = edit.labels();
    for (const edit_label& old : before) {
        if (old.rate() != from) {
            continue;
        }
        label first = old.first();
        if (first.userType() == kTimecodeLabelType && first.scale().rate == from) {
            first = label(label::Scale::timecode(to), first.frames());
        }
        edit_label moved(old.get_MediumRoll(), first, old.at() * factor, to);
        moved.set_channels(old.channels());
        moved.set_pulldown(old.pulldown());
        edit.setLabel(moved);
    }
}

/// The out point of every pair of material gets the level of its in point. How many had another.
int levelOutPoints(Edit& edit) {
    int changed = 0;
    forEachCel(edit, AnyChan, [&changed](const IdStamp&, cel& content) {
        for (int i = 0; i + 1 < content.numEvents(); i += 2) {
            const channel_event in = content.get_event(i);
            if (!in.strip.isMagic() && content.get_event(i + 1).level != in.level) {
                ce_handle(&content, i + 1).set_strip_level(in.level);
                ++changed;
            }
        }
    });
    return changed;
}

} // namespace

void Edit::updateLegacyFrameRate(const Qx::Ed2Support::TVStd& standard) {
    const Qx::FrameRate from(standard.frameRateCode);
    const Qx::FrameRate to = rateOf(standard);
    if (to.valid() && to != from) {
        const double factor = to.frameDuration() / from.frameDuration();
        if (scaleTimes(*this, factor, to.frameDuration())) {
            moveLabels(*this, from, to);
            setFrameRate(to);
            noteUpgrade("its times went from " + from.asString() + " to " + to.asString() +
                        " frames a second");
        } else {
            noteNotUpgraded("updateLegacyFrameRate", "its times do not map from " + from.asString() + " to " +
                                                         to.asString() + " frames a second; they stay");
        }
    } else if (to.valid()) {
        setFrameRate(to);
    }
    updateLegacyMedium(standard);
}

void Edit::updateLegacyMedium(const Qx::Ed2Support::TVStd& standard) {
    const edit_log_type_t type = get_log_type();
    if (type == kLogShot) {
        const Qx::FrameRate mediumRate = Qx::Ed2Support::mediumFrameRate(standard.mediumCode);
        const Qx::FilmSync sync{Qx::projectFrameRate(), mediumRate,
                                Qx::Ed2Support::isFilmMedium(standard.mediumCode),
                                EditKeys::kFilmSpeed.get(m_header)};
        if (const cel* const first = get_edit_cel_p(0)) {
            setSourceMediumDuration(Qx::mediumTime(first->get_end_time(), getFrameRate(), mediumRate));
        }
        setSourceMedium(standard.mediumCode);
        EditKeys::kTransferAudioMedium.set(m_header, mediumRate.denominator() == 1001 ? kMediumRateWith1001
                                                                                      : kMediumRateWhole);
        double factor = 1;
        if (sync.playbackFactor(factor)) {
            EditKeys::kFilmSyncFactor.set(m_header, factor);
            noteUpgrade(
                String::format("its source is on medium %d", standard.mediumCode) +
                (factor == 1 ? String() : String::format(", its sound plays at %.5f of its speed", factor)));
        } else {
            LogBoth("ED2 IMPORT - legacy edit has invalid audio-rate factors\n");
        }
        return;
    }
    setSourceMedium(Qx::currentProject().defaultEditMedium);
    if (type != kLogGhost3 && type != kLogGhost5) {
        return;
    }
    if (const int changed = levelOutPoints(*this); changed > 0) {
        noteUpgrade(countedText(changed, "out point", " got the level of its in point"));
    }
}
