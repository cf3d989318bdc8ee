#include "tools/qmedit/time_ruler.h"

#include "platform/media/timecode.h"

#include <algorithm>

namespace {

/// A mark, its label of eleven columns and two blanks.
constexpr int kColumnsOfMark = 14;

/// Frames from midnight of the label that is `count` labels after 00:00:00:00; beyond 24 hours the days are
/// added. Drop frame leaves labels out, so that a second is not always the same number of frames.
int64_t framesOfLabel(int64_t count, Qx::FrameRate rate, bool dropFrame) {
    const int64_t nominal = rate.nominal();
    const int64_t day = 24 * 3600 * nominal;
    const int64_t days = count / day;
    count %= day;
    Qx::TimecodeFields fields;
    fields.frames = static_cast<int>(count % nominal);
    fields.seconds = static_cast<int>(count / nominal % 60);
    fields.minutes = static_cast<int>(count / nominal / 60 % 60);
    fields.hours = static_cast<int>(count / nominal / 3600);
    return days * Qx::framesPerDay(rate, dropFrame) + Qx::timecodeFrames(fields, rate, dropFrame);
}

/// Labels between two marks: the least of the customary steps that leaves a label its room.
int64_t stepFor(int64_t least, int64_t nominal) {
    for (const int64_t frames : {1, 2, 5, 10}) {
        if (frames >= least && frames < nominal) {
            return frames;
        }
    }
    for (const int64_t seconds :
         {1, 2, 5, 10, 15, 30, 60, 120, 300, 600, 900, 1800, 3600, 7200, 21600, 43200}) {
        if (seconds * nominal >= least) {
            return seconds * nominal;
        }
    }
    const int64_t day = 24 * 3600 * nominal;
    return (least / day + 1) * day;
}

} // namespace

std::vector<RulerMark> rulerMarks(const EditReport& report, int columns) {
    std::vector<RulerMark> marks;
    const int64_t length = report.frames(report.duration());
    if (length <= 0 || columns < 2 || !report.rate.valid()) {
        return marks;
    }
    const int64_t step = stepFor(length * kColumnsOfMark / (columns - 1) + 1, report.rate.nominal());
    const int64_t origin = report.frames(report.origin);
    const int64_t first = origin + report.frames(report.start);
    for (int64_t label = std::max<int64_t>(first, 0) / step * step;; label += step) {
        const int64_t frame = framesOfLabel(label, report.rate, report.dropFrame);
        // The last mark keeps room for its label.
        if (frame > first + length - length * (kColumnsOfMark - 2) / (columns - 1)) {
            break;
        }
        if (frame >= first) {
            marks.push_back({report.rate.toSeconds(frame - origin),
                             Qx::timecodeText(frame, report.rate, report.dropFrame)});
        }
    }
    if (marks.empty()) {
        marks.push_back({report.start, report.recordTimecode(report.start)});
    }
    return marks;
}
