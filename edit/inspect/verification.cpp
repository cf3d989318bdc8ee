#include "edit/inspect/verification.h"

#include "edit/inspect/effect_check.h"
#include "edit/manager/folder_names.h"
#include "edit/persist/edit_salvage.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <algorithm>
#include <map>
#include <optional>

namespace {

/// ".U1", ".R12".
bool isBackupExtension(const String& extension) {
    return extension.size() > 2 && (extension[1] == 'U' || extension[1] == 'R') &&
           extension.find_first_not_of("0123456789", 2) == String::npos;
}

/// The item that a file of the project's folder belongs to; false for a file that is none of an edit's. A
/// file with an edit's extension that is named after no item gives the invalid cookie.
bool itemOfFile(const String& name, cookie& item) {
    const String file = isBackupExtension(Qx::extensionOf(name)) ? Qx::withoutExtension(name) : name;
    if (Qx::extensionOf(file) != getEditFilenameExt()) {
        return false;
    }
    item = cookie(std::string_view(Qx::withoutExtension(file)));
    item = item.isStorable() ? item : invalid_cookie;
    return true;
}

class Verifier {
public:
    Verifier(const String& folder, const std::vector<cookie>& items, std::vector<VerifiedFile>& files,
             const std::function<void(const String&)>& checking)
        : m_folder(folder), m_items(items), m_files(files), m_checking(checking) {}

    Qx::Status addEdits();
    Qx::Status addMilestones();

private:
    void add(const cookie& item, const String& name);
    [[nodiscard]] std::optional<cel::Range> extentOf(const cookie& strip);

    const String& m_folder;
    const std::vector<cookie>& m_items;
    std::vector<VerifiedFile>& m_files;
    const std::function<void(const String&)>& m_checking;
    std::map<cookie, std::optional<cel::Range>> m_extents; ///< of items that were asked for
};

/// What an item of the folder has to play; nothing for one whose file is not there or does not read.
std::optional<cel::Range> Verifier::extentOf(const cookie& strip) {
    const auto [known, isNew] = m_extents.try_emplace(strip);
    if (isNew && strip.isStorable()) {
        const EditPtr item(new Edit);
        const String path = Qx::joinPath(m_folder, strip.asString() + getEditFilenameExt());
        if (item->readFile(Qx::widen(path), eOpenExisting) == Edit::kReadOk &&
            item->getEndTime() - item->getStartTime() > Qx::kTimeTolerance) {
            known->second = cel::Range(item->getStartTime(), item->getEndTime());
        }
    }
    return known->second;
}

void Verifier::add(const cookie& item, const String& name) {
    if (!m_items.empty() && std::find(m_items.begin(), m_items.end(), item) == m_items.end()) {
        return;
    }
    VerifiedFile& file = m_files.emplace_back();
    file.name = name;
    file.item = item;
    const String path = Qx::joinPath(m_folder, name);
    if (m_checking) {
        m_checking(name);
    }
    // A writer may move or replace it at that moment: then what is there afterwards counts.
    constexpr int kTries = 5;
    for (int tries = 0; tries < kTries; ++tries) {
        const Qx::FileInfo before = Qx::askFile(path).info();
        file.faults.clear();
        EditPtr read;
        verifyEditFile(path, file.faults, &read);
        if (read.valid()) {
            checkEffects(
                *read, [this](const cookie& strip) { return extentOf(strip); }, file.faults);
        }
        if (file.faults.empty()) {
            break;
        }
        const Qx::FileAnswer after = Qx::askFile(path);
        if (after.isMissing()) {
            m_files.pop_back();
            return;
        }
        if (Qx::isSameFile(before, after.info())) {
            break;
        }
    }
    if (!item.is_valid()) {
        file.faults.push_back("its name is not that of an item, so nothing opens it; rename it to a cookie");
    }
}

Qx::Status Verifier::addEdits() {
    std::vector<String> names;
    const Qx::FileError error = Qx::retryInterrupted([&] { return Qx::fileSystem().list(m_folder, names); });
    for (const String& name : names) {
        if (cookie item; itemOfFile(name, item)) {
            add(item, name);
        }
    }
    return error ? Qx::Status::failure(error.text()) : Qx::Status();
}

Qx::Status Verifier::addMilestones() {
    const String milestones = Qx::joinPath(m_folder, kMilestonesFolder);
    std::vector<String> items;
    if (Qx::Status listed = namesOfFolder(milestones, FolderLink::NotFollowed, items); !listed) {
        return listed;
    }
    for (const String& name : items) {
        const cookie item = cookie(std::string_view(name));
        std::vector<String> copies;
        if (Qx::Status listed =
                namesOfFolder(Qx::joinPath(milestones, name), FolderLink::NotFollowed, copies);
            !listed) {
            return listed;
        }
        for (const String& copy : copies) {
            if (item.isStorable() && copy.starts_with(name + ".")) {
                add(item, Qx::joinPath(Qx::joinPath(kMilestonesFolder, name), copy));
            }
        }
    }
    return {};
}

} // namespace

Qx::Status verifyProject(const String& folder, const std::vector<cookie>& items,
                         std::vector<VerifiedFile>& files,
                         const std::function<void(const String&)>& checking) {
    Verifier verifier(folder, items, files, checking);
    Qx::Status status = verifier.addEdits();
    return status ? verifier.addMilestones() : status;
}
