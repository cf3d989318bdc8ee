#pragma once

#include "platform/services/atomic_file.h"
#include "platform/services/files.h"

#include <filesystem>
#include <fstream>
#include <map>
#include <mutex>
#include <random>
#include <set>
#include <string>
#include <vector>

namespace test {

/// How much of what was not made durable is there after a crash.
enum class CrashKind {
    Ordered,      ///< all of it: the process died, the machine went on
    NamesInOrder, ///< of the bytes any part; the names up to some moment
    AnyOrder      ///< any part of either
};

/// The machine's file system, installed while it lives, which keeps what changes a folder, so that the folder
/// can be made again elsewhere as it would be after a crash at any moment.
///
/// The model: writing to a file and changing names (making, renaming, removing) are pending at first. A sync
/// of the file makes its bytes durable, a sync of the folder the names in it, `syncAll` everything. At a
/// crash each pending write is there, is there in part, or is not there and leaves zeros where later bytes
/// are; the length of a file is that of the bytes that are there. Files that lay in the folder before are not
/// known: record from an empty folder.
class RecordingFileSystem : public Qx::FileSystem {
public:
    explicit RecordingFileSystem(std::string folder)
        : m_folder(std::move(folder)), m_before(Qx::setFileSystem(this)) {}
    ~RecordingFileSystem() override { Qx::setFileSystem(m_before); }
    RecordingFileSystem(const RecordingFileSystem&) = delete;
    RecordingFileSystem& operator=(const RecordingFileSystem&) = delete;

    /// How many operations there were so far.
    [[nodiscard]] size_t size() const { return m_operations.size(); }
    /// Operation `n`, from 0, for a report.
    [[nodiscard]] String text(size_t n) const {
        static constexpr const char* kNames[] = {"make",   "write",       "sync",        "rename",
                                                 "remove", "make folder", "sync folder", "sync all"};
        const Operation& its = m_operations[n];
        return String(kNames[static_cast<size_t>(its.kind)]) + " " + Qx::fileNameOf(its.path) +
               (its.to.empty() ? "" : " " + Qx::fileNameOf(its.to));
    }

    /// Makes the folder as it is after the first `count` operations and a crash.
    void materialise(const std::string& folder, size_t count, CrashKind kind, std::mt19937_64& random) const {
        Disk disk;
        for (size_t i = 0; i < count; ++i) {
            take(disk, m_operations[i]);
        }
        const size_t keepOneIn = 1 + random() % 4;
        const auto lost = [&] { return kind != CrashKind::Ordered && random() % (keepOneIn + 1) != 0; };
        size_t names = disk.pending.size();
        if (kind == CrashKind::NamesInOrder) {
            names = random() % (names + 1);
        }
        for (size_t i = 0; i < names; ++i) {
            if (kind != CrashKind::AnyOrder || !lost()) {
                apply(disk, *disk.pending[i]);
            }
        }
        for (auto& [file, its] : disk.files) {
            for (const Operation* const write : its.pending) {
                if (!lost()) {
                    const bool torn = kind != CrashKind::Ordered && random() % 4 == 0;
                    put(its.bytes, *write, torn ? write->bytes.size() / 2 : write->bytes.size());
                }
            }
        }
        for (const std::string& made : disk.folders) {
            std::filesystem::create_directories(folder + made);
        }
        for (const auto& [path, file] : disk.names) {
            std::filesystem::create_directories(std::filesystem::path(folder + path).parent_path());
            std::ofstream(folder + path, std::ios::binary) << disk.files[file].bytes;
        }
    }

    Qx::FileError open(const String& path, Qx::OpenMode mode, std::unique_ptr<Qx::OpenFile>& file) override {
        const std::lock_guard hold(m_mutex);
        std::unique_ptr<Qx::OpenFile> real;
        Qx::FileInfo before;
        static_cast<void>(machine().info(path, before));
        auto error = machine().open(path, mode, real);
        if (!error && isRecorded(path) && mode != Qx::OpenMode::Read) {
            if (before.kind == Qx::FileKind::Missing) {
                m_files[path] = ++m_lastFile;
                m_operations.push_back({Kind::Make, inside(path), {}, m_lastFile, 0, {}});
            }
            const uint64_t at = mode == Qx::OpenMode::Append ? before.size : 0;
            file = std::make_unique<File>(*this, std::move(real), path, m_files[path], at);
        } else if (!error) {
            file = std::move(real);
        }
        return error;
    }
    Qx::FileError info(const String& path, Qx::FileInfo& info) override { return machine().info(path, info); }
    Qx::FileError rename(const String& from, const String& to) override {
        const std::lock_guard hold(m_mutex);
        auto error = machine().rename(from, to);
        if (!error) {
            const auto moved = m_files.extract(from);
            const size_t file = moved ? moved.mapped() : 0;
            m_files[to] = file;
            m_operations.push_back({Kind::Rename, inside(from), inside(to), file, 0, {}});
        }
        return error;
    }
    Qx::FileError remove(const String& path) override {
        const std::lock_guard hold(m_mutex);
        auto error = machine().remove(path);
        if (!error) {
            m_files.erase(path);
            m_operations.push_back({Kind::Remove, inside(path), {}, 0, 0, {}});
        }
        return error;
    }
    Qx::FileError makeFolder(const String& path) override {
        const std::lock_guard hold(m_mutex);
        auto error = machine().makeFolder(path);
        if (!error && isRecorded(path)) {
            m_operations.push_back({Kind::MakeFolder, inside(path), {}, 0, 0, {}});
        }
        return error;
    }
    Qx::FileError removeFolder(const String& path) override { return machine().removeFolder(path); }
    Qx::FileError list(const String& path, std::vector<String>& names) override {
        return machine().list(path, names);
    }
    Qx::FileError syncFolder(const String& path) override {
        return record({Kind::SyncFolder, inside(path), {}, 0, 0, {}});
    }
    Qx::FileError syncAll(const String& folder) override {
        return record({Kind::SyncAll, inside(folder), {}, 0, 0, {}});
    }
    Qx::FileError touch(const String& path, bool accessOnly) override {
        return machine().touch(path, accessOnly);
    }

private:
    enum class Kind { Make, Write, Sync, Rename, Remove, MakeFolder, SyncFolder, SyncAll };
    struct Operation {
        Kind kind;
        std::string path; ///< below the folder
        std::string to;
        size_t file; ///< files keep their number when they are renamed
        uint64_t offset;
        std::string bytes;
    };
    struct Content {
        std::string bytes;
        std::vector<const Operation*> pending;
    };
    struct Disk {
        std::map<std::string, size_t> names;
        std::set<std::string> folders;
        std::map<size_t, Content> files;
        std::vector<const Operation*> pending; ///< of names
    };

