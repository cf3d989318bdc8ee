#pragma once

#include <benchmark/benchmark.h>

#include <chrono>

namespace bench {

/// Seconds that a piece of work takes.
template <typename Work>
double secondsOf(Work&& work) {
    const auto start = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

/// Gives a measure the three sizes, in clips a channel.
inline void allSizes(benchmark::internal::Benchmark* measure) {
    measure->Arg(100)->Arg(1000)->Arg(10000);
}

/// The same for a measure that takes the time of a part of each round itself.
inline void allSizesTimed(benchmark::internal::Benchmark* measure) {
    allSizes(measure);
    measure->UseManualTime();
}

/// The same for one whose times vary, with the disk or with the memory that the system has: more rounds.
inline void allSizesOften(benchmark::internal::Benchmark* measure) {
    allSizesTimed(measure);
    measure->MinTime(0.2);
}

/// Ends a measure whose library call failed, with what it said.
inline bool failed(benchmark::State& state, bool failure, const std::string& why) {
    if (failure) {
        state.SkipWithError(why.c_str());
    }
    return failure;
}

} // namespace bench
