#include "edit/model/edit.h"
#include "edit/model/edit_registry.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/clock.h"
#include "platform/services/current_project.h"
#include "platform/services/log.h"

namespace {

/// First revision whose header holds the frame rate.
constexpr int kRevisionWithFrameRate = 501;
/// First revision whose header holds the duration of the source.
constexpr int kRevisionWithDuration = 503;
constexpr uint32_t kRevisionUnknown = UINT32_MAX;

/// Seconds since 1970 as the header keeps them: the low 32 bits.
int32_t now() {
    return static_cast<int32_t>(static_cast<uint32_t>(Qx::nowSeconds()));
}

} // namespace

void Edit::initHeader() {
    const Qx::CurrentProject project = Qx::currentProject();
    m_header.clear();
    m_header.setBool("READ_ONLY", false);
    m_header.setInt("IS_BACKUP", 0);
    m_header.setInt("ORIGINAL_MATERIAL", 0);
    m_header.setInt("HIDDEN", 0);
    m_header.setInt("SEARCH_EDIT", 0);
    m_header.setCookie("UNDO_COOKIE", invalid_cookie);
    m_header.setCookie("REDO_COOKIE", invalid_cookie);
    m_header.setCookie("PROJECT_COOKIE", project.project);
    m_header.setInt("CREATION_TIME", now());
    setModificationDetails();
    m_header.setInt("ED2_REVISION", kCurrentRevision);
    m_header.setInt("FRAME_RATE", project.frameRateCode);
    m_header.setInt("SOURCE_MEDIUM", project.defaultEditMedium);
    m_header.setInt("FRAME_BASED", 1);
    m_header.setInt("TRANSFER", kDefaultTransfer);
    m_header.setString("OWNER", PermissionsManager::getCurrentUser());

    clear_cache_flags();
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
    dropDerivedValues();
}

void Edit::dropDerivedValues() {
    m_sourceMediumDuration = Qx::kNoTime;
}

String Edit::getName() const {
    return m_header.getString("NAME");
}

void Edit::setName(const String& name) {
    if (name != getName()) {
        m_header.setString("NAME", name);
        recordChange(kNameChanged, true);
    }
}

bool Edit::get_read_only() const {
    return m_header.getBool("READ_ONLY", false);
}

void Edit::set_read_only(bool readOnly) {
    if (readOnly && !get_read_only()) {
        // Once the property is set nothing can dirty the edit, and the property itself has to be saved.
        set_dirty(true);
        const QuietHeader quiet(*this);
        m_header.setBool("READ_ONLY", true);
    } else {
        m_header.setBool("READ_ONLY", readOnly);
    }
}

int Edit::get_backup() const {
    return m_header.getInt("IS_BACKUP");
}

void Edit::set_backup(int backup) {
    m_header.setInt("IS_BACKUP", backup);
}

int Edit::get_hidden() const {
    return m_header.getInt("HIDDEN");
}

void Edit::set_hidden(int hidden) {
    if (hidden != get_hidden()) {
        m_header.setInt("HIDDEN", hidden);
    }
}

int Edit::get_search_edit() const {
    return m_header.getInt("SEARCH_EDIT");
}

void Edit::set_search_edit(int search) {
    m_header.setInt("SEARCH_EDIT", search);
}

int Edit::get_original_material() const {
    return m_header.getInt("ORIGINAL_MATERIAL");
}

void Edit::set_original_material(int original) {
    m_header.setInt("ORIGINAL_MATERIAL", original);
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
    m_header.setInt("ENTIRE_MEDIUM", entire);
    updateProjectRecord();
}

cookie Edit::get_undo_cookie() const {
    return m_header.getCookie("UNDO_COOKIE", invalid_cookie);
}

void Edit::set_undo_cookie(const cookie& item) {
    m_header.setCookie("UNDO_COOKIE", item);
}

cookie Edit::get_redo_cookie() const {
    return m_header.getCookie("REDO_COOKIE", invalid_cookie);
}

void Edit::set_redo_cookie(const cookie& item) {
    m_header.setCookie("REDO_COOKIE", item);
}

int Edit::getCreationTime() const {
    return m_header.getInt("CREATION_TIME");
}

String Edit::getCreationProgram() const {
    return m_header.getString("CREATION_PROGRAM");
}

void Edit::setCreationDetails() {
    m_header.setInt("CREATION_TIME", now());
    m_header.setString("CREATION_PROGRAM", kProgramVersion);
}

int Edit::getModificationTime() const {
    return m_header.getInt("MODIFICATION_TIME");
}

