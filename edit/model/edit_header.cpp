#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "edit/model/edit_registry.h"
#include "edit/project/permissions_manager.h"
#include "platform/media/tv_standard.h"
#include "platform/services/clock.h"
#include "platform/services/current_project.h"
#include "platform/services/log.h"

namespace {

/// First revision whose header holds the frame rate.
constexpr int kRevisionWithFrameRate = 501;
/// First revision whose header holds the duration of the source.
constexpr int kRevisionWithDuration = 503;
constexpr uint32_t kRevisionUnknown = UINT32_MAX;

static_assert(EditKeys::kTransfer.fallback() == Edit::kDefaultTransfer);
static_assert(EditKeys::kPermissions.fallback() == Edit::kPermissionsAll);

/// Seconds since 1970 as the header keeps them: the low 32 bits.
int32_t now() {
    return static_cast<int32_t>(static_cast<uint32_t>(Qx::nowSeconds()));
}

} // namespace

void Edit::initHeader() {
    const Qx::CurrentProject project = Qx::currentProject();
    m_header.clear();
    EditKeys::kReadOnly.set(m_header, false);
    EditKeys::kBackup.set(m_header, 0);
    EditKeys::kOriginalMaterial.set(m_header, 0);
    EditKeys::kHidden.set(m_header, 0);
    EditKeys::kSearchEdit.set(m_header, 0);
    EditKeys::kUndoCookie.set(m_header, invalid_cookie);
    EditKeys::kRedoCookie.set(m_header, invalid_cookie);
    EditKeys::kProjectCookie.set(m_header, project.project);
    EditKeys::kCreationTime.set(m_header, now());
    setModificationDetails();
    EditKeys::kRevision.set(m_header, kCurrentRevision);
    EditKeys::kFrameRate.set(m_header, project.frameRateCode);
    EditKeys::kSourceMedium.set(m_header, project.defaultEditMedium);
    EditKeys::kFrameBased.set(m_header, 1);
    EditKeys::kTransfer.set(m_header, kDefaultTransfer);
    EditKeys::kOwner.set(m_header, PermissionsManager::getCurrentUser());

    clear_cache_flags();
    dropLabels(true);
    m_entireMedium = 0;
    m_revision = static_cast<uint32_t>(kCurrentRevision);
    m_frameRate = Qx::FrameRate(project.frameRateCode);
    m_frameRateValid = true;
    m_sourceMedium = project.defaultEditMedium;
    m_transfer = kDefaultTransfer;
}

void Edit::clear_cache_flags() {
    m_frameRateValid = false;
    m_revision = kRevisionUnknown;
    m_sourceMedium.reset();
    m_transfer.reset();
    dropLabels(false);
    dropDerivedValues();
}

void Edit::dropDerivedValues() {
    m_sourceMediumDuration = Qx::kNoTime;
}

String Edit::getName() const {
    return EditKeys::kName.get(m_header);
}

void Edit::setName(const String& name) {
    if (name != getName()) {
        EditKeys::kName.set(m_header, name);
        recordChange(kNameChanged, true);
    }
}

bool Edit::get_read_only() const {
    return EditKeys::kReadOnly.get(m_header);
}

void Edit::set_read_only(bool readOnly) {
    if (readOnly && !get_read_only()) {
        // Once the property is set nothing can dirty the edit, and the property itself has to be saved.
        set_dirty(true);
        const QuietHeader quiet(*this);
        EditKeys::kReadOnly.set(m_header, true);
    } else {
        EditKeys::kReadOnly.set(m_header, readOnly);
    }
}

int Edit::get_backup() const {
    return EditKeys::kBackup.get(m_header);
}

void Edit::set_backup(int backup) {
    EditKeys::kBackup.set(m_header, backup);
}

int Edit::get_hidden() const {
    return EditKeys::kHidden.get(m_header);
}

void Edit::set_hidden(int hidden) {
    if (hidden != get_hidden()) {
        EditKeys::kHidden.set(m_header, hidden);
    }
}

