#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/status.h"

#include <span>
#include <vector>

/// Hands out the cookies of new edits: kind 'E', first word counted from 1, second word 0, so never a magic
/// one. The count is "NEXT_EDIT" in the project's settings file. Allocation is safe between threads, objects
/// and processes: it happens under the lock of the project's folder, and the count is durable before a cookie
/// is handed out. So a number that was handed out is never handed out again, even if nothing was written for
/// it.
///
/// Whatever names an edit takes its number: a file of it, a backup, a milestone, what was set aside of it, in
/// the project's folder; and what a caller says to be taken, such as the sources that an edit from elsewhere
/// plays ("TAKEN_EDITS" in the settings, until the count has passed them). Where the count is lost, it goes
/// on behind the last number that is named, as edits may still play what is not there any more.
class QM_API CookieAllocator {
public:
    /// For the project in a folder. Nothing is touched before `allocate`; the folder must exist by then.
    /// Without a settings file the count starts at 1 and the file is made.
    explicit CookieAllocator(String projectFolder);

    /// Appends `count` fresh cookies to `out`, in ascending order, for one lock, one listing of the folder
    /// and one write whatever the count. A number that is taken is passed over; "new_edit() Skipped %d
    /// pre-existing cookies\n" is logged if there was any. `taken` are cookies that must not be handed out,
    /// neither here nor later; those that are no edit's of this count are ignored. Fails, leaving `out` and
    /// the settings as they were, when the folder cannot be locked, listed, read or written, when the
    /// settings file is damaged, and when the numbers are used up (1 679 615 in a project).
    Qx::Status allocate(unsigned count, std::vector<cookie>& out, std::span<const cookie> taken = {});

    /// One fresh cookie; invalid on failure, which is logged.
    [[nodiscard]] cookie allocateOne(std::span<const cookie> taken = {});

private:
    String m_folder;
};
