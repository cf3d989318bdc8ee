#include "edit/graph/edit_graph_iterator.h"
#include "edit/model/cel_iterator.h"
#include "edit/model/edit.h"
#include "platform/base/ole_splat.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace {

/// The place of a channel among those of its type and subtype, from 0; -1 for what is no channel.
int placeAmongKind(const Edit& edit, const IdStamp& track) {
    int place = 0;
    int chan = kBeforeFirstChan;
    const auto [type, subtype] = edit.getChanTypeAndSubType(track);
    while (edit.getNextChan(chan, type, subtype) != NO_CHAN) {
        if (edit.getId(chan) == track) {
            return place;
        }
        ++place;
    }
    return -1;
}

} // namespace

IdStamp findShownTrack(const CelEventPair& pair, const EditPtr& inner, double time) {
    const Edit_Chan_Type type = pair.getChanType() == AudioChan ? AudioChan : VideoChan;
    const int wanted = pair.getEdit().valid() && pair.getChanSubType() == Edit_Chan_SubType::NONE
                           ? placeAmongKind(*pair.getEdit(), pair.trackId())
                           : 0;
    int chan = inner->getFirstChan(type, Edit_Chan_SubType::NONE);
    const int first = chan;
    for (int i = 0; i < wanted && chan != NO_CHAN; ++i) {
        inner->getNextChan(chan, type, Edit_Chan_SubType::NONE);
    }
    const IdStamp track = inner->getId(chan != NO_CHAN ? chan : first);
    return type == VideoChan ? findTopTrack(inner, track, time) : track;
}

IdStamp findTopTrack(const EditPtr& edit, const IdStamp& track, double time) {
    IdStamp top = track;
    for (int risen = 0; edit.valid() && risen < EditGraphIterator::kMostSearchLevels; ++risen) {
        bool isCovered = false;
        int chan = kBeforeFirstChan;
        while (!isCovered && edit->getNextChan(chan, VideoChan, Edit_Chan_SubType::ALIAS) != NO_CHAN) {
            const Tag<FXGraphNodeBase> node = CelEventPair(edit, chan, time).getEffectHandle();
            for (unsigned i = 0; node.valid() && i < node->getNumTrackInputs() && !isCovered; ++i) {
                isCovered = node->getInputTrackId(i) == top;
            }
        }
        if (!isCovered) {
            break;
        }
        top = edit->getId(chan);
    }
    return top;
}

bool EditGraphIterator::isMaterialUtr(const CelEventPair& pair) {
    return pair.valid() && pair.getObjectID().getMagicType() == IdStampMagic::Material;
}

IdStamp EditGraphIterator::getAliasedTrackId(const CelEventPair& pair) {
    const IdStamp shown = pair.getObjectID();
    return shown.getMagicType() == IdStampMagic::Channel ? shown : IdStamp();
}

EditPtr EditGraphIterator::getGhostEdit(const CelEventPair& pair) {
    const cookie strip = pair.stripCookie();
    const bool mayBeEdit = strip.type() == Cookie_Type::Edit || strip.type() == Cookie_Type::Transient;
    if (!isMaterialUtr(pair) || !mayBeEdit || strip.isMagic() || strip.isAlias()) {
        return {};
    }
    EditPtr shown(strip, eOpenExisting);
    return shown.valid() && shown->isEdit() ? shown : EditPtr();
}

bool EditGraphIterator::isAliasUtr(const CelEventPair& pair) {
    return pair.valid() && (getAliasedTrackId(pair).valid() || getGhostEdit(pair).valid());
}

bool EditGraphIterator::moveToInput(unsigned input) {
    const EffectInstance* const effect = currentEffect();
    if (effect == nullptr || input >= effect->getNumTrackInputs()) {
        return false;
    }
    const Extents before = m_extents;
    EntryPtr entry = freshEntry();
    const bool found = effect->hasExplicitInputs()
                           ? moveToInputExplicit(effect->getInputTrackId(input), *entry)
                           : moveToInputImplicit(input, *effect, *entry);
    if (!found) {
        m_extents = before;
        recycle(std::move(entry));
        return false;
    }
    entry->parentInputNum = static_cast<int>(input);
    addStackItem(std::move(entry));
    return true;
}

/// To what an input names: a channel of the same edit, or a node of the same graph.
bool EditGraphIterator::moveToInputExplicit(const IdStamp& source, ItorStackEntry& entry) {
    const ItorStackEntry& from = *entryAt(-1);
    if (!source.valid()) {
        return false;
    }
    if (source.getMagicType() == IdStampMagic::Channel) {
        const double time = applyTimeTransformsStackTo(m_time, false);
        fill(entry, CelEventPair(from.edit, source, time), time);
        return entry.ceh.valid() != 0;
    }
    if (from.bag() == nullptr) {
        return false;
    }
    const Tag<FXGraphNodeBase> node(*from.bag(), source);
    if (!node.valid()) {
        return false;
    }
    entry.setFromNode(from, node);
    return true;
}

