#include "edit/graph/detail/trail.h"
#include "edit/graph/edit_graph_iterator.h"
#include "edit/model/edit.h"
#include "platform/effects/effect_graph.h"

#include <algorithm>
#include <limits>
#include <set>

using EditGraph::Trail;

namespace {

template <typename T>
void addOnce(Vector<T>& list, const T& item) {
    if (std::find(list.begin(), list.end(), item) == list.end()) {
        list.push_back(item);
    }
}

void appendOpened(const Vector<Tag<FXGraphNodeBase>>& tags, Vector<FXGraphNodeBase*>& nodes) {
    for (const Tag<FXGraphNodeBase>& tag : tags) {
        if (FXGraphNodeBase* const node = tag.get()) {
            nodes.push_back(node);
        }
    }
}

/// True at material that is no black.
bool isAtMaterial(const EditGraphIterator& at) {
    const ItorStackEntry* const entry = at.getEntry();
    return entry != nullptr && entry->ceh.getEffectGraph().getMagicType() == IdStampMagic::Material &&
           entry->ceh.valid() != 0 && !entry->ceh.get_strip_cookie().isBlack();
}

bool playsSomething(const CelEventPair& pair) {
    return pair.valid() && !pair.stripCookie().isBlack();
}

} // namespace

void EditGraphIterator::visit(const std::function<void(const EditGraphIterator&)>& visitor, Trail& trail) {
    const Trail::Stay stay(trail, *this, m_current);
    if (!stay || m_current >= kMostSearchLevels) {
        return;
    }
    visitor(*this);
    const EffectInstance* const effect = currentEffect();
    for (unsigned i = 0; effect != nullptr && i < effect->getNumTrackInputs(); ++i) {
        if (moveToInput(i)) {
            visit(visitor, trail);
            static_cast<void>(moveBack());
        } else {
            narrowToGap(effect->getInputTrackId(i));
        }
    }
}

/// Narrows the extents to where a channel of the present edit shows nothing, if it shows nothing here.
void EditGraphIterator::narrowToGap(const IdStamp& track) {
    const EditPtr edit = getCurrentPosEdit();
    cel* const content = track.getMagicType() == IdStampMagic::Channel ? edit->getCel(track) : nullptr;
    if (content == nullptr) {
        return;
    }
    const double time = applyTimeTransformsStackTo(m_time, false);
    const CelEventPair before(edit, content, time);
    if (before.containsEditTime(time)) {
        return;
    }
    const ce_handle next =
        before.valid() ? ce_handle(content, before.getCelIdx() + 2) : content->get_start_ceh();
    constexpr double kEver = std::numeric_limits<double>::infinity();
    narrowExtents(before.valid() ? before.endEditTime() : -kEver,
                  next.valid() != 0 ? next.get_edit_time() : kEver, {});
}

void EditGraphIterator::visitBelow(const std::function<void(const EditGraphIterator&)>& visitor) const {
    EditGraphIterator walker(EditGraphIterator(*this, 0), kBidirectional);
    Trail trail;
    walker.visit(visitor, trail);
}

void EditGraphIterator::findInputTracksRaw(Vector<int>& tracks) const {
    const EffectInstance* const effect = currentEffect();
    for (unsigned i = 0; effect != nullptr && i < effect->getNumTrackInputs(); ++i) {
        const int track = getCurrentPosEdit()->getIdx(effect->getInputTrackId(i));
        if (track != NO_CHAN) {
            addOnce(tracks, track);
        }
    }
}

void EditGraphIterator::findComponentsForCurrentEffect(Vector<Tag<FXGraphNodeBase>>& nodes) const {
    const Tag<FXGraphNodeBase> head = getNodeH(-1);
    if (head.valid()) {
        Vector<Tag<FXGraphNodeBase>> its;
        Fx::listGraph(*head.bag(), head.id(), its);
        nodes.insert(nodes.end(), its.begin(), its.end());
    }
}

void EditGraphIterator::findComponentsForCurrentEffect(Vector<FXGraphNodeBase*>& nodes) const {
    Vector<Tag<FXGraphNodeBase>> tags;
    findComponentsForCurrentEffect(tags);
    appendOpened(tags, nodes);
}

