#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/status.h"

#include <vector>

/// Hands out the cookies of new edits: kind 'E', first word counted from 1, second word 0, so never a magic
/// one. The count is "NEXT_EDIT" in the project's settings file. Allocation is safe between threads, objects
/// and processes: it happens under the lock of the project's folder, and the count is durable before a cookie
/// is handed out. So a number that was handed out is never handed out again, even if nothing was written for
/// it.
class QM_API CookieAllocator {
public:
    /// For the project in a folder. Nothing is touched before `allocate`; the folder must exist by then.
    /// Without a settings file the count starts at 1 and the file is made.
    explicit CookieAllocator(String projectFolder);

    /// Appends `count` fresh cookies to `out`, in ascending order, for one lock and one write whatever the
    /// count. A number whose edit file exists is passed over; "new_edit() Skipped %d pre-existing cookies\n"
    /// is logged if there was any. Fails, leaving `out` and the count as they were, when the folder cannot be
    /// locked, read or written, when the settings file is damaged, and when the numbers are used up (1 679
    /// 615 in a project).
    Qx::Status allocate(unsigned count, std::vector<cookie>& out);

    /// One fresh cookie; invalid on failure, which is logged.
    [[nodiscard]] cookie allocateOne();

private:
    String m_folder;
};
