#pragma once

#include "edit/editing/detail/edit_plan.h"

#include <set>

/// Sees to what is bound to the events of an edit, and to its transitions, during one operation: each step is
/// between `beforeStep` and `afterStep`, and `finish` comes when the channels are as they are to be.
class Editor::ObjectFollower {
public:
    /// `channels` tells which channels of the source correspond to which here; null when the source is the
    /// edit itself.
    ObjectFollower(Edit& edit, const Plan& plan, edit_operation op, const SrcToDestChanMap* channels);

    /// Takes out the transitions that the step would leave without a clip, and notes what it may change.
    void beforeStep(cel& content, const Step& step);
    void afterStep(cel& content, const Step& step, const cel::IdMap& copied, const cel::Splits& splits);
    /// What lost its event is noted in the edit's list of orphans.
    void finish();
    /// What to tell of transitions that were taken out; empty for none.
    [[nodiscard]] String notice() const;

private:
    void takeOut(cel& content, const Step& step, int pair, double at);
    void keepEffects(cel& content, const Step& step);
    void settleBlackSides(cel& content, const Step& step) const;
    void retargetAliases(cel& content, const cel::Range& span) const;

    Edit& m_edit;
    const Plan& m_plan;
    edit_operation m_op;
    const SrcToDestChanMap* m_channels;
    std::vector<EventObjects::Bound> m_before;
    std::vector<EventObjects::Bound> m_lost;
    std::set<IdStamp> m_copied; ///< events of the edit that live on as copies
    std::vector<String> m_takenOut;
};
