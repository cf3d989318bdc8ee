#include "edit/model/channel_event.h"

#include "platform/media/frame_rate.h"

#include <cmath>
#include <limits>

IdStamp channel_event::newId() {
    return IdStamp::fresh(IdStampMagic::Material);
}

unsigned channel_event::timeToQFrames(double seconds) {
    constexpr unsigned most = std::numeric_limits<uint16_t>::max();
    const double quarters = seconds * Qx::projectFrameRate().framesPerSecond() * 4;
    if (!(quarters > 0)) {
        return 0;
    }
    return quarters >= double{most} ? most : static_cast<unsigned>(std::lround(quarters));
}
