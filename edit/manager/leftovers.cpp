#include "edit/manager/leftovers.h"

#include "edit/manager/folder_names.h"
#include "edit/manager/import_note.h"
#include "edit/manager/recovery.h"
#include "platform/services/atomic_file.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <algorithm>

namespace {

/// Adds the files of one folder that no process is going to finish.
Qx::Status addAbandonedIn(const String& folder, FolderLink link, std::vector<Leftover>& found) {
    std::vector<String> names;
    Qx::Status listed = namesOfFolder(folder, link, names);
    for (const String& name : names) {
        const String path = Qx::joinPath(folder, name);
        if (Qx::isStaleTemporary(path)) {
            found.push_back({Leftover::Temporary, path});
        } else if (name.ends_with(getEditFilenameExt() + kRecoveryCopy) && Qx::askFile(path).isRegular()) {
            found.push_back({Leftover::RecoveryCopy, path});
        }
    }
    return listed;
}

/// The same for the project's folder and those of its milestones.
Qx::Status addAbandoned(const String& folder, std::vector<Leftover>& found) {
    Qx::Status status = addAbandonedIn(folder, FolderLink::Followed, found);
    const String milestones = Qx::joinPath(folder, kMilestonesFolder);
    std::vector<String> items;
    if (Qx::Status listed = namesOfFolder(milestones, FolderLink::NotFollowed, items); !listed) {
        return listed;
    }
    for (const String& item : items) {
        if (Qx::Status more = addAbandonedIn(Qx::joinPath(milestones, item), FolderLink::NotFollowed, found);
            !more) {
            status = more;
        }
    }
    return status;
}

void remove(const String& path) {
    static_cast<void>(Qx::retryInterrupted([&] { return Qx::fileSystem().remove(path); }).code);
}

cookie itemOf(const String& path) {
    return cookie(std::string_view(Qx::withoutExtension(Qx::fileNameOf(path))));
}

} // namespace

Qx::Status findLeftovers(const String& folder, std::vector<Leftover>& leftovers) {
    Qx::Status status = addAbandoned(folder, leftovers);
    std::vector<UnfinishedImport> imports;
    if (Qx::Status looked = unfinishedImports(folder, imports); !looked) {
        status = looked;
    }
    for (const UnfinishedImport& import : imports) {
        for (const String& file : import.files) {
            leftovers.push_back({Leftover::ImportedShot, file});
        }
        leftovers.push_back({Leftover::ImportNote, import.note});
    }
    return status;
}

// What could not be looked at stays, and is found by `findLeftovers` another time.

void removeLeftovers(const String& folder) {
    std::vector<Leftover> found;
    static_cast<void>(addAbandonedIn(folder, FolderLink::Followed, found).isOk());
    for (const Leftover& file : found) {
        remove(file.path);
    }
    std::vector<UnfinishedImport> imports;
    static_cast<void>(unfinishedImports(folder, imports).isOk());
    for (const UnfinishedImport& import : imports) {
        if (import.files.empty() || !import.mayBePlayed) {
            takeBackImport(import);
        }
    }
}

void removeAllLeftovers(const String& folder, const std::function<bool(const cookie& shot)>& isPlayed) {
    std::vector<Leftover> found;
    static_cast<void>(addAbandoned(folder, found).isOk());
    for (const Leftover& file : found) {
        remove(file.path);
    }
    std::vector<UnfinishedImport> imports;
    static_cast<void>(unfinishedImports(folder, imports).isOk());
    for (UnfinishedImport& import : imports) {
        if (import.mayBePlayed) {
            std::erase_if(import.files, [&](const String& file) { return isPlayed(itemOf(file)); });
        }
        takeBackImport(import);
    }
}
