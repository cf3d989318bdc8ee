#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"

/// The extension of edit files, ".qme", or without its dot "qme".
QM_API String getEditFilenameExt(bool withDot = true);

/// The path of an item's file: the current project's folder, the cookie's text, the edit extension. Empty for
/// a cookie that is not storable and while there is no project folder.
QM_API String getFilenameForCookie(const cookie& item);

/// The folder of a project's milestones in the project's own: in it a folder an edit, named by its cookie.
inline constexpr const char* kMilestonesFolder = "Milestones";
