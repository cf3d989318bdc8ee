#include "platform/media/time_def.h"

#include "platform/base/num_range.h"
#include "platform/media/timecode.h"

String time_def::asString(double seconds) const {
    return Qx::durationText(m_rate.toFrames(seconds), m_rate, m_dropFrame);
}

double time_def::seconds(std::string_view text) const {
    int64_t frames = 0;
    const bool isTime =
        !text.empty() && m_rate.valid() && Qx::parseDuration(text, m_rate, m_dropFrame, frames).isOk();
    return isTime ? m_rate.toSeconds(frames) : Qx::kNoTime;
}