String Edit::getModificationProgram() const {
    return m_header.getString("MODIFICATION_PROGRAM");
}

void Edit::setModificationDetails() {
    const int32_t time = now();
    m_header.setInt("MODIFICATION_TIME", time);
    m_header.setInt("MOD_TIME_V3", time);
    m_header.setString("MODIFICATION_PROGRAM", kProgramVersion);
}

uint64_t Edit::getModificationCount() const {
    const int64_t count = m_header.getInt64("MOD_COUNT", 0);
    return count > 0 ? static_cast<uint64_t>(count) : 0;
}

void Edit::incModificationCount() {
    // A count from outside may be the greatest there is; it stays there.
    const uint64_t count = getModificationCount();
    if (count < static_cast<uint64_t>(INT64_MAX)) {
        m_header.setInt64("MOD_COUNT", static_cast<int64_t>(count + 1));
    }
}

Edit::Permissions Edit::getPermissions() const {
    const int value = m_header.getInt("PERMISSIONS", kPermissionsAll);
    return value >= kPermissionsNone && value <= kPermissionsAll ? static_cast<Permissions>(value)
                                                                 : kPermissionsAll;
}

void Edit::setPermissions(Permissions permissions) {
    m_header.setInt("PERMISSIONS", permissions);
}

int Edit::get_ed2_revision() const {
    if (m_revision == kRevisionUnknown) {
        m_revision = static_cast<uint32_t>(m_header.getInt("ED2_REVISION", 1));
    }
    return static_cast<int>(m_revision);
}

void Edit::set_ed2_revision(int revision) {
    m_revision = static_cast<uint32_t>(revision);
    if (m_revision == kRevisionUnknown) {
        m_header.remove("ED2_REVISION");
    } else {
        m_header.setInt("ED2_REVISION", revision);
    }
}

Qx::FrameRate Edit::getFrameRate() const {
    if (m_frameRateValid) {
        return m_frameRate;
    }
    Qx::FrameRate rate = Qx::projectFrameRate();
    if (get_ed2_revision() >= kRevisionWithFrameRate) {
        const Qx::FrameRate stored(m_header.getInt("FRAME_RATE", rate.code()));
        rate = stored.valid() ? stored : rate;
    } else {
        const Qx::FrameRate derived(
            Qx::Ed2Support::tvStdFromText(m_header.getString("tvtype")).frameRateCode);
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
    if (!m_header.contains("FRAME_RATE") || m_header.getInt("FRAME_RATE") != rate.code()) {
        m_header.setInt("FRAME_RATE", rate.code());
    }
    m_frameRate = rate;
    m_frameRateValid = true;
}

double Edit::get_frame_time() const {
    return getFrameRate().frameDuration();
}

double Edit::getSourceMediumDuration() const {
    if (m_sourceMediumDuration == Qx::kNoTime && get_ed2_revision() >= kRevisionWithDuration) {
        m_sourceMediumDuration = m_header.getDouble("SOURCE_MEDIUM_DURATION", Qx::kNoTime);
    }
    return m_sourceMediumDuration;
}

void Edit::setSourceMediumDuration(double seconds) {
    m_sourceMediumDuration = seconds;
    m_header.setDouble("SOURCE_MEDIUM_DURATION", seconds);
}

int Edit::getSourceMedium() const {
    if (!m_sourceMedium) {
        m_sourceMedium = m_header.getInt("SOURCE_MEDIUM", Qx::currentProject().defaultEditMedium);
    }
    return *m_sourceMedium;
}

void Edit::setSourceMedium(int medium) {
    m_sourceMedium = medium;
    m_header.setInt("SOURCE_MEDIUM", medium);
}

int Edit::getTransfer() const {
    if (!m_transfer) {
        m_transfer = m_header.getInt("TRANSFER", kDefaultTransfer);
    }
    return *m_transfer;
}

void Edit::setTransfer(int transfer) {
    m_transfer = transfer;
    m_header.setInt("TRANSFER", transfer);
}

double Edit::get_elapsed_time_origin() const {
    return m_header.getDouble("ELAPSED_ORIGIN", 0.0);
}

void Edit::set_elapsed_time_origin(double seconds) {
    m_header.setDouble("ELAPSED_ORIGIN", seconds);
}

String Edit::getOwner() const {
    return m_header.getString("OWNER");
}

void Edit::setOwner(const String& owner, bool notify) {
    if (owner == getOwner()) {
        return;
    }
    m_header.setString("OWNER", owner);
    if (notify) {
        recordChange(kPropertiesChanged, true);
    }
}
