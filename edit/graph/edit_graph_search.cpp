#include "edit/graph/detail/trail.h"
#include "edit/graph/edit_graph_iterator.h"
#include "edit/model/edit.h"
#include "platform/services/log.h"

using EditGraph::Trail;

bool EditGraphIterator::search(const IdStamp& id, SearchType type) {
    if (!m_valid) {
        return false;
    }
    Trail trail;
    const Extents before = m_extents;
    const bool found = m_bidirectional ? biDirectionalSearch(id, type, trail)
                                       : searchInternal(EditGraphIterator(*this, getIterationFlags()), id,
                                                        m_current, 0, trail);
    countTransforms();
    if (!found) {
        m_extents = before;
    }
    return found;
}

bool EditGraphIterator::search(const Tag<FXGraphNodeBase>& node) {
    return m_valid && node.valid() && search(node.id(), NodeId);
}

bool EditGraphIterator::matches(const IdStamp& id, SearchType type) const {
    const FXGraphNodeBase* const node = getNodeH(-1).get();
    switch (type) {
    case NodeId:
        return node != nullptr && getNodeId(-1) == id;
    case InputTrackId:
        for (unsigned i = 0; node != nullptr && i < node->getNumTrackInputs(); ++i) {
            if (node->getInputTrackId(i) == id) {
                return true;
            }
        }
        return false;
    case ChanId:
        return getChanId(-1) == id;
    }
    return false;
}

/// On the live stack, which stays as it was when nothing is found.
bool EditGraphIterator::biDirectionalSearch(const IdStamp& id, SearchType type, Trail& trail) {
    if (m_current < 0) {
        return false;
    }
    if (m_current + 1 >= kMostSearchLevels) {
        herc_printf("EditGraphIterator::biDirectionalSearch() : Search aborted\n");
        return false;
    }
    if (matches(id, type)) {
        return true;
    }
    const EffectInstance* const effect = currentEffect();
    if (effect == nullptr) {
        return false;
    }
    const Trail::Stay stay(trail, *this, m_current);
    if (!stay) {
        if (trail.takeAbort()) {
            herc_printf("EditGraphIterator::biDirectionalSearch() : Search aborted\n");
        }
        return false;
    }
    for (unsigned i = 0; i < effect->getNumTrackInputs(); ++i) {
        if (moveToInput(i)) {
            if (biDirectionalSearch(id, type, trail)) {
                return true;
            }
            static_cast<void>(moveBack());
        }
    }
    return false;
}

/// From the position of `from`, which keeps one level and is at the level `depth` of this iterator.
bool EditGraphIterator::searchInternal(const EditGraphIterator& from, const IdStamp& id, int depth,
                                       unsigned firstInput, Trail& trail) {
    if (depth >= kMostSearchLevels) {
        herc_printf("EditGraphIterator::searchInternal() : Search aborted\n");
        return false;
    }
    const FXGraphNodeBase* const node = from.getNodeH(-1).get();
    if (node == nullptr) {
        return false;
    }
    if (from.getNodeId(-1) == id) {
        putEntryAt(depth, from);
        return true;
    }
    const Trail::Stay stay(trail, from, depth);
    if (!stay) {
        if (trail.takeAbort()) {
            herc_printf("EditGraphIterator::searchInternal() : Search aborted\n");
        }
        return false;
    }
    for (unsigned i = firstInput; i < node->getNumTrackInputs(); ++i) {
        EditGraphIterator below(from, 0);
        if (below.moveToInput(i) && searchInternal(below, id, depth + 1, 0, trail)) {
            if (m_bidirectional) {
                *m_stack[static_cast<size_t>(depth) + 1] = *below.entryAt(-1);
            }
            return true;
        }
    }
    return false;
}

/// Makes the place of another iterator the present level: of a bidirectional one the one that is given, of another
/// the only one.
void EditGraphIterator::putEntryAt(int level, const EditGraphIterator& from) {
    if (!m_bidirectional) {
        *m_stack[0] = *from.entryAt(-1);
        m_above = from.m_above;
        m_current = 0;
        return;
    }
    while (m_current > level) {
        static_cast<void>(moveBack());
    }
    while (m_current < level) {
        addStackItem(freshEntry());
    }
}

bool EditGraphIterator::searchNext() {
    if (!m_valid || !m_bidirectional || m_current < 0) {
        return false;
    }
    const IdStamp sought = getNodeId(-1);
    for (;;) {
        const int from = getParentInputNum() + 1;
        if (!moveBack()) {
            return false;
        }
        const FXGraphNodeBase* const node = getNodeH(-1).get();
        if (node == nullptr || static_cast<unsigned>(from) >= node->getNumTrackInputs()) {
            continue;
        }
        Trail trail;
        if (searchInternal(EditGraphIterator(*this, 0), sought, m_current, static_cast<unsigned>(from),
                           trail)) {
            countTransforms();
            return true;
        }
    }
}
