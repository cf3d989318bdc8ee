#include "edit/manager/revision_chain.h"

#include "platform/services/atomic_file.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"
#include "platform/store/tag_bag.h"

#include <algorithm>
#include <cerrno>
#include <cstdint>

namespace {

/// More than any folder holds; leaves room for the numbers behind it.
constexpr int kGreatestDepth = 1'000'000'000;

/// So many numbers without a backup end a chain.
constexpr int kLongestHole = 64;

const char* marker(RevisionChain::Kind kind) {
    return kind == RevisionChain::Undo ? "U" : "R";
}

} // namespace

RevisionChain::RevisionChain(const cookie& item, Kind kind, int depth)
    : RevisionChain(getFilenameForCookie(item), kind, depth) {}

RevisionChain::RevisionChain(const String& file, Kind kind, int depth)
    : m_file(file), m_kind(kind), m_depth(std::clamp(depth, 1, kGreatestDepth)) {}

String RevisionChain::extension(Kind kind, int number) {
    return number < 0 ? String::format("%s*", marker(kind)) : String::format("%s%d", marker(kind), number);
}

String RevisionChain::path(int number) const {
    return m_file + "." + extension(m_kind, number);
}

Qx::FileAnswer RevisionChain::ask(int number) const {
    return Qx::askFile(m_file.empty() ? String() : path(number));
}

Qx::Status RevisionChain::findFrom(int first, std::vector<int>& numbers, size_t limit) const {
    numbers.clear();
    for (int number = first, missing = 0;
         !m_file.empty() && number <= m_depth && missing < kLongestHole && numbers.size() < limit; ++number) {
        const Qx::FileAnswer answer = ask(number);
        if (const Qx::FileError error = answer.obstacle()) {
            return error.status();
        }
        missing = answer.isRegular() ? 0 : missing + 1;
        if (answer.isRegular()) {
            numbers.push_back(number);
        }
    }
    return {};
}

Qx::Status RevisionChain::exists(bool& found) const {
    int number = 0;
    const Qx::Status status = findNewest(number);
    found = number != 0;
    if (!status || found) {
        return status;
    }
    const Qx::FileAnswer behind = ask(m_depth + 1);
    found = behind.isRegular();
    return behind.obstacle().status();
}

std::vector<int> RevisionChain::numbers() const {
    std::vector<int> found;
    static_cast<void>(numbers(found).isOk());
    return found;
}

Qx::Status RevisionChain::numbers(std::vector<int>& found) const {
    std::vector<String> names;
    if (const Qx::FileError error =
            m_file.empty() ? Qx::FileError() : Qx::fileSystem().list(Qx::folderOf(m_file), names)) {
        return error.status();
    }
    found = numbers(names);
    return {};
}

std::vector<int> RevisionChain::numbers(const std::vector<String>& names) const {
    if (m_file.empty()) {
        return {};
    }
    const String start = Qx::fileNameOf(m_file) + "." + marker(m_kind);
    std::vector<int> found;
    for (auto name = std::lower_bound(names.begin(), names.end(), start);
         name != names.end() && name->starts_with(start); ++name) {
        int number = 0;
        // A number with a leading zero or a sign is not a name of this chain.
        if (Qx::textToInt(std::string_view(*name).substr(start.size()), number) && number > 0 &&
            *name == start + std::to_string(number)) {
            // It was listed, so it is there also when nobody can tell what it is.
            if (const Qx::FileAnswer answer = ask(number); answer.isRegular() || answer.isUnknown()) {
                found.push_back(number);
            }
        }
    }
    std::sort(found.begin(), found.end());
    return found;
}

Qx::Status RevisionChain::findNewest(int& number, int after) const {
    std::vector<int> found;
    Qx::Status status = findFrom(after + 1, found, 1);
    number = found.empty() ? 0 : found.front();
    return status;
}

/// Moves backups, in the order in which they are given, by so many numbers.
Qx::Status RevisionChain::shift(Qx::FileMoves& moves, const std::vector<int>& numbers, int by) const {
    for (const int number : numbers) {
        if (Qx::Status status = moves.move(path(number), path(number + by)); !status) {
            return status;
        }
    }
    return {};
}

Qx::Status RevisionChain::rotate(Qx::FileMoves& moves) const {
    std::vector<int> numbers;
    if (Qx::Status status = findFrom(1, numbers, SIZE_MAX); !status) {
        return status;
    }
    std::reverse(numbers.begin(), numbers.end());
    if (!numbers.empty() && numbers.front() == m_depth) {
        // It goes when everything else is in its place.
        int free = m_depth;
        while (!ask(++free).isMissing()) {
            if (const Qx::FileError error = ask(free).obstacle()) {
                return error.status();
            }
        }
        if (Qx::Status status = moves.move(path(m_depth), path(free)); !status) {
            return status;
        }
        moves.removeWhenFinished(path(free));
        numbers.erase(numbers.begin());
    }
    Qx::Status status = shift(moves, numbers, 1);
    return status ? moves.sync() : status;
}

