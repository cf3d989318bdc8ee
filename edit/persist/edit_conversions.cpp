#include "edit/persist/detail/edit_file.h"
#include "edit/persist/detail/legacy_upgrades.h"
#include "edit/persist/revision_history.h"

namespace {

// Medium codes of film transferred at 24 and at 23.976 frames a second.
constexpr int kMediumFilm24 = 24;
constexpr int kMediumFilm23 = 23;
constexpr int kPlainAudioMedium = 2;

} // namespace

bool Edit::doEditConversions() {
    // The steps in their order, each with the first revision in which its work is done already.
    struct Upgrade {
        int doneIn;
        void (*step)(Edit& edit, const Qx::Ed2Support::TVStd& standard);
    };
    using Standard = Qx::Ed2Support::TVStd;
    static constexpr Upgrade kUpgrades[] = {
        {220, [](Edit& edit, const Standard&) { edit.removeHiddenFXTracks(); }},
        {230, [](Edit& edit, const Standard&) { edit.utilizeMagicIdStampsForChannelIds(); }},
        {230, [](Edit& edit, const Standard&) { edit.makeMaterialNodesTransient(); }},
        {240, [](Edit& edit, const Standard&) { edit.updateChannelGroups(); }},
        {300, [](Edit& edit, const Standard&) { edit.validateUTRIDs(); }},
        {310, [](Edit& edit, const Standard&) { edit.removeShotSoundRamps(); }},
        {310, [](Edit& edit, const Standard&) { edit.initialiseAudioVarispeeds(); }},
        {kFirstCurrentRevision, [](Edit& edit, const Standard&) { edit.updateLegacyFileLabels(); }},
        {kFirstCurrentRevision,
         [](Edit& edit, const Standard& standard) { edit.updateLegacyFrameRate(standard); }},
        {kFirstCurrentRevision, [](Edit& edit, const Standard&) { edit.replaceLegacyEffects(); }},
    };
    const int revision = get_ed2_revision();
    if (revision >= kFirstCurrentRevision) {
        return false;
    }
    clear_cache_flags();
    Qx::Ed2Support::TVStd standard =
        Qx::Ed2Support::getTvStandard(EditKeys::kTvType.get(m_header), EditKeys::kFrameRate.get(m_header));
    if (EditKeys::kTransferAudioMedium.get(m_header) == kPlainAudioMedium &&
        standard.mediumCode == kMediumFilm24) {
        standard.mediumCode = kMediumFilm23;
    }
    redetermineLogType();
    updateLegacyFormat(standard);
    const RememberedFlags flags(*this);
    for (const Upgrade& upgrade : kUpgrades) {
        if (revision < upgrade.doneIn) {
            upgrade.step(*this, standard);
        }
    }
    set_ed2_revision(kCurrentEditRevision);
    flags.restore(*this);
    return true;
}
