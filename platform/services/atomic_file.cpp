#include "platform/services/atomic_file.h"

#include "platform/base/id_stamp.h"
#include "platform/services/atomic_batch.h"
#include "platform/services/clock.h"
#include "platform/services/process_origin.h"

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <new>
#include <optional>
#include <unistd.h>

namespace Qx {

namespace {

constexpr std::string_view kTemporaryEnd = ".tmp";
constexpr size_t kOriginDigits = 16;
constexpr size_t kRandomDigits = 16;
/// What is kept of a file's name in its temporary name, so that the latter is at most 255 bytes long.
constexpr size_t kNameKept = 200;
/// So many bytes are written before the disk is put to work on them, while the rest is made and written.
constexpr uint64_t kSyncAhead = uint64_t{2} << 20;
/// How many temporary names are tried before giving up.
constexpr int kTries = 100;

bool failed(const std::from_chars_result& result) {
    return result.ec != std::errc();
}

bool allOf(std::string_view text, std::string_view set) {
    return !text.empty() && text.find_first_not_of(set) == std::string_view::npos;
}

} // namespace

String temporaryNameFor(const String& path) {
    // A stamp differs on every thread and after every fork, so two writers do not wait for each other's
    // names.
    const IdStamp stamp = IdStamp::fresh(IdStampMagic::EffectNode);
    const String name = fileNameOf(path).substr(0, kNameKept);
    const ProcessOrigin origin = ProcessOrigin::current().value_or(ProcessOrigin());
    const String temporary =
        String::format(".%s.%ld-%08x%08x%08x%08x.tmp", name.c_str(), static_cast<long>(::getpid()),
                       origin.machine, origin.run, stamp.word(0) ^ stamp.word(1), stamp.word(2));
    return path.find('/') == String::npos ? temporary : joinPath(folderOf(path), temporary);
}

AtomicFile::AtomicFile(String path) : m_path(std::move(path)) {}

AtomicFile::~AtomicFile() {
    try {
        discard();
    } catch (const std::bad_alloc&) {
        // Without memory for the tale of a failure the temporary file stays, as after a kill.
        m_file.reset();
    }
}

FileError AtomicFile::openTemporary() {
    if (m_file) {
        return {};
    }
    const String name = fileNameOf(m_path);
    if (name.empty() || name == "." || name == ".." || m_path.find('\0') != String::npos) {
        return {EINVAL, "write", m_path};
    }
    if (auto error = askFile(m_path).obstacle("replace")) {
        return error;
    }
    FileError error;
    for (int i = 0; i < kTries; ++i) {
        const String temporary = temporaryNameFor(m_path);
        error = retryInterrupted([&] { return fileSystem().open(temporary, OpenMode::CreateNew, m_file); });
        if (!error) {
            m_temporary = temporary;
            return {};
        }
        if (error.code != EEXIST) {
            error.path = m_path;
            break;
        }
    }
    return error;
}

FileError AtomicFile::fail(FileError error) {
    if (error) {
        // The temporary name says nothing to whoever asked for the file.
        if (error.path == m_temporary) {
            error.path = m_path;
        }
        m_failed = error;
        discard();
    }
    return error;
}

FileError AtomicFile::write(const void* from, size_t size) {
    if (m_failed) {
        return m_failed;
    }
    if (m_done) {
        return {EBADF, "write", m_path};
    }
    if (auto error = openTemporary()) {
        return fail(error);
    }
    if (auto error = writeAll(*m_file, from, size)) {
        error.path = m_path;
        return fail(error);
    }
    m_size += size;
    if (m_size - m_begun >= kSyncAhead) {
        m_file->beginSync();
        m_begun = m_size;
    }
    return {};
}

FileError AtomicFile::overwrite(uint64_t offset, const void* from, size_t size) {
    if (m_failed) {
        return m_failed;
    }
    if (m_done) {
        return {EBADF, "write", m_path};
    }
    if (offset > m_size || size > m_size - offset) {
        return fail({EINVAL, "write past the end of", m_path});
    }
    if (size == 0) {
        return {};
    }
    if (auto error = retryInterrupted([&] { return m_file->seek(offset); })) {
        return fail(error);
    }
    if (auto error = writeAll(*m_file, from, size)) {
        error.path = m_path;
        return fail(error);
    }
    return fail(retryInterrupted([&] { return m_file->seek(m_size); }));
}

FileError AtomicFile::finishTemporary(bool sync) {
    if (auto error = openTemporary()) {
        return error;
    }
    const FileAnswer old = askFile(m_path);
    if (auto error = old.obstacle("replace")) {
        return error;
    }
    if (old.isRegular()) {
        auto error = retryInterrupted([&] { return m_file->setPermissions(old.info().permissions); });
        // A file system without permission bits has none to keep.
        if (error && error.code != EPERM && error.code != ENOTSUP && error.code != ENOSYS) {
            return error;
        }
    }
    if (sync) {
        if (auto error = retryInterrupted([&] { return m_file->sync(); })) {
            return error;
        }
    }
    auto error = retryInterrupted([&] { return m_file->info(m_info); });
    if (!error) {
        error = retryInterrupted([&] { return m_file->close(); });
    }
    m_file.reset();
    return error;
}

FileError AtomicFile::replace(bool durable) {
    // Memory is asked for before the file is in place.
    const String folder = folderOf(m_path);
    const bool isDeferred = durable && FolderSyncs::defer(folder);
    if (auto error = retryInterrupted([&] { return fileSystem().rename(m_temporary, m_path); })) {
        return fail(error);
    }
    m_temporary.clear();
    m_replaced = true;
    m_done = true;
    if (durable && !isDeferred) {
        m_failed = retryInterrupted([&] { return fileSystem().syncFolder(folder); });
    }
    return m_failed;
}

FileError AtomicFile::commit(bool durable) {
    if (m_failed || m_done) {
        return m_failed;
    }
    AtomicBatch* batch = AtomicBatch::current();
    if (auto error = finishTemporary(durable && batch == nullptr)) {
        return fail(error);
    }
    if (batch != nullptr) {
        batch->enrol(std::move(m_temporary), m_path, durable);
        m_temporary.clear();
        m_done = true;
        return {};
    }
    return replace(durable);
}

void AtomicFile::discard() {
    m_file.reset();
    if (m_temporary.empty()) {
        return;
    }
    const auto error = retryInterrupted([&] { return fileSystem().remove(m_temporary); });
    if (!error || error.code == ENOENT) {
        m_temporary.clear();
    }
}

namespace {

/// What a temporary name tells of who made it.
struct TemporaryName {
    bool isOne = false;
    long process = 0;
    std::optional<ProcessOrigin> origin; ///< none in names that do not tell, as on a system that does not
};

TemporaryName parseTemporary(std::string_view name) {
    TemporaryName parsed;
    if (name.size() <= kTemporaryEnd.size() + 1 || name.front() != '.' || !name.ends_with(kTemporaryEnd)) {
        return parsed;
    }
    name.remove_suffix(kTemporaryEnd.size());
    const size_t dot = name.rfind('.');
    const std::string_view tail = name.substr(dot + 1);
    const size_t dash = tail.find('-');
    if (dot <= 1 || dash == std::string_view::npos || !allOf(tail.substr(0, dash), "0123456789")) {
        return parsed;
    }
    const std::string_view digits = tail.substr(dash + 1);
    const bool hasOrigin = digits.size() == kOriginDigits + kRandomDigits;
    parsed.isOne = (hasOrigin || digits.size() == kRandomDigits) && allOf(digits, "0123456789abcdef");
    ProcessOrigin origin;
    if (parsed.isOne && hasOrigin &&
        !failed(std::from_chars(tail.data(), tail.data() + dash, parsed.process)) &&
        !failed(std::from_chars(digits.data(), digits.data() + 8, origin.machine, 16)) &&
        !failed(std::from_chars(digits.data() + 8, digits.data() + 16, origin.run, 16))) {
        parsed.origin = origin;
    }
    return parsed;
}

} // namespace

bool isTemporaryName(std::string_view fileName) {
    return parseTemporary(fileName).isOne;
}

bool isStaleTemporary(const String& path, int64_t age) {
    const TemporaryName name = parseTemporary(fileNameOf(path));
    if (!name.isOne) {
        return false;
    }
    const FileAnswer found = askFile(path);
    return found.isRegular() && ((name.origin && name.origin->hasEnded(name.process)) ||
                                 found.info().modifiedNs / 1000000000 <= nowSeconds() - age);
}

unsigned removeStaleTemporaries(const String& folder, int64_t age) {
    FileSystem& system = fileSystem();
    std::vector<String> names;
    if (retryInterrupted([&] { return system.list(folder, names); })) {
        return 0;
    }
    unsigned removed = 0;
    for (const String& name : names) {
        const String path = joinPath(folder, name);
        if (isStaleTemporary(path, age) && !retryInterrupted([&] { return system.remove(path); })) {
            ++removed;
        }
    }
    return removed;
}

} // namespace Qx
