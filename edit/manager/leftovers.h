#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <functional>
#include <vector>

/// What commands and programs that were killed leave in a project's folder: temporary files, the copy that a
/// recovery makes, and shots of an import that did not come to its end. No edit needs any of it.
struct Leftover {
    enum Kind { Temporary, RecoveryCopy, ImportedShot, ImportNote };
    Kind kind = Temporary;
    String path;
};

/// Adds what is left over in a project's folder and below it. Changes nothing. An import that is just being
/// finished by another process is told of too. A failure says what the system could not tell; what it could
/// is added all the same.
QM_API Qx::Status findLeftovers(const String& folder, std::vector<Leftover>& leftovers);

/// Removes what lies in the folder itself and belongs to nobody for certain; what cannot be looked at or
/// removed stays. Called under the writers' lock (`EditManagerLock`).
QM_API void removeLeftovers(const String& folder);

/// Removes all of it, but for shots that an edit may play: `isPlayed` is asked for each where edits were
/// written since it was imported. What cannot be looked at or removed stays. Called under the writers' lock.
QM_API void removeAllLeftovers(const String& folder, const std::function<bool(const cookie& shot)>& isPlayed);
