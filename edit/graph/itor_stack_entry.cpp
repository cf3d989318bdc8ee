#include "edit/graph/itor_stack_entry.h"

#include "edit/model/edit.h"

void ItorStackEntry::setFromUtr(const CelEventPair& pair, double) {
    if (!pair.valid()) {
        invalidate();
        return;
    }
    edit = pair.getEdit();
    ceh = pair.inH();
    m_held = pair.getCel()->weak_from_this().lock();
    chanIndex = pair.idx();
    editRange = pair.editRange(CelEventPair::CutToCut);
    editRange1 = pair.editRange(CelEventPair::WithFades);
    stripRange = pair.stripRange(CelEventPair::WithFades);
    Tag<FXGraphNodeBase>& node = *this;
    if (chanIndex == NO_CHAN) {
        node = edit.valid() ? edit->getVideoNodeForEvent(ceh) : Tag<FXGraphNodeBase>();
    } else {
        node = pair.getEffectHandle();
    }
}

void ItorStackEntry::setFromNode(const ItorStackEntry& owner, const Tag<FXGraphNodeBase>& node) {
    edit = owner.edit;
    ceh = owner.ceh;
    m_held = owner.m_held;
    chanIndex = owner.chanIndex;
    editRange = owner.editRange;
    editRange1 = owner.editRange1;
    stripRange = owner.stripRange;
    Tag<FXGraphNodeBase>::operator=(node);
}

void ItorStackEntry::invalidate() {
    Tag<FXGraphNodeBase>::operator=(Tag<FXGraphNodeBase>());
    chanIndex = NO_CHAN;
    ceh = ce_handle();
    edit.invalidate();
    m_held.reset();
    editRange = editRange1 = Range();
    stripRange = {0, 0};
    parentInputNum = -1;
    transforms.clear();
}

double ItorStackEntry::eventStart() const {
    return ceh.valid() != 0 ? ceh.get_edit_time() : editRange.start();
}

bool ItorStackEntry::operator==(const ItorStackEntry& other) const {
    return Tag<FXGraphNodeBase>::operator==(other) && chanIndex == other.chanIndex && ceh == other.ceh &&
           edit == other.edit && editRange == other.editRange && editRange1 == other.editRange1 &&
           stripRange == other.stripRange && parentInputNum == other.parentInputNum &&
           transforms == other.transforms;
}
