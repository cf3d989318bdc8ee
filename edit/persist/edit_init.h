#pragma once

#include "platform/base/export.h"
#include "platform/base/status.h"

/// Starts the edit library: writes "Last.Version.Used.txt" into the projects base directory (the root folder
/// of the current project), a header store that names this version, the revision of the edit files that it
/// writes and the history of those revisions. The file is written anew on every start. Without a base
/// directory nothing is written. A failure names the file and the reason, and the library is usable all the
/// same.
QM_API Qx::Status edit_init();
