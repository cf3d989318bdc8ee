#include "platform/services/files.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace Qx {

namespace {

FileError failed(const char* operation, const String& path, int code = errno) {
    return {code, operation, path};
}

int64_t nanoseconds(const timespec& time) {
    return int64_t{time.tv_sec} * 1000000000 + time.tv_nsec;
}

void describe(const struct stat& status, FileInfo& info) {
    info.kind = S_ISREG(status.st_mode)   ? FileKind::Regular
                : S_ISDIR(status.st_mode) ? FileKind::Folder
                : S_ISLNK(status.st_mode) ? FileKind::Link
                                          : FileKind::Other;
    info.size = static_cast<uint64_t>(status.st_size);
    info.modifiedNs = nanoseconds(status.st_mtim);
    info.accessedNs = nanoseconds(status.st_atim);
    info.device = static_cast<uint64_t>(status.st_dev);
    info.inode = static_cast<uint64_t>(status.st_ino);
    info.links = static_cast<int>(status.st_nlink);
    info.permissions = static_cast<uint32_t>(status.st_mode & 07777u);
}

class MachineFile : public OpenFile {
public:
    MachineFile(int descriptor, String path) : m_descriptor(descriptor), m_path(std::move(path)) {}

    ~MachineFile() override {
        if (m_descriptor >= 0) {
            ::close(m_descriptor);
        }
    }
    MachineFile(const MachineFile&) = delete;
    MachineFile& operator=(const MachineFile&) = delete;

    FileError read(void* to, size_t size, size_t& got) override {
        const ssize_t count = ::read(m_descriptor, to, size);
        got = count > 0 ? static_cast<size_t>(count) : 0;
        return count < 0 ? failed("read", m_path) : FileError();
    }

    FileError write(const void* from, size_t size, size_t& put) override {
        const ssize_t count = ::write(m_descriptor, from, size);
        put = count > 0 ? static_cast<size_t>(count) : 0;
        return count < 0 ? failed("write", m_path) : FileError();
    }

    FileError seek(uint64_t offset) override {
        if (offset > static_cast<uint64_t>(INT64_MAX)) {
            return failed("seek in", m_path, EINVAL);
        }
        return ::lseek(m_descriptor, static_cast<off_t>(offset), SEEK_SET) < 0 ? failed("seek in", m_path)
                                                                               : FileError();
    }

    FileError sync() override { return ::fsync(m_descriptor) != 0 ? failed("sync", m_path) : FileError(); }

    void beginSync() override {
#ifdef SYNC_FILE_RANGE_WRITE
        static_cast<void>(::sync_file_range(m_descriptor, 0, 0, SYNC_FILE_RANGE_WRITE));
#endif
    }

    FileError info(FileInfo& info) override {
        struct stat status {};
        if (::fstat(m_descriptor, &status) != 0) {
            return failed("examine", m_path);
        }
        describe(status, info);
        return {};
    }

    FileError setPermissions(uint32_t permissions) override {
        return ::fchmod(m_descriptor, static_cast<mode_t>(permissions)) != 0
                   ? failed("set the permissions of", m_path)
                   : FileError();
    }

    FileError lock(bool wait, bool& taken) override {
        taken = ::flock(m_descriptor, wait ? LOCK_EX : LOCK_EX | LOCK_NB) == 0;
        return taken || errno == EWOULDBLOCK ? FileError() : failed("lock", m_path);
    }

    FileError close() override {
        const int descriptor = std::exchange(m_descriptor, -1);
        // An interrupted close has given the descriptor back all the same.
        const bool closed = descriptor < 0 || ::close(descriptor) == 0 || errno == EINTR;
        return closed ? FileError() : failed("close", m_path);
    }

private:
    int m_descriptor;
    String m_path;
};

int flagsFor(OpenMode mode) {
    switch (mode) {
    case OpenMode::Read:
        return O_RDONLY;
    case OpenMode::CreateNew:
        return O_WRONLY | O_CREAT | O_EXCL;
    case OpenMode::ReadWrite:
        return O_RDWR;
    case OpenMode::Append:
        return O_WRONLY | O_APPEND | O_CREAT;
    }
    return O_RDONLY;
}

/// A folder that is open for as long as a call needs it.
class OpenFolder {
public:
    explicit OpenFolder(const String& path)
        : m_descriptor(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC)) {}
    ~OpenFolder() {
        if (m_descriptor >= 0) {
            ::close(m_descriptor);
        }
    }
    OpenFolder(const OpenFolder&) = delete;
    OpenFolder& operator=(const OpenFolder&) = delete;
    [[nodiscard]] int descriptor() const { return m_descriptor; }

private:
    int m_descriptor;
};

