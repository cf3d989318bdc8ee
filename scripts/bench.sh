#!/usr/bin/env bash
# Runs the benchmarks and shows what they say against the machine's own limits: ./run bench [--quick]
# The figures go to build/bench/results.json, the chart to build/bench/chart.svg.
set -u
cd "$(dirname "${BASH_SOURCE[0]}")/.." || exit 1
. scripts/prepare.sh

# Every measure and limit takes its turn three times, in random order, so that a busy moment of the machine hits all
# alike; the median counts.
repetitions=3 least=0.05
case ${1-} in
    "") ;;
    --quick) repetitions=1 least=0.01 ;;
    *) fail "There is no option ${1}. Use: ./run bench [--quick]" ;;
esac

# shellcheck disable=SC2086
need $BUILD_PACKAGES $BENCH_PACKAGES
build release "Building the benchmarks" "-DQUILLMARCH_TESTS=OFF -DQUILLMARCH_BENCH=ON" quillmarch_bench bench_report qmedit

programs=$PWD/build/release/bench
mkdir -p build/bench && cd build/bench || exit 1
rm -rf bench-work.??????   # of a run that was killed
say "Measuring; this takes a minute. A quiet machine gives the clearest figures."
"$programs/quillmarch_bench" --benchmark_out=results.json --benchmark_out_format=json \
    --benchmark_repetitions=$repetitions --benchmark_min_time=$least --benchmark_enable_random_interleaving=true ||
    fail "A measure failed; the lines above say which."
"$programs/report/report" results.json --svg chart.svg || exit 1
say ""
say "The figures: build/bench/results.json. The chart: build/bench/chart.svg."
