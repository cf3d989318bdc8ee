#include "edit/editing/detail/edit_plan.h"

unsigned autoInitAudioTracks(EditModule& module) {
    const EditPtr& edit = module.getEdit();
    if (!edit.valid() || !editing_detail::isWritable(*edit)) {
        return 0;
    }
    Vector<IdStamp> chans;
    module.getSelectedChans(chans, AudioChan, Edit_Chan_SubType::ANY);
    const double end = edit->getEndTime();
    unsigned filled = 0;
    for (const IdStamp& chan : chans) {
        cel* const content = edit->get_edit_cel_p(edit->getIdx(chan));
        filled += content != nullptr && content->fillToTime(end) ? 1 : 0;
    }
    if (filled > 0) {
        edit->set_dirty(true);
    }
    return filled;
}

unsigned autoInitAudioLevelsTracks(EditModule& module) {
    const EditPtr& edit = module.getEdit();
    if (!edit.valid() || !editing_detail::isWritable(*edit)) {
        return 0;
    }
    Vector<IdStamp> chans;
    module.getSelectedChans(chans, AudioChan, Edit_Chan_SubType::ANY);
    unsigned changed = 0;
    for (const IdStamp& chan : chans) {
        AudLevelsCel levels = editing_detail::levelsOf(*edit, chan);
        const bool done = levels.valid() ? levels.checkNodesRevision(edit->getAudCel(chan))
                                         : editing_detail::addLevels(*edit, chan).valid();
        changed += done ? 1 : 0;
    }
    if (changed > 0) {
        edit->set_dirty(true);
    }
    return changed;
}