int Edit::get_search_edit() const {
    return EditKeys::kSearchEdit.get(m_header);
}

void Edit::set_search_edit(int search) {
    EditKeys::kSearchEdit.set(m_header, search);
}

int Edit::get_original_material() const {
    return EditKeys::kOriginalMaterial.get(m_header);
}

void Edit::set_original_material(int original) {
    EditKeys::kOriginalMaterial.set(m_header, original);
    dropDerivedValues();
    if (m_cookie.is_valid()) {
        const Qx::Status recorded =
            PermissionsManager::setOwner(m_cookie, PermissionsManager::getCurrentUser(), true);
        if (!recorded) {
            herc_printf("Edit::set_original_material( %s ) - %s\n", cookie_string(m_cookie).c_str(),
                        recorded.reason().c_str());
        }
    }
}

void Edit::set_entire_medium(int entire) {
    m_entireMedium = entire;
    EditKeys::kEntireMedium.set(m_header, entire);
    updateProjectRecord();
}

cookie Edit::get_undo_cookie() const {
    return EditKeys::kUndoCookie.get(m_header);
}

void Edit::set_undo_cookie(const cookie& item) {
    EditKeys::kUndoCookie.set(m_header, item);
}

cookie Edit::get_redo_cookie() const {
    return EditKeys::kRedoCookie.get(m_header);
}

void Edit::set_redo_cookie(const cookie& item) {
    EditKeys::kRedoCookie.set(m_header, item);
}

int Edit::getCreationTime() const {
    return EditKeys::kCreationTime.get(m_header);
}

String Edit::getCreationProgram() const {
    return EditKeys::kCreationProgram.get(m_header);
}

void Edit::setCreationDetails() {
    EditKeys::kCreationTime.set(m_header, now());
    EditKeys::kCreationProgram.set(m_header, kProgramVersion);
}

int Edit::getModificationTime() const {
    return EditKeys::kModificationTime.get(m_header);
}

String Edit::getModificationProgram() const {
    return EditKeys::kModificationProgram.get(m_header);
}

void Edit::setModificationDetails() {
    const int32_t time = now();
    EditKeys::kModificationTime.set(m_header, time);
    EditKeys::kModificationTimeV3.set(m_header, time);
    EditKeys::kModificationProgram.set(m_header, kProgramVersion);
}

uint64_t Edit::getModificationCount() const {
    const int64_t count = EditKeys::kModificationCount.get(m_header);
    return count > 0 ? static_cast<uint64_t>(count) : 0;
}

void Edit::incModificationCount() {
    // A count from outside may be the greatest there is; it stays there.
    const uint64_t count = getModificationCount();
    if (count < static_cast<uint64_t>(INT64_MAX)) {
        EditKeys::kModificationCount.set(m_header, static_cast<int64_t>(count + 1));
    }
}

Edit::Permissions Edit::getPermissions() const {
    const int value = EditKeys::kPermissions.get(m_header);
    return value >= kPermissionsNone && value <= kPermissionsAll ? static_cast<Permissions>(value)
                                                                 : kPermissionsAll;
}

void Edit::setPermissions(Permissions permissions) {
    EditKeys::kPermissions.set(m_header, permissions);
}

int Edit::get_ed2_revision() const {
    if (m_revision == kRevisionUnknown) {
        m_revision = static_cast<uint32_t>(EditKeys::kRevision.get(m_header));
    }
    return static_cast<int>(m_revision);
}

void Edit::set_ed2_revision(int revision) {
    m_revision = static_cast<uint32_t>(revision);
    if (m_revision == kRevisionUnknown) {
        m_header.remove(EditKeys::kRevision);
    } else {
        EditKeys::kRevision.set(m_header, revision);
    }
}

