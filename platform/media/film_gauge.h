#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <cstdint>

/// A film stock and how many perforations a frame of it takes: what decides how many frames go into a foot.
/// The codes live in edit files: do not change them.
enum class FilmGauge : int32_t {
    None = 0,
    Film35mm4Perf = 1,
    Film35mm3Perf = 2,
    Film35mm2Perf = 3,
    Film35mm8Perf = 4, ///< VistaVision
    Film16mm = 5,
    Film16mm16Frames = 6 ///< 16 mm sound numbered every 16 frames, as 35 mm is
};

namespace Qx {

/// "35mm 4-perf", "35mm 3-perf", "35mm 2-perf", "35mm 8-perf", "16mm", "16mm 16-frame"; empty for `None`.
QM_API String filmGaugeText(FilmGauge gauge);
/// The inverse, without regard to case; `None` for any other text.
QM_API FilmGauge filmGaugeFromText(std::string_view text);

/// Perforations a frame; 0 for `None`.
QM_API int perforationsPerFrame(FilmGauge gauge);

/// How frames are counted along a film in units of one count: a foot, or for a key number on 16 mm half a
/// foot. Only 35 mm of 3 perforations has counts of unequal length: 21, 21 and 22 frames in turn, 64 in three
/// (SMPTE 254 numbers its feet of 64 perforations).
class QM_API FilmCount {
public:
    enum Unit { Foot, KeyNumber };

    /// `pattern` is the place, 0 to 2, of count 0 in the turn of three.
    FilmCount(FilmGauge gauge, Unit unit, int pattern = 0);

    /// Frames in a count.
    [[nodiscard]] int framesIn(int64_t count) const;
    /// Frames from the start of count 0 to that of another, which may be negative.
    [[nodiscard]] int64_t firstFrameOf(int64_t count) const;
    /// The count that a frame lies in.
    [[nodiscard]] int64_t countOf(int64_t frame) const;
    /// The place of a count in the turn of three, 1 to 3; 0 where all counts are alike.
    [[nodiscard]] int placeOf(int64_t count) const;

private:
    int m_framesPerThree; ///< three counts
    int m_pattern;
};

} // namespace Qx
