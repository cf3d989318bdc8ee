#include "edit/editing/detail/cue_follower.h"
#include "edit/editing/detail/edit_op_performer.h"
#include "edit/editing/detail/object_follower.h"
#include "platform/base/ole_splat.h"
#include "platform/services/log.h"

#include <algorithm>

using Op = edit_operation;

bool Editor::EditOpPerformer::doEdit(cel& content, const Step& step, cel::IdMap& copied,
                                     cel::Splits& splits) const {
    const cel::Range all(0, step.length);
    switch (step.core) {
    case kCoreReplace:
        return content.replace(step.part.get(), all, step.at, copied, m_op == Op::ReplaceMaterial, &splits);
    case kCoreInsert:
        return content.insert(step.part.get(), all, step.at, copied, &splits);
    case kCoreRemove:
        return content.remove({step.at, step.end()}, &splits);
    default:
        herc_printf("EditOpPerformer::doEdit() : Unhandled EditOperation\n");
        return false;
    }
}

void Editor::EditOpPerformer::doLevels(AudLevelsCel& content, const Step& step) {
    if (!content.valid() || !step.withLevels) {
        return;
    }
    if (step.core == kCoreReplace) {
        content.replace(step.levels, step.levelsRange, step.at);
    } else if (step.core == kCoreInsert) {
        content.insert(step.levels, step.levelsRange, step.at);
    } else if (step.core == kCoreRemove) {
        content.remove({step.at, step.end()});
    }
}

/// Makes the plan's changes, in order, and sees to what hangs on the events.
void Editor::makeChanges(edit_operation op, CueFollower& cues, ObjectFollower& objects) {
    const EditOpPerformer performer(op, {m_plan->at, m_plan->at + m_plan->length});
    const Edit& edit = *m_destination.getEdit();
    for (const Step& step : m_plan->steps) {
        const Target& target = m_plan->targets[step.target];
        cel* const content = celOf(target.chan);
        if (content == nullptr) {
            continue; // a channel that could not be added; `autoAddTracks` has reported it
        }
        const double end = content->get_end_time();
        if (step.core != kCoreRemove && editing_detail::isContinuous(target.type)) {
            content->fillToTime(step.at);
        }
        objects.beforeStep(*content, step);
        cel::IdMap copied;
        cel::Splits splits;
        if (!performer.doEdit(*content, step, copied, splits)) {
            ole_splat("Editor: a step of %s that was checked failed\n", editOperationName(op).data());
            continue;
        }
        AudLevelsCel levels = edit.getLevelsCel(target.levels);
        EditOpPerformer::doLevels(levels, step);
        objects.afterStep(*content, step, copied, splits);
        cues.noteCopies(target.chan, copied);
        noteTouched(target.chan, {std::min(step.at, end), step.core == kCoreRemove ? step.at : step.end()});
    }
}
