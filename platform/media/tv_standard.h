#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/media/frame_rate.h"

namespace Qx::Ed2Support {

/// A television standard as legacy edits name it. A plain value.
///
/// The frame rate is a `FrameRate` code. The picture format is 1 for 625 lines and 2 for 525. The medium is 1
/// for 625-line video, 3 for 525-line video and 24 for film at 24 frames a second. All are 0 for a standard
/// that is not known.
struct TVStd {
    int frameRateCode = 0;
    int formatCode = 0;
    int mediumCode = 0;
    bool operator==(const TVStd&) const = default;
    [[nodiscard]] bool known() const { return frameRateCode != 0; }
};

/// The standard for a text ("pal", "ntsc", "ntsc_drop_frame", "pal_24", "ntsc_24", "ntsc_drop_frame_24"); one
/// that is not known for any other. Blanks around the text and the case of its letters do not count. The two
/// NTSC texts are 29.97 frames a second, the three of 24 frames exactly 24.
QM_API TVStd tvStdFromText(std::string_view text);
/// The standard that a legacy edit is of: the one that `text` names, else what follows from the code of its
/// frame rate. With a rate that no text stands for only the rate is told; one that is not known when neither
/// tells anything.
QM_API TVStd getTvStandard(std::string_view text, int frameRateCode);
/// The frames a second of a medium as a standard names it: 25 for 1, 29.97 for 3, 24 for 24, and 23.976 for 23,
/// which is film at 24 whose sound was taken at the slower speed; `Unknown` for any other.
QM_API FrameRate mediumFrameRate(int mediumCode);
/// True for the media 23 and 24.
QM_API bool isFilmMedium(int mediumCode);
/// The text of the current project's standard; empty for a rate that has none.
QM_API String tvStdTextForProject();

} // namespace Qx::Ed2Support
