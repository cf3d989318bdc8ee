// Measures of the edit's file: saving, loading, the legacy text, and the memory that a loaded edit takes.

#include "bench/fixed_sequence.h"
#include "bench/measuring.h"
#include "bench/unsynced_files.h"
#include "bench/work_folder.h"
#include "platform/services/files.h"

#include <fstream>
#include <malloc.h>
#include <unistd.h>

using namespace bench;

namespace {

cookie itemOf(int64_t n) {
    return {Cookie_Type::Edit, static_cast<int>(n), 1};
}

String fileOf(int64_t n) {
    return workPath(itemOf(n).asString() + ".qme");
}

/// An edit of the sequence that has a file.
const EditPtr& savedEdit(int64_t n) {
    static std::map<int64_t, EditPtr> edits;
    EditPtr& edit = edits[n];
    if (!edit.valid()) {
        edit = FixedSequence::of(n).build();
        edit->set_cookie(itemOf(n));
        edit->write_file(Qx::widen(fileOf(n)));
    }
    return edit;
}

/// A save of an edit in which every channel was changed.
void save(benchmark::State& state) {
    const EditPtr& edit = savedEdit(state.range(0));
    const WString path = Qx::widen(fileOf(state.range(0)));
    settleDisk();
    for (auto _ : state) {
        for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
            celOf(edit, channel).setChanged(true);
        }
        edit->set_dirty(true);
        bool written = false;
        state.SetIterationTime(secondsOf([&] { written = edit->write_file(path); }));
        if (failed(state, !written, edit->lastFileError())) {
            break;
        }
    }
}
BENCHMARK(save)->Name("save_durable")->Apply(allSizesOften);

void saveFast(benchmark::State& state) {
    const UnsyncedFiles unsynced;
    save(state);
}
BENCHMARK(saveFast)->Name("save_fast")->Apply(allSizesOften);

void load(benchmark::State& state) {
    static_cast<void>(savedEdit(state.range(0)));
    const WString path = Qx::widen(fileOf(state.range(0)));
    settleDisk();
    for (auto _ : state) {
        EditPtr edit;
        state.SetIterationTime(secondsOf([&] { edit = EditPtr(new Edit(path, eOpenExisting)); }));
        if (failed(state, edit->isBad(), edit->lastFileError())) {
            break;
        }
    }
}
BENCHMARK(load)->Apply(allSizesOften);

/// Bytes of memory that the program has in use, as the system counts them in pages. What the heap could give
/// back is given back first, so that none of it is taken for new.
size_t residentBytes() {
    ::malloc_trim(0);
    size_t total = 0;
    size_t resident = 0;
    std::ifstream("/proc/self/statm") >> total >> resident;
    return resident * static_cast<size_t>(::sysconf(_SC_PAGESIZE));
}

/// What a loaded edit takes. Only a large one makes a figure: the system counts in pages.
void memory(benchmark::State& state) {
    static_cast<void>(savedEdit(state.range(0)));
    const WString path = Qx::widen(fileOf(state.range(0)));
    double held = 0;
    for (auto _ : state) {
        const size_t before = residentBytes();
        EditPtr edit;
        state.SetIterationTime(secondsOf([&] { edit = EditPtr(new Edit(path, eOpenExisting)); }));
        held = static_cast<double>(residentBytes()) - static_cast<double>(before);
        if (failed(state, edit->isBad(), edit->lastFileError())) {
            break;
        }
    }
    state.counters["bytes_per_event"] =
        held / static_cast<double>(FixedSequence::of(state.range(0)).numEvents());
}
BENCHMARK(memory)->Arg(10000)->UseManualTime()->Iterations(1);

void legacyExport(benchmark::State& state) {
    const EditPtr& edit = savedEdit(state.range(0));
    const WString path = Qx::widen(workPath(itemOf(state.range(0)).asString() + ".ed2"));
    const UnsyncedFiles unsynced;
    settleDisk();
    for (auto _ : state) {
        if (failed(state, !edit->writeToLegacyFile(path), edit->lastFileError())) {
            break;
        }
    }
}
BENCHMARK(legacyExport)->Name("legacy_export")->Apply(allSizes)->Unit(benchmark::kMillisecond);

void legacyImport(benchmark::State& state) {
    const EditPtr& edit = savedEdit(state.range(0));
    const WString path = Qx::widen(workPath(itemOf(state.range(0)).asString() + ".ed2"));
    if (failed(state, !edit->writeToLegacyFile(path), edit->lastFileError())) {
        return;
    }
    for (auto _ : state) {
        EditPtr read;
        state.SetIterationTime(secondsOf([&] { read = EditPtr(new Edit(path, eOpenExisting)); }));
        if (failed(state, read->isBad(), read->lastFileError())) {
            break;
        }
    }
}
BENCHMARK(legacyImport)->Name("legacy_import")->Apply(allSizesTimed);

} // namespace
