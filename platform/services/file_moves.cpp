#include "platform/services/file_moves.h"

#include "platform/services/log.h"

#include <new>

namespace Qx {

namespace {

FileError rename(const String& from, const String& to) {
    return retryInterrupted([&] { return fileSystem().rename(from, to); });
}

} // namespace

FileMoves::~FileMoves() {
    try {
        takeBack();
    } catch (const std::bad_alloc&) {
        // What is left of the moves stays.
    }
}

Status FileMoves::move(const String& from, const String& to) {
    const FileAnswer there = askFile(to);
    if (there.isUnknown()) {
        return there.obstacle().status();
    }
    if (!there.isMissing()) {
        return Status::failure(StatusCode::Refused,
                               "cannot move " + from + " to " + to + ": there is something of that name");
    }
    // Noted first, as noting may run out of memory.
    m_moves.push_back({from, to});
    const FileError error = rename(from, to);
    if (error) {
        m_moves.pop_back();
    } else {
        m_synced = false;
    }
    return error.status();
}

Status FileMoves::sync() {
    if (m_synced) {
        return {};
    }
    const FileError error = retryInterrupted([&] { return fileSystem().syncFolder(m_folder); });
    m_synced = !error;
    return error.status();
}

Status FileMoves::finish() {
    if (Status status = sync(); !status) {
        takeBack();
        return status;
    }
    keep();
    return {};
}

void FileMoves::keep() {
    m_moves.clear();
    for (const String& path : m_going) {
        static_cast<void>(fileSystem().remove(path).code);
    }
    m_going.clear();
}

bool FileMoves::moveBack(const Move& move) const {
    const FileAnswer place = askFile(move.from);
    if (askFile(move.to).isMissing() || (!place.isMissing() && !place.isUnknown())) {
        return false;
    }
    FileError error = place.obstacle();
    if (!error) {
        error = rename(move.to, move.from);
    }
    if (error) {
        herc_printf("FileMoves: %s stays as %s: %s\n", move.from.c_str(), move.to.c_str(),
                    error.text().c_str());
    }
    return !error;
}

bool FileMoves::takeBack() {
    m_going.clear();
    bool all = true;
    for (auto move = m_moves.rbegin(); move != m_moves.rend(); ++move) {
        // In the order that is safe where names lose theirs.
        static_cast<void>(sync());
        if (moveBack(*move)) {
            m_synced = false;
        } else {
            all = false;
        }
    }
    m_moves.clear();
    static_cast<void>(sync());
    return all;
}

} // namespace Qx
