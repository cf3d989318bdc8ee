#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <vector>

/// What a link in a folder's place stands for: a project's own folder may be one, those below it may not.
enum class FolderLink { NotFollowed, Followed };

/// The names in a folder, in order of their bytes; none of one that is not there, or is no folder. A failure,
/// with no names, when the system cannot tell.
QM_API Qx::Status namesOfFolder(const String& folder, FolderLink link, std::vector<String>& names);
