#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/media/frame_rate.h"

#include <string_view>

/// The text form of a time in a project's records: a timecode of whole frames at one rate, as
/// `Qx::durationText` writes it. A plain value.
class QM_API time_def {
public:
    time_def(Qx::FrameRate rate, bool dropFrame) : m_rate(rate), m_dropFrame(dropFrame) {}

    /// The timecode of a time in seconds, to the nearest frame.
    [[nodiscard]] String asString(double seconds) const;
    /// The time in seconds that a timecode names; `Qx::kNoTime` for an empty text and one that does not read,
    /// and without a rate.
    [[nodiscard]] double seconds(std::string_view text) const;

private:
    Qx::FrameRate m_rate;
    bool m_dropFrame;
};
