#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/media/frame_rate.h"

#include <cstdint>

namespace Qx {

/// How frames of one rate were laid onto another. Counts are frames from a frame that both have in common
/// (0 on either side) and may be negative; arithmetic is exact. A plain value.
///
///     TwoThree         24 on 30: film frames A B C D on five video frames,
///                          video   0  1  2  3  4
///                          fields  AA BB BC CD DD
///                      `phase` is the letter of the film frame at video frame 0 (SMPTE RP 197)
///     FrameForFrame    each frame is one frame: 24 on 25 runs 25/24 faster
///     OneHeld          24&1: the last of every 24 film frames is shown twice, 25 video frames a second
///     None             the same frames
class QM_API Pulldown {
public:
    enum Kind : int { None = 0, TwoThree = 1, FrameForFrame = 2, OneHeld = 3 };

    Pulldown() = default;
    /// A `phase` other than 'A' to 'D' is 'A'. It counts for `TwoThree` only.
    explicit Pulldown(Kind kind, char phase = 'A');
    /// The usual one between two rates by their labels a second: 24 to 30 (and 48 to 60) `TwoThree`, 24 to 25
    /// (48 to 50) `FrameForFrame`, `None` otherwise.
    [[nodiscard]] static Pulldown between(FrameRate film, FrameRate video);

    [[nodiscard]] Kind kind() const { return m_kind; }
    [[nodiscard]] char phase() const { return static_cast<char>('A' + m_phase); }

    /// The first video frame that shows a film frame, wholly or with one field.
    [[nodiscard]] int64_t videoFrame(int64_t filmFrame) const;
    /// The film frame of a video frame; of two that share one, that of the first field.
    [[nodiscard]] int64_t filmFrame(int64_t videoFrame) const;
    /// True if the video frame shows two film frames, a field of each.
    [[nodiscard]] bool isMixed(int64_t videoFrame) const;

    /// "none", "2:3 A", "1:1", "24&1"; and the inverse, false for another text.
    [[nodiscard]] String asString() const;
    [[nodiscard]] static bool fromString(std::string_view text, Pulldown& pulldown);

    bool operator==(const Pulldown&) const = default;

private:
    Kind m_kind = None;
    int m_phase = 0; ///< 0 to 3 for A to D
};

} // namespace Qx
