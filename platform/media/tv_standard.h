#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/media/frame_rate.h"

namespace Qx::Ed2Support {

/// A television standard as legacy edits name it: codes of frame rate, picture format and medium. A plain
/// value.
struct TVStd {
    int frameRateCode = 0;
    int formatCode = 0;
    int mediumCode = 0;
    bool operator==(const TVStd&) const = default;
    [[nodiscard]] bool known() const { return frameRateCode != 0; }
};

/// The standard for a text ("pal", "ntsc", "ntsc_drop_frame", "pal_24", "ntsc_24", "ntsc_drop_frame_24"); one
/// that is not known for any other.
QM_API TVStd tvStdFromText(std::string_view text);
/// The text of the current project's standard; empty for a rate that has none.
QM_API String tvStdTextForProject();

} // namespace Qx::Ed2Support
