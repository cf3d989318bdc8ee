#include "edit/manager/detail/manager_state.h"

#include "edit/manager/revision_chain.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"

namespace {

bool isSameFile(const Qx::FileInfo& a, const Qx::FileInfo& b) {
    return a.kind == b.kind && a.device == b.device && a.inode == b.inode && a.size == b.size &&
           a.modifiedNs == b.modifiedNs;
}

/// Keeps the file of another program as undo backup 1 if it is not the one this process knows.
bool keepForeignFile(const ManagerState::CachedEdit& entry, int depth) {
    const String path = getFilenameForCookie(entry.item);
    Qx::FileInfo present;
    if (!entry.file || Qx::fileSystem().info(path, present) || present.kind != Qx::FileKind::Regular ||
        isSameFile(*entry.file, present)) {
        return true;
    }
    const Qx::Status kept = RevisionChain(entry.item, RevisionChain::Undo, depth).push();
    if (!kept) {
        herc_printf("edit_manager: %s was changed by another program and could not be kept as a backup, so it "
                    "was not written: %s\n",
                    path.c_str(), kept.reason().c_str());
        return false;
    }
    herc_printf("edit_manager: %s was changed by another program; that version is kept as its undo backup 1\n",
                path.c_str());
    return true;
}

} // namespace

ManagerState& managerState() {
    static auto& state = *new ManagerState;
    return state;
}

bool isNoItem(const cookie& item) {
    return !item.is_valid() || (item.word(0) == 0 && item.word(1) == 0 && item.word(2) == 0);
}

ManagerState::CachedEdit& ManagerState::put(const cookie& item, EditPtr edit) {
    auto entry = std::make_unique<CachedEdit>();
    entry->item = item;
    entry->edit = std::move(edit);
    if (entry->edit.valid()) {
        noteFile(*entry);
    }
    std::unique_ptr<CachedEdit>& place = cache[item];
    place = std::move(entry);
    return *place;
}

void ManagerState::noteFile(CachedEdit& entry) {
    Qx::FileInfo info;
    entry.file.reset();
    if (!Qx::fileSystem().info(getFilenameForCookie(entry.item), info) &&
        info.kind == Qx::FileKind::Regular) {
        entry.file = info;
    }
}

bool ManagerState::write(CachedEdit& entry) {
    Edit& edit = *entry.edit;
    const std::lock_guard<criticalSection> hold(edit.section());
    if (!edit.needsToBeWritten()) {
        return true;
    }
    if (!keepForeignFile(entry, backupDepth)) {
        return false;
    }
    if (!edit.write_file()) {
        herc_printf("edit_manager: %s\n", edit.lastFileError().c_str());
        return false;
    }
    noteFile(entry);
    return true;
}
