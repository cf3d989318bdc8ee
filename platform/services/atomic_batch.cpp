#include "platform/services/atomic_batch.h"

#include <iterator>
#include <new>
#include <set>
#include <utility>

namespace Qx {

namespace {

thread_local AtomicBatch* innermost = nullptr;
thread_local FolderSyncs* gathering = nullptr;

} // namespace

AtomicBatch::AtomicBatch() : m_outer(std::exchange(innermost, this)) {}

AtomicBatch::~AtomicBatch() {
    innermost = m_outer;
    try {
        removeTemporaries(0);
    } catch (const std::bad_alloc&) {
        // Without memory for the tale of a failure temporary files stay, as after a kill.
        m_entries.clear();
    }
}

AtomicBatch* AtomicBatch::current() {
    return innermost;
}

void AtomicBatch::enrol(String temporary, String path, bool durable) {
    m_entries.push_back({std::move(temporary), std::move(path), durable});
}

std::vector<String> AtomicBatch::durableFolders() const {
    std::vector<String> folders;
    std::set<String> seen;
    for (const Entry& entry : m_entries) {
        if (entry.durable && seen.insert(folderOf(entry.path)).second) {
            folders.push_back(folderOf(entry.path));
        }
    }
    return folders;
}

FileError AtomicBatch::commit() {
    m_numReplaced = 0;
    if (m_outer != nullptr) {
        std::move(m_entries.begin(), m_entries.end(), std::back_inserter(m_outer->m_entries));
        m_entries.clear();
        return {};
    }
    const std::vector<String> folders = durableFolders();
    for (const String& folder : folders) {
        if (auto error = retryInterrupted([&] { return fileSystem().syncAll(folder); })) {
            removeTemporaries(0);
            return error;
        }
    }
    FileError failure = replaceAll();
    // Also after a failure: the names that were replaced are to last.
    for (const String& folder : folders) {
        if (m_numReplaced == 0) {
            break;
        }
        auto error = retryInterrupted([&] { return fileSystem().syncFolder(folder); });
        if (error && !failure) {
            failure = error;
        }
    }
    return failure;
}

FileError AtomicBatch::replaceAll() {
    const size_t count = m_entries.size();
    for (size_t i = 0; i < count; ++i) {
        const Entry& entry = m_entries[i];
        auto error = retryInterrupted([&] { return fileSystem().rename(entry.temporary, entry.path); });
        if (error) {
            removeTemporaries(i);
            error.operation =
                String::format("replace (%zu of %zu files hold their new contents)", m_numReplaced, count);
            return error;
        }
        ++m_numReplaced;
    }
    m_entries.clear();
    return {};
}

void AtomicBatch::removeTemporaries(size_t from) {
    for (size_t i = from; i < m_entries.size(); ++i) {
        const String& temporary = m_entries[i].temporary;
        const auto error = retryInterrupted([&] { return fileSystem().remove(temporary); });
        static_cast<void>(error);
    }
    m_entries.clear();
}

AtomicBatch::Pause::Pause() : m_paused(std::exchange(innermost, nullptr)) {}

AtomicBatch::Pause::~Pause() {
    innermost = m_paused;
}

FolderSyncs::FolderSyncs() : m_outer(gathering) {
    if (m_outer == nullptr) {
        gathering = this;
    }
}

FolderSyncs::~FolderSyncs() {
    try {
        static_cast<void>(commit().code);
    } catch (const std::bad_alloc&) {
        m_folders.clear();
    }
    gathering = m_outer;
}

bool FolderSyncs::defer(const String& folder) {
    if (gathering == nullptr) {
        return false;
    }
    gathering->m_folders.insert(folder);
    return true;
}

FileError FolderSyncs::commit() {
    FileError failure;
    for (auto folder = m_folders.begin(); folder != m_folders.end();) {
        FileError error = retryInterrupted([&] { return fileSystem().syncFolder(*folder); });
        folder = error ? std::next(folder) : m_folders.erase(folder);
        if (error && !failure) {
            failure = std::move(error);
        }
    }
    return failure;
}

} // namespace Qx
