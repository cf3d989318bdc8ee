#pragma once

#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <vector>

/// What the opening of an edit did, for a caller who tells its user or decides by it. A plain value.
struct OpenReport {
    /// Where the edit came from.
    enum class Source {
        None,   ///< it was not opened
        Cache,  ///< it was open already
        File,   ///< its file
        Backup, ///< an undo backup, which took the file's place
        Fresh   ///< nowhere: it is a new one, without a file yet
    };
    /// A file that did not read and was moved to another name.
    struct SetAside {
        String path; ///< where it lies
        Qx::Status why;
    };

    Source source = Source::None;
    /// For `Backup`: its number, as the backups were numbered before the opening.
    int backup = 0;
    /// There was no file under the edit's name, for certain.
    bool wasMissing = false;
    /// What was moved out of the way, in order: the edit's file first, then the backups that did not read
    /// either.
    std::vector<SetAside> setAside;
    /// A success when the edit was opened. Otherwise why its file did not open: `NotFound`, `Damaged`,
    /// `Newer`, what the system said, `BadArgument` for an item that has no file, `Cancelled` while the
    /// project is being left and when the manager was shut down.
    Qx::Status status;
    /// What kept a backup, or a fresh edit that was asked for, from taking the place of a file that is
    /// missing or damaged; a success when nothing did, or there is no backup.
    Qx::Status recovery;
};
