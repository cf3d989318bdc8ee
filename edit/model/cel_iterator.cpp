#include "edit/model/cel_iterator.h"

#include "edit/model/edit.h"

CelIterator::CelIterator(const EditPtr& edit, int chanIdx)
    : CelIterator(edit, edit.valid() ? edit->getId(chanIdx) : IdStamp()) {}

CelIterator::CelIterator(const EditPtr& edit, const IdStamp& chan)
    : CelEventPair(edit, ce_handle(), chan), m_stamp(chan), m_itsEdit(edit) {
    moveToStart();
}

CelIterator::CelIterator(const EditPtr& edit, int chanIdx, double time)
    : CelIterator(CelEventPair(edit, chanIdx, time)) {}

CelIterator::CelIterator(const EditPtr& edit, const IdStamp& chan, double time)
    : CelIterator(CelEventPair(edit, chan, time)) {}

CelIterator::CelIterator(const EditPtr& edit, int chanIdx, const ce_handle& event)
    : CelIterator(CelEventPair(edit, event, chanIdx)) {}

CelIterator::CelIterator(const CelEventPair& pair)
    : CelEventPair(pair), m_stamp(pair.trackId()), m_itsEdit(pair.getEdit()) {}

CelIterator::CelIterator(cel* content)
    : CelEventPair(EditPtr(), content, content != nullptr ? content->get_start_ceh() : ce_handle()) {}

cel* CelIterator::findCel() const {
    if (m_itsEdit.valid() && m_stamp.valid()) {
        return m_itsEdit->getCel(m_stamp);
    }
    return getCel();
}

void CelIterator::moveToStart() {
    const cel* content = findCel();
    setPair(content != nullptr ? content->get_start_ceh() : ce_handle());
}

void CelIterator::moveToEnd() {
    const cel* content = findCel();
    invalidate();
    if (content != nullptr) {
        setPair(content->get_end_ceh());
    }
}

void CelIterator::moveTo(const CelEventPair& pair) {
    CelEventPair::operator=(pair);
    m_stamp = pair.trackId();
    m_itsEdit = pair.getEdit();
}

int CelIterator::idx() const {
    return m_itsEdit.valid() && m_stamp.valid() ? m_itsEdit->getIdx(m_stamp) : NO_CHAN;
}

CelIterator CelIterator::operator++(int) {
    CelIterator before = *this;
    inc();
    return before;
}

CelIterator CelIterator::operator--(int) {
    CelIterator before = *this;
    dec();
    return before;
}