void EditGraphIterator::findAllComponents(Vector<Tag<FXGraphNodeBase>>& nodes) const {
    std::set<const FXGraphNodeBase*> seen;
    visitBelow([&](const EditGraphIterator& at) {
        if (seen.contains(at.getNodeH(-1).get())) {
            return;
        }
        Vector<Tag<FXGraphNodeBase>> its;
        at.findComponentsForCurrentEffect(its);
        for (const Tag<FXGraphNodeBase>& tag : its) {
            if (seen.insert(tag.get()).second) {
                nodes.push_back(tag);
            }
        }
    });
}

void EditGraphIterator::findAllComponents(Vector<FXGraphNodeBase*>& nodes) const {
    Vector<Tag<FXGraphNodeBase>> tags;
    findAllComponents(tags);
    appendOpened(tags, nodes);
}

void EditGraphIterator::findMaterialTracks(Vector<int>& tracks) const {
    visitBelow([&](const EditGraphIterator& at) {
        if (isAtMaterial(at) && at.getChanIndex(-1) != NO_CHAN) {
            addOnce(tracks, at.getChanIndex(-1));
        }
    });
}

void EditGraphIterator::findMaterialTracks(Vector<IdStamp>& tracks) const {
    Vector<int> indices;
    findMaterialTracks(indices);
    const EditPtr edit = getCurrentPosEdit();
    for (const int index : indices) {
        addOnce(tracks, edit->getId(index));
    }
}

Tag<FXGraphNodeBase> EditGraphIterator::findOriginalMaterialNodeForVTrackUTR() const {
    EditGraphIterator walker(*this, 0);
    for (int steps = 0; steps < kMostSearchLevels && walker.moveToInput(0); ++steps) {
    }
    const ItorStackEntry* const entry = walker.getEntry();
    return entry != nullptr && isAtMaterial(walker) && entry->edit.valid()
               ? entry->edit->getVideoNodeForEvent(entry->ceh)
               : Tag<FXGraphNodeBase>();
}

EditGraphIterator::Extents EditGraphIterator::calculateMorphologyExtentsExplicit() {
    if (!m_valid) {
        return m_extents;
    }
    // The walk narrows the extents of the iterator that walks.
    EditGraphIterator walker(EditGraphIterator(*this, 0), getIterationFlags() | kBidirectional);
    Trail trail;
    walker.visit([](const EditGraphIterator&) {}, trail);
    m_extents = walker.m_extents;
    return m_extents;
}

void listMaterialSourceTracks(Vector<int>& tracks, const EditPtr& edit, const IdStamp& track, double time) {
    EditGraphIterator(CelEventPair(edit, track, time), time).findMaterialTracks(tracks);
}

void listAllSourceTracks(Vector<int>& tracks, const EditPtr& edit, const IdStamp& track, double time) {
    EditGraphIterator(CelEventPair(edit, track, time), time).visitBelow([&](const EditGraphIterator& at) {
        const bool isBelow = at.getStackDepth() > 1 || isAtMaterial(at);
        if (isBelow && at.getChanIndex(-1) != NO_CHAN) {
            addOnce(tracks, at.getChanIndex(-1));
        }
    });
}

void findAllRootNodeChans(EditPtr& edit, double time, Vector<IdStamp>& tracks) {
    Vector<IdStamp> playing;
    std::set<IdStamp> shown;
    for (int chan = 0; edit.valid() && chan < edit->getNumChans(); ++chan) {
        const CelEventPair pair(edit, chan, time);
        if (!playsSomething(pair)) {
            continue;
        }
        playing.push_back(pair.trackId());
        shown.insert(EditGraphIterator::getAliasedTrackId(pair));
        const Tag<FXGraphNodeBase> head = pair.getEffectHandle();
        Vector<Tag<FXGraphNodeBase>> nodes;
        if (head.valid()) {
            Fx::listGraph(*head.bag(), head.id(), nodes);
        }
        for (const Tag<FXGraphNodeBase>& node : nodes) {
            for (unsigned i = 0; i < node->getNumTrackInputs(); ++i) {
                shown.insert(node->getInputTrackId(i));
            }
        }
    }
    for (const IdStamp& track : playing) {
        if (!shown.contains(track)) {
            tracks.push_back(track);
        }
    }
}
