#pragma once

#include "platform/services/files.h"

#include <set>

namespace Qx {

/// Makes many files durable for the price of about one. While a batch is open, `AtomicFile::commit` on this
/// thread closes its temporary file and enrols it; `commit` of the batch then makes all of them durable with
/// one call a folder, renames them in the order in which they were enrolled and makes the folders durable.
///
///     AtomicBatch batch;
///     for (...) { AtomicFile file(path); ... file.commit() ... }   // names still hold the old files
///     return batch.commit();
///
/// Until then a reader finds the old files, also on this thread, and `AtomicFile::replaced` stays false. Each
/// single name holds its old or its new file at every instant; the names together do not change in one step.
/// Destroyed without a commit, the batch removes its temporary files and no name has changed.
///
/// A batch that is opened inside another hands its files over to the outer one when it commits. A batch is
/// used on the thread that made it, as a local variable. It belongs to no other batch or thread.
class QM_API AtomicBatch {
public:
    AtomicBatch();
    ~AtomicBatch();
    AtomicBatch(const AtomicBatch&) = delete;
    AtomicBatch& operator=(const AtomicBatch&) = delete;

    /// Replaces all files. On a failure before the first rename, every temporary file is removed and nothing
    /// has changed. A failure among the renames leaves the names before it with their new files, removes the
    /// other temporary files, and says in its text how many names hold new files. If only the sync of a
    /// folder fails, all names hold their new files, which may not yet be durable. The batch is empty
    /// afterwards and may be filled again.
    FileError commit();

    /// How many files wait for the commit.
    [[nodiscard]] size_t size() const { return m_entries.size(); }
    /// How many names hold their new files after the last commit. 0 for a batch inside another.
    [[nodiscard]] size_t numReplaced() const { return m_numReplaced; }

    /// The innermost batch that is open on this thread and not suspended; null if there is none.
    [[nodiscard]] static AtomicBatch* current();

    /// While one lives, files of this thread are replaced at their own commit although a batch is open: for a
    /// file that others must see before a lock is released.
    class QM_API Pause {
    public:
        Pause();
        ~Pause();
        Pause(const Pause&) = delete;
        Pause& operator=(const Pause&) = delete;

    private:
        AtomicBatch* m_paused;
    };

private:
    friend class AtomicFile;

    struct Entry {
        String temporary;
        String path;
        bool durable = true;
    };

    void enrol(String temporary, String path, bool durable);
    [[nodiscard]] std::vector<String> durableFolders() const;
    FileError replaceAll();
    void removeTemporaries(size_t from);

    AtomicBatch* m_outer;
    std::vector<Entry> m_entries;
    size_t m_numReplaced = 0;
};

/// Makes the names of many files durable together. While one is open, each `AtomicFile` that is committed on
/// this thread makes its bytes durable and takes its name at once, but leaves the sync of the folder to
/// `commit`: until then a crash may bring the old file back. A sync waits for the disk, so that of one folder
/// a file costs as much as the file. Used on the thread that made it, as a local variable; one inside another
/// leaves the folders to the outer one.
class QM_API FolderSyncs {
public:
    FolderSyncs();
    /// Syncs what was not committed; a failure is not reported.
    ~FolderSyncs();
    FolderSyncs(const FolderSyncs&) = delete;
    FolderSyncs& operator=(const FolderSyncs&) = delete;

    /// Syncs each folder. On a failure all are tried, and tried again by the next call.
    FileError commit();

private:
    friend class AtomicFile;
    /// False when none is open: the caller syncs the folder itself.
    static bool defer(const String& folder);

    FolderSyncs* m_outer;
    std::set<String> m_folders;
};

} // namespace Qx
