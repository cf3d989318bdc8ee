#include "platform/services/files.h"

#include "platform/services/atomic_file.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstring>
#include <system_error>

namespace Qx {

namespace {

std::atomic<FileSystem*> installed{nullptr};

/// How much is read or copied at a time, in bytes.
constexpr size_t kBlock = size_t{1} << 20;

String reasonFor(int code) {
    switch (code) {
    case ELOOP:
        return "It is a symbolic link";
    case ENXIO:
        return "It is not a regular file";
    case EFBIG:
        return "It is larger than is accepted";
    default:
        break;
    }
#if defined(__GLIBC__)
    // The text that no locale translates.
    if (const char* text = strerrordesc_np(code)) {
        return text;
    }
#endif
    return std::generic_category().message(code);
}

StatusCode kindOf(int code) {
    switch (code) {
    case ENOENT:
        return StatusCode::NotFound;
    case ENOSPC:
    case EDQUOT:
        return StatusCode::Full;
    case EROFS:
        return StatusCode::ReadOnly;
    default:
        return StatusCode::Refused;
    }
}

/// Why something of a kind is no regular file.
int codeFor(FileKind kind) {
    switch (kind) {
    case FileKind::Regular:
        return 0;
    case FileKind::Missing:
        return ENOENT;
    case FileKind::Folder:
        return EISDIR;
    case FileKind::Link:
        return ELOOP;
    case FileKind::Other:
        return ENXIO;
    case FileKind::Unknown:
        break;
    }
    return EIO;
}

/// Opens a file for reading and learns its size, which is at most `limit`.
FileError openForReading(const String& path, uint64_t limit, std::unique_ptr<OpenFile>& file,
                         uint64_t& size) {
    FileSystem& system = fileSystem();
    if (auto error = retryInterrupted([&] { return system.open(path, OpenMode::Read, file); })) {
        return error;
    }
    FileInfo info;
    if (auto error = retryInterrupted([&] { return file->info(info); })) {
        return error;
    }
    if (info.kind != FileKind::Regular) {
        return {codeFor(info.kind), "open", path};
    }
    if (info.size > limit) {
        return {EFBIG, "read", path};
    }
    size = info.size;
    return {};
}

/// Reads a file that is at most `limit` bytes into a container of bytes. The file may grow or shrink while it
/// is read: what is found counts, and the limit holds in any case.
template <typename Bytes>
FileError readWhole(const String& path, Bytes& bytes, uint64_t limit) {
    bytes.clear();
    std::unique_ptr<OpenFile> file;
    uint64_t size = 0;
    if (auto error = openForReading(path, limit, file, size)) {
        return error;
    }
    Bytes read;
    read.resize(static_cast<size_t>(size));
    size_t filled = 0;
    while (true) {
        if (filled == read.size()) {
            // One byte more than is expected tells the end of the file from a file that grew.
            read.resize(filled + (filled == size ? 1 : kBlock));
        }
        size_t got = 0;
        const auto readMore = [&] { return file->read(read.data() + filled, read.size() - filled, got); };
        if (auto error = retryInterrupted(readMore)) {
            return error;
        }
        if (got == 0) {
            break;
        }
        filled += got;
        if (filled > limit) {
            return {EFBIG, "read", path};
        }
    }
    read.resize(filled);
    bytes = std::move(read);
    return {};
}

} // namespace

OpenFile::~OpenFile() = default;

void OpenFile::beginSync() {}
FileSystem::~FileSystem() = default;

Status FileError::status() const {
    return code == 0 ? Status() : Status::failure(kindOf(code), text(), code);
}

String FileError::text() const {
    if (code == 0) {
        return "no error";
    }
    return "cannot " + operation + " " + path + ": " + reasonFor(code);
}

FileSystem& fileSystem() {
    FileSystem* system = installed.load(std::memory_order_acquire);
    return system != nullptr ? *system : machineFileSystem();
}

FileSystem* setFileSystem(FileSystem* replacement) {
    FileSystem* before = installed.exchange(replacement, std::memory_order_acq_rel);
    return before != nullptr ? before : &machineFileSystem();
}

int interruptedCode() {
    return EINTR;
}

String joinPath(std::string_view folder, std::string_view name) {
    if (folder.empty()) {
        return String(name);
    }
    String path(folder);
    if (path.back() != '/') {
        path += '/';
    }
    path += name;
    return path;
}

String folderOf(std::string_view path) {
    const size_t separator = path.rfind('/');
    if (separator == std::string_view::npos) {
        return ".";
    }
    return separator == 0 ? String("/") : String(path.substr(0, separator));
}

String fileNameOf(std::string_view path) {
    const size_t separator = path.rfind('/');
    return String(separator == std::string_view::npos ? path : path.substr(separator + 1));
}

namespace {

/// Where the last extension of a name begins, or its length if there is none. The dot that begins the name of
/// a hidden file begins no extension, and a dot in a folder's name is not looked at.
size_t extensionStart(std::string_view name) {
    const size_t separator = name.rfind('/');
    const size_t begin = separator == std::string_view::npos ? 0 : separator + 1;
    const size_t dot = name.rfind('.');
    return dot == std::string_view::npos || dot <= begin ? name.size() : dot;
}

} // namespace

String withoutExtension(std::string_view name) {
    return String(name.substr(0, extensionStart(name)));
}

String extensionOf(std::string_view name) {
    return String(name.substr(extensionStart(name)));
}

bool isSameFile(const FileInfo& a, const FileInfo& b) {
    return a.kind == b.kind && a.kind != FileKind::Unknown && a.device == b.device && a.inode == b.inode &&
           a.size == b.size && a.modifiedNs == b.modifiedNs;
}

FileAnswer::FileAnswer(const FileInfo& info, const FileError& error, const String& path)
    : m_info(info), m_error(error), m_path(path) {
    if (m_error) {
        m_info = {};
        m_info.kind = FileKind::Unknown;
    }
}

FileError FileAnswer::obstacle(const char* operation) const {
    if (m_error || isRegular() || isMissing()) {
        return m_error;
    }
    return {codeFor(kind()), operation, m_path};
}

FileAnswer askFile(const String& path) {
    FileInfo info;
    const FileError error =
        path.empty() ? FileError() : retryInterrupted([&] { return fileSystem().info(path, info); });
    return {info, error, path};
}

FileError readAll(OpenFile& file, void* to, size_t size) {
    auto* position = static_cast<std::byte*>(to);
    while (size > 0) {
        size_t got = 0;
        if (auto error = retryInterrupted([&] { return file.read(position, size, got); })) {
            return error;
        }
        if (got == 0) {
            return {EIO, "read all of", "a file that ends too early"};
        }
        position += got;
        size -= got;
    }
    return {};
}

FileError readWholeFile(const String& path, std::vector<std::byte>& bytes, uint64_t limit) {
    return readWhole(path, bytes, limit);
}

FileError readWholeFile(const String& path, String& text, uint64_t limit) {
    return readWhole(path, text, limit);
}

FileError writeAll(OpenFile& file, const void* from, size_t size) {
    const auto* position = static_cast<const std::byte*>(from);
    while (size > 0) {
        size_t put = 0;
        if (auto error = retryInterrupted([&] { return file.write(position, size, put); })) {
            return error;
        }
        if (put == 0) {
            return {ENOSPC, "write", "a file that takes no more bytes"};
        }
        position += put;
        size -= put;
    }
    return {};
}

FileError makeFolders(const String& path) {
    if (path.empty()) {
        return {ENOENT, "make folder", path};
    }
    FileSystem& system = fileSystem();
    FileError error = retryInterrupted([&] { return system.makeFolder(path); });
    const String parent = folderOf(path);
    if (error.code != ENOENT || parent == path) {
        return error;
    }
    if (auto parentError = makeFolders(parent)) {
        return parentError;
    }
    return retryInterrupted([&] { return system.makeFolder(path); });
}

FileError copyFile(const String& from, const String& to) {
    std::unique_ptr<OpenFile> source;
    uint64_t size = 0;
    if (auto error = openForReading(from, UINT64_MAX, source, size)) {
        return error;
    }
    AtomicFile target(to);
    std::vector<std::byte> block(static_cast<size_t>(std::clamp<uint64_t>(size, 1, kBlock)));
    while (true) {
        size_t got = 0;
        const auto readMore = [&] { return source->read(block.data(), block.size(), got); };
        if (auto error = retryInterrupted(readMore)) {
            return error;
        }
        if (got == 0) {
            break;
        }
        if (auto error = target.write(block.data(), got)) {
            return error;
        }
    }
    return target.commit();
}

} // namespace Qx