Qx::Status RevisionChain::push(Qx::FileMoves& moves) {
    const Qx::FileAnswer present = Qx::askFile(m_file);
    if (const Qx::FileError error = present.obstacle("keep")) {
        return error.status();
    }
    if (present.isMissing()) {
        return Qx::Status::failure(Qx::StatusCode::NotFound,
                                   "there is no file " + m_file + " to keep as a backup");
    }
    Qx::Status status = rotate(moves);
    return status ? moves.move(m_file, path(1)) : status;
}

Qx::Status RevisionChain::push() {
    Qx::FileMoves moves(Qx::folderOf(m_file));
    Qx::Status status = push(moves);
    return status ? moves.finish() : status;
}

Qx::Status RevisionChain::pull(Qx::FileMoves& moves, int number) {
    Qx::Status status = moves.sync();
    if (status) {
        status = moves.move(path(number), m_file);
    }
    std::vector<int> numbers;
    if (status) {
        status = findFrom(number + 1, numbers, SIZE_MAX);
    }
    if (status && !numbers.empty()) {
        status = moves.sync();
    }
    return status ? shift(moves, numbers, -number) : status;
}

Qx::Status RevisionChain::restoreNewest(int& restored) {
    restored = 0;
    int newest = 0;
    Qx::FileMoves restoring(Qx::folderOf(m_file));
    Qx::Status status = findNewest(newest);
    if (!status || newest == 0) {
        return status;
    }
    if (status = restoring.move(path(newest), m_file); !status) {
        return status;
    }
    restored = newest;
    const bool durable = restoring.sync().isOk();
    restoring.keep();
    // A hole is passed over, so nothing depends on its being closed.
    Qx::FileMoves closing(Qx::folderOf(m_file));
    std::vector<int> numbers;
    if (durable && findFrom(newest + 1, numbers, SIZE_MAX) && shift(closing, numbers, -newest)) {
        static_cast<void>(closing.finish());
    }
    return {};
}

Qx::Status RevisionChain::park(Qx::FileMoves& moves) const {
    std::vector<int> numbers;
    Qx::Status status = findFrom(1, numbers, static_cast<size_t>(m_depth));
    for (size_t i = 0; status && i < numbers.size() && numbers[i] <= m_depth; ++i) {
        String parked = Qx::temporaryNameFor(path(numbers[i]));
        status = moves.move(path(numbers[i]), parked);
        if (const int error = status.systemError(); error != 0) {
            // The temporary name says nothing to whoever asked for a backup.
            status = Qx::FileError{error, "set aside", path(numbers[i])}.status();
        }
        moves.removeWhenFinished(std::move(parked));
    }
    return status;
}

Qx::Status RevisionChain::closeHoles() {
    Qx::FileMoves moves(Qx::folderOf(m_file));
    std::vector<int> numbers;
    Qx::Status status = findFrom(1, numbers, SIZE_MAX);
    for (size_t i = 0; status && i < numbers.size(); ++i) {
        const int place = static_cast<int>(i) + 1;
        if (numbers[i] != place) {
            status = moves.move(path(numbers[i]), path(place));
        }
    }
    return status ? moves.finish() : status;
}

Qx::Status RevisionChain::deleteTail(int keep) {
    bool any = false;
    for (int number = std::max(keep, 0); number < m_depth; any = true) {
        ++number;
        const auto error = Qx::retryInterrupted([&] { return Qx::fileSystem().remove(path(number)); });
        if (error.code == ENOENT) {
            break;
        }
        if (error) {
            return error.status();
        }
    }
    return any ? syncFolder() : Qx::Status();
}

Qx::Status RevisionChain::syncFolder() const {
    return Qx::retryInterrupted([this] { return Qx::fileSystem().syncFolder(Qx::folderOf(m_file)); })
        .status();
}

EditFileState examineEditFile(const String& path, String& why) {
    constexpr size_t kCookieLength = 8;
    const String name = Qx::fileNameOf(path);
    const cookie item(std::string_view(name).substr(0, kCookieLength));
    if (!item.isStorable()) {
        why = path + " is not named after an item";
        return EditFileState::Refused;
    }
    TagBag bag;
    const TagBag::OpenResult result =
        bag.open(item, Qx::folderOf(path), eOpenExisting, name.substr(kCookieLength));
    why = bag.openError();
    switch (result) {
    case TagBag::Opened:
        if (const Qx::Status status = bag.checkRevisions(); !status) {
            why = status.reason();
            return EditFileState::Refused;
        }
        return EditFileState::Sound;
    case TagBag::Damaged:
    case TagBag::Foreign:
        return EditFileState::Damaged;
    default:
        return EditFileState::Refused;
    }
}

Qx::Status findCorruptName(const String& file, String& name) {
    for (int number = 0;; ++number) {
        name = file + (number == 0 ? String(".CORRUPT") : String::format(".CORRUPT.%d", number));
        const Qx::FileAnswer found = Qx::askFile(name);
        if (found.isMissing()) {
            return {};
        }
        if (found.isUnknown()) {
            return found.obstacle().status();
        }
    }
}

String getUndoExtension(int number) {
    return RevisionChain::extension(RevisionChain::Undo, number);
}

String getRedoExtension(int number) {
    return RevisionChain::extension(RevisionChain::Redo, number);
}
