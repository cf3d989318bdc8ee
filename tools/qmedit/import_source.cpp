#include "tools/qmedit/import_source.h"

#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <vector>

namespace {

/// How much of a file is looked at to tell what it is.
constexpr size_t kSniffedBytes = size_t{64} * 1024;

/// The start of a file, at most `kSniffedBytes`.
Qx::FileError readStart(const String& path, String& start) {
    std::unique_ptr<Qx::OpenFile> file;
    if (Qx::FileError error = Qx::fileSystem().open(path, Qx::OpenMode::Read, file); error) {
        return error;
    }
    start.resize(kSniffedBytes);
    size_t filled = 0;
    for (size_t got = 1; got > 0 && filled < start.size(); filled += got) {
        if (Qx::FileError error = file->read(start.data() + filled, start.size() - filled, got); error) {
            return error;
        }
    }
    start.resize(filled);
    return {};
}

int lineOf(std::string_view text, size_t position) {
    return 1 + static_cast<int>(
                   std::count(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(position), '\n'));
}

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

/// "TITLE: ...", "FCM: ...", or an event number followed by more on the line.
bool isEdlLine(const String& line) {
    const String text = line.trimmed();
    const String upper = text.substr(0, 6);
    if (upper.upper().starts_with("TITLE:") || upper.upper().starts_with("FCM:")) {
        return true;
    }
    const auto blank = std::find_if_not(text.begin(), text.end(), isDigit);
    return blank != text.begin() && blank != text.end() && (*blank == ' ' || *blank == '\t') &&
           std::count(text.begin(), text.end(), ':') >= 4;
}

bool looksLikeEdl(String start) {
    std::replace(start.begin(), start.end(), '\r', '\n');
    if (start.starts_with("\xEF\xBB\xBF")) {
        start.erase(0, 3);
    }
    const std::vector<String> lines = start.split('\n', true);
    return std::any_of(lines.begin(), lines.end(), isEdlLine);
}

Qx::Status failure(const String& path, int line, const String& what) {
    return Qx::Status::failure(path + (line > 0 ? ":" + std::to_string(line) : "") + ": " + what);
}

Qx::Status checkContent(const String& path, std::string_view start) {
    const String extension = Qx::extensionOf(Qx::fileNameOf(path)).lower();
    if (extension == getEditFilenameExt() || start.starts_with("QME")) {
        return failure(path, 0,
                       "this is an edit file, which needs no import; copy it into a project's folder "
                       "(DIR/P0001000) and look at it with 'qmedit show COOKIE --project DIR'");
    }
    if (start.empty()) {
        return failure(path, 1, "the file is empty; export the list again and import that");
    }
    if (const size_t zero = start.find('\0'); zero != std::string_view::npos) {
        return failure(path, lineOf(start, zero),
                       "not text but binary data; import reads CMX 3600 edit decision lists (.edl) and "
                       "legacy text (.ed2)");
    }
    if (extension != ".edl" && extension != ".ed2" && !looksLikeEdl(String(start))) {
        return failure(path, 1,
                       "no EDL: it has no TITLE, FCM or event line; import reads CMX 3600 edit decision "
                       "lists (.edl) and "
                       "legacy text (.ed2)");
    }
    return {};
}

} // namespace

Qx::Status checkImportSource(const String& path, String& resolved) {
    resolved = path;
    Qx::FileAnswer found = Qx::askFile(path);
    if (found.kind() == Qx::FileKind::Link) {
        std::error_code code;
        const std::filesystem::path target =
            std::filesystem::canonical(std::filesystem::path(path.c_str()), code);
        if (code) {
            return failure(path, 0, "the link leads to no file; give the list itself");
        }
        resolved = target.string();
        found = Qx::askFile(resolved);
    }
    if (found.isUnknown()) {
        return Qx::Status::failure(found.obstacle().text());
    }
    if (found.isMissing()) {
        return failure(path, 0, "there is no such file; check the name");
    }
    if (found.isFolder()) {
        return failure(path, 0, "this is a folder; give the EDL file in it");
    }
    if (!found.isRegular()) {
        return failure(path, 0, "not a regular file; save the list to a file and import that");
    }
    String start;
    if (const Qx::FileError error = readStart(resolved, start); error) {
        return Qx::Status::failure(error.text());
    }
    return checkContent(path, start);
}

Qx::Status readStandardInput(const String& name, uint64_t most, String& text) {
    text.clear();
    char buffer[65536];
    for (size_t got = 0; (got = std::fread(buffer, 1, sizeof buffer, stdin)) > 0;) {
        if (text.size() + got > most) {
            return failure(name, 0, "larger than 64 MiB, which no edit list is; check where it comes from");
        }
        text.append(buffer, got);
    }
    if (std::ferror(stdin) != 0) {
        return failure(name, 0, String("cannot be read: ") + std::strerror(errno));
    }
    return checkContent(name, std::string_view(text).substr(0, kSniffedBytes));
}
