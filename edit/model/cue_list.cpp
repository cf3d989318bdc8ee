#include "edit/model/cue_list.h"

#include "edit/model/cel.h"
#include "edit/model/detail/event_search.h"

#include <algorithm>
#include <cmath>

namespace {

constexpr int kLastCueChan = kAnyCueChan - 1;

bool isOnChan(const cue_point& cue, int chan) {
    return chan < 0 || chan == kAnyCueChan || cue.channel() == chan;
}

} // namespace

cue_list::~cue_list() = default;

void cue_list::add_cue_point(const cue_point& cue) {
    m_cues.push_back(cue);
}

bool cue_list::add_cue_point(const char* text, double time, int chan, int code, const Vector<cel*>& cels,
                             bool attach) {
    if (!std::isfinite(time)) {
        return false;
    }
    m_cues.emplace_back(text, time, chan, code, cels, attach);
    return true;
}

size_t cue_list::get_num_cue_points(int flags) const {
    if (flags == 0) {
        return m_cues.size();
    }
    return static_cast<size_t>(std::count_if(m_cues.begin(), m_cues.end(),
                                             [flags](const cue_point& cue) { return cue.hasFlags(flags); }));
}

const cue_point* cue_list::get_cue_point(size_t i, int flags) const {
    if (flags == 0) {
        return i < m_cues.size() ? &m_cues[i] : nullptr;
    }
    for (const cue_point& cue : m_cues) {
        if (cue.hasFlags(flags) && i-- == 0) {
            return &cue;
        }
    }
    return nullptr;
}

cue_point* cue_list::get_cue_point(size_t i, int flags) {
    return const_cast<cue_point*>(static_cast<const cue_list*>(this)->get_cue_point(i, flags));
}

bool cue_list::delete_cue_point(size_t i) {
    if (i >= m_cues.size()) {
        return false;
    }
    m_cues.erase(m_cues.begin() + static_cast<std::ptrdiff_t>(i));
    return true;
}

size_t cue_list::delete_matching_cues(int flags, int chan) {
    return delete_cues_if(
        [&](size_t, const cue_point& cue) { return cue.hasFlags(flags) && isOnChan(cue, chan); });
}

void cue_list::shuffleChans(int firstChan, int count) {
    for (cue_point& cue : m_cues) {
        if (cue.channel() >= firstChan && cue.channel() >= 0 && cue.channel() < kAnyCueChan) {
            const int64_t moved = int64_t{cue.channel()} + count;
            cue.setChannel(static_cast<int>(std::clamp<int64_t>(moved, 0, kLastCueChan)));
        }
    }
}

void cue_list::sort() {
    std::stable_sort(m_cues.begin(), m_cues.end());
}

bool cue_list::slide(double seconds) {
    const bool fits = std::all_of(m_cues.begin(), m_cues.end(), [seconds](const cue_point& cue) {
        return std::isfinite(cue.editTime() + seconds) && std::isfinite(cue.secondTime() + seconds);
    });
    if (!fits || !std::isfinite(seconds)) {
        return false;
    }
    for (cue_point& cue : m_cues) {
        cue.slide(seconds);
    }
    return true;
}

int cue_list::update_edit_time() {
    int changed = 0;
    EventSearch search;
    for (cue_point& cue : m_cues) {
        if (cue.updateEditTime(search)) {
            changed = 1;
        }
    }
    return changed;
}

void cue_list::update_strip_time() {
    EventSearch search;
    for (cue_point& cue : m_cues) {
        cue.updateStripTime(search);
    }
}

bool cue_list::rescale(double editFactor, double stripFactor, double editOffset, double stripOffset) {
    const auto edit = [&](double time) { return time * editFactor + editOffset; };
    const auto strip = [&](double time) { return time * stripFactor + stripOffset; };
    const bool fits = std::all_of(m_cues.begin(), m_cues.end(), [&](const cue_point& cue) {
        return std::isfinite(edit(cue.editTime())) && std::isfinite(edit(cue.secondTime())) &&
               std::isfinite(strip(cue.stripTime()));
    });
    if (!fits) {
        return false;
    }
    for (cue_point& cue : m_cues) {
        cue.setEditTime(edit(cue.editTime()));
        cue.setSecondTime(edit(cue.secondTime()));
        if (cue.attached()) {
            cue.setStripTime(strip(cue.stripTime()));
            cue.m_stripFrom = strip(cue.m_stripFrom);
            cue.m_stripTo = strip(cue.m_stripTo);
        }
    }
    return true;
}

void cue_list::convert(const Vector<cel*>& cels) {
    EventSearch search;
    for (cue_point& cue : m_cues) {
        cue.convert(cels, search);
    }
}

void cue_list::rebindCel(const cel* from, cel* to) {
    EventSearch search;
    for (cue_point& cue : m_cues) {
        if (from == nullptr || cue.event().get_its_cel() != from) {
            continue;
        }
        const int hint = std::max(cue.event().index(), 0);
        const int index = to != nullptr ? search.nearest(*to, cue.m_eventId, hint) : -1;
        cue.m_event = index >= 0 ? ce_handle(to, index) : ce_handle();
    }
}

std::unique_ptr<cue_list> cue_list::extract(double from, double to, int chan) const {
    return extract(from, to, chan, nullptr);
}

std::unique_ptr<cue_list> cue_list::extract(double from, double to, int chan, cel* part) const {
    auto cut = std::make_unique<cue_list>();
    if (!(from < to)) {
        return cut;
    }
    EventSearch search;
    for (const cue_point& cue : m_cues) {
        if (!isOnChan(cue, chan) || !Qx::timeIsConsideredToBeInRegion(cue.editTime(), {from, to})) {
            continue;
        }
        cue_point moved = cue;
        if (!moved.slide(-from)) {
            continue;
        }
        if (part == nullptr || !moved.attached() || !moved.attachByTimes({part}, search)) {
            moved.detach();
        }
        cut->m_cues.push_back(std::move(moved));
    }
    return cut;
}

void cue_list::overlay(const cue_list* other, int chan) {
    if (other == nullptr || other == this) {
        return;
    }
    sort();
    const size_t own = m_cues.size();
    const auto isThere = [&](const cue_point& cue) {
        const auto end = m_cues.begin() + static_cast<std::ptrdiff_t>(own);
        auto it = std::lower_bound(m_cues.begin(), end, cue.editTime() - Qx::kTimeTolerance,
                                   [](const cue_point& mine, double time) { return mine.editTime() < time; });
        for (; it != end && it->editTime() <= cue.editTime() + Qx::kTimeTolerance; ++it) {
            if (it->text() == cue.text() && it->channel() == cue.channel() && it->code() == cue.code()) {
                return true;
            }
        }
        return false;
    };
    for (const cue_point& cue : other->m_cues) {
        cue_point added = cue;
        if (chan >= 0) {
            added.setChannel(chan);
        }
        if (!isThere(added)) {
            m_cues.push_back(std::move(added));
        }
    }
    sort();
}
