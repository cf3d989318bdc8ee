#include "edit/model/edit_upgrade.h"
#include "edit/persist/detail/edit_file.h"
#include "edit/persist/detail/legacy_upgrades.h"
#include "edit/persist/revision_history.h"
#include "platform/services/log.h"

namespace {

// Medium codes of film transferred at 24 and at 23.976 frames a second.
constexpr int kMediumFilm24 = 24;
constexpr int kMediumFilm23 = 23;
constexpr int kPlainAudioMedium = 2;

} // namespace

void Edit::beginUpgrade(int from) {
    m_upgrade = std::make_shared<EditUpgrade>();
    m_upgrade->from = from;
    m_upgrade->to = kCurrentEditRevision;
}

void Edit::noteUpgrade(String what) {
    if (m_upgrade != nullptr) {
        m_upgrade->done.push_back(std::move(what));
    }
}

void Edit::noteNotUpgraded(const char* step, const String& what) {
    herc_printf("Edit::%s( %s ) - %s\n", step, get_cookie_str().c_str(), what.c_str());
    if (m_upgrade != nullptr) {
        m_upgrade->notDone.push_back(what);
    }
}

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
        {240,
         [](Edit& edit, const Standard&) {
             const unsigned before = edit.numGroups();
             edit.updateChannelGroups();
             if (const unsigned now = edit.numGroups(); now > before) {
                 edit.noteUpgrade(
                     countedText(static_cast<int>(now - before), "channel group", " came out of a text"));
             }
         }},
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
    beginUpgrade(revision);
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
    dropLabels(false); // what of them is read depends on the revision
    flags.restore(*this);
    return true;
}
