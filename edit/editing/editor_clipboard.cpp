#include "edit/editing/detail/edit_plan.h"
#include "edit/manager/edit_manager.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit_keys.h"
#include "platform/services/log.h"

#include <algorithm>
#include <mutex>

using editing_detail::isContinuous;
using editing_detail::makePart;

namespace {

/// Takes out what the clipboard holds, with the objects bound to its events.
void clearClipboard(Edit& clipboard) {
    clipboard.removeChans(false);
    clipboard.get_cues().delete_all_cues();
    for (const String& name : clipboard.objectStore().names()) {
        if (IdStamp(name).valid() && IdStamp(name).getMagicType() == IdStampMagic::Material) {
            clipboard.objectStore().removeObject(name);
        }
    }
}

/// Binds copies of the objects of a cel's events in another edit.
void copyEffects(const cel& events, TagBag& from, TagBag& to) {
    for (int i = 0; i < events.numEvents() && from.getNumObjects() > 0; ++i) {
        const String name = events.getChanEventPtr(i)->id.asString();
        const Streamable* const object = from.contains(name) ? from.openObject(name) : nullptr;
        if (object != nullptr) {
            to.storeObject(name, object->clone());
        }
    }
}

} // namespace

/// The clipboard edit, made if the project has none; null if that is not possible. That it was looked for
/// once and not there is remembered and answers every opening; it must not keep it from being made.
EditPtr Editor::openClipboard() {
    EditPtr clipboard(clipboard_cookie, eOpenOrCreate);
    if (!clipboard.valid() && edit_manager::invalidateCache(clipboard_cookie)) {
        clipboard = EditPtr(clipboard_cookie, eOpenOrCreate);
    }
    return clipboard;
}

/// Puts what the operation takes away or overwrites into the clipboard edit: a channel for each that is
/// changed, the earliest region at time 0.
void Editor::doClipboardEditing(edit_operation op) {
    Edit& edit = *m_destination.getEdit();
    const EditPtr clipboard = m_clipboardReady ? openClipboard() : EditPtr();
    if (!clipboard.valid() || !editing_detail::isWritable(*clipboard)) {
        if (m_clipboardReady) {
            tellOfClipboard(clipboard.valid() ? "be written" : "be opened");
        }
        return;
    }
    const std::lock_guard<criticalSection> hold(clipboard->section());
    clearClipboard(*clipboard);
    clipboard->setFrameRate(edit.getFrameRate());
    for (size_t i = 0; i < m_plan->targets.size(); ++i) {
        const Target& target = m_plan->targets[i];
        const cel* const events = celOf(target.chan);
        double from = Qx::kNoTime;
        double to = 0;
        for (const Step& step : m_plan->steps) {
            if (step.target == i) {
                from = std::min(from, step.at);
                to = std::max(to, step.end());
            }
        }
        to = events != nullptr ? std::min(to, events->get_end_time()) : 0;
        if (!(to - from > Qx::kTimeTolerance)) {
            continue;
        }
        auto content = std::make_unique<cel>();
        const double start = from - m_plan->at;
        if (isContinuous(target.type)) {
            content->fillToTime(start);
        }
        const std::shared_ptr<cel> part = makePart(events, {from, to}, isContinuous(target.type));
        if (part == nullptr || !content->weld(part.get(), start)) {
            continue;
        }
        copyEffects(*part, edit.objectStore(), clipboard->objectStore());
        const IdStamp kept = setCel(*clipboard, target.type, std::move(content));
        const AudLevelsCel levels = edit.getLevelsCel(target.levels);
        if (kept.valid() && !levels.is_dummy()) {
            AudLevelsCel copy = AudLevelsCel::create();
            copy.replace(levels, {from, to}, start);
            clipboard->addLevelsChan(kept, copy, false);
        }
    }
    if (clipboard->getNumChans() == 0) {
        // Nothing was there; an edit without channels cannot be stored.
        setCel(*clipboard, {VideoChan, Edit_Chan_SubType::NONE}, nullptr);
    }
    EditKeys::kClipboardUsed.set(edit.Opts(), 1);
    clipboard->setChangeDescription(editModificationOf(op), true);
}
