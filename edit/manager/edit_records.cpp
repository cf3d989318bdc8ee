#include "edit/manager/detail/manager_state.h"
#include "edit/manager/edit_record.h"
#include "edit/manager/revision_chain.h"
#include "edit/persist/edit_salvage.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"
#include "platform/store/tag_bag.h"

#include <exception>

namespace {

/// The record of an edit in memory, gathered. False if it is not there, or is being changed at the moment:
/// then it counts as stale, as nothing is waited for here.
bool gatherFromMemory(const cookie& item, projdb::Record& record) {
    ManagerState& state = managerState();
    EditPtr edit;
    {
        const ManagerState::Hold hold(state.lock);
        if (const ManagerState::CachedEdit* const found = state.findCacheEntry(item)) {
            edit = found->edit;
        }
    }
    if (!edit.valid()) {
        return false;
    }
    const std::unique_lock<criticalSection> section(edit->section(), std::try_to_lock);
    if (!section.owns_lock()) {
        state.records.markStale(item);
        return false;
    }
    record = editRecordOf(*edit, nullptr);
    const ManagerState::Hold hold(state.lock);
    const ManagerState::CachedEdit* const entry = state.findCacheEntry(item);
    if (entry == nullptr || entry->edit != edit) {
        return false;
    }
    if (entry->file.kind == Qx::FileKind::Regular && !edit->isDirty(true)) {
        stampRecord(record, entry->file);
    }
    state.records.put(item, record);
    return true;
}

/// Reads what a record is made from: the item's file, without the cache and without recovery, or a backup of
/// it. Null, with why, when it cannot be read; `refused` tells that the system would not have it read.
EditPtr readRevision(const String& path, bool isBackup, String& why, bool& refused) {
    EditPtr edit;
    try {
        if (isBackup) {
            std::vector<String> lost;
            const Qx::Status status = salvageEdit(path, edit, lost);
            if (!status) {
                why = status.reason();
            } else if (!lost.empty()) {
                why = path + ": " + lost.front();
            }
            return why.empty() ? edit : EditPtr();
        }
        edit = EditPtr(new Edit);
        edit->setNetworkNotificationSuppressed(true);
        if (edit->readFile(Qx::widen(path), eOpenExisting) == Edit::kReadOk) {
            return edit;
        }
        why = edit->lastFileError();
        refused = edit->objectStore().lastOpenResult() == TagBag::NotOpened;
    } catch (const std::exception& error) {
        why = path + " cannot be read: " + error.what();
    }
    return {};
}

projdb::Record readRecord(const String& path, bool isBackup, const Qx::FileInfo& info) {
    String why;
    bool refused = isBackup;
    if (const EditPtr edit = readRevision(path, isBackup, why, refused); edit.valid()) {
        return editRecordOf(*edit, &info);
    }
    projdb::Record record;
    record[projdb::Damage] = why;
    // What a person can put right without changing the file is looked at again each time.
    if (!refused || info.kind != Qx::FileKind::Regular) {
        stampRecord(record, info);
    }
    return record;
}

/// Brings the record of an item that is not in memory up to date: with its file, or, while that is away, with
/// the backup that opening would bring back. A record that was made from a file goes with it. What nobody
/// can be asked about leaves the record as it is.
bool refreshFromDisk(const cookie& item, projdb::Record& record, bool found) {
    ManagerState& state = managerState();
    String path = getFilenameForCookie(item);
    Qx::FileAnswer file = Qx::askFile(path);
    const bool isAway = file.isMissing();
    if (isAway) {
        const RevisionChain undo(path, RevisionChain::Undo, state.backupDepth);
        int newest = 0;
        if (!undo.findNewest(newest)) {
            return found;
        }
        if (newest == 0) {
            if (found && !record[projdb::FileSize].empty()) {
                state.records.remove(item);
                found = false;
            }
            return found;
        }
        path = undo.path(newest);
        file = undo.ask(newest);
    }
    if (file.isMissing() || file.isUnknown() || (found && isRecordOfFile(record, file.info()))) {
        return found;
    }
    record = readRecord(path, isAway, file.info());
    state.records.put(item, record);
    return true;
}

/// Brings one record up to date; false if there is none.
bool refreshRecord(projdb& records, const cookie& item, projdb::Record& record) {
    if (managerState().records.takeStale(item) && gatherFromMemory(item, record)) {
        return true;
    }
    const bool found = records.find(item, record);
    if (edit_manager::get_present(item)) {
        return found || gatherFromMemory(item, record);
    }
    if (refreshFromDisk(item, record, found)) {
        return true;
    }
    record = projdb::Record();
    return false;
}

void removeRecordsBut(projdb& records, const std::set<cookie>& items) {
    ManagerState& state = managerState();
    Vector<cookie> gone;
    records.forEach([&](const cookie& item, const projdb::Record&) {
        if (!items.contains(item)) {
            gone.push_back(item);
        }
        return true;
    });
    for (const cookie& item : gone) {
        if (!edit_manager::get_present(item)) {
            state.records.remove(item);
        }
    }
}

} // namespace

