// Measures of what is done with the events of channels in memory.

#include "bench/fixed_sequence.h"
#include "bench/measuring.h"
#include "edit/model/cel_event_pair.h"

using namespace bench;

namespace {

const EditPtr& builtEdit(int64_t n) {
    static std::map<int64_t, EditPtr> edits;
    EditPtr& edit = edits[n];
    if (!edit.valid()) {
        edit = FixedSequence::of(n).build();
    }
    return edit;
}

void build(benchmark::State& state) {
    const FixedSequence& sequence = FixedSequence::of(state.range(0));
    for (auto _ : state) {
        EditPtr edit;
        state.SetIterationTime(secondsOf([&] { edit = sequence.build(); }));
    }
}
BENCHMARK(build)->Apply(allSizesTimed);

void find(benchmark::State& state) {
    const FixedSequence& sequence = FixedSequence::of(state.range(0));
    const EditPtr& edit = builtEdit(state.range(0));
    const cel* cels[FixedSequence::kNumChannels] = {};
    for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
        cels[channel] = &celOf(edit, channel);
    }
    const Query* const queries = sequence.queries().data();
    const size_t mask = sequence.queries().size() - 1;
    size_t next = 0;
    for (auto _ : state) {
        const Query& query = queries[next++ & mask];
        const ce_handle found = cels[query.channel]->find_ceh(query.time, CE_IN_POINT);
        benchmark::DoNotOptimize(found.index());
    }
}
BENCHMARK(find)->Apply(allSizes);

void walk(benchmark::State& state) {
    const EditPtr& edit = builtEdit(state.range(0));
    for (auto _ : state) {
        double sum = 0;
        for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
            cel& content = celOf(edit, channel);
            for (CelEventPair pair(edit, &content, content.get_start_ceh()); pair.valid(); ++pair) {
                sum += pair.editTime() + pair.endEditTime();
            }
        }
        benchmark::DoNotOptimize(sum);
    }
}
BENCHMARK(walk)->Apply(allSizes);

void walkHandles(benchmark::State& state) {
    const EditPtr& edit = builtEdit(state.range(0));
    for (auto _ : state) {
        double sum = 0;
        for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
            for (ce_handle at = celOf(edit, channel).get_start_ceh(); at.valid() != 0;
                 at.increment(CE_IN_POINT)) {
                sum += at.get_edit_time() + at.matching_out_ceh().get_edit_time();
            }
        }
        benchmark::DoNotOptimize(sum);
    }
}
BENCHMARK(walkHandles)->Name("walk_handles")->Apply(allSizes);

void deepCopy(benchmark::State& state) {
    const EditPtr& edit = builtEdit(state.range(0));
    for (auto _ : state) {
        EditPtr copied;
        state.SetIterationTime(secondsOf([&] { copied = edit->copy(); }));
    }
}
BENCHMARK(deepCopy)->Name("deep_copy")->Apply(allSizesTimed);

/// The whole price of a copy, which puts off most of its work: copied, and then a change to every channel.
void copyAndChange(benchmark::State& state) {
    const EditPtr& edit = builtEdit(state.range(0));
    for (auto _ : state) {
        EditPtr copied;
        state.SetIterationTime(secondsOf([&] {
            copied = edit->copy();
            for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
                celOf(copied, channel).get_start_ceh().set_dmod_code(1);
            }
        }));
    }
}
BENCHMARK(copyAndChange)->Name("copy_and_change")->Apply(allSizesTimed);

enum class Change { Replace, Insert, Remove };

void apply(Change change, cel& content, const cel& laid, double at) {
    cel::IdMap ids;
    const cel::Range whole(0, FixedSequence::kEditLength);
    switch (change) {
    case Change::Replace:
        content.replace(&laid, whole, at, ids);
        break;
    case Change::Insert:
        content.insert(&laid, whole, at, ids);
        break;
    case Change::Remove:
        content.remove({at, at + FixedSequence::kEditLength});
        break;
    }
}

/// So often a channel is changed before the next round starts from the sequence again: not past its end.
size_t numRounds(int64_t n) {
    return n <= 100 ? 10 : 64;
}

void bareOne(benchmark::State& state, Change change) {
    const FixedSequence& sequence = FixedSequence::of(state.range(0));
    const EditPtr insertion = FixedSequence::buildInsertion();
    const cel& fresh = celOf(builtEdit(state.range(0)), sequence.shortestChannel());
    const cel& laid = celOf(insertion, 0);
    std::unique_ptr<cel> content;
    size_t k = 0;
    for (auto _ : state) {
        if (k % numRounds(state.range(0)) == 0) {
            content = fresh.copy();
            k = 0;
        }
        const double at = sequence.place(k++);
        state.SetIterationTime(secondsOf([&] { apply(change, *content, laid, at); }));
    }
}
BENCHMARK_CAPTURE(bareOne, replace, Change::Replace)->Name("bare_replace_one")->Apply(allSizesTimed);
BENCHMARK_CAPTURE(bareOne, insert, Change::Insert)->Name("bare_insert_one")->Apply(allSizesTimed);
BENCHMARK_CAPTURE(bareOne, remove, Change::Remove)->Name("bare_remove_one")->Apply(allSizesTimed);

void bareAll(benchmark::State& state, Change change) {
    const FixedSequence& sequence = FixedSequence::of(state.range(0));
    const EditPtr insertion = FixedSequence::buildInsertion();
    EditPtr edit;
    size_t k = 0;
    for (auto _ : state) {
        if (k % numRounds(state.range(0)) == 0) {
            edit = builtEdit(state.range(0))->copy();
            k = 0;
        }
        const double at = sequence.place(k++);
        state.SetIterationTime(secondsOf([&] {
            for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
                apply(change, celOf(edit, channel), celOf(insertion, channel), at);
            }
        }));
    }
}
BENCHMARK_CAPTURE(bareAll, replace, Change::Replace)->Name("bare_replace_all")->Apply(allSizesTimed);
BENCHMARK_CAPTURE(bareAll, insert, Change::Insert)->Name("bare_insert_all")->Apply(allSizesTimed);
BENCHMARK_CAPTURE(bareAll, remove, Change::Remove)->Name("bare_remove_all")->Apply(allSizesTimed);

} // namespace
