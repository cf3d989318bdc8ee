#!/usr/bin/env bash
# Fuzzes every target for a number of seconds (default 60) under the address and undefined-behaviour sanitizers,
# two at a time, from the seeds in fuzz/corpus. What a run finds is kept in build/fuzz/found.
set -u
cd "$(dirname "${BASH_SOURCE[0]}")/.." || exit 1
. scripts/prepare.sh
seconds=${1:-60}

# shellcheck disable=SC2086
need $BUILD_PACKAGES $TEST_PACKAGES clang libclang-rt-14-dev
mkdir -p build/fuzz/found
say "Building the fuzz targets"
if ! { CXX=clang++ cmake --preset asan -B build/fuzz -DQUILLMARCH_FUZZ=ON -DQUILLMARCH_UNITY=ON -DQUILLMARCH_TOOLS=ON -DQUILLMARCH_TESTS=ON &&
        cmake --build build/fuzz -j "$(jobs)" --target fuzz_targets; } >build/fuzz.log 2>&1; then
    tail -n 40 build/fuzz.log >&2
    fail "The fuzz targets could not be built; the lines above and build/fuzz.log say why."
fi

one() {
    local name=$1 seconds=$2 log=build/fuzz/$1.log work
    work=$(mktemp -d)
    if build/fuzz/fuzz/fuzz_"$name" -seed=20261121 -max_total_time="$seconds" -timeout=20 -rss_limit_mb=2048 \
            -artifact_prefix=build/fuzz/found/"$name"- "$work" fuzz/corpus/"$name" >"$log" 2>&1; then
        printf '%-14s %s\n' "$name" "$(grep -oE 'Done [0-9]+ runs in [0-9]+ second' "$log" | tail -n 1)s" >&2
    else
        tail -n 25 "$log" >&2
        printf '%-14s FOUND SOMETHING; its input is in build/fuzz/found\n' "$name" >&2
        rm -rf "$work"
        return 1
    fi
    rm -rf "$work"
}
export -f one

names=$(sed -nE 's/^quillmarch_fuzz\(([a-z0-9_]+).*/\1/p' fuzz/targets.cmake)
say "Fuzzing $(echo "$names" | wc -l) targets for $seconds s each"
printf '%s\n' "$names" | xargs -P 2 -I{} bash -c 'one {} '"$seconds" || exit 1
say "No target found anything."
