#include "edit/model/ce_handle.h"

#include "edit/model/detail/cel_events.h"

using namespace cel_detail;

const channel_event* ce_handle::event() const {
    return get_chan_evnt_ptr();
}

/// The event of a valid handle, for a change of anything but its edit time.
channel_event& ce_handle::changing() const {
    return m_cel->m_events.change(static_cast<size_t>(m_index));
}

const channel_event* ce_handle::get_chan_evnt_ptr() const {
    return m_cel != nullptr ? m_cel->getChanEventPtr(m_index) : nullptr;
}

bool ce_handle::is_in_point() const {
    return get_ce_info() == CE_IN_POINT;
}

bool ce_handle::is_out_point() const {
    return get_ce_info() == CE_OUT_POINT;
}

ce_info ce_handle::get_ce_info() const {
    const channel_event* content = event();
    return content != nullptr ? content->kind : ce_info{};
}

ce_handle ce_handle::get_next_ceh(int kinds) const {
    ce_handle next = *this;
    next.increment(kinds);
    return next;
}

ce_handle ce_handle::get_prev_ceh(int kinds) const {
    ce_handle before = *this;
    before.decrement(kinds);
    return before;
}

bool ce_handle::next() {
    increment(CE_ANY);
    return valid() != 0;
}

ce_handle ce_handle::get_start_ceh() const {
    return m_cel != nullptr ? m_cel->get_start_ceh() : ce_handle();
}

ce_handle ce_handle::get_end_ceh() const {
    return m_cel != nullptr ? m_cel->get_end_ceh() : ce_handle();
}

bool ce_handle::find_ceh(ce_handle& found, double time, int kinds) const {
    found = m_cel != nullptr ? m_cel->find_ceh(time, kinds) : ce_handle();
    return found.valid() != 0;
}

bool ce_handle::set_edit_time(double time) {
    return m_cel != nullptr && m_cel->set_edit_time(*this, time, false);
}

double ce_handle::get_strip_time(double editTime) const {
    const channel_event* content = event();
    if (content == nullptr) {
        return 0;
    }
    return editTime == Qx::kStripTimeAtEvent ? content->stripTime
                                             : stripAt(*matching_in_ceh().get_chan_evnt_ptr(), editTime);
}

void ce_handle::set_strip_time(double time) {
    if (m_cel != nullptr) {
        m_cel->set_strip_time(*this, time);
    }
}

cookie ce_handle::get_strip_cookie() const {
    const channel_event* content = event();
    return content != nullptr ? content->strip : invalid_cookie;
}

void ce_handle::set_strip_cookie(const cookie& strip) {
    change([&](channel_event& content) { content.strip = strip; });
}

float ce_handle::get_strip_level(double editTime) const {
    const channel_event* content = event();
    if (content == nullptr) {
        return 0;
    }
    const channel_event* out = matching_out_ceh().get_chan_evnt_ptr();
    if (editTime == Qx::kStripTimeAtEvent || out == nullptr) {
        return content->level;
    }
    return levelAt(*matching_in_ceh().get_chan_evnt_ptr(), *out, editTime);
}

void ce_handle::set_strip_level(float level) {
    change([&](channel_event& content) { content.level = level; });
}

double ce_handle::get_strip_velocity() const {
    const channel_event* content = event();
    return content != nullptr ? content->velocity : 0;
}

void ce_handle::set_strip_velocity(double velocity) {
    const ce_handle in = matching_in_ceh();
    const ce_handle out = matching_out_ceh();
    channel_event first = in.get_channel_event();
    first.velocity = velocity;
    if (valid() == 0 || !isGoodEvent(first)) {
        return;
    }
    in.changing() = first;
    if (out.valid() != 0) {
        channel_event& second = out.changing();
        second.velocity = velocity;
        second.stripTime = stripAt(first, second.editTime);
    }
    m_cel->changedNow();
}

int ce_handle::get_dmod_code() const {
    const channel_event* content = event();
    return content != nullptr ? content->code : 0;
}

void ce_handle::set_dmod_code(int code) {
    change([&](channel_event& content) { content.code = code; });
}

channel_event ce_handle::get_channel_event() const {
    const channel_event* content = event();
    return content != nullptr ? *content : channel_event();
}

bool ce_handle::time_in_range_exclusive(double time) const {
    return valid() != 0 && matching_out_ceh().valid() != 0 &&
           !isNotPast(time, matching_in_ceh().get_edit_time()) &&
           !isNotPast(matching_out_ceh().get_edit_time(), time);
}

IdStamp ce_handle::getEffectGraph() const {
    const channel_event* content = event();
    return content != nullptr ? content->id : IdStamp();
}

void ce_handle::setEffectGraph(const IdStamp& id) {
    change([&](channel_event& content) { content.id = id; });
}

uint16_t ce_handle::audioRamp_DurationQFrames() const {
    const channel_event* content = event();
    return content != nullptr ? content->rampQFrames : uint16_t{0};
}

void ce_handle::set_audioRamp_DurationQFrames(uint16_t quarterFrames) {
    change([&](channel_event& content) { content.rampQFrames = quarterFrames; });
}

Aud::GainCurve::eCurveType ce_handle::audioRamp_CurveType() const {
    const channel_event* content = event();
    return static_cast<Aud::GainCurve::eCurveType>(content != nullptr ? content->rampCurve : 0);
}

void ce_handle::set_audioRamp_CurveType(Aud::GainCurve::eCurveType type) {
    change([&](channel_event& content) { content.rampCurve = type; });
}

template <typename Change>
void ce_handle::change(Change&& apply) {
    const channel_event* content = event();
    if (content == nullptr) {
        return;
    }
    channel_event changed = *content;
    apply(changed);
    if (changed != *content && isGoodEvent(changed)) {
        changing() = changed;
        m_cel->changedNow();
    }
}

CEHPair::CEHPair(const ce_handle& event) : m_in(event.matching_in_ceh()), m_out(event.matching_out_ceh()) {}

CEHPair::CEHPair(const cel& content, double time) : CEHPair(&content, time) {}

CEHPair::CEHPair(const cel* content, double time) {
    const ce_handle in = content != nullptr ? content->find_ceh(time, CE_IN_POINT) : ce_handle();
    const ce_handle out = in.matching_out_ceh();
    if (in.valid() != 0 && out.valid() != 0 &&
        Qx::timeIsConsideredToBeInRegion(time, {in.get_edit_time(), out.get_edit_time()})) {
        m_in = in;
        m_out = out;
    }
}

cel::Range CEHPair::editRange() const {
    return valid() ? cel::Range(m_in.get_edit_time(), m_out.get_edit_time()) : Editable::invalidRange();
}