Qx::FrameRate Edit::getFrameRate() const {
    if (m_frameRateValid) {
        return m_frameRate;
    }
    Qx::FrameRate rate = Qx::projectFrameRate();
    if (get_ed2_revision() >= kRevisionWithFrameRate) {
        const Qx::FrameRate stored(EditKeys::kFrameRate.get(m_header, rate.code()));
        rate = stored.valid() ? stored : rate;
    } else {
        const Qx::FrameRate derived(
            Qx::Ed2Support::tvStdFromText(EditKeys::kTvType.get(m_header)).frameRateCode);
        if (derived.valid()) {
            rate = derived;
            if (!isReadOnly()) {
                // The answer is made part of the edit, so that it outlives the project's settings.
                const_cast<Edit*>(this)->setFrameRate(derived);
            }
        }
    }
    m_frameRate = rate;
    m_frameRateValid = true;
    return rate;
}

void Edit::setFrameRate(Qx::FrameRate rate) {
    if (!rate.valid()) {
        return;
    }
    if (!m_header.contains(EditKeys::kFrameRate) || EditKeys::kFrameRate.get(m_header) != rate.code()) {
        EditKeys::kFrameRate.set(m_header, rate.code());
    }
    m_frameRate = rate;
    m_frameRateValid = true;
    ownTimecodeChanged();
}

double Edit::get_frame_time() const {
    return getFrameRate().frameDuration();
}

double Edit::getSourceMediumDuration() const {
    if (m_sourceMediumDuration == Qx::kNoTime && get_ed2_revision() >= kRevisionWithDuration) {
        m_sourceMediumDuration = EditKeys::kSourceMediumDuration.get(m_header);
    }
    return m_sourceMediumDuration;
}

void Edit::setSourceMediumDuration(double seconds) {
    m_sourceMediumDuration = seconds;
    EditKeys::kSourceMediumDuration.set(m_header, seconds);
}

int Edit::getSourceMedium() const {
    if (!m_sourceMedium) {
        m_sourceMedium = EditKeys::kSourceMedium.get(m_header, Qx::currentProject().defaultEditMedium);
    }
    return *m_sourceMedium;
}

void Edit::setSourceMedium(int medium) {
    m_sourceMedium = medium;
    EditKeys::kSourceMedium.set(m_header, medium);
}

int Edit::getTransfer() const {
    if (!m_transfer) {
        m_transfer = EditKeys::kTransfer.get(m_header);
    }
    return *m_transfer;
}

void Edit::setTransfer(int transfer) {
    m_transfer = transfer;
    EditKeys::kTransfer.set(m_header, transfer);
}

double Edit::get_elapsed_time_origin() const {
    return EditKeys::kElapsedOrigin.get(m_header);
}

void Edit::set_elapsed_time_origin(double seconds) {
    EditKeys::kElapsedOrigin.set(m_header, seconds);
}

int64_t Edit::getStartTimecode() const {
    const Qx::FrameRate rate = getFrameRate();
    return EditKeys::kStartTimecode.get(m_header, rate.toFrames(get_elapsed_time_origin()));
}

void Edit::setStartTimecode(int64_t frames) {
    EditKeys::kStartTimecode.set(m_header, frames);
    ownTimecodeChanged();
}

double Edit::getTimecodeOrigin() const {
    return m_header.contains(EditKeys::kStartTimecode) ? getFrameRate().toSeconds(getStartTimecode())
                                                       : get_elapsed_time_origin();
}

bool Edit::isDropFrame(bool otherwise) const {
    return EditKeys::kDropFrame.get(m_header, otherwise) && getFrameRate().hasDropFrame();
}

void Edit::setDropFrame(bool dropFrame) {
    EditKeys::kDropFrame.set(m_header, dropFrame);
    ownTimecodeChanged();
}

String Edit::getOwner() const {
    return EditKeys::kOwner.get(m_header);
}

void Edit::setOwner(const String& owner, bool notify) {
    if (owner == getOwner()) {
        return;
    }
    EditKeys::kOwner.set(m_header, owner);
    if (notify) {
        recordChange(kPropertiesChanged, true);
    }
}
