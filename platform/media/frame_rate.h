#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <cstdint>

namespace Qx {

/// A frame rate: one of the rates that television and film use, by a code that lives in edit files. Do not
/// change the codes. A plain value.
class QM_API FrameRate {
public:
    enum Code : int {
        Unknown = 0,
        Fps24 = 1,
        Fps23_976 = 2,
        Fps25 = 3,
        Fps29_97 = 4,
        Fps30 = 5,
        Fps48 = 6,
        Fps50 = 7,
        Fps59_94 = 8,
        Fps60 = 9,
        Fps47_952 = 10
    };

    constexpr FrameRate() = default;
    /// A code that is none gives `Unknown`.
    explicit FrameRate(int code);

    [[nodiscard]] constexpr int code() const { return m_code; }
    [[nodiscard]] constexpr bool valid() const { return m_code != Unknown; }
    /// Frames a second as an exact fraction, 0/1 for `Unknown`.
    [[nodiscard]] int numerator() const;
    [[nodiscard]] int denominator() const;
    [[nodiscard]] double framesPerSecond() const;
    /// Seconds a frame; 0 for `Unknown`.
    [[nodiscard]] double frameDuration() const;
    /// The labels that a second of timecode counts: 24 for 23.976, 30 for 29.97.
    [[nodiscard]] int nominal() const;
    /// True for 29.97 and 59.94, the only rates that have drop-frame timecode.
    [[nodiscard]] bool hasDropFrame() const;

    /// Seconds to frames, rounded to nearest (halves away from zero), and back. Frame counts beyond 2^53 are
    /// clamped.
    [[nodiscard]] int64_t toFrames(double seconds) const;
    [[nodiscard]] double toSeconds(int64_t frames) const;

    /// "25", "29.97", "23.976": the text that users write. Empty for `Unknown`.
    [[nodiscard]] String asString() const;
    /// Reads a rate as users write it ("25", "25.00", "29.97", "30000/1001"), or a number within 0.01 of a
    /// known rate. `Unknown` for anything else.
    [[nodiscard]] static FrameRate fromString(std::string_view text);

    auto operator<=>(const FrameRate&) const = default;

private:
    int m_code = Unknown;
};

/// The current project's frame rate.
QM_API FrameRate projectFrameRate();

/// `seconds` rounded to a whole number of the current project's frames.
QM_API double frameRound(double seconds);

} // namespace Qx
