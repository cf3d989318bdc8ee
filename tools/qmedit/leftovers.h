#pragma once

#include "platform/base/cookie.h"
#include "platform/base/qx_string.h"

#include <functional>
#include <vector>

/// What commands and programs that were killed leave in a project's folder: temporary files, the copy that a
/// recovery makes, and shots of an import that did not come to its end. No edit needs any of it.
struct Leftover {
    String path;
    String what; ///< for a person
};

/// What is left over in a project's folder and below it. Changes nothing. An import that is just being
/// finished by another process is told of too.
std::vector<Leftover> findLeftovers(const String& folder);

/// Removes what lies in the folder itself and belongs to nobody for certain. Called under the writers' lock.
void removeLeftovers(const String& folder);

/// Removes all of it, but for shots that an edit may play: `isPlayed` is asked for each where edits were
/// written since it was imported. Called under the writers' lock. Returns the paths that went.
std::vector<String> removeAllLeftovers(const String& folder,
                                       const std::function<bool(const cookie& shot)>& isPlayed);
