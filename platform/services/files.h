#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

/// The one seam through which the library touches files. It knows bytes and names, nothing of edits. Every
/// operation of the system that can fail has one call here, so that a test can put a file system in its place
/// that fails, fills up or dies at any of them.
namespace Qx {

/// Why a file operation failed: the system's error number, what was tried and on which path.
struct [[nodiscard]] QM_API FileError {
    int code = 0; ///< `errno` of the system; 0 means success
    String operation;
    String path;

    explicit operator bool() const { return code != 0; }
    /// For a person: "cannot write /a/b.qme: No space left on device".
    [[nodiscard]] String text() const;
    /// The same as an outcome, with `text` for its sentence: ENOENT is `NotFound`; ENOSPC and EDQUOT are
    /// `Full`; EROFS is `ReadOnly`; every other number is `Refused`. The number is kept. Success without an
    /// error.
    [[nodiscard]] Status status() const;
};

/// What kind of thing a name stands for. Links are never followed in finding out. `Unknown` is what the
/// system could not tell; no file system answers a question with it, it stands where there was no answer.
enum class FileKind { Missing, Regular, Folder, Link, Other, Unknown };

struct FileInfo {
    FileKind kind = FileKind::Missing;
    uint64_t size = 0;
    int64_t modifiedNs = 0; ///< nanoseconds since 1970, UTC
    int64_t accessedNs = 0; ///< likewise, of the last access
    uint64_t device = 0;
    uint64_t inode = 0;
    int links = 0;
    uint32_t permissions = 0; ///< the nine permission bits (and set-id and sticky bits)
};

/// How a file is opened. None of them follows a link in the last component or blocks on a FIFO; opening
/// anything but a regular file fails.
enum class OpenMode {
    Read,
    CreateNew, ///< for writing; fails when the name exists
    ReadWrite, ///< existing file, both ways
    Append     ///< for writing at the end; created when missing
};

/// An open file. Closed by the destructor without a report if `close` was not called.
class QM_API OpenFile {
public:
    virtual ~OpenFile();
    /// Reads at most `size` bytes at the file's position; `got` may be less, and is 0 at the end.
    virtual FileError read(void* to, size_t size, size_t& got) = 0;
    /// Writes at most `size` bytes at the file's position; `put` may be less.
    virtual FileError write(const void* from, size_t size, size_t& put) = 0;
    /// Moves the position to `offset` bytes from the start.
    virtual FileError seek(uint64_t offset) = 0;
    /// Makes the file's bytes durable.
    virtual FileError sync() = 0;
    /// Asks the system to begin with that for what was written so far, without waiting for it: a sync that
    /// follows finds less to do. A hint; it cannot fail, and a file system without it does nothing.
    virtual void beginSync();
    virtual FileError info(FileInfo& info) = 0;
    /// Sets the permission bits.
    virtual FileError setPermissions(uint32_t permissions) = 0;
    /// Takes (or, without `wait`, tries to take) an exclusive advisory lock that dies with the process.
    /// `taken` tells whether the lock is held.
    virtual FileError lock(bool wait, bool& taken) = 0;
    /// Gives the file back to the system. The object is closed whatever the answer; closing again is a
    /// success.
    virtual FileError close() = 0;
};

/// The file system. Thread-safe. Paths are bytes as the system takes them. A call that a signal interrupts
/// fails with EINTR and has done nothing; the helpers below, and everything that the library builds on them,
/// try again.
class QM_API FileSystem {
public:
    virtual ~FileSystem();
    virtual FileError open(const String& path, OpenMode mode, std::unique_ptr<OpenFile>& file) = 0;
    /// Information about a name; a name that does not exist is a success of kind Missing.
    virtual FileError info(const String& path, FileInfo& info) = 0;
    /// Moves `from` over `to` atomically, replacing what was there.
    virtual FileError rename(const String& from, const String& to) = 0;
    virtual FileError remove(const String& path) = 0;
    /// Makes one folder. A folder that exists already is a success.
    virtual FileError makeFolder(const String& path) = 0;
    virtual FileError removeFolder(const String& path) = 0;
    /// The names in a folder, sorted by bytes, without "." and "..".
    virtual FileError list(const String& path, std::vector<String>& names) = 0;
    /// Makes the names in a folder durable.
    virtual FileError syncFolder(const String& path) = 0;
    /// Makes everything durable that was written to the file system which holds the folder: one call for any
    /// number of files, at the cost of waiting for the writes of others.
    virtual FileError syncAll(const String& folder) = 0;
    /// Sets the times of last access and, unless `accessOnly`, of last change to now.
    virtual FileError touch(const String& path, bool accessOnly) = 0;
};

/// The file system in use, at first the machine's own.
QM_API FileSystem& fileSystem();
/// The machine's own file system.
QM_API FileSystem& machineFileSystem();
/// Puts another file system in place and returns the one before; null restores the machine's own. The caller
/// keeps ownership and must not destroy it while it is in use.
QM_API FileSystem* setFileSystem(FileSystem* replacement);

/// \name Built on the seam
/// @{

/// The system's number for a call that a signal interrupted (EINTR).
QM_API int interruptedCode();

/// Folder and name joined by the system's separator.
QM_API String joinPath(std::string_view folder, std::string_view name);
/// What precedes the last separator ("." if there is none), and what follows it.
QM_API String folderOf(std::string_view path);
QM_API String fileNameOf(std::string_view path);
/// A file name without its last extension, and that extension with its dot ("" if none).
QM_API String withoutExtension(std::string_view name);
QM_API String extensionOf(std::string_view name);

/// True if both tell of one and the same file, unchanged, or of none. What is unknown is the same as nothing.
QM_API bool isSameFile(const FileInfo& a, const FileInfo& b);

/// The answer to the question what a name stands for. Three answers are possible: something of some kind is
/// there, nothing is, or the system could not tell (a disk or server that fails, a folder that may not be
/// searched). Nothing turns it into a bool, as the third is neither a yes nor a no: who would rename, replace
/// or remove anything because a name is vacant asks `isMissing`, and gives up with `obstacle` otherwise.
class [[nodiscard]] QM_API FileAnswer {
public:
    FileAnswer(const FileInfo& info, const FileError& error, const String& path);

