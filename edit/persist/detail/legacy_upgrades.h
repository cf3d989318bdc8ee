#pragma once

#include "platform/base/id_stamp.h"
#include "platform/media/tv_standard.h"

class Edit;
class TextFile;
class configb;

/// The steps that bring an edit of an older revision, or one from a legacy text, to the current model. Each
/// repairs what it can and none fails the read; a step that cannot act on what it finds logs one line.
namespace LegacyUpgrades {

/// The television standard that a header names: its "tvtype", else what follows from its frame rate; one
/// that is not known when it tells neither.
[[nodiscard]] Qx::Ed2Support::TVStd getTvStandard(const configb& header);

/// The television standard that a legacy text names in the "tvtype" line of its header, else the one that
/// follows from its frame rate.
[[nodiscard]] Qx::Ed2Support::TVStd getNamedStandard(const TextFile& file);

/// What a conversion must not change, remembered over it.
class RememberedFlags {
public:
    explicit RememberedFlags(const Edit& edit);
    /// Puts the values back; a key that was not there goes again.
    void restore(Edit& edit) const;

private:
    bool m_hadSequence, m_hadFrameBased, m_hadTransfer;
    int m_sequence, m_frameBased, m_transfer;
};

/// For a shot: the picture format that its standard had would become its shot video metadata. The table of
/// output formats is not part of this library, so a shot keeps the metadata that it has.
void updateLegacyFormat(Edit& edit, const Qx::Ed2Support::TVStd& standard);

/// Below 220: removes effects channels in which nothing but black lies; they were hidden and carried no
/// effect. Effects channels with content stay.
void removeHiddenFXTracks(Edit& edit);

/// Below 230: gives channel stamps, levels channels included, the magic type of a channel; the other bits
/// stay unless that stamp is taken. Events that show such a channel follow.
void utilizeMagicIdStampsForChannelIds(Edit& edit);

/// Below 230: material nodes of effect graphs would become transient. Effect graphs are not read here; they
/// stay in the file as they are.
void makeMaterialNodesTransient(Edit& edit);

/// Below 300: every event gets an identity of its own; see the log line that tells how many were given.
void validateUTRIDs(Edit& edit);

/// Below 310 and from legacy text: turns level ramps of clips into nodes of a levels channel.
void removeShotSoundRamps(Edit& edit);

/// Below 310 and from legacy text: every audio event plays at speed 1.
void initialiseAudioVarispeeds(Edit& edit);

/// Labels of older revisions would move to the rolls of current ones. Labels are carried along as the header
/// texts that they are.
void updateLegacyFileLabels(Edit& edit);

/// Maps times from the rate that a standard named to the one that it stands for, and sets the source medium.
/// The duration of a shot's source is its end time as it is: no translation between media is made, and no
/// film-sync playback factor is derived.
void updateLegacyFrameRate(Edit& edit, const Qx::Ed2Support::TVStd& standard);

/// Effects of older revisions would be replaced. They stay as they are.
void replaceLegacyEffects(Edit& edit);

} // namespace LegacyUpgrades
