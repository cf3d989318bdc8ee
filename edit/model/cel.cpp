#include "edit/model/cel.h"

#include "edit/model/detail/cel_events.h"

using namespace cel_detail;

cel::cel() : StreamableLayer(kForm) {}
cel::~cel() = default;
cel::cel(const cel& other) = default;

std::unique_ptr<cel> cel::copy() const {
    return std::make_unique<cel>(*this);
}

bool cel::close() {
    if (m_events.size() % 2 != 0) {
        channel_event out = m_events.back();
        out.kind = CE_OUT_POINT;
        out.id = channel_event::newId();
        out.rampQFrames = 0;
        out.rampCurve = 0;
        m_events.append(out);
        changedNow();
    }
    if (!isGood(m_events)) {
        m_events.clear();
        changedNow();
        return false;
    }
    return true;
}

void cel::reserve(int pairs) {
    if (pairs > 0) {
        m_events.reserve(2 * static_cast<size_t>(pairs));
    }
}

bool cel::add_event(const channel_event& event) {
    const bool inExpected = m_events.size() % 2 == 0;
    channel_event added = event;
    if (!added.id.valid()) {
        added.id = channel_event::newId();
    }
    if (!isGoodEvent(added) || (added.kind == CE_IN_POINT) != inExpected) {
        return false;
    }
    if (!m_events.empty()) {
        const double last = m_events.back().editTime;
        if (!isNotPast(last, added.editTime)) {
            return false;
        }
        added.editTime = TimeLayer(last).lay(added.editTime);
    }
    m_events.append(added);
    changedNow();
    return true;
}

ce_handle cel::appendEventPair(const cookie& strip, double stripTime, double editTime, double length) {
    return insertEventPair(numPairs(), strip, stripTime, editTime, length);
}

ce_handle cel::insertEventPair(int pair, const cookie& strip, double stripTime, double editTime,
                               double length) {
    if (pair < 0 || pair > numPairs() || m_events.size() % 2 != 0 || !(length >= 0)) {
        return {};
    }
    const size_t at = 2 * static_cast<size_t>(pair);
    const double before = timeBefore(at);
    const double after = timeFrom(at);
    const double end = editTime + length;
    if (!isNotPast(before, editTime) || !isNotPast(end, after)) {
        return {};
    }
    TimeLayer layer(before, after);
    const double from = layer.lay(editTime);
    const FreshPair added(strip, stripTime, from, layer.lay(end));
    if (!isGoodEvent(added.in) || !isGoodEvent(added.out)) {
        return {};
    }
    if (at == m_events.size()) {
        m_events.append(added.in);
        m_events.append(added.out);
    } else {
        const channel_event both[] = {added.in, added.out};
        m_events.splice(at, at, both);
    }
    changedNow();
    return {this, static_cast<int>(at)};
}

channel_event cel::get_event(int index) const {
    const channel_event* event = getChanEventPtr(index);
    return event != nullptr ? *event : channel_event();
}

bool cel::setEvent(int index, const channel_event& event) {
    if (getChanEventPtr(index) == nullptr || !isGoodEvent(event)) {
        return false;
    }
    const size_t at = static_cast<size_t>(index);
    const double before = timeBefore(at);
    const double after = timeFrom(at + 1);
    if (event.kind != (at % 2 == 0 ? CE_IN_POINT : CE_OUT_POINT) || event.editTime < before ||
        event.editTime > after) {
        return false;
    }
    m_events.change(at) = event;
    m_events.setTime(at, TimeLayer(before, after).lay(event.editTime));
    changedNow();
    return true;
}

bool cel::replacePairs(int pair, int count, std::span<const channel_event> events) {
    if (pair < 0 || count < 0 || pair > numPairs() || count > numPairs() - pair || m_events.size() % 2 != 0) {
        return false;
    }
    Events block(events.begin(), events.end());
    const size_t first = 2 * static_cast<size_t>(pair);
    const size_t last = first + 2 * static_cast<size_t>(count);
    if (!checkAndSettle(block)) {
        return false;
    }
    if (!block.empty()) {
        TimeLayer layer(timeBefore(first), timeFrom(last));
        const bool fits = !(block.front().editTime < timeBefore(first) - kTolerance) &&
                          !(block.back().editTime > timeFrom(last) + kTolerance);
        for (channel_event& event : block) {
            event.editTime = layer.lay(event.editTime);
        }
        if (!fits) {
            return false;
        }
    }
    m_events.splice(first, last, block);
    changedNow();
    return true;
}

void cel::set_resolution(double quantum) {
    if (std::isfinite(quantum) && quantum >= 0 && quantum != m_resolution) {
        m_resolution = quantum;
        m_changed = true;
    }
}

void cel::editChannelInfo(String name, const IdStamp& id, String subType, String materialInfo) {
    if (name == m_name && id == m_id && subType == m_subType && materialInfo == m_materialInfo) {
        return;
    }
    m_name = std::move(name);
    m_id = id;
    m_subType = std::move(subType);
    m_materialInfo = std::move(materialInfo);
    m_changed = true;
}

String cel::hierarchyName(bool withId, bool withEvents) const {
    String name = m_name;
    if (withId) {
        name += " (" + m_id.asString() + ")";
    }
    if (withEvents) {
        name += String::format(" [%d events]", numEvents());
    }
    return name;
}

int cel::is_good_cel() const {
    return isGood(m_events) ? 1 : 0;
}

namespace cel_detail {

namespace {

bool isInPlace(const channel_event& event, size_t index) {
    return isGoodEvent(event) && event.kind == (index % 2 == 0 ? CE_IN_POINT : CE_OUT_POINT);
}

} // namespace

bool isGood(std::span<const channel_event> events) {
    double last = -Qx::kNoTime;
    for (size_t i = 0; i < events.size(); ++i) {
        const double time = events[i].editTime;
        if (!isInPlace(events[i], i) || (isNotPast(time, last) && time != last)) {
            return false;
        }
        last = time;
    }
    return events.size() % 2 == 0;
}

bool checkAndSettle(Events& events) {
    double last = -Qx::kNoTime;
    TimeLayer layer;
    for (size_t i = 0; i < events.size(); ++i) {
        if (!isInPlace(events[i], i) || !isNotPast(last, events[i].editTime)) {
            return false;
        }
        last = events[i].editTime = layer.lay(events[i].editTime);
    }
    return events.size() % 2 == 0;
}

} // namespace cel_detail
