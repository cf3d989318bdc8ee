#include "edit/model/cel_event_pair.h"

#include "edit/model/edit.h"
#include "platform/store/tag.h"

#include <cmath>

CelEventPair::CelEventPair(const EditPtr& edit, cel* content, double time) : m_edit(edit) {
    if (content != nullptr) {
        setPair(content->find_ceh(time, CE_IN_POINT));
    }
}

CelEventPair::CelEventPair(const EditPtr& edit, cel* content, const ce_handle& in) : m_edit(edit), m_in(in) {
    if (content != nullptr && m_in.get_its_cel() == nullptr) {
        m_in.set_its_cel(content);
    }
    m_out = m_in.matching_out_ceh();
    hold();
}

CelEventPair::CelEventPair(const EditPtr& edit, const ce_handle& event, int chanIdx)
    : CelEventPair(edit, event, edit.valid() ? edit->getId(chanIdx) : IdStamp()) {}

CelEventPair::CelEventPair(const EditPtr& edit, const ce_handle& event, const IdStamp& chan)
    : m_edit(edit), m_chan(chan) {
    if (m_edit.valid()) {
        setPair(event);
    }
}

CelEventPair::CelEventPair(const EditPtr& edit, const IdStamp& chan, double time)
    : m_edit(edit), m_chan(chan) {
    findAt(time);
}

CelEventPair::CelEventPair(const EditPtr& edit, int chanIdx, double time)
    : CelEventPair(edit, edit.valid() ? edit->getId(chanIdx) : IdStamp(), time) {}

void CelEventPair::findAt(double time) {
    cel* content = m_edit.valid() && m_chan.valid() ? m_edit->getCel(m_chan) : nullptr;
    if (content == nullptr) {
        return;
    }
    setPair(content->find_ceh(time, CE_IN_POINT));
    if (!containsEditTime(time)) {
        invalidate();
    }
}

void CelEventPair::setPair(const ce_handle& event) {
    m_in = event.matching_in_ceh();
    m_out = event.matching_out_ceh();
    hold();
}

void CelEventPair::hold() {
    const cel* const content = getCel();
    if (m_held.get() != content) {
        m_held = content != nullptr ? content->weak_from_this().lock() : nullptr;
    }
}

void CelEventPair::invalidate() {
    m_in.set_index(-1);
    m_out.set_index(-1);
}

int CelEventPair::idx() const {
    return valid() && m_edit.valid() ? m_edit->getIdx(m_chan) : NO_CHAN;
}

double CelEventPair::stripTime() const {
    return valid() ? m_in.get_strip_time(Qx::kStripTimeAtEvent) : Qx::kNoPairTime;
}

double CelEventPair::endStripTime() const {
    return valid() ? m_out.get_strip_time(Qx::kStripTimeAtEvent) : Qx::kNoPairTime;
}

cookie CelEventPair::stripCookie() const {
    return valid() ? m_in.get_strip_cookie() : cookie();
}

bool CelEventPair::isZeroLength() const {
    return std::abs(length()) <= Qx::kTimeTolerance;
}

Edit_Chan_Type CelEventPair::getChanType() const {
    return m_edit.valid() ? m_edit->getChanType(m_chan) : NoChan;
}

Edit_Chan_SubType CelEventPair::getChanSubType() const {
    return m_edit.valid() ? m_edit->getChanSubtype(m_chan) : Edit_Chan_SubType::INVALID;
}

uint16_t CelEventPair::getAudioFadeInQFrames() const {
    return valid() ? m_in.audioRamp_DurationQFrames() : uint16_t{0};
}

uint16_t CelEventPair::getAudioFadeOutQFrames() const {
    return valid() ? m_out.audioRamp_DurationQFrames() : uint16_t{0};
}

Tag<FXGraphNodeBase> CelEventPair::getEffectHandle() const {
    return m_edit.valid() ? m_edit->openObject(getObjectID()) : Tag<FXGraphNodeBase>();
}

CelEventPair::Range CelEventPair::editRange(RangeType type) const {
    if (!valid()) {
        return Editable::invalidRange();
    }
    const uint16_t fadeIn = getAudioFadeInQFrames();
    const uint16_t fadeOut = getAudioFadeOutQFrames();
    if (type != WithFades || (fadeIn == 0 && fadeOut == 0)) {
        return {editTime(), endEditTime()};
    }
    const double quarterFrame = Qx::projectFrameRate().frameDuration() / 4;
    return {editTime() - fadeIn * quarterFrame, endEditTime() + fadeOut * quarterFrame};
}

CelEventPair::StripRange CelEventPair::stripRange(RangeType type) const {
    if (!valid()) {
        return {Qx::kNoTime, Qx::kNoTime};
    }
    if (type != WithFades) {
        return {stripTime(), endStripTime()};
    }
    const Range range = editRange(type);
    return {m_in.get_strip_time(range.start()), m_in.get_strip_time(range.end())};
}

bool CelEventPair::overlaps(double from, double to) const {
    if (!valid()) {
        return false;
    }
    const double start = editTime();
    const double end = endEditTime();
    return std::abs(start - from) <= Qx::kTimeTolerance || std::abs(end - to) <= Qx::kTimeTolerance ||
           (start > from && to > start) || (to > end && end > from) || (from > start && end > to);
}

bool CelEventPair::overlaps(const CelEventPair& other) const {
    return other.valid() && overlaps(other.editTime(), other.endEditTime());
}

bool CelEventPair::containsEditTime(double time) const {
    return valid() && Qx::timeIsConsideredToBeInRegion(time, {editTime(), endEditTime()});
}

bool CelEventPair::coincidesWith(const Range& range) const {
    return valid() && std::abs(editTime() - range.start()) <= Qx::kTimeTolerance &&
           std::abs(endEditTime() - range.end()) <= Qx::kTimeTolerance;
}

bool CelEventPair::coincidesWith(const CelEventPair& other) const {
    return other.valid() && coincidesWith(other.editRange());
}

void CelEventPair::resize(double length) {
    if (valid() && getCel()->set_edit_time(m_out, editTime() + length, true)) {
        m_out.set_strip_time(m_in.get_strip_time(endEditTime()));
    }
}

void CelEventPair::setStripCookie(const cookie& strip) {
    m_in.set_strip_cookie(strip);
    m_out.set_strip_cookie(strip);
}

CelEventPair CelEventPair::operator++(int) {
    CelEventPair before = *this;
    inc();
    return before;
}

CelEventPair CelEventPair::operator--(int) {
    CelEventPair before = *this;
    dec();
    return before;
}
