#pragma once

#include "edit/model/edit_upgrade.h"
#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/status.h"

#include <vector>

/// What became of an edit that was to be brought up to date. A plain value.
struct UpgradedEdit {
    enum Outcome {
        Current,      ///< it was up to date
        WouldUpgrade, ///< it can be upgraded whole; nothing was written
        Upgraded,     ///< its file is of the current revision
        NotWhole,     ///< some of it cannot be brought up to date: the file is as it was
        Failed        ///< it does not read or could not be written: the file is as it was
    };
    cookie item;
    Outcome outcome = Failed;
    EditUpgrade upgrade; ///< what was, or would be, done; and what could not be
    Qx::Status status;   ///< why it failed
    String kept;         ///< the undo backup that the old file became
};

/// Brings the file of an item of the current project up to date. The old file becomes undo backup 1, byte for
/// byte, and the oldest backup of a full chain goes. With `dryRun` nothing is written. A file that cannot be
/// upgraded whole is never touched, nor is that of an edit that is read-only or open; when the process dies
/// meanwhile the next opening finds the old file. Other processes are kept away with the writers' lock.
[[nodiscard]] QM_API UpgradedEdit upgradeEdit(const cookie& item, bool dryRun);

/// The items of the current project that have a file, by cookies. Fails when the folder cannot be read.
QM_API Qx::Status itemsToUpgrade(std::vector<cookie>& items);
