#include "edit/model/edit.h"
#include "platform/base/num_range.h"

#include <cmath>

double Edit::get_current_time(int /*chan*/) const {
    return m_currentTime;
}

void Edit::set_current_time(int chan, double time) {
    if (std::isfinite(time) && time != m_currentTime) {
        set_current_time_raw(chan, time);
        announcePosition(EditModification(kCurrentTimeChanged).setSpan(time, 0));
    }
}

void Edit::set_current_time_raw(int /*chan*/, double time) {
    if (std::isfinite(time)) {
        m_currentTime = time;
    }
}

double Edit::get_mark_time(int /*chan*/) const {
    return m_markTime;
}

void Edit::set_mark_time(int chan, double time) {
    if (std::isfinite(time) && time != m_markTime) {
        set_mark_time_raw(chan, time);
        announcePosition(EditModification(kMarkChanged).setSpan(time, 0));
    }
}

void Edit::set_mark_time_raw(int /*chan*/, double time) {
    if (std::isfinite(time)) {
        m_markTime = time;
    }
}

bool Edit::mark_is_valid(int /*chan*/) const {
    return m_markTime != Qx::kNoTime;
}

void Edit::mark_invalidate(int chan) {
    set_mark_time(chan, Qx::kNoTime);
}
