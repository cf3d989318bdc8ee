#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"

namespace Qx {

/// What the application says of the project that is open. A plain value.
struct QM_API CurrentProject {
    cookie project = cookie("P0001000");
    String rootFolder; ///< the projects' base folder; each project has a folder of its cookie's text in it
    String name;
    int frameRateCode = 3;     ///< a `Qx::FrameRate` code; 3 is 25 frames a second
    bool dropFrame = false;    ///< timecode display, for the rates that have drop frame
    int defaultEditMedium = 1; ///< the medium code that a new edit gets
    int outputImageRate = 0;   ///< code of the output image rate
    String user;               ///< the current user's name, UTF-8

    /// The folder that holds the project's edit files. Empty without a root folder, or when the project is
    /// not storable.
    [[nodiscard]] QM_API String folder() const;
};

/// A copy of what is set. Safe on any thread. Before the first call of `setCurrentProject` the root folder is
/// empty and the user is that of the process.
QM_API CurrentProject currentProject();
QM_API void setCurrentProject(const CurrentProject& project);
/// Rises whenever another project or root folder is set: whoever keeps what belongs to a project asks for it
/// cheaply.
QM_API unsigned currentProjectGeneration();

} // namespace Qx
