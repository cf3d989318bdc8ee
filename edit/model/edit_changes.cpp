#include "edit/model/detail/channel_set.h"
#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "edit/model/edit_registry.h"
#include "edit/project/permissions_manager.h"
#include "platform/notify/val_server.h"
#include "platform/services/log.h"
#include "platform/services/network.h"

#include <algorithm>

namespace {

/// The types of the messages that an edit sends.
struct MessageTypes {
    NotifyMsgType changed{"editChanged"};
    NotifyMsgType deleted{"editDelete"};
    NotifyMsgType chanAdded{"editChanAdded"};
    NotifyMsgType chanDeleted{"editChanDeleted"};
    NotifyMsgType shotSound{"editShotSound"};
    NotifyMsgType impendingRevision{"impendingRevChange"};
    NotifyMsgType revision{"revChange"};
};

const MessageTypes& messageTypes() {
    static const MessageTypes types;
    return types;
}

/// Interns them when the library loads.
[[maybe_unused]] const MessageTypes& internedAtLoad = messageTypes();

/// Changes that the record of the edit in the project database shows.
bool concernsProjectRecord(EditModificationType type) {
    return isConsoleEditOp(type) || type == kPropertiesChanged || type == kNameChanged ||
           type == kChansInserted || type == kChansRemoved;
}

} // namespace

NotifyMsgType Edit::getEditChangedNotifyMsgType() {
    return messageTypes().changed;
}
NotifyMsgType Edit::getEditDeleteNotifyMsgType() {
    return messageTypes().deleted;
}
NotifyMsgType Edit::getChanAddedNotifyMsgType() {
    return messageTypes().chanAdded;
}
NotifyMsgType Edit::getChanDeletedNotifyMsgType() {
    return messageTypes().chanDeleted;
}
NotifyMsgType Edit::getShotSoundAlteredNotifyMsgType() {
    return messageTypes().shotSound;
}
NotifyMsgType Edit::getImpendingRevChangeMsgType() {
    return messageTypes().impendingRevision;
}
NotifyMsgType Edit::getRevChangeMsgType() {
    return messageTypes().revision;
}

void Edit::init_dirty() {
    m_dirty = true;
}

bool Edit::get_dirty() const {
    return m_dirty || m_header.isDirty();
}

bool Edit::isReadOnlyForUser() const {
    return m_cookie.is_valid() && PermissionsManager::getReadOnly(m_cookie);
}

bool Edit::isReadOnly() const {
    return isReadOnlyForUser() || get_read_only();
}

void Edit::set_dirty(bool dirty) {
    if (m_initialising) {
        return;
    }
    if (!dirty) {
        if (Qx::traceIsOn()) {
            herc_printf("edit\"%8s\" dirty was %d\n", cookie_string(m_cookie).c_str(), m_dirty ? 1 : 0);
        }
        m_dirty = false;
        m_header.setDirty(false);
        return;
    }
    if (isReadOnly()) {
        warnOfReadOnly();
        return;
    }
    if (!m_dirty) {
        announceDirt();
    }
    m_dirty = true;
}

/// Tells the other machines and the manager that a clean edit becomes dirty.
void Edit::announceDirt() {
    if (!m_networkSuppressed && Qx::Network::networkMode() && get_log_type() != kLogEdit) {
        Qx::Network::send({Qx::Network::EditBeingChanged, m_cookie, PermissionsManager::getCurrentUser()});
    }
    if (EditRegistry* const registry = EditRegistry::current()) {
        registry->addToDirtyList(m_cookie);
    }
}

bool Edit::isDirty(bool deep) const {
    if (get_dirty()) {
        return true;
    }
    return deep && m_channels->any([](const ChannelSet::Channel& channel) { return channel.changed(); });
}

bool Edit::needsToBeWritten() {
    if (!m_writeSuppressed && !isReadOnlyForUser()) {
        return !m_temporary && isDirty(true);
    }
    set_dirty(false);
    return false;
}

void Edit::onConfigbDirty() {
    if (m_quietHeader == 0) {
        set_dirty(true);
    }
}

Edit::QuietHeader::~QuietHeader() {
    --m_edit.m_quietHeader;
}

Edit::KeepAlive::KeepAlive(Edit& edit) {
    if (edit.refCount() > 0) {
        m_handle = &edit;
    }
}

void Edit::setChangeDescription(EditModificationType type, bool notify) {
    setChangeDescription(EditModification(type), notify);
}

