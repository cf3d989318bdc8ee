#pragma once

#include "interchange/export.h"
#include "interchange/import.h"

namespace interchange {

/// Writes an edit as legacy text (".ED2", docs/ed2-format.md), atomically. What the text cannot hold is a
/// loss each: video tracks but the first, effects channels, levels, groups, cues behind cues that are not
/// kept, and a frame rate other than the project's. With `strict` a loss is a failure and nothing is written.
/// A project whose frame rate the text has no name for is refused, as the text could not be read again.
QM_INTERCHANGE_API Qx::Status exportLegacyText(Edit& edit, bool strict, const String& path,
                                               LossReport& report);

/// Reads a legacy text into an edit in memory that is not part of a project (`saveImport` makes it one; it
/// has no shots). Its events name their sources by the cookies that they had in their own project. On
/// failure, which names file and line, `result` is as it was.
QM_INTERCHANGE_API Qx::Status importLegacyText(const String& path, Import& result);

} // namespace interchange
