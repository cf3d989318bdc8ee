#include "tools/qmedit/leftovers.h"

#include "edit/manager/milestone_ring.h"
#include "interchange/import_note.h"
#include "platform/services/atomic_file.h"
#include "platform/services/edit_filenames.h"
#include "tools/qmedit/revisions.h"

#include <algorithm>

namespace {

constexpr const char* kMilestones = "Milestones";

/// Files of one folder that no process is going to finish.
std::vector<Leftover> abandonedIn(const String& folder) {
    std::vector<Leftover> found;
    std::vector<String> names;
    if (!Qx::askFile(folder).isFolder() || Qx::fileSystem().list(folder, names)) {
        return found;
    }
    for (const String& name : names) {
        const String path = Qx::joinPath(folder, name);
        if (Qx::isStaleTemporary(path)) {
            found.push_back({path, "a temporary file"});
        } else if (name.ends_with(getEditFilenameExt() + kRecoveryCopy) && Qx::askFile(path).isRegular()) {
            found.push_back({path, "the copy of a recovery that did not come to its end"});
        }
    }
    return found;
}

std::vector<Leftover> abandoned(const String& folder) {
    std::vector<Leftover> found = abandonedIn(folder);
    const String milestones = Qx::joinPath(folder, kMilestones);
    std::vector<String> items;
    if (!Qx::askFile(milestones).isFolder() || Qx::fileSystem().list(milestones, items)) {
        return found;
    }
    for (const String& item : items) {
        const std::vector<Leftover> more = abandonedIn(Qx::joinPath(milestones, item));
        found.insert(found.end(), more.begin(), more.end());
    }
    return found;
}

bool removed(const String& path) {
    const Qx::FileError error = Qx::retryInterrupted([&] { return Qx::fileSystem().remove(path); });
    return !error;
}

cookie itemOf(const String& path) {
    return cookie(std::string_view(Qx::withoutExtension(Qx::fileNameOf(path))));
}

} // namespace

std::vector<Leftover> findLeftovers(const String& folder) {
    std::vector<Leftover> found = abandoned(folder);
    for (const interchange::UnfinishedImport& import : interchange::unfinishedImports(folder)) {
        for (const String& file : import.files) {
            found.push_back({file, "a shot of an import that did not come to its end"});
        }
        found.push_back({import.note, "the note of an import that did not come to its end"});
    }
    return found;
}

void removeLeftovers(const String& folder) {
    for (const Leftover& file : abandonedIn(folder)) {
        static_cast<void>(removed(file.path));
    }
    for (const interchange::UnfinishedImport& import : interchange::unfinishedImports(folder)) {
        if (import.files.empty() || !import.mayBePlayed) {
            interchange::takeBackImport(import);
        }
    }
}

std::vector<String> removeAllLeftovers(const String& folder,
                                       const std::function<bool(const cookie& shot)>& isPlayed) {
    std::vector<String> gone;
    for (const Leftover& file : abandoned(folder)) {
        if (removed(file.path)) {
            gone.push_back(file.path);
        }
    }
    for (interchange::UnfinishedImport& import : interchange::unfinishedImports(folder)) {
        if (import.mayBePlayed) {
            std::erase_if(import.files, [&](const String& file) { return isPlayed(itemOf(file)); });
        }
        interchange::takeBackImport(import);
        gone.insert(gone.end(), import.files.begin(), import.files.end());
        gone.push_back(import.note);
    }
    return gone;
}
