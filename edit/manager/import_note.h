#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <vector>

/// The note that lies in a project's folder while the edits of an import take their names: which they are,
/// the sequence last. A process that dies on the way leaves it, with shots that no sequence plays. Written,
/// removed and acted on under the writers' lock of the project, so that a note that somebody finds there is
/// one of an import that has ended.
struct UnfinishedImport {
    String note;               ///< its path
    std::vector<String> files; ///< the paths of the shots that are there and were not changed since
    /// Some edit of the project was written since, so that it may play one of the shots.
    bool mayBePlayed = false;
};

/// Writes the note of an import, durably. `path` becomes its path.
QM_API Qx::Status writeImportNote(const String& folder, const std::vector<cookie>& edits, String& path);

/// Adds the imports of a project that did not come to their end. One whose sequence is there, in any state,
/// has no files. A failure says what the system could not tell; an import that it concerns is not added.
QM_API Qx::Status unfinishedImports(const String& folder, std::vector<UnfinishedImport>& imports);

/// Removes the files of an unfinished import, then its note. Returns how many files went; the note stays
/// while any could not be removed.
QM_API size_t takeBackImport(const UnfinishedImport& import);