    class File : public Qx::OpenFile {
    public:
        File(RecordingFileSystem& system, std::unique_ptr<Qx::OpenFile> real, String path, size_t file,
             uint64_t at)
            : m_system(system), m_real(std::move(real)), m_path(std::move(path)), m_file(file), m_at(at) {}
        Qx::FileError read(void* to, size_t size, size_t& got) override {
            auto error = m_real->read(to, size, got);
            m_at += got;
            return error;
        }
        Qx::FileError write(const void* from, size_t size, size_t& put) override {
            auto error = m_real->write(from, size, put);
            const std::lock_guard hold(m_system.m_mutex);
            m_system.m_operations.push_back({Kind::Write,
                                             m_system.inside(m_path),
                                             {},
                                             m_file,
                                             m_at,
                                             std::string(static_cast<const char*>(from), put)});
            m_at += put;
            return error;
        }
        Qx::FileError seek(uint64_t offset) override {
            m_at = offset;
            return m_real->seek(offset);
        }
        Qx::FileError sync() override {
            return m_system.record({Kind::Sync, m_system.inside(m_path), {}, m_file, 0, {}});
        }
        Qx::FileError info(Qx::FileInfo& info) override { return m_real->info(info); }
        Qx::FileError setPermissions(uint32_t permissions) override {
            return m_real->setPermissions(permissions);
        }
        Qx::FileError lock(bool wait, bool& taken) override { return m_real->lock(wait, taken); }
        Qx::FileError close() override { return m_real->close(); }

    private:
        RecordingFileSystem& m_system;
        std::unique_ptr<Qx::OpenFile> m_real;
        String m_path;
        size_t m_file;
        uint64_t m_at;
    };

    static Qx::FileSystem& machine() { return Qx::machineFileSystem(); }
    [[nodiscard]] bool isRecorded(const String& path) const { return path.starts_with(m_folder); }
    [[nodiscard]] std::string inside(const String& path) const {
        return isRecorded(path) ? path.substr(m_folder.size()) : std::string(path);
    }
    Qx::FileError record(Operation operation) {
        const std::lock_guard hold(m_mutex);
        m_operations.push_back(std::move(operation));
        return {};
    }

    static std::string parentOf(const std::string& path) { return std::string(Qx::folderOf(path)); }
    static void put(std::string& bytes, const Operation& write, size_t size) {
        bytes.resize(std::max<size_t>(bytes.size(), write.offset + size));
        bytes.replace(write.offset, size, write.bytes.substr(0, size));
    }
    /// Brings a change of names to the disk.
    static void apply(Disk& disk, const Operation& its) {
        switch (its.kind) {
        case Kind::Make:
            disk.names[its.path] = its.file;
            break;
        case Kind::Rename:
            if (const auto found = disk.names.find(its.path);
                found != disk.names.end() && found->second == its.file) {
                disk.names.erase(found);
            }
            disk.names[its.to] = its.file;
            break;
        case Kind::Remove:
            disk.names.erase(its.path);
            break;
        default:
            disk.folders.insert(its.path);
        }
    }
    static void take(Disk& disk, const Operation& its) {
        const auto syncFile = [](Content& content) {
            for (const Operation* const write : content.pending) {
                put(content.bytes, *write, write->bytes.size());
            }
            content.pending.clear();
        };
        switch (its.kind) {
        case Kind::Write:
            disk.files[its.file].pending.push_back(&its);
            break;
        case Kind::Sync:
            syncFile(disk.files[its.file]);
            break;
        case Kind::SyncFolder:
        case Kind::SyncAll:
            std::erase_if(disk.pending, [&](const Operation* name) {
                const std::string& changed = name->kind == Kind::Rename ? name->to : name->path;
                const bool concerned = its.kind == Kind::SyncAll || parentOf(changed) == its.path;
                if (concerned) {
                    apply(disk, *name);
                }
                return concerned;
            });
            for (auto& [file, content] : disk.files) {
                if (its.kind == Kind::SyncAll) {
                    syncFile(content);
                }
            }
            break;
        default:
            disk.pending.push_back(&its);
        }
    }

    std::string m_folder;
    Qx::FileSystem* m_before;
    mutable std::mutex m_mutex;
    std::vector<Operation> m_operations;
    std::map<std::string, size_t> m_files; ///< by their names of the moment
    size_t m_lastFile = 0;
};

} // namespace test
