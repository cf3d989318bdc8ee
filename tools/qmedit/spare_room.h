#pragma once

#include "platform/base/status.h"
#include "platform/services/atomic_file.h"

#include <optional>

/// Room on the disk beside a file, kept from others until it is given back. A command that moves an edit out
/// of the way before it writes it takes the room first: so a full disk is a refusal with nothing changed.
class SpareRoom {
public:
    /// A failure names the file and the cause.
    Qx::Status take(const String& besideFile, uint64_t bytes);
    void giveBack() { m_file.reset(); }

private:
    std::optional<Qx::AtomicFile> m_file;
};
