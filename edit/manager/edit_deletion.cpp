#include "edit/manager/detail/manager_state.h"
#include "edit/manager/edit_info.h"
#include "edit/manager/revision_chain.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/config_int.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"
#include "platform/services/network.h"

namespace {

EditPtr presentEdit(const cookie& item) {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    const ManagerState::CachedEdit* const found = state.findCacheEntry(item);
    return found == nullptr ? EditPtr() : found->edit;
}

/// Removes the file, then the backups from the oldest on. False, with nothing changed, when the file cannot
/// be removed, and with some backups left when one of them cannot.
bool removeFiles(const Vector<String>& files, const String& file) {
    if (Qx::fileExists(file)) {
        if (const Qx::FileError error = Qx::fileSystem().remove(file)) {
            herc_printf("edit_manager::delete_edit_file: %s\n", error.text().c_str());
            return false;
        }
    }
    bool allRemoved = true;
    for (auto path = files.rbegin(); path != files.rend(); ++path) {
        if (*path == file) {
            continue;
        }
        if (const Qx::FileError error = Qx::fileSystem().remove(*path)) {
            herc_printf("edit_manager::delete_edit_file: %s\n", error.text().c_str());
            allRemoved = false;
        }
    }
    return allRemoved;
}

/// Deletes an item's files and drops it from the cache. `ownHandles` counts the references that the caller
/// has.
bool deleteFiles(const cookie& item, bool force, int ownHandles) {
    ManagerState& state = managerState();
    const String file = getFilenameForCookie(item);
    std::unique_ptr<ManagerState::CachedEdit> dropped;
    const Qx::AccessScope<cookie> turn(state.queue, item);
    EditManagerLock writers;
    if (!takeWritersLock(writers)) {
        return false;
    }
    const ManagerState::Hold hold(state.lock);
    const ManagerState::CachedEdit* const entry = state.findCacheEntry(item);
    const bool isPresent = entry != nullptr && entry->edit.valid();
    if (!force && isPresent && entry->edit->refCount() > 1 + ownHandles) {
        herc_printf("edit_manager: %s is in use and was not deleted\n", item.asString().c_str());
        return false;
    }
    const Vector<String> files = edit_manager::getEditFiles(item);
    if ((files.empty() && !isPresent) || !removeFiles(files, file)) {
        return false;
    }
    static_cast<void>(RevisionChain(file, RevisionChain::Undo, 1).makeDurable());
    dropped = state.removeCacheEntry(item);
    return true;
}

} // namespace

bool edit_manager::delete_edit_file_and_backups(const cookie& item, bool force) {
    ManagerState& state = managerState();
    if (getFilenameForCookie(item).empty()) {
        return false;
    }
    if (!force && PermissionsManager::getReadOnly(item)) {
        herc_printf("edit_manager: %s is read-only and was not deleted\n", item.asString().c_str());
        return false;
    }
    {
        // Asked before anybody is told.
        const EditPtr edit = presentEdit(item);
        if (!force && edit.valid() && edit->refCount() > 2) {
            herc_printf("edit_manager: %s is in use and was not deleted\n", item.asString().c_str());
            return false;
        }
        if (!edit.valid() && getEditFiles(item).empty()) {
            return false;
        }
    }
    issuePreDeletionNotifications(item);
    if (!deleteFiles(item, force, 0)) {
        return false;
    }
    state.records.remove(item);
    storeRecords();
    Qx::Network::send({Qx::Network::EditDeleted, item, PermissionsManager::getCurrentUser()});
    return true;
}

bool edit_manager::deleteEditFilesAndBackups(const CookieVec& items, bool force) {
    bool allDeleted = true;
    for (const cookie& item : items) {
        allDeleted = delete_edit_file_and_backups(item, force) && allDeleted;
    }
    return allDeleted;
}

Vector<String> edit_manager::getEditFiles(const cookie& item) {
    Vector<String> files;
    const String file = getFilenameForCookie(item);
    if (file.empty()) {
        return files;
    }
    if (Qx::fileExists(file)) {
        files.push_back(file);
    }
    for (const RevisionChain::Kind kind : {RevisionChain::Undo, RevisionChain::Redo}) {
        const RevisionChain chain(file, kind, backupDepth());
        for (const int number : chain.numbers()) {
            files.push_back(chain.path(number));
        }
    }
    return files;
}

void edit_manager::issuePreDeletionNotifications(const cookie& item) {
    const bool tellsHidden = config_int("notify_hidden_deleted", 0) != 0;
    if (!tellsHidden && EditInfo(item, eOpenExisting).isHidden()) {
        return;
    }
    if (const EditPtr edit = presentEdit(item); edit.valid()) {
        const ManagerState::Hold section(edit->section());
        edit->notifyEditDelete();
    }
    managerState().tell(editDeletedMsgType(), item);
}

void edit_manager::handleNetDelete(const cookie& item) {
    ManagerState& state = managerState();
    issuePreDeletionNotifications(item);
    std::unique_ptr<ManagerState::CachedEdit> dropped;
    {
        const ManagerState::Hold hold(state.lock);
        dropped = state.removeCacheEntry(item);
    }
    state.records.remove(item);
    storeRecords();
}
