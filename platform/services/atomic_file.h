#pragma once

#include "platform/services/files.h"

namespace Qx {

/// Writes a file whole, so that at every instant its name holds the old file or the new one: a temporary
/// name in the same folder, the bytes, sync, rename over the name, sync of the folder. Everything in the
/// library that writes a file goes through here.
///
///     AtomicFile file(path);
///     if (auto error = file.write(bytes, size)) return error;   // any number of writes
///     return file.commit();
///
/// Unless `commit` succeeded, the destructor removes the temporary file and the old file is as it was. A
/// temporary name that is taken already is left alone and another one used; a folder, link, FIFO or device in
/// the place of the file is refused, never followed. If the sync of the folder fails after the rename, commit
/// reports that error and `replaced()` is true: the name holds the new, whole file, which may not yet be
/// durable. One object is used on one thread.
///
/// The file keeps the permission bits of the one it replaces, where the file system can. The bytes go to the
/// system as they come: a caller with many small pieces gathers them first. While an `AtomicBatch` is open on
/// the thread, `commit` enrols the file there instead of renaming it.
class QM_API AtomicFile {
public:
    /// Nothing is touched before the first write.
    explicit AtomicFile(String path);
    ~AtomicFile();
    AtomicFile(const AtomicFile&) = delete;
    AtomicFile& operator=(const AtomicFile&) = delete;

    FileError write(const void* from, size_t size);
    FileError write(std::string_view text) { return write(text.data(), text.size()); }
    /// Overwrites bytes written before, at `offset` from the start; the position then returns to the end.
    FileError overwrite(uint64_t offset, const void* from, size_t size);
    /// How many bytes were written.
    [[nodiscard]] uint64_t size() const { return m_size; }

    /// Makes the new file take the name. With `durable` false the two syncs are left out (for files that can
    /// be made again, and for measuring). Without any write before it, the new file is empty. After a success
    /// the object is done: another commit is a success that does nothing, a write fails.
    FileError commit(bool durable = true);
    /// True once the name holds the new file.
    [[nodiscard]] bool replaced() const { return m_replaced; }
    /// The new file as it was when it was whole, under the temporary name: what it is under its own name as
    /// well, except for a time that the file system sets late. Set by `commit`.
    [[nodiscard]] const FileInfo& info() const { return m_info; }

private:
    FileError openTemporary();
    FileError finishTemporary(bool sync);
    FileError replace(bool durable);
    FileError fail(FileError error);
    void discard();

    String m_path;
    String m_temporary;
    std::unique_ptr<OpenFile> m_file;
    uint64_t m_size = 0;
    uint64_t m_begun = 0; ///< how many bytes the system was asked to begin to make durable
    FileInfo m_info;
    bool m_replaced = false;
    bool m_done = false; ///< committed: renamed, or handed to a batch
    FileError m_failed;  ///< the first failure; later calls repeat it
};

/// A fresh name beside a file for something that is to lie there for a while only, as `AtomicFile` takes
/// them.
QM_API String temporaryNameFor(const String& path);

/// True for such a name; a listing of a folder passes them over.
QM_API bool isTemporaryName(std::string_view fileName);

/// True for a temporary file that nobody is going to finish: the process that made it has ended, as far as
/// that can be known here, or its last change is at least `age` seconds ago.
QM_API bool isStaleTemporary(const String& path, int64_t age = 24 * 3600);

/// Removes the stale temporary files of a folder. Returns how many went; a folder that cannot be listed has
/// none.
QM_API unsigned removeStaleTemporaries(const String& folder, int64_t age = 24 * 3600);

} // namespace Qx
