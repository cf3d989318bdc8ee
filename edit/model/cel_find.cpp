#include "edit/model/cel.h"

#include "edit/model/detail/cel_events.h"

using namespace cel_detail;

ce_handle cel::get_start_ceh() const {
    return {this, m_events.empty() ? -1 : 0};
}

ce_handle cel::get_end_ceh() const {
    return {this, numEvents() - 1};
}

ce_handle cel::find_ceh(double time, int kinds) const {
    const bool ins = (kinds & CE_IN_POINT) != 0;
    const bool outs = (kinds & CE_OUT_POINT) != 0;
    if (std::isnan(time) || (!ins && !outs)) {
        return {this, -1};
    }
    if (ins) {
        const int pair = static_cast<int>(m_events.numStartingUpTo(time, kTolerance)) - 1;
        const int index = 2 * pair;
        if (!outs || pair < 0) {
            return {this, pair < 0 ? -1 : index};
        }
        const bool ended =
            index + 1 < numEvents() && isNotPast(m_events[static_cast<size_t>(index) + 1].editTime, time);
        return {this, ended ? index + 1 : index};
    }
    const size_t pair = m_events.numEndingBefore(time, kTolerance);
    return {this, 2 * pair + 1 < m_events.size() ? static_cast<int>(2 * pair) + 1 : -1};
}

ce_handle cel::get_next_ceh(const ce_handle& from, int kinds) const {
    ce_handle next(this, from.index());
    next.increment(kinds);
    return next;
}

int cel::check_ceh(const ce_handle& handle) const {
    return handle.get_its_cel() == this && handle.valid() != 0 ? 1 : 0;
}

ce_handle cel::findId(const IdStamp& id, int hint) const {
    const channel_event* likely = getChanEventPtr(hint);
    if (likely != nullptr && likely->id == id) {
        return {this, hint};
    }
    for (const ce_info kind : {CE_IN_POINT, CE_OUT_POINT}) {
        for (size_t i = kind == CE_IN_POINT ? 0 : 1; i < m_events.size(); i += 2) {
            if (m_events[i].id == id) {
                return {this, static_cast<int>(i)};
            }
        }
    }
    return {this, -1};
}

double cel::get_start_time() const {
    return m_events.empty() ? 0 : m_events.front().editTime;
}

double cel::get_end_time() const {
    return m_events.empty() ? 0 : m_events.back().editTime;
}

double cel::get_edit_time(const ce_handle& handle) const {
    const channel_event* event = getChanEventPtr(handle.index());
    return event != nullptr ? event->editTime : 0;
}

bool cel::set_edit_time(const ce_handle& handle, double time, bool force) {
    if (check_ceh(handle) == 0 || !isUsableTime(time)) {
        return false;
    }
    const size_t at = static_cast<size_t>(handle.index());
    const double least = timeBefore(at);
    const double most = timeFrom(at + 1);
    if (!force && (!isNotPast(least, time) || !isNotPast(time, most))) {
        return false;
    }
    m_events.setTime(at, TimeLayer(least, most).lay(std::clamp(time, least, most)));
    changedNow();
    return true;
}

double cel::get_strip_time(const ce_handle& handle, double editTime) const {
    return ce_handle(this, handle.index()).get_strip_time(editTime);
}

namespace {

/// The in point of the pair that plays at a time; null where none does.
const channel_event* playingAt(const EventArray& events, double time) {
    const size_t pairs = events.numStartingUpTo(time, kTolerance);
    if (pairs == 0 || 2 * pairs > events.size()) {
        return nullptr;
    }
    const channel_event* in = &events[2 * pairs - 2];
    return Qx::timeIsConsideredToBeInRegion(time, {in[0].editTime, in[1].editTime}) ? in : nullptr;
}

} // namespace

double cel::get_strip_time(double editTime) const {
    const channel_event* in = playingAt(m_events, editTime);
    return in != nullptr ? stripAt(*in, editTime) : Qx::kNoTime;
}

void cel::set_strip_time(const ce_handle& handle, double time) {
    if (check_ceh(handle) != 0 && std::abs(time) <= kGreatestStripTime) {
        m_events.change(static_cast<size_t>(handle.index())).stripTime = time;
        changedNow();
    }
}

cookie cel::get_strip_cookie(const ce_handle& handle) const {
    const channel_event* event = getChanEventPtr(handle.index());
    return event != nullptr ? event->strip : invalid_cookie;
}

cookie cel::get_strip_cookie(double editTime) const {
    const channel_event* in = playingAt(m_events, editTime);
    return in != nullptr ? in->strip : invalid_cookie;
}

cel::Range cel::getExtents(Editable::ExtentType type, bool fromZero) const {
    size_t first = 0;
    size_t last = m_events.size() / 2;
    if (type == Editable::MaterialOnly) {
        while (first < last && m_events[2 * first].strip.isBlack()) {
            ++first;
        }
        while (first < last && m_events[2 * last - 2].strip.isBlack()) {
            --last;
        }
    }
    if (first == last) {
        return Editable::invalidRange();
    }
    const double start = m_events[2 * first].editTime;
    return {fromZero ? std::min(start, 0.0) : start, m_events[2 * last - 1].editTime};
}

bool cel::isEmpty(const Range& range) const {
    const Region region(m_events, range.start(), range.end());
    const size_t end = region.from.pair + region.numPairs();
    for (size_t pair = region.from.pair; pair < end; ++pair) {
        if (!m_events[2 * pair].strip.isBlack()) {
            return false;
        }
    }
    return true;
}

bool cel::isEmpty() const {
    return getExtents(Editable::MaterialOnly) == Editable::invalidRange();
}
