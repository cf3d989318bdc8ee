#include "edit/manager/revision_chain.h"

#include "platform/services/edit_filenames.h"

#include <algorithm>

namespace {

Qx::Status asStatus(const Qx::FileError& error) {
    return error ? Qx::Status::failure(error.text()) : Qx::Status();
}

const char* marker(RevisionChain::Kind kind) {
    return kind == RevisionChain::Undo ? "U" : "R";
}

} // namespace

RevisionChain::RevisionChain(const cookie& item, Kind kind, int depth)
    : RevisionChain(getFilenameForCookie(item), kind, depth) {}

RevisionChain::RevisionChain(const String& file, Kind kind, int depth)
    : m_file(file), m_kind(kind), m_depth(std::max(depth, 1)) {}

String RevisionChain::extension(Kind kind, int number) {
    return number < 0 ? String::format("%s*", marker(kind)) : String::format("%s%d", marker(kind), number);
}

String RevisionChain::path(int number) const {
    return m_file + "." + extension(m_kind, number);
}

Qx::FileAnswer RevisionChain::ask(int number) const {
    return Qx::askFile(m_file.empty() ? String() : path(number));
}

Qx::Status RevisionChain::exists(bool& found) const {
    int newest = 0;
    Qx::Status status = findNewest(newest);
    found = newest != 0;
    if (status && !found && !m_file.empty()) {
        std::vector<String> names;
        status = asStatus(
            Qx::retryInterrupted([&] { return Qx::fileSystem().list(Qx::folderOf(m_file), names); }));
        found = !numbers(names).empty();
    }
    return status;
}

std::vector<String> RevisionChain::namesInFolder() const {
    std::vector<String> names;
    if (m_file.empty() || Qx::fileSystem().list(Qx::folderOf(m_file), names)) {
        return {};
    }
    return names;
}

std::vector<int> RevisionChain::numbers() const {
    return numbers(namesInFolder());
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

Qx::Status RevisionChain::move(int from, int to) const {
    return asStatus(Qx::fileSystem().rename(path(from), path(to)));
}

Qx::Status RevisionChain::findFirst(bool there, int from, int& number) const {
    for (number = from; number <= m_depth; ++number) {
        const Qx::FileAnswer answer = ask(number);
        if (const Qx::FileError error = answer.obstacle()) {
            return asStatus(error);
        }
        if (answer.isRegular() == there) {
            break;
        }
    }
    return {};
}

Qx::Status RevisionChain::findNewest(int& number) const {
    const Qx::Status status = findFirst(true, 1, number);
    if (!status || number > m_depth) {
        number = 0;
    }
    return status;
}

Qx::Status RevisionChain::rotate() {
    if (m_depth == 1) {
        return {};
    }
    int firstFree = 1;
    if (Qx::Status status = findFirst(false, 1, firstFree); !status) {
        return status;
    }
    if (firstFree > m_depth) {
        firstFree = m_depth;
        if (Qx::Status status = asStatus(Qx::fileSystem().remove(path(m_depth))); !status) {
            return status;
        }
    }
    for (int number = firstFree - 1; number >= 1; --number) {
        if (Qx::Status status = move(number, number + 1); !status) {
            return status;
        }
    }
    return {};
}

Qx::Status RevisionChain::push() {
    const Qx::FileAnswer present = Qx::askFile(m_file);
    if (const Qx::FileError error = present.obstacle("keep")) {
        return asStatus(error);
    }
    if (present.isMissing()) {
        return Qx::Status::failure("there is no file " + m_file + " to keep as a backup");
    }
    if (const Qx::FileError error = ask(1).obstacle("replace")) {
        return asStatus(error);
    }
    if (Qx::Status status = rotate(); !status) {
        return status;
    }
    return asStatus(Qx::fileSystem().rename(m_file, path(1)));
}

Qx::Status RevisionChain::restoreNewest(int& restored) {
    restored = 0;
    int newest = 0;
    if (Qx::Status status = findNewest(newest); !status || newest == 0) {
        return status;
    }
    if (const Qx::FileError error = Qx::askFile(m_file).obstacle("replace")) {
        return asStatus(error);
    }
    if (Qx::Status status = asStatus(Qx::fileSystem().rename(path(newest), m_file)); !status) {
        return status;
    }
    restored = newest;
    for (int number = restored + 1; number <= m_depth; ++number) {
        const Qx::FileAnswer answer = ask(number);
        if (answer.obstacle() || (answer.isRegular() && !move(number, number - restored))) {
            break; // what is left keeps its order; a hole is passed over
        }
    }
    return {};
}

bool RevisionChain::deleteTail(int keep) {
    for (int number = m_depth; number > std::max(keep, 0); --number) {
        const Qx::FileAnswer answer = ask(number);
        if (answer.obstacle() || (answer.isRegular() && Qx::fileSystem().remove(path(number)))) {
            return false;
        }
    }
    return true;
}

Qx::Status RevisionChain::makeDurable() const {
    return asStatus(
        Qx::retryInterrupted([this] { return Qx::fileSystem().syncFolder(Qx::folderOf(m_file)); }));
}

String getUndoExtension(int number) {
    return RevisionChain::extension(RevisionChain::Undo, number);
}

String getRedoExtension(int number) {
    return RevisionChain::extension(RevisionChain::Redo, number);
}
