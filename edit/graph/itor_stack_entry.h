#pragma once

#include "edit/graph/edit_by_ref_time_transform.h"
#include "edit/model/cel_event_pair.h"
#include "platform/base/vector.h"
#include "platform/effects/effect_instance.h"

/// One position of an `EditGraphIterator`: an event, and as the tag that it is the effect node there, which names
/// nothing where there is none. It holds the edit and the event's cel. Times are seconds of `edit`.
struct QM_API ItorStackEntry : public Tag<FXGraphNodeBase> {
    using Range = NumRange<double, Ordered>;

    int chanIndex = NO_CHAN; ///< of the event's channel in `edit`; `NO_CHAN` for none, and in an unset entry
    ce_handle ceh;           ///< the event's in point; invalid in an unset entry
    EditPtr edit;
    Range editRange;  ///< of the event, cut to cut
    Range editRange1; ///< and with what else is played of it (`CelEventPair::WithFades`)
    CelEventPair::StripRange stripRange{0, 0}; ///< strip times at the ends of `editRange1`
    int parentInputNum = -1; ///< the input of the level above that leads here; -1 for the root
    Vector<EditByRefTimeTransform> transforms; ///< from the times of the level above to those of `edit`

    /// Takes event, edit and ranges from a pair, and the effect node that is bound to it. `transforms` and
    /// `parentInputNum` stay. An invalid pair leaves the entry unset. The time does not matter.
    void setFromUtr(const CelEventPair& pair, double time);
    /// Becomes a node that has no event of its own: one of the graph of the event of `owner`.
    void setFromNode(const ItorStackEntry& owner, const Tag<FXGraphNodeBase>& node);
    /// The node; null when there is none or it is no `EffectInstance`.
    [[nodiscard]] EffectInstance* getFXPtr() const { return dynamic_cast<EffectInstance*>(get()); }
    /// Unset, with the edit let go. Keeps the memory of `transforms`.
    void invalidate();
    /// The edit time at which the event begins, which keyframes are counted from.
    [[nodiscard]] double eventStart() const;
    [[nodiscard]] bool operator==(const ItorStackEntry& other) const;

private:
    Qx::Ptr<const cel> m_held;
};
