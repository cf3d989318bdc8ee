#pragma once

#include "edit/editing/detail/edit_plan.h"
#include "edit/model/aud_levels_cel.h"
#include "edit/model/cel.h"

/// Makes the changes of one operation: the core operation, the operation as given, and the edit region.
class Editor::EditOpPerformer {
public:
    EditOpPerformer(edit_operation op, const cel::Range& region)
        : m_core(::getCoreEditOperation(op)), m_op(op), m_region(region) {}

    [[nodiscard]] edit_operation core() const { return m_core; }
    [[nodiscard]] edit_operation operation() const { return m_op; }
    [[nodiscard]] const cel::Range& region() const { return m_region; }

    /// Makes one change of a channel's cel; receives the stamps of copied and of cut events. False, with the
    /// channel unchanged, for a core that is none of replace, insert and remove.
    bool doEdit(cel& content, const Step& step, cel::IdMap& copied, cel::Splits& splits) const;
    /// The same for the levels of an audio channel.
    static void doLevels(AudLevelsCel& content, const Step& step);

private:
    edit_operation m_core;
    edit_operation m_op;
    cel::Range m_region;
};
