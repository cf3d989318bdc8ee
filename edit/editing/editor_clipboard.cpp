#include "edit/editing/detail/edit_plan.h"
#include "edit/manager/edit_manager.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit_keys.h"
#include "platform/effects/orphaned_component_list.h"
#include "platform/services/log.h"

#include <algorithm>
#include <mutex>

using editing_detail::isContinuous;
using editing_detail::makePart;

namespace {

/// Takes out what the clipboard holds, with the objects bound to its events.
void clearClipboard(Edit& clipboard) {
    clipboard.get_cues().delete_all_cues();
    for (const String& name : clipboard.objectStore().names()) {
        const IdStamp id{std::string_view(name)};
        const bool isOfEvent = id.valid() && (id.getMagicType() == IdStampMagic::Material ||
                                              id.getMagicType() == IdStampMagic::EffectNode);
        if (isOfEvent || name == OrphanedComponentList::Id) {
            clipboard.objectStore().removeObject(name);
        }
    }
    clipboard.removeChans(false);
}

/// What is bound to events that were put into the clipboard; it is copied when all channels are there.
struct Kept {
    IdStamp chan;
    std::vector<EventObjects::Bound> bound;
};

/// Binds copies of what the edit has for them to the events of the clipboard.
void copyEffects(Edit& edit, Edit& clipboard, const std::vector<Kept>& kept, const StampMap& channels) {
    for (const Kept& part : kept) {
        const cel* const content = clipboard.get_edit_cel_p(clipboard.getIdx(part.chan));
        cel::IdMap same;
        for (const EventObjects::Bound& event : part.bound) {
            same.emplace(event.id, event.id);
        }
        if (content == nullptr || same.empty()) {
            continue;
        }
        EventObjects::bindCopies(edit.objectStore(), part.bound, clipboard.objectStore(),
                                 {*content, {content->get_start_time(), content->get_end_time()}}, same,
                                 channels);
        for (const EventObjects::Bound& event : part.bound) {
            static_cast<void>(EventObjects::unwireMissing(clipboard, event.id));
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
    std::vector<Kept> bound;
    StampMap channels;
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
        editing_detail::WholeEnds ends;
        if (isContinuous(target.type)) {
            ends = editing_detail::wholeEnds(*events, {from, to}, edit.objectStore());
        }
        const std::shared_ptr<cel> part = makePart(ends.channel != nullptr ? ends.channel.get() : events,
                                                   {from, to}, isContinuous(target.type));
        if (part == nullptr || !content->weld(part.get(), start)) {
            continue;
        }
        const IdStamp kept = setCel(*clipboard, target.type, std::move(content));
        Kept& its = bound.emplace_back(Kept{kept, {}});
        EventObjects::listBound(*events, edit.objectStore(), {from, to}, its.bound);
        for (EventObjects::Bound& event : its.bound) {
            event.range = {event.range.start() - m_plan->at, event.range.end() - m_plan->at};
        }
        channels[target.chan] = kept;
        const AudLevelsCel levels = edit.getLevelsCel(target.levels);
        if (kept.valid() && !levels.is_dummy()) {
            AudLevelsCel copy = AudLevelsCel::create();
            copy.replace(levels, {from, to}, start);
            clipboard->addLevelsChan(kept, copy, false);
        }
    }
    copyEffects(edit, *clipboard, bound, channels);
    if (clipboard->getNumChans() == 0) {
        // Nothing was there; an edit without channels cannot be stored.
        setCel(*clipboard, {VideoChan, Edit_Chan_SubType::NONE}, nullptr);
    }
    EditKeys::kClipboardUsed.set(edit.Opts(), 1);
    clipboard->setChangeDescription(editModificationOf(op), true);
}
