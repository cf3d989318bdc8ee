#include "edit/persist/detail/edit_file.h"
#include "edit/persist/detail/legacy_upgrades.h"
#include "edit/persist/revision_history.h"

namespace {

// Medium codes of film transferred at 24 and at 23.976 frames a second.
constexpr int kMediumFilm24 = 24;
constexpr int kMediumFilm23 = 23;
constexpr int kPlainAudioMedium = 2;

// First revisions in which a step's work is done already.
constexpr int kWithoutHiddenTracks = 220;
constexpr int kWithMagicStamps = 230;
constexpr int kWithGroupObjects = 240;
constexpr int kWithUniqueIds = 300;
constexpr int kWithLevelsTracks = 310;

} // namespace

bool Edit::doEditConversions() {
    const int revision = get_ed2_revision();
    if (revision >= kFirstCurrentRevision) {
        return false;
    }
    clear_cache_flags();
    Qx::Ed2Support::TVStd standard = LegacyUpgrades::getTvStandard(m_header);
    if (EditKeys::kTransferAudioMedium.get(m_header) == kPlainAudioMedium &&
        standard.mediumCode == kMediumFilm24) {
        standard.mediumCode = kMediumFilm23;
    }
    redetermineLogType();
    LegacyUpgrades::updateLegacyFormat(*this, standard);
    const LegacyUpgrades::RememberedFlags flags(*this);

    if (revision < kWithLevelsTracks) {
        if (revision < kWithUniqueIds) {
            if (revision < kWithGroupObjects) {
                if (revision < kWithMagicStamps) {
                    if (revision < kWithoutHiddenTracks) {
                        LegacyUpgrades::removeHiddenFXTracks(*this);
                    }
                    LegacyUpgrades::utilizeMagicIdStampsForChannelIds(*this);
                    LegacyUpgrades::makeMaterialNodesTransient(*this);
                }
                updateChannelGroups();
            }
            LegacyUpgrades::validateUTRIDs(*this);
        }
        LegacyUpgrades::removeShotSoundRamps(*this);
        LegacyUpgrades::initialiseAudioVarispeeds(*this);
    }
    LegacyUpgrades::updateLegacyFileLabels(*this);
    LegacyUpgrades::updateLegacyFrameRate(*this, standard);
    LegacyUpgrades::replaceLegacyEffects(*this);
    set_ed2_revision(kCurrentEditRevision);
    flags.restore(*this);
    return true;
}