void Edit::setChangeDescription(const EditModification& modification, bool notify) {
    const KeepAlive keep(*this);
    const EditModification described = modification; // the caller's may belong to what a listener changes
    const EditModificationType type = described.type();
    if (concernsProjectRecord(type)) {
        updateProjectRecord();
    }
    const EditModificationType before = m_changes.getValue().type();
    if (notify) {
        m_changes.setValue(described);
    } else {
        m_changes.setValueSilently(described);
    }
    if (before != kInitial && before != type) {
        m_changes.setValueSilently(kSeveral);
    }
    if (type == kTransient || isReadOnly()) {
        return;
    }
    writeDescription();
    if (type != kEditDeleted) {
        set_dirty(true);
    }
}

/// Puts the current description and the count of changes into the header, without that dirtying the edit.
void Edit::writeDescription() {
    const QuietHeader quiet(*this);
    const bool wasDirty = m_header.isDirty();
    EditKeys::kChangeDescription.set(m_header, m_changes.getValue().asString());
    m_header.remove(EditKeys::kOwnChange);
    incModificationCount();
    m_header.setDirty(wasDirty);
}

EditModification Edit::getChangeDescription() const {
    return m_header.contains(EditKeys::kChangeDescription)
               ? EditModification::fromString(EditKeys::kChangeDescription.get(m_header))
               : EditModification(kNotDescribed);
}

void Edit::resetChangeDescription() {
    const QuietHeader quiet(*this);
    const bool wasDirty = m_header.isDirty();
    m_changes.setValueSilently(kInitial);
    m_header.remove(EditKeys::kChangeDescription);
    m_header.remove(EditKeys::kOwnChange);
    m_header.setDirty(wasDirty);
}

void Edit::recordChange(const EditModification& change, bool notify) {
    if (!m_initialising && !m_loading) {
        setChangeDescription(change, notify);
    }
}

void Edit::recordUndescribed() {
    if (!m_loading) {
        set_dirty(true);
    }
}

bool Edit::refusesChange() const {
    if (m_initialising || m_loading || m_temporary || !isReadOnly()) {
        return false;
    }
    warnOfReadOnly();
    return true;
}

void Edit::warnOfReadOnly() const {
    herc_printf("Mild warning: attempt to dirty read-only edit \"%s\"\n", cookie_string(m_cookie).c_str());
}

void Edit::recordChangeOf(EditModificationType type, const IdStamp& chan, bool notify) {
    if (notify) {
        recordChange(EditModification(type).setChan(chan), true);
    } else {
        recordUndescribed();
    }
}

void Edit::soundChanged(EditModificationType type, const IdStamp& chan, bool notify) {
    const KeepAlive keep(*this);
    const IdStamp altered = chan; // the caller's may belong to what a listener changes
    const bool ofShot = is_original() && !m_initialising && !m_loading;
    recordChangeOf(ofShot ? kShotSoundChanged : type, altered, notify);
    if (ofShot && notify) {
        notifyShotSoundAltered(altered);
    }
}

void Edit::announcePosition(const EditModification& change) {
    const KeepAlive keep(*this);
    recordUndescribed();
    if (!m_initialising && !m_loading) {
        m_changes.announce(change);
    }
}

void Edit::updateProjectRecord() {
    if (EditRegistry* const registry = EditRegistry::current()) {
        registry->updateProjdbRec(m_cookie, false);
    }
}

void Edit::sendChannelMessage(NotifyMsgType message, Edit_Chan_Type type, int index, int count) {
    notify({message, String::format("%s %d %d %d", cookie_string(m_cookie).c_str(), static_cast<int>(type),
                                    index, count)});
}

void Edit::notifyEditDelete() {
    const KeepAlive keep(*this);
    notify({getEditDeleteNotifyMsgType(), cookie_string(m_cookie).c_str()});
    setChangeDescription(kEditDeleted, true);
}

void Edit::notifyImpendingRevisionChange(RevisionChangeType type) {
    notify({getImpendingRevChangeMsgType(),
            String::format("%s %d", cookie_string(m_cookie).c_str(), static_cast<int>(type))});
}

void Edit::notifyRevisionChange(RevisionChangeType type) {
    notify({getRevChangeMsgType(),
            String::format("%s %d", cookie_string(m_cookie).c_str(), static_cast<int>(type))});
}

void Edit::notifyShotSoundAltered(const IdStamp& chan) {
    notify({getShotSoundAlteredNotifyMsgType(),
            String::format("%s %s", cookie_string(m_cookie).c_str(), chan.asString().c_str())});
}
