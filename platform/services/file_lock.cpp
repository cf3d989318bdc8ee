#include "platform/services/file_lock.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <new>
#include <unistd.h>

namespace Qx {

namespace {

/// The holder's text fills this many bytes of the file, with blanks behind it, so that a shorter text covers
/// a longer one.
constexpr size_t kHolderSize = 160;

String programName() {
#if defined(__GLIBC__)
    if (program_invocation_short_name != nullptr) {
        return program_invocation_short_name;
    }
#endif
    return "a program";
}

String thisProcess() {
    std::array<char, 256> host{};
    if (::gethostname(host.data(), host.size() - 1) != 0) {
        host[0] = '\0';
    }
    String text = programName() + String::format(", process %ld", static_cast<long>(::getpid()));
    if (host[0] != '\0') {
        text += String(" on ") + host.data();
    }
    return text;
}

FileError openLockFile(const String& path, std::unique_ptr<OpenFile>& file) {
    FileSystem& system = fileSystem();
    const auto open = [&](OpenMode mode) {
        return retryInterrupted([&] { return system.open(path, mode, file); });
    };
    auto error = open(OpenMode::ReadWrite);
    if (error.code != ENOENT) {
        return error;
    }
    // Whoever comes first makes the file; a second one finds it.
    if (auto made = open(OpenMode::Append)) {
        return made;
    }
    return open(OpenMode::ReadWrite);
}

} // namespace

FileLock::FileLock(String path) : m_path(std::move(path)) {}

FileLock::~FileLock() {
    release();
}

Status FileLock::take(bool wait) {
    if (m_file) {
        return {};
    }
    std::unique_ptr<OpenFile> file;
    if (auto error = openLockFile(m_path, file)) {
        return error.status();
    }
    bool taken = false;
    if (auto error = retryInterrupted([&] { return file->lock(wait, taken); })) {
        return error.status();
    }
    if (!taken) {
        const String who = holder(m_path);
        return Status::failure(StatusCode::Locked, m_path + " is locked by " +
                                                       (who.empty() ? String("another process") : who) +
                                                       "; try again when it has finished");
    }
    m_file = std::move(file);
    writeHolder(thisProcess());
    return {};
}

void FileLock::release() {
    if (m_file) {
        writeHolder({});
        m_file.reset();
    }
}

void FileLock::writeHolder(std::string_view text) noexcept {
    std::array<char, kHolderSize> padded{};
    padded.fill(' ');
    text.copy(padded.data(), kHolderSize - 1);
    padded.back() = '\n';
    // A courtesy: the lock holds whether or not the disk has room for the name of its holder, or memory for
    // the tale of a failure.
    try {
        if (!retryInterrupted([&] { return m_file->seek(0); })) {
            static_cast<void>(writeAll(*m_file, padded.data(), padded.size()).code);
        }
    } catch (const std::bad_alloc&) {
        return;
    }
}

String FileLock::holder(const String& path) {
    String text;
    if (readWholeFile(path, text, 4096)) {
        return {};
    }
    text.resize(std::min({text.size(), text.find('\n'), kHolderSize}));
    text = text.trimmed();
    const bool printable = std::all_of(text.begin(), text.end(), [](unsigned char c) { return c >= ' '; });
    return printable && isUtf8(text) ? text : String();
}

} // namespace Qx