    /// A regular file is there for certain.
    [[nodiscard]] bool isRegular() const { return kind() == FileKind::Regular; }
    /// A folder is there for certain.
    [[nodiscard]] bool isFolder() const { return kind() == FileKind::Folder; }
    /// Nothing is there, for certain.
    [[nodiscard]] bool isMissing() const { return kind() == FileKind::Missing; }
    /// The system could not tell.
    [[nodiscard]] bool isUnknown() const { return kind() == FileKind::Unknown; }
    [[nodiscard]] FileKind kind() const { return m_info.kind; }
    /// What is known of it; of kind Missing or Unknown when nothing is.
    [[nodiscard]] const FileInfo& info() const { return m_info; }
    /// Why no regular file can be read from or put in the name's place: the system could not tell, or
    /// something else is there. No error for a regular file and for a vacant name.
    [[nodiscard]] FileError obstacle(const char* operation = "use") const;

private:
    FileInfo m_info;
    FileError m_error;
    String m_path;
};

/// Asks the file system in use what a name stands for, again as long as a signal interrupts it. Nothing lies
/// at an empty path.
[[nodiscard]] QM_API FileAnswer askFile(const String& path);

/// Calls an operation of the seam again as long as a signal interrupts it.
template <typename Operation>
FileError retryInterrupted(Operation operation) {
    FileError error = operation();
    while (error.code == interruptedCode()) {
        error = operation();
    }
    return error;
}

/// Reads exactly `size` bytes at the file's position, retrying interrupted and short reads. The file's end
/// before that is a failure with EIO.
QM_API FileError readAll(OpenFile& file, void* to, size_t size);

/// Reads a whole regular file, retrying interrupted and short reads. `limit` is the greatest size accepted; a
/// larger file fails with EFBIG before anything is read. On failure `bytes` is empty.
QM_API FileError readWholeFile(const String& path, std::vector<std::byte>& bytes, uint64_t limit);
QM_API FileError readWholeFile(const String& path, String& text, uint64_t limit);

/// Writes all of `size` bytes, retrying interrupted and short writes.
QM_API FileError writeAll(OpenFile& file, const void* from, size_t size);

/// Makes a folder and all that leads to it.
QM_API FileError makeFolders(const String& path);

/// Copies a regular file to a name that is replaced atomically, durably.
QM_API FileError copyFile(const String& from, const String& to);

/// @}

} // namespace Qx
