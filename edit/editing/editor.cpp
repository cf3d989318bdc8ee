#include "edit/editing/editor.h"

#include "edit/editing/detail/cue_follower.h"
#include "edit/editing/detail/object_follower.h"
#include "edit/manager/edit_manager.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit_keys.h"
#include "platform/services/config_int.h"
#include "platform/services/log.h"

#include <mutex>

namespace {

/// Tells the edit's observers of channels that were added, a message for each kind.
void sendChannelsAdded(Edit& edit, Edit_Chan_Type type, int count) {
    if (count > 0) {
        edit.notify(
            {Edit::getChanAddedNotifyMsgType(), String::format("%s %d %d %d", edit.get_cookie_str().c_str(),
                                                               static_cast<int>(type), NO_CHAN, count)});
    }
}

} // namespace

Editor::Editor(unsigned flags) : m_flags(flags) {}

Editor::~Editor() = default;

Editor::Result Editor::apply(const EditModule& source, const EditModule& destination, edit_operation op,
                             unsigned flags) {
    return Editor(flags).applyInternal(source, destination, op);
}

bool Editor::wasClipboardUsed(const EditPtr& edit) {
    return edit.valid() && EditKeys::kClipboardUsed.get(edit->Opts()) != 0;
}

Editor::Result Editor::applyInternal(const EditModule& source, const EditModule& destination,
                                     edit_operation op) {
    Result result;
    if (!checkMarks(destination)) {
        result.m_status = Qx::Status::failure(Qx::StatusCode::BadArgument, "there is no destination edit");
        return result;
    }
    m_destination = destination;
    Edit& edit = *m_destination.getEdit();
    // Whoever saves edits on another thread waits until this one is whole again.
    const std::lock_guard<criticalSection> hold(edit.section());
    const int numChans = edit.getNumChans();
    if (!doPreEditTasks(source, op)) {
        result.m_status = m_refusal;
        return result;
    }
    if (editOpRequiresSourceAndDest(op)) {
        performEdit(source, op, result);
    } else {
        performEdit(op, result);
    }
    result.m_type = edit.getNumChans() == numChans ? m_type : kChansInserted;
    for (const String* const notice : {&m_notice, &m_effectsNotice, &m_clipboardNotice}) {
        result.m_notice += (result.m_notice.empty() || notice->empty() ? "" : "; ") + *notice;
    }
    doPostEditTasks(result);
    return result;
}

/// The operation goes on without the clipboard, and says so.
void Editor::tellOfClipboard(const char* what) {
    const String text =
        "the clipboard " + clipboard_cookie.asString() + " cannot " + what + " and is left as it is";
    herc_printf("Editor: %s\n", text.c_str());
    m_clipboardNotice = text;
}

/// Finds every reason to refuse, backs up, and adds the channels that are missing.
bool Editor::doPreEditTasks(const EditModule& source, edit_operation op) {
    m_source = editOpRequiresSourceAndDest(op) ? source.getEdit() : m_destination.getEdit();
    if (!makePlan(source, op)) {
        return false;
    }
    m_clipboardReady = editOpRequiresClipboard(op) && (m_flags & (KeepClipboard | NoBackup)) == 0 &&
                       !m_destination.getEdit()->get_cookie().isClipboard() &&
                       !m_source->get_cookie().isClipboard() && edit_manager::theEditManager() != nullptr;
    // Observers are told of the backup and may change the edit: what was planned before would be out of date.
    if (!backUp() || !makePlan(source, op)) {
        return false;
    }
    autoAddTracks();
    return true;
}

bool Editor::makePlan(const EditModule& source, edit_operation op) {
    m_destination.verify();
    Planner planner(source, m_destination, op, m_flags);
    m_plan = planner.plan();
    m_refusal = planner.refusal();
    m_notice = m_plan != nullptr ? planner.notice(*m_plan) : String();
    return m_plan != nullptr;
}

bool editing_detail::makeRevision(const EditPtr& edit, Qx::Status& refusal) {
    const cookie item = edit->get_cookie();
    const bool managed = edit_manager::theEditManager() != nullptr && edit_manager::get_present(item) &&
                         edit_manager::openEdit(item, eOpenExisting) == edit;
    if (managed) {
        if (const Qx::Status kept = edit_manager::backup_edit(item); !kept) {
            refusal = kept.retold("the edit " + item.asString() +
                                  " cannot be backed up, so nothing was changed: " + kept.reason());
            return false;
        }
    }
    return true;
}

bool Editor::backUp() {
    if ((m_flags & NoBackup) == 0 && !editing_detail::makeRevision(m_destination.getEdit(), m_refusal)) {
        return false;
    }
    const bool together = config_int("undo_clipboard", 1) != 0;
    if (m_clipboardReady && together) {
        const bool opens = openClipboard().valid();
        if (!opens || !edit_manager::backup_edit(clipboard_cookie)) {
            tellOfClipboard(opens ? "be backed up" : "be opened");
            m_clipboardReady = false;
        }
    }
    return true;
}

/// The two-module form: the source's content comes into the destination.
void Editor::performEdit(const EditModule& source, edit_operation op, Result& result) {
    if (!source.getEdit()->isEmpty()) {
        autoCreateTrackGroups(source);
    }
    perform(op, result);
}

/// The one-module form: the destination's own content, which the plan has taken out already.
void Editor::performEdit(edit_operation op, Result& result) {
    perform(op, result);
}

void Editor::perform(edit_operation op, Result& result) {
    doClipboardEditing(op);
    autoAddLevels();
    CueFollower cues(*m_destination.getEdit(), *m_plan, op);
    ObjectFollower objects(*m_destination.getEdit(), *m_plan, op,
                           m_source == m_destination.getEdit() ? nullptr : &m_map);
    makeChanges(op, cues, objects);
    cues.follow();
    padTracksWithBlack(op);
    simplifyBlack();
    objects.finish();
    m_effectsNotice = objects.notice();
    m_destination.getEdit()->get_cues().update_edit_time();
    verifyTracks();
    m_destination.getEdit()->verifyAudioNodes();
    result.m_syncLoss = recordInterTrackSyncLosses();
    result.m_curTime = m_plan->current;
    result.m_markValid = !editOpAffectsTrackSync(op);
    m_type = editModificationOf(op);
}

/// Announces what was done: once, with everything in place.
void Editor::doPostEditTasks(Result& result) {
    Edit& edit = *m_destination.getEdit();
    EditModification change(result.m_type);
    change.setSpan(m_plan->at, m_plan->length);
    int added[2] = {0, 0};
    for (const IdStamp& chan : m_added) {
        ++added[edit.getChanType(chan) == AudioChan ? 1 : 0];
    }
    if (result.m_type == kChansInserted) {
        const int numAdded = static_cast<int>(m_added.size() + m_numLevelsAdded);
        const IdStamp first = m_added.empty() ? m_firstLevelsAdded : m_added.front();
        change.setChan(first).setChans(edit.getIdx(first), numAdded);
    } else if (m_plan->targets.size() == 1) {
        change.setChan(m_plan->targets.front().chan);
    }
    sendChannelsAdded(edit, VideoChan, added[0]);
    sendChannelsAdded(edit, AudioChan, added[1]);
    edit.setChangeDescription(change, true);
    for (const Target& target : m_plan->targets) {
        if (target.type.type == AudioChan && edit.is_original()) {
            edit.notifyShotSoundAltered(target.chan);
        }
    }
}

cel* Editor::celOf(const IdStamp& chan) const {
    const Edit& edit = *m_destination.getEdit();
    return edit.get_edit_cel_p(edit.getIdx(chan));
}
