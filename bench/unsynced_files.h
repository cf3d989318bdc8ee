#pragma once

#include "platform/services/files.h"

#include <memory>

namespace bench {

/// The machine's file system without its syncs, installed while it lives: what is left of a save is the work
/// of the library and of the system, and not the wait for the disk.
class UnsyncedFiles : public Qx::FileSystem {
public:
    UnsyncedFiles() : m_before(Qx::setFileSystem(this)) {}
    ~UnsyncedFiles() override { Qx::setFileSystem(m_before); }
    UnsyncedFiles(const UnsyncedFiles&) = delete;
    UnsyncedFiles& operator=(const UnsyncedFiles&) = delete;

    Qx::FileError open(const String& path, Qx::OpenMode mode, std::unique_ptr<Qx::OpenFile>& file) override {
        std::unique_ptr<Qx::OpenFile> real;
        Qx::FileError error = machine().open(path, mode, real);
        if (!error) {
            file = std::make_unique<File>(std::move(real));
        }
        return error;
    }
    Qx::FileError info(const String& path, Qx::FileInfo& info) override { return machine().info(path, info); }
    Qx::FileError rename(const String& from, const String& to) override { return machine().rename(from, to); }
    Qx::FileError remove(const String& path) override { return machine().remove(path); }
    Qx::FileError makeFolder(const String& path) override { return machine().makeFolder(path); }
    Qx::FileError removeFolder(const String& path) override { return machine().removeFolder(path); }
    Qx::FileError list(const String& path, std::vector<String>& names) override {
        return machine().list(path, names);
    }
    Qx::FileError syncFolder(const String&) override { return {}; }
    Qx::FileError syncAll(const String&) override { return {}; }
    Qx::FileError touch(const String& path, bool accessOnly) override {
        return machine().touch(path, accessOnly);
    }

private:
    class File : public Qx::OpenFile {
    public:
        explicit File(std::unique_ptr<Qx::OpenFile> real) : m_real(std::move(real)) {}
        Qx::FileError read(void* to, size_t size, size_t& got) override {
            return m_real->read(to, size, got);
        }
        Qx::FileError write(const void* from, size_t size, size_t& put) override {
            return m_real->write(from, size, put);
        }
        Qx::FileError seek(uint64_t offset) override { return m_real->seek(offset); }
        Qx::FileError sync() override { return {}; }
        Qx::FileError info(Qx::FileInfo& info) override { return m_real->info(info); }
        Qx::FileError setPermissions(uint32_t bits) override { return m_real->setPermissions(bits); }
        Qx::FileError lock(bool wait, bool& taken) override { return m_real->lock(wait, taken); }
        Qx::FileError close() override { return m_real->close(); }

    private:
        std::unique_ptr<Qx::OpenFile> m_real;
    };

    static Qx::FileSystem& machine() { return Qx::machineFileSystem(); }

    Qx::FileSystem* m_before;
};

} // namespace bench