Qx::Status listItems(std::set<cookie>& items) {
    std::vector<String> names;
    if (const Qx::FileError error = Qx::fileSystem().list(Qx::currentProject().folder(), names)) {
        return error.status();
    }
    constexpr size_t kTextSize = 8;
    for (const String& name : names) {
        const cookie item{std::string_view(name).substr(0, kTextSize)};
        const String rest = name.substr(std::min(kTextSize, name.size()));
        const bool isEdit = rest == getEditFilenameExt() || rest.starts_with(getEditFilenameExt() + ".U");
        if (item.is_valid() && isEdit) {
            items.insert(item);
        }
    }
    return {};
}

void storeRecords() {
    ManagerState& state = managerState();
    projdb::Record record;
    for (const cookie& item : state.records.takeStale()) {
        gatherFromMemory(item, record);
    }
    state.records.store();
}

bool currentRecord(const cookie& item, projdb::Record& record) {
    ManagerState& state = managerState();
    state.records.store();
    const std::shared_ptr<projdb> records = state.records.database();
    if (records == nullptr || !item.isStorable() || !refreshRecord(*records, item, record)) {
        return false;
    }
    state.records.store();
    return record[projdb::Damage].empty();
}

projdb* edit_manager::get_projdb() {
    storeRecords();
    return managerState().records.database().get();
}

bool edit_manager::update_projdb(const std::function<bool(size_t done, size_t total)>& progress) {
    ManagerState& state = managerState();
    storeRecords();
    const std::shared_ptr<projdb> records = state.records.database();
    std::set<cookie> items;
    if (records == nullptr) {
        return false;
    }
    if (const Qx::Status status = listItems(items); !status) {
        herc_printf("edit_manager::update_projdb: %s\n", status.reason().c_str());
        return false;
    }
    constexpr size_t kStoreEvery = 64;
    size_t done = 0;
    projdb::Record record;
    for (const cookie& item : items) {
        if (progress && !progress(done, items.size())) {
            state.records.store();
            return false;
        }
        static_cast<void>(refreshRecord(*records, item, record));
        if (++done % kStoreEvery == 0) {
            state.records.store();
        }
    }
    removeRecordsBut(*records, items);
    state.records.store();
    return !progress || progress(done, items.size());
}

void edit_manager::updateProjdbRec(const cookie& item, bool) {
    managerState().records.markStale(item);
}

bool edit_manager::getProjDBValue(const String& key, String& value, const cookie& project) {
    const Qx::CurrentProject current = Qx::currentProject();
    if (!project.is_valid() || project == current.project) {
        const std::shared_ptr<projdb> records = managerState().records.database();
        return records != nullptr && records->getValue(key, value);
    }
    Qx::CurrentProject other = current;
    other.project = project;
    // Asking for a value does not make records where there are none.
    if (other.folder().empty() || !Qx::askFile(Qx::joinPath(other.folder(), projdb::kFileName)).isRegular()) {
        return false;
    }
    projdb records;
    return records.open(other.folder()) && records.getValue(key, value);
}

bool edit_manager::setProjDBValue(const String& key, const String& value) {
    const std::shared_ptr<projdb> records = managerState().records.database();
    if (records == nullptr) {
        return false;
    }
    const Qx::Status status = records->setValue(key, value);
    if (!status) {
        herc_printf("edit_manager: the project's value %s was not stored: %s\n", key.c_str(),
                    status.reason().c_str());
    }
    return status.isOk();
}