class MachineFileSystem : public FileSystem {
public:
    FileError open(const String& path, OpenMode mode, std::unique_ptr<OpenFile>& file) override {
        // A name with a NUL byte would stand for another file than the one that was checked.
        if (path.find('\0') != String::npos) {
            return failed("open", path.c_str(), EINVAL);
        }
        const int flags = flagsFor(mode) | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY;
        const int descriptor = ::open(path.c_str(), flags, 0666);
        if (descriptor < 0) {
            return failed("open", path);
        }
        auto opened = std::make_unique<MachineFile>(descriptor, path);
        FileInfo status;
        if (auto error = opened->info(status)) {
            if (mode == OpenMode::CreateNew) {
                ::unlink(path.c_str()); // made a moment ago, and nobody's
            }
            return error;
        }
        if (status.kind != FileKind::Regular) {
            return failed("open", path, status.kind == FileKind::Folder ? EISDIR : ENXIO);
        }
        file = std::move(opened);
        return {};
    }

    FileError info(const String& path, FileInfo& info) override {
        // A name with a NUL byte would be answered for another one.
        if (path.find('\0') != String::npos) {
            return failed("examine", path.c_str(), EINVAL);
        }
        struct stat status {};
        FileInfo found;
        if (::lstat(path.c_str(), &status) == 0) {
            describe(status, found);
        } else if (errno != ENOENT && errno != ENOTDIR) {
            return failed("examine", path);
        }
        info = found;
        return {};
    }

    FileError rename(const String& from, const String& to) override {
        return ::rename(from.c_str(), to.c_str()) != 0 ? failed("replace", to) : FileError();
    }

    FileError remove(const String& path) override {
        return ::unlink(path.c_str()) != 0 ? failed("remove", path) : FileError();
    }

    FileError makeFolder(const String& path) override {
        if (::mkdir(path.c_str(), 0777) == 0) {
            return {};
        }
        const int code = errno;
        struct stat status {};
        if (code == EEXIST && ::stat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode)) {
            return {};
        }
        return failed("make folder", path, code);
    }

    FileError removeFolder(const String& path) override {
        return ::rmdir(path.c_str()) != 0 ? failed("remove folder", path) : FileError();
    }

    FileError list(const String& path, std::vector<String>& names) override {
        DIR* folder = ::opendir(path.c_str());
        if (folder == nullptr) {
            return failed("list", path);
        }
        std::vector<String> found;
        errno = 0;
        while (const dirent* entry = ::readdir(folder)) {
            const std::string_view name = entry->d_name;
            if (name != "." && name != "..") {
                found.emplace_back(name);
            }
            errno = 0;
        }
        const int code = errno;
        ::closedir(folder);
        if (code != 0) {
            return failed("list", path, code);
        }
        std::sort(found.begin(), found.end());
        names = std::move(found);
        return {};
    }

    FileError syncFolder(const String& path) override {
        const OpenFolder folder(path);
        if (folder.descriptor() < 0) {
            return failed("open folder", path);
        }
        // Some file systems have nothing to make durable in a folder and say EINVAL.
        const bool synced = ::fsync(folder.descriptor()) == 0 || errno == EINVAL;
        return synced ? FileError() : failed("sync folder", path);
    }

    FileError syncAll(const String& path) override {
        const OpenFolder folder(path);
        if (folder.descriptor() < 0) {
            return failed("open folder", path);
        }
#if defined(__linux__)
        return ::syncfs(folder.descriptor()) != 0 ? failed("sync the file system of", path) : FileError();
#else
        ::sync();
        return {};
#endif
    }

    FileError touch(const String& path, bool accessOnly) override {
        const timespec now{0, UTIME_NOW};
        const timespec unchanged{0, UTIME_OMIT};
        const timespec times[2] = {now, accessOnly ? unchanged : now};
        return ::utimensat(AT_FDCWD, path.c_str(), times, AT_SYMLINK_NOFOLLOW) != 0
                   ? failed("set the times of", path)
                   : FileError();
    }
};

} // namespace

FileSystem& machineFileSystem() {
    // Never destroyed: other statics may use it while the process ends.
    static auto& system = *new MachineFileSystem;
    return system;
}

} // namespace Qx
