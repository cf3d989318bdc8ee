#pragma once

#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "interchange/loss_report.h"

#include <map>
#include <vector>

namespace interchange::detail {

/// The cues of an edit as the LOC notes of a list.
class EdlMarkers {
public:
    /// Record times are counted from `start`, frames from midnight.
    EdlMarkers(const Edit& edit, Qx::FrameRate rate, bool drop, int64_t start, LossReport& report);

    /// True if a note line of an imported list is to be written again: it is no LOC, or it is one of a cue
    /// that no other line stands for, or it never made a cue.
    bool keeps(std::string_view note);
    /// The notes of the cues before `until` that no line stands for, joined by line feeds; they count as
    /// written.
    String takeBefore(int64_t until);

private:
    struct Marker {
        int64_t position = 0; ///< frames from the edit's start
        int code = 0;
        String text;
        bool written = false;
    };
    void add(const cue_point& cue);
    [[nodiscard]] String noteOf(const Marker& marker) const;

    Qx::FrameRate m_rate;
    bool m_drop;
    int64_t m_start;
    LossReport& m_report;
    std::vector<Marker> m_markers; ///< in order of time
    size_t m_next = 0;
};

} // namespace interchange::detail
