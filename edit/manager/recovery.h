#pragma once

#include "edit/manager/revisions.h"
#include "platform/base/status.h"

/// The end of the name that a recovery copies to, beside the edit.
inline constexpr const char* kRecoveryCopy = ".RECOVERY";

/// Puts a copy of one sound state of an edit in the edit's place, durably. What is there becomes an undo
/// backup, or a file set aside (".CORRUPT") when it is damaged; `kept` is the name that it has afterwards,
/// empty when there was nothing. `list` is what `revisionsOf` answered for the item, `taken` one of it.
///
/// Takes the writers' lock of the project and drops an unchanged edit that nobody holds from the cache.
/// Refused, with nothing changed, for an edit that is open or read-only, for a state that is not sound, when
/// the edit's own file cannot be read here (it may be sound), and when either file is another than it was
/// when it was checked. After any other failure the edit is as it was, or lies whole as `kept`.
QM_API Qx::Status recoverEdit(const cookie& item, const RevisionList& list, const Revision& taken,
                              String& kept);
