#pragma once

#include "platform/base/export.h"
#include "platform/media/frame_rate.h"

namespace Qx {

/// What decides how fast sound that was recorded with a picture plays beside it.
struct FilmSync {
    /// Frames a second at which film usually runs through a camera.
    static constexpr double kUsualCameraSpeed = 24;

    FrameRate projectRate;
    FrameRate mediumRate; ///< of the medium that the picture is on
    bool isFilm = false;  ///< the medium is film, so that the camera's speed counts
    double cameraSpeed = kUsualCameraSpeed;

    /// By how much the sound is resampled so that it stays in step: the source frames that are shown in a
    /// second over those that were taken in one. Film of 24 frames shown at 25 gives 25/24, on 29.97 with 2:3
    /// pulldown 1000/1001, tape in a project of its own rate 1. False, leaving `factor`, for rates or a
    /// camera speed that are none, and for a factor outside 1/8 to 8.
    [[nodiscard]] QM_API bool playbackFactor(double& factor) const;
};

/// The time on a medium at which the frame lies that is seen at a time of an edit, both from the same frame:
/// frame for frame, or by the usual pulldown. The time itself where the rates are one, or one is none.
[[nodiscard]] QM_API double mediumTime(double editTime, FrameRate editRate, FrameRate mediumRate);

} // namespace Qx
