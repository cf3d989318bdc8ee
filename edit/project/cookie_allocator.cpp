#include "edit/project/cookie_allocator.h"

#include "edit/project/detail/project_files.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"

using namespace Qx::detail;

namespace {

/// True, in `taken`, if there is anything in the place of an edit's file: also a link or a folder keeps a
/// number from use, for no edit could be stored there.
Qx::FileError nameIsTaken(const String& folder, const cookie& edit, bool& taken) {
    const String path = Qx::joinPath(folder, edit.asString() + getEditFilenameExt());
    const Qx::FileAnswer found = Qx::askFile(path);
    taken = !found.isMissing();
    return found.isUnknown() ? found.obstacle() : Qx::FileError();
}

/// Chooses `count` free numbers from `next` on and moves `next` past them. Numbers whose files exist are
/// counted in `skipped`.
Qx::Status choose(const String& folder, unsigned count, int& next, std::vector<cookie>& chosen,
                  int& skipped) {
    while (chosen.size() < count) {
        if (next > kLastEditNumber) {
            return Qx::Status::failure(
                folder + ": the numbers of the project's edits are used up; go on in a new project");
        }
        const cookie edit(Cookie_Type::Edit, next++, 0);
        bool taken = false;
        if (auto error = nameIsTaken(folder, edit, taken)) {
            return Qx::Status::failure(error.text());
        }
        if (taken) {
            ++skipped;
        } else {
            chosen.push_back(edit);
        }
    }
    return {};
}

} // namespace

CookieAllocator::CookieAllocator(String projectFolder) : m_folder(std::move(projectFolder)) {}

Qx::Status CookieAllocator::allocate(unsigned count, std::vector<cookie>& out) {
    if (m_folder.empty()) {
        return Qx::Status::failure("there is no project folder to number edits in; open a project first");
    }
    if (count == 0) {
        return {};
    }
    Qx::FileLock lock(lockPath(m_folder));
    if (auto status = lock.take(); !status) {
        return status;
    }
    const String path = settingsPath(m_folder);
    configb settings = emptySettings();
    bool found = false;
    if (auto status = readStore(path, settings, found); !status) {
        return status;
    }
    int next = 1;
    if (auto status = readNextEditNumber(settings, path, next); !status) {
        return status;
    }
    std::vector<cookie> chosen;
    int skipped = 0;
    if (auto status = choose(m_folder, count, next, chosen, skipped); !status) {
        return status;
    }
    settings.setInt(kNextEditKey, next);
    if (auto status = writeStore(path, settings); !status) {
        return status;
    }
    lock.release();
    if (skipped > 0) {
        herc_printf("new_edit() Skipped %d pre-existing cookies\n", skipped);
    }
    out.insert(out.end(), chosen.begin(), chosen.end());
    return {};
}

cookie CookieAllocator::allocateOne() {
    std::vector<cookie> chosen;
    if (auto status = allocate(1, chosen); !status) {
        herc_printf("CookieAllocator::allocateOne: %s\n", status.reason().c_str());
        return invalid_cookie;
    }
    return chosen.front();
}
