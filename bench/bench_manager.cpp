// Measures of the manager: opening what is cached, revisions, and editing operations with their backups.

#include "bench/fixed_sequence.h"
#include "bench/measuring.h"
#include "bench/open_items.h"
#include "bench/projects.h"
#include "bench/work_folder.h"
#include "edit/editing/editor.h"
#include "edit/manager/edit_manager.h"

using namespace bench;

namespace {

/// An edit of the sequence that the manager has, its file written and its backups gone.
EditPtr freshEdit(int64_t n) {
    enterProject(Project::Few);
    const cookie item(Cookie_Type::Edit, static_cast<int>(n), 2);
    edit_manager::delete_edit_file_and_backups(item, true);
    EditPtr edit(item, eOpenOrCreate);
    const FixedSequence& sequence = FixedSequence::of(n);
    for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
        edit->addChan(channel < FixedSequence::kNumVideo ? VideoChan : AudioChan, nullptr, false);
        sequence.append(channel, celOf(edit, channel));
    }
    edit->set_dirty(true);
    edit_manager::flush_edit(item);
    return edit;
}

void cachedOpen(benchmark::State& state) {
    // The threads wait for each other before the first round.
    if (state.thread_index() == 0) {
        enterProject(Project::Few);
        for (int i = 0; i < kNumOpenEdits; ++i) {
            const EditPtr edit(openItem(i), eOpenOrCreate);
        }
    }
    int next = state.thread_index();
    for (auto _ : state) {
        const EditPtr edit(openItem(next++ % kNumOpenEdits), eOpenExisting);
        benchmark::DoNotOptimize(edit.valid());
    }
}
BENCHMARK(cachedOpen)->Name("cached_open");
BENCHMARK(cachedOpen)->Name("cached_open_8")->Threads(8)->UseRealTime();

/// A small change to every channel, as an edit makes it.
void touchChannels(const EditPtr& edit) {
    for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
        ce_handle at = celOf(edit, channel).get_start_ceh();
        at.set_dmod_code(at.get_dmod_code() + 1);
    }
    edit->setChangeDescription(EditModification(kEventsChanged), true);
}

void backup(benchmark::State& state) {
    EditPtr edit = freshEdit(state.range(0));
    settleDisk();
    for (auto _ : state) {
        touchChannels(edit);
        bool done = false;
        state.SetIterationTime(
            secondsOf([&] { done = edit_manager::backup_edit(edit->get_cookie()).isOk(); }));
        if (failed(state, !done, "the edit could not be backed up")) {
            break;
        }
    }
}
BENCHMARK(backup)->Apply(allSizesOften);

/// Undo of a change that is not yet written, or redo of it.
void step(benchmark::State& state, bool redo) {
    EditPtr edit = freshEdit(state.range(0));
    const cookie item = edit->get_cookie();
    settleDisk();
    for (auto _ : state) {
        bool done = edit_manager::backup_edit(item).isOk();
        touchChannels(edit);
        edit.invalidate();
        const double undone = secondsOf([&] { done = edit_manager::undoRequest(item) && done; });
        double redone = 0;
        if (redo) {
            redone = secondsOf([&] { done = edit_manager::redoRequest(item) && done; });
        }
        state.SetIterationTime(redo ? redone : undone);
        edit = EditPtr(item, eOpenExisting);
        if (failed(state, !done || !edit.valid(), "the edit could not be backed up, undone or redone")) {
            break;
        }
    }
}
BENCHMARK_CAPTURE(step, undo, false)->Name("undo")->Apply(allSizesOften);
BENCHMARK_CAPTURE(step, redo, true)->Name("redo")->Apply(allSizesTimed);

/// An operation on all channels through the editor, marks and plan, clipboard and announcement included.
void applied(benchmark::State& state, edit_operation op, unsigned flags) {
    const FixedSequence& sequence = FixedSequence::of(state.range(0));
    EditModule source(FixedSequence::buildInsertion());
    source.markAllAt({0, FixedSequence::kEditLength});
    const size_t rounds = state.range(0) <= 100 ? 10 : 64;
    EditPtr edit;
    size_t k = 0;
    settleDisk();
    for (auto _ : state) {
        if (k % rounds == 0) {
            edit = freshEdit(state.range(0));
            k = 0;
        }
        EditModule destination(edit);
        const double at = sequence.place(k++);
        destination.markAllAt({at, at + FixedSequence::kEditLength});
        String reason;
        state.SetIterationTime(secondsOf([&] {
            const Editor::Result result = Editor::apply(source, destination, op, flags);
            reason = result.reason();
        }));
        if (failed(state, !reason.empty(), reason)) {
            break;
        }
    }
}
BENCHMARK_CAPTURE(applied, replace, edit_operation::Replace, 0U)->Name("apply_replace")->Apply(allSizesTimed);
BENCHMARK_CAPTURE(applied, insert, edit_operation::Insert, 0U)->Name("apply_insert")->Apply(allSizesTimed);
BENCHMARK_CAPTURE(applied, remove, edit_operation::Remove, 0U)->Name("apply_remove")->Apply(allSizesTimed);
BENCHMARK_CAPTURE(applied, replace_bare, edit_operation::Replace, Editor::NoBackup)
    ->Name("apply_replace_no_backup")
    ->Apply(allSizesTimed);
BENCHMARK_CAPTURE(applied, insert_bare, edit_operation::Insert, Editor::NoBackup)
    ->Name("apply_insert_no_backup")
    ->Apply(allSizesTimed);
BENCHMARK_CAPTURE(applied, remove_bare, edit_operation::Remove, Editor::NoBackup)
    ->Name("apply_remove_no_backup")
    ->Apply(allSizesTimed);

} // namespace
