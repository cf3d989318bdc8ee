#pragma once

#include "platform/services/files.h"

#include <algorithm>
#include <cerrno>
#include <cstring>

namespace test {

/// A file system that holds one file, read-only and in memory, under every name; installed while it lives.
/// For reading many variants of a file quickly.
class MemoryFile : public Qx::FileSystem {
public:
    explicit MemoryFile(std::string bytes = {})
        : m_bytes(std::move(bytes)), m_before(Qx::setFileSystem(this)) {}
    ~MemoryFile() override { Qx::setFileSystem(m_before); }
    MemoryFile(const MemoryFile&) = delete;
    MemoryFile& operator=(const MemoryFile&) = delete;

    void setBytes(std::string bytes) {
        m_bytes = std::move(bytes);
        ++m_version;
    }

    Qx::FileError open(const String& path, Qx::OpenMode mode, std::unique_ptr<Qx::OpenFile>& file) override {
        if (mode != Qx::OpenMode::Read) {
            return refuse(path);
        }
        file = std::make_unique<File>(*this, path);
        return {};
    }
    Qx::FileError info(const String&, Qx::FileInfo& info) override {
        info = {};
        info.kind = Qx::FileKind::Regular;
        info.size = m_bytes.size();
        info.modifiedNs = m_version;
        info.device = 1;
        info.inode = 1;
        info.links = 1;
        return {};
    }
    Qx::FileError rename(const String&, const String& to) override { return refuse(to); }
    Qx::FileError remove(const String& path) override { return refuse(path); }
    Qx::FileError makeFolder(const String& path) override { return refuse(path); }
    Qx::FileError removeFolder(const String& path) override { return refuse(path); }
    Qx::FileError list(const String& path, std::vector<String>&) override { return refuse(path); }
    Qx::FileError syncFolder(const String& path) override { return refuse(path); }
    Qx::FileError syncAll(const String& folder) override { return refuse(folder); }
    Qx::FileError touch(const String& path, bool) override { return refuse(path); }

private:
    static Qx::FileError refuse(const String& path) { return {EROFS, "change", path}; }

    class File : public Qx::OpenFile {
    public:
        File(MemoryFile& its, String path) : m_its(its), m_path(std::move(path)) {}
        Qx::FileError read(void* to, size_t size, size_t& got) override {
            const size_t left = m_its.m_bytes.size() - std::min(m_at, m_its.m_bytes.size());
            got = std::min(size, left);
            if (got > 0) {
                std::memcpy(to, m_its.m_bytes.data() + m_at, got);
            }
            m_at += got;
            return {};
        }
        Qx::FileError write(const void*, size_t, size_t&) override { return refuse(m_path); }
        Qx::FileError seek(uint64_t offset) override {
            m_at = static_cast<size_t>(offset);
            return {};
        }
        Qx::FileError sync() override { return {}; }
        Qx::FileError info(Qx::FileInfo& info) override { return m_its.info(m_path, info); }
        Qx::FileError setPermissions(uint32_t) override { return refuse(m_path); }
        Qx::FileError lock(bool, bool& taken) override {
            taken = false;
            return {};
        }
        Qx::FileError close() override { return {}; }

    private:
        MemoryFile& m_its;
        String m_path;
        size_t m_at = 0;
    };

    std::string m_bytes;
    int64_t m_version = 1;
    Qx::FileSystem* m_before;
};

} // namespace test
