#pragma once

#include "platform/base/export.h"

#include <cstdint>
#include <optional>

namespace Qx {

/// Where a process number means something: one run of one machine, or of one container on it. Written into
/// the names of temporary files, so that those of processes that died can be told from those in use.
struct QM_API ProcessOrigin {
    uint32_t machine = 0; ///< the host, its machine number and the space of process numbers
    uint32_t run = 0;     ///< this start of the machine

    /// That of this process; found out once. Nothing where the system does not tell.
    [[nodiscard]] static const std::optional<ProcessOrigin>& current();

    /// True if a process of this origin, by its number, is known to have ended. False as long as that cannot
    /// be known, as of a process on another machine.
    [[nodiscard]] bool hasEnded(long process) const;
};

} // namespace Qx
