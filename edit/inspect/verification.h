#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <functional>
#include <vector>

/// A checked file of a project.
struct VerifiedFile {
    String name;                ///< below the project's folder
    cookie item;                ///< whose file it is; invalid for an edit file that is named after no item
    std::vector<String> faults; ///< a sentence each; empty for a sound one
};

/// Checks the edit files, backups and milestones in a project's folder, each whole (`verifyEditFile`), and
/// adds what was found: the folder's own files in order of their names, then the milestones. With `items`
/// only the files of those. Changes nothing. A failure when the names of a folder cannot be had; what was
/// checked before is in `files`. `checking`, which may be empty, is told of each file before it is read.
QM_API Qx::Status verifyProject(const String& folder, const std::vector<cookie>& items,
                                std::vector<VerifiedFile>& files,
                                const std::function<void(const String& name)>& checking = nullptr);