/// To a neighbour on the channel of the event, unless the input names something else.
bool EditGraphIterator::moveToInputImplicit(unsigned input, const EffectInstance& effect,
                                            ItorStackEntry& entry) {
    const ItorStackEntry* const from = findStackEntryWithDuration();
    if (from == nullptr) {
        return false;
    }
    const IdStamp source = effect.getInputTrackId(input);
    bool isOutgoing = input == 0;
    if (effect.getNumTrackInputs() != 2 || effect.getInputTrackId(0).valid() ||
        effect.getInputTrackId(1).valid()) {
        if (source != previousInputId && source != nextInputId) {
            return moveToInputExplicit(source, entry);
        }
        isOutgoing = source == previousInputId;
    }
    CelIterator neighbour(from->edit, from->chanIndex, from->ceh);
    if (!(isOutgoing ? neighbour.dec() : neighbour.inc()) || !neighbour.valid()) {
        return false;
    }
    double time = applyTimeTransformsStackTo(m_time, false);
    CelEventPair pair = neighbour.getEventPair();
    constrainMorphologyExtents(pair, time, entry.transforms);
    const bool isMaterial = isMaterialUtr(pair);
    const bool isAlias = getAliasedTrackId(pair).valid();
    if (isAlias) {
        traverseAliasing(pair, time, entry.transforms);
    } else if (isMaterial && m_traverseGhosts) {
        traverseGhostAliasing(pair, time, entry.transforms);
    }
    entry.setFromUtr(pair, time);
    if (!isMaterial && !isAlias && isOutgoing) {
        std::swap(entry.editRange, entry.editRange1);
    }
    return entry.ceh.valid() != 0;
}

const ItorStackEntry* EditGraphIterator::findStackEntryWithDuration() const {
    for (int level = m_current; level >= 0; --level) {
        const ItorStackEntry* const entry = entryAt(level);
        if (entry->ceh.valid() != 0) {
            return entry;
        }
    }
    return nullptr;
}

/// Resolves what a pair that plays at a time of its edit refers to, and takes the result, which may be unset.
void EditGraphIterator::fill(ItorStackEntry& entry, CelEventPair pair, double time) {
    traverseAliasing(pair, time, entry.transforms);
    if (isMaterialUtr(pair)) {
        constrainMorphologyExtents(pair, time, entry.transforms);
    }
    entry.setFromUtr(pair, time);
}

/// From a pair to what it shows in the end; it becomes invalid where that is nothing. `time` and `transforms` are
/// brought along into the edits on the way.
void EditGraphIterator::traverseAliasing(CelEventPair& pair, double& time, Transforms& transforms) {
    traverseTrackAliasing(pair, time, transforms);
    if (m_traverseGhosts && isMaterialUtr(pair)) {
        traverseGhostAliasing(pair, time, transforms);
    }
}

void EditGraphIterator::traverseTrackAliasing(CelEventPair& pair, double time, Transforms& transforms) {
    for (int hops = 0; pair.valid(); ++hops) {
        const EditPtr& edit = pair.getEdit();
        narrowExtents(pair.editTime(), pair.endEditTime(), transforms);
        const IdStamp shown = getAliasedTrackId(pair);
        if (!shown.valid() || !edit.valid() || !edit->chanValid(shown)) {
            return;
        }
        if (shown == pair.trackId() || hops > edit->getNumChans()) {
            ole_splat("EditGraphIterator::traverseTrackAliasing() : Loop detected!");
            pair.invalidate();
            return;
        }
        pair = CelEventPair(edit, shown, time);
    }
}

void EditGraphIterator::traverseGhostAliasing(CelEventPair& pair, double& time, Transforms& transforms) {
    for (int hops = 0; isMaterialUtr(pair); ++hops) {
        const EditPtr inner = getGhostEdit(pair);
        if (!inner.valid()) {
            return;
        }
        if (hops >= kMostNestedEdits) {
            ole_splat("EditGraphIterator::traverseGhostAliasing() : Loop detected!");
            pair.invalidate();
            return;
        }
        const EditByRefTimeTransform& into = transforms.emplace_back(
            pair.stripTime(), pair.editTime(), static_cast<float>(pair.inH().get_strip_velocity()));
        time = into.applyTo(time);
        hold(inner);
        pair = CelEventPair(inner, findShownTrack(pair, inner, time), time);
        traverseTrackAliasing(pair, time, transforms);
    }
}

void EditGraphIterator::hold(const EditPtr& edit) {
    if (std::find(m_held.rbegin(), m_held.rend(), edit) == m_held.rend()) {
        m_held.push_back(edit);
    }
}

/// `updateExtents` with times of what lies below the present level by some transforms.
void EditGraphIterator::narrowExtents(double a, double b, const Transforms& transforms) {
    const auto toRoot = [&](double time) {
        for (auto its = transforms.rbegin(); its != transforms.rend(); ++its) {
            time = its->inverseApplyTo(time);
        }
        return applyTimeTransformsStackTo(time, true);
    };
    const double low = toRoot(a);
    const double high = toRoot(b);
    updateExtents(std::min(low, high), std::max(low, high));
}

/// Narrows the extents to where the pair's source has material, or to where it has none.
void EditGraphIterator::constrainMorphologyExtents(const CelEventPair& pair, double time,
                                                   const Transforms& transforms) {
    const cookie strip = pair.stripCookie();
    if (!m_materialShortfallDetection || !isMaterialUtr(pair) || !strip.isStorable() || strip.isMagic()) {
        return;
    }
    const double velocity = pair.inH().get_strip_velocity();
    const EditPtr source(strip, eOpenExisting);
    if (!source.valid() || velocity == 0 || source->getEndTime() <= source->getStartTime()) {
        return;
    }
    const auto toEdit = [&](double stripTime) {
        return pair.editTime() + (stripTime - pair.stripTime()) / velocity;
    };
    const Extents usable(toEdit(source->getStartTime()), toEdit(source->getEndTime()));
    constexpr double kEver = std::numeric_limits<double>::infinity();
    if (time < usable.start()) {
        narrowExtents(-kEver, usable.start(), transforms);
    } else if (time >= usable.end()) {
        narrowExtents(usable.end(), kEver, transforms);
    } else {
        narrowExtents(usable.start(), usable.end(), transforms);
    }
}
