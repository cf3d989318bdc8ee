#include "edit/project/permissions_manager.h"

#include "edit/project/detail/project_files.h"
#include "platform/services/current_project.h"
#include "platform/services/log.h"

#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <set>

using namespace Qx::detail;

namespace {

constexpr const char* kOwnerPrefix = "OWNER_";
constexpr const char* kReadOnlyPrefix = "READ_ONLY_";

configb emptyRecords() {
    return configb("PERMISSIONS", "END_PERMISSIONS");
}

String permissionsPath(const String& folder) {
    return Qx::joinPath(folder, "Permissions.txt");
}

/// The words of an item as a key's end. Not its text form alone, which cannot hold every cookie.
String keyFor(const char* prefix, const cookie& item) {
    if (item.isStorable()) {
        return prefix + item.asString();
    }
    return prefix + String::format("%c%u_%u", item.typeChar(), item.word(0), item.word(1));
}

/// Items that are never stored have their records in memory only.
bool livesInFile(const cookie& item) {
    return item.isStorable() && item.type() != Cookie_Type::Transient;
}

/// The records of the current project.
struct Records {
    std::mutex mutex;
    bool wereRead = false;
    String folder;                      ///< whose records these are
    configb stored = emptyRecords();    ///< as in the file
    std::optional<Qx::FileInfo> file;   ///< what that file was; none if it is to be read again
    configb transient = emptyRecords(); ///< of items that are never stored, or without a project folder
    std::map<cookie, String> noted;     ///< owners that items name themselves
    std::set<int> rights;

    /// Reads the file of the current project unless that was done. A file that cannot be read counts as
    /// empty, and is never written over.
    void read() {
        const String current = Qx::currentProject().folder();
        if (wereRead && folder == current) {
            return;
        }
        if (folder != current) {
            transient.clear();
            noted.clear();
        }
        stored.clear();
        folder = current;
        wereRead = true;
        if (folder.empty()) {
            return;
        }
        // Asked before: a file that is replaced while it is read is another one.
        file = fileNow();
        bool found = false;
        if (auto status = readStore(permissionsPath(folder), stored, found); !status) {
            herc_printf("PermissionsManager::read: %s\n", status.reason().c_str());
            file.reset();
        }
    }

    /// The file at this moment; none if it is not there or does not open. It is opened for it, as a network
    /// file system may answer the question about a name from memory.
    [[nodiscard]] std::optional<Qx::FileInfo> fileNow() const {
        const String path = permissionsPath(folder);
        std::unique_ptr<Qx::OpenFile> opened;
        Qx::FileInfo info;
        if (Qx::retryInterrupted([&] { return Qx::fileSystem().open(path, Qx::OpenMode::Read, opened); }) ||
            Qx::retryInterrupted([&] { return opened->info(info); })) {
            return std::nullopt;
        }
        return info;
    }

    [[nodiscard]] String ownerOf(const cookie& item) {
        read();
        const auto place = noted.find(item);
        return place == noted.end() ? of(item).getString(keyFor(kOwnerPrefix, item)) : place->second;
    }

    [[nodiscard]] const configb& of(const cookie& item) const {
        return folder.empty() || !livesInFile(item) ? transient : stored;
    }

    /// Makes a change, which answers whether it changed anything. For a stored item it is made to what the
    /// file holds at this moment, so that other seats' changes stay.
    Qx::Status change(const cookie& item, const std::function<bool(configb&)>& alter) {
        read();
        if (folder.empty() || !livesInFile(item)) {
            alter(transient);
            return {};
        }
        configb fresh = stored;
        if (!alter(fresh)) {
            return {};
        }
        Qx::FileLock lock(lockPath(folder));
        if (auto status = lock.take(); !status) {
            return status;
        }
        const std::optional<Qx::FileInfo> before = fileNow();
        bool differs = true;
        // A large project has a record an item: what nobody else replaced is not read again.
        if (!file || !before || !Qx::isSameFile(*file, *before)) {
            fresh = emptyRecords();
            bool found = false;
            if (auto status = readStore(permissionsPath(folder), fresh, found); !status) {
                return status;
            }
            differs = alter(fresh);
        }
        if (differs) {
            if (auto status = writeStore(permissionsPath(folder), fresh); !status) {
                return status;
            }
        }
        file = differs ? fileNow() : before;
        stored = fresh;
        return {};
    }
};

Records& records() {
    static auto& shared = *new Records;
    return shared;
}

Qx::Status noItem() {
    return Qx::Status::failure(Qx::StatusCode::BadArgument, "the invalid cookie has no owner or permissions");
}

} // namespace

String PermissionsManager::getCurrentUser() {
    return Qx::currentProject().user;
}

String PermissionsManager::getOwner(const cookie& item) {
    const std::lock_guard hold(records().mutex);
    return records().ownerOf(item);
}

void PermissionsManager::noteOwner(const cookie& item, const String& owner, bool onlyIfNone) {
    if (!item.is_valid() || owner.empty() || !Qx::isUtf8(owner)) {
        return;
    }
    const std::lock_guard hold(records().mutex);
    const String known = records().ownerOf(item);
    if (known != owner && (!onlyIfNone || known.empty())) {
        records().noted[item] = owner;
    }
}

Qx::Status PermissionsManager::setOwner(const cookie& item, const String& user, bool onlyIfNone) {
    if (!item.is_valid()) {
        return noItem();
    }
    if (!Qx::isUtf8(user)) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   "the owner of " + item.asString() + " is not UTF-8 text");
    }
    const String key = keyFor(kOwnerPrefix, item);
    const std::lock_guard hold(records().mutex);
    if (onlyIfNone && !records().ownerOf(item).empty()) {
        return {};
    }
    Qx::Status status = records().change(item, [&](configb& store) {
        const String before = store.getString(key);
        if (before == user || (onlyIfNone && !before.empty())) {
            return false;
        }
        return user.empty() ? store.remove(key) : store.setString(key, user);
    });
    if (status) {
        records().noted.erase(item);
    }
    return status;
}

bool PermissionsManager::getReadOnly(const cookie& item) {
    const std::lock_guard hold(records().mutex);
    records().read();
    return records().of(item).getBool(keyFor(kReadOnlyPrefix, item));
}

Qx::Status PermissionsManager::setReadOnly(const cookie& item, bool readOnly) {
    if (!item.is_valid()) {
        return noItem();
    }
    const String key = keyFor(kReadOnlyPrefix, item);
    const std::lock_guard hold(records().mutex);
    return records().change(item, [&](configb& store) {
        if (store.getBool(key) == readOnly) {
            return false;
        }
        return readOnly ? store.setBool(key, true) : store.remove(key);
    });
}

bool PermissionsManager::hasRight(Right right) {
    const std::lock_guard hold(records().mutex);
    return records().rights.count(right) != 0;
}

void PermissionsManager::setRight(Right right, bool granted) {
    const std::lock_guard hold(records().mutex);
    if (granted) {
        records().rights.insert(right);
    } else {
        records().rights.erase(right);
    }
}

void PermissionsManager::reload() {
    const std::lock_guard hold(records().mutex);
    records().wereRead = false;
}
