#include "platform/media/film_gauge.h"

namespace {

struct GaugeRow {
    FilmGauge gauge;
    const char* text;
    int perforations;
    int framesPerThreeFeet;
    int framesPerThreeKeyNumbers;
};

constexpr GaugeRow kGauges[] = {
    {FilmGauge::Film35mm4Perf, "35mm 4-perf", 4, 48, 48},
    {FilmGauge::Film35mm3Perf, "35mm 3-perf", 3, 64, 64},
    {FilmGauge::Film35mm2Perf, "35mm 2-perf", 2, 96, 96},
    {FilmGauge::Film35mm8Perf, "35mm 8-perf", 8, 24, 24},
    {FilmGauge::Film16mm, "16mm", 1, 120, 60},
    {FilmGauge::Film16mm16Frames, "16mm 16-frame", 1, 48, 60},
};

constexpr GaugeRow kNoGauge = {FilmGauge::None, "", 0, 48, 48};

const GaugeRow& rowOf(FilmGauge gauge) {
    for (const GaugeRow& row : kGauges) {
        if (row.gauge == gauge) {
            return row;
        }
    }
    return kNoGauge;
}

int64_t floorDivide(int64_t a, int64_t b) {
    return a / b - (a % b < 0 ? 1 : 0);
}

} // namespace

namespace Qx {

String filmGaugeText(FilmGauge gauge) {
    return rowOf(gauge).text;
}

FilmGauge filmGaugeFromText(std::string_view text) {
    for (const GaugeRow& row : kGauges) {
        if (String::equalNoCase(text, row.text)) {
            return row.gauge;
        }
    }
    return FilmGauge::None;
}

int perforationsPerFrame(FilmGauge gauge) {
    return rowOf(gauge).perforations;
}

FilmCount::FilmCount(FilmGauge gauge, Unit unit, int pattern)
    : m_framesPerThree(unit == Foot ? rowOf(gauge).framesPerThreeFeet
                                    : rowOf(gauge).framesPerThreeKeyNumbers),
      m_pattern(m_framesPerThree % 3 == 0 ? 0 : pattern) {}

int FilmCount::framesIn(int64_t count) const {
    return static_cast<int>(firstFrameOf(count + 1) - firstFrameOf(count));
}

int64_t FilmCount::firstFrameOf(int64_t count) const {
    // The longer count is the last of the three.
    const int64_t each = m_framesPerThree / 3;
    const int64_t placed = count + m_pattern;
    const int64_t turn = floorDivide(placed, 3);
    return turn * m_framesPerThree + (placed - 3 * turn) * each - m_pattern * each;
}

int64_t FilmCount::countOf(int64_t frame) const {
    const int64_t each = m_framesPerThree / 3;
    const int64_t placed = frame + m_pattern * each;
    const int64_t turn = floorDivide(placed, m_framesPerThree);
    const int64_t within = (placed - turn * m_framesPerThree) / each;
    return 3 * turn + (within < 3 ? within : 2) - m_pattern;
}

int FilmCount::placeOf(int64_t count) const {
    if (m_framesPerThree % 3 == 0) {
        return 0;
    }
    const int64_t placed = count + m_pattern;
    return static_cast<int>(placed - 3 * floorDivide(placed, 3)) + 1;
}

} // namespace Qx
