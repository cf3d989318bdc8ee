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

constexpr RevisionChain::Kind kChains[] = {RevisionChain::Undo, RevisionChain::Redo};

RevisionChain chainOf(const String& file, RevisionChain::Kind kind) {
    return {file, kind, edit_manager::backupDepth()};
}

/// The file and the backups of it that are there, the file first. `names` are those of its folder.
Vector<String> editFiles(const String& file, const std::vector<String>& names) {
    Vector<String> files;
    if (const Qx::FileAnswer present = Qx::askFile(file); present.isRegular() || present.isUnknown()) {
        files.push_back(file);
    }
    for (const RevisionChain::Kind kind : kChains) {
        const RevisionChain chain = chainOf(file, kind);
        for (const int number : chain.numbers(names)) {
            files.push_back(chain.path(number));
        }
    }
    return files;
}

Qx::FileError removeFile(const String& path) {
    return Qx::retryInterrupted([&] { return Qx::fileSystem().remove(path); });
}

/// Removes the backups, the oldest first, then the file: what a crash leaves of an edit is the edit, never an
/// older state of it in its place. A backup that cannot be removed keeps the file. Another thread may have
/// made backups since the files were listed; they have numbers in the depth.
Qx::Status removeFiles(const Vector<String>& files, const String& file) {
    const Qx::FileAnswer present = Qx::askFile(file);
    if (const Qx::FileError error = present.obstacle("remove")) {
        return error.status();
    }
    bool anyBackup = false;
    for (auto path = files.rbegin(); path != files.rend(); ++path) {
        if (*path == file) {
            continue;
        }
        if (const Qx::FileError error = removeFile(*path)) {
            return error.status();
        }
        anyBackup = true;
    }
    for (const RevisionChain::Kind kind : kChains) {
        if (Qx::Status status = chainOf(file, kind).deleteTail(0); !status) {
            return status;
        }
    }
    if (present.isMissing()) {
        return {};
    }
    Qx::FileError error;
    if (anyBackup) {
        error = Qx::retryInterrupted([&] { return Qx::fileSystem().syncFolder(Qx::folderOf(file)); });
    }
    if (!error) {
        error = removeFile(file);
    }
    return error.status();
}

/// Asked before anybody is told.
bool mayBeDeleted(const cookie& item, bool force) {
    const String file = getFilenameForCookie(item);
    if (file.empty()) {
        return false;
    }
    if (!force && PermissionsManager::getReadOnly(item)) {
        herc_printf("edit_manager: %s is read-only and was not deleted\n", item.asString().c_str());
        return false;
    }
    const EditPtr edit = presentEdit(item);
    if (!force && edit.valid() && edit->refCount() > 2) {
        herc_printf("edit_manager: %s is in use and was not deleted\n", item.asString().c_str());
        return false;
    }
    if (edit.valid()) {
        return true;
    }
    Vector<String> files;
    if (const Qx::Status found = edit_manager::getEditFiles(item, files); !found) {
        herc_printf("edit_manager: %s was not deleted: %s\n", item.asString().c_str(),
                    found.reason().c_str());
    }
    return !files.empty();
}

/// Deletes an item's files and drops it from the cache. `names` are those of its folder, listed under the
/// writers' lock, which is held.
bool deleteFiles(const cookie& item, bool force, const std::vector<String>& names) {
    ManagerState& state = managerState();
    const String file = getFilenameForCookie(item);
    std::unique_ptr<ManagerState::CachedEdit> dropped;
    const Qx::AccessScope<cookie> turn(state.queue, item);
    const ManagerState::Hold hold(state.lock);
    // Nobody may open it from here on: who asks for it waits for the end of this.
    dropped = force ? state.removeCacheEntry(item) : state.removeUnreferenced(item, false);
    if (dropped == nullptr && state.findCacheEntry(item) != nullptr) {
        herc_printf("edit_manager: %s is in use and was not deleted\n", item.asString().c_str());
        return false;
    }
    const bool isPresent = dropped != nullptr && dropped->edit.valid();
    const Vector<String> files = editFiles(file, names);
    const Qx::Status removed =
        files.empty() && !isPresent ? Qx::Status::failure("there is none") : removeFiles(files, file);
    if (!removed) {
        herc_printf("edit_manager: %s was not deleted: %s\n", item.asString().c_str(),
                    removed.reason().c_str());
        state.putBack(std::move(dropped));
    }
    return removed.isOk();
}

/// Deletes what can be deleted, with one listing of the folder for all. Returns the items that are gone.
CookieVec deleteAllFiles(const CookieVec& items, bool force) {
    CookieVec gone;
    EditManagerLock writers;
    if (items.empty() || !takeWritersLock(writers)) {
        return gone;
    }
    const String folder = Qx::folderOf(getFilenameForCookie(items.front()));
    std::vector<String> names;
    if (const Qx::FileError error =
            Qx::retryInterrupted([&] { return Qx::fileSystem().list(folder, names); })) {
        herc_printf("edit_manager: nothing was deleted: %s\n", error.text().c_str());
        return gone;
    }
    for (const cookie& item : items) {
        if (deleteFiles(item, force, names)) {
            gone.push_back(item);
        }
    }
    if (!gone.empty()) {
        // A deletion that a crash takes back leaves a whole edit.
        static_cast<void>(Qx::fileSystem().syncFolder(folder).code);
    }
    return gone;
}

} // namespace

bool edit_manager::delete_edit_file_and_backups(const cookie& item, bool force) {
    return deleteEditFilesAndBackups({item}, force);
}

bool edit_manager::deleteEditFilesAndBackups(const CookieVec& items, bool force) {
    CookieVec going;
    for (const cookie& item : items) {
        if (mayBeDeleted(item, force)) {
            issuePreDeletionNotifications(item);
            going.push_back(item);
        }
    }
    const CookieVec gone = deleteAllFiles(going, force);
    for (const cookie& item : gone) {
        managerState().records.remove(item);
    }
    storeRecords();
    for (const cookie& item : gone) {
        Qx::Network::send({Qx::Network::EditDeleted, item, PermissionsManager::getCurrentUser()});
    }
    return gone.size() == items.size();
}

Qx::Status edit_manager::getEditFiles(const cookie& item, Vector<String>& files) {
    const String file = getFilenameForCookie(item);
    std::vector<String> names;
    if (file.empty()) {
        files.clear();
        return {};
    }
    if (const Qx::FileError error = Qx::fileSystem().list(Qx::folderOf(file), names);
        error && error.code != ENOENT) {
        return error.status();
    }
    files = editFiles(file, names);
    return {};
}

Vector<String> edit_manager::getEditFiles(const cookie& item) {
    Vector<String> files;
    if (const Qx::Status status = getEditFiles(item, files); !status) {
        herc_printf("edit_manager::getEditFiles( %s ) : %s\n", item.asString().c_str(),
                    status.reason().c_str());
    }
    return files;
}

void edit_manager::issuePreDeletionNotifications(const cookie& item) {
    const bool tellsHidden = config_int("notify_hidden_deleted", 0) != 0;
    if (!tellsHidden && EditInfo(item, eOpenExisting).isHidden()) {
        return;
    }
    if (const EditPtr edit = presentEdit(item); edit.valid()) {
        const SectionHold section(edit);
        if (section.isHeld()) {
            edit->notifyEditDelete();
        }
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
