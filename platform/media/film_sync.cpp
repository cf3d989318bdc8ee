#include "platform/media/film_sync.h"

#include "platform/media/pulldown.h"

#include <cmath>

namespace Qx {

namespace {

constexpr double kGreatestFactor = 8;

} // namespace

bool FilmSync::playbackFactor(double& factor) const {
    if (!projectRate.valid() || !mediumRate.valid() || !std::isfinite(cameraSpeed) || cameraSpeed <= 0) {
        return false;
    }
    // Of five frames of a 2:3 pulldown four are the medium's.
    const bool isPulledDown = Pulldown::between(mediumRate, projectRate).kind() == Pulldown::TwoThree;
    const double shown = projectRate.framesPerSecond() * (isPulledDown ? 0.8 : 1.0);
    const double taken = mediumRate.framesPerSecond() * (isFilm ? cameraSpeed / kUsualCameraSpeed : 1.0);
    const double found = shown / taken;
    if (!(found >= 1 / kGreatestFactor && found <= kGreatestFactor)) {
        return false;
    }
    factor = found;
    return true;
}

double mediumTime(double editTime, FrameRate editRate, FrameRate mediumRate) {
    if (!editRate.valid() || !mediumRate.valid() || editRate == mediumRate) {
        return editTime;
    }
    const int64_t frames = editRate.toFrames(editTime);
    return mediumRate.toSeconds(Pulldown::between(mediumRate, editRate).filmFrame(frames));
}

} // namespace Qx
