# Sourced by ./run, ./test and scripts/bench.sh: installs what is missing, configures and builds with a line of progress.
# Needs Debian 12 or a system with its packages; everything it makes lies under build/.

say() { printf '%s\n' "$*" >&2; }
fail() { say "$*"; exit 1; }

# The number of parallel jobs: one a core, as far as there is 1.5 GiB of memory for each.
jobs() {
    local cores room
    cores=$(nproc 2>/dev/null || echo 2)
    room=$(awk '/^MemAvailable:/ { print int($2 / 1572864) }' /proc/meminfo 2>/dev/null)
    [ -n "$room" ] && [ "$room" -lt "$cores" ] && cores=$room
    echo $((cores < 1 ? 1 : cores))
}

# need PACKAGE...: installs those of the packages that are not there. As root it installs them; otherwise it
# prints the one command to type and stops.
need() {
    local missing=() package
    command -v dpkg-query >/dev/null 2>&1 ||
        { say "This is not a Debian system; these packages must be there by other means: $*"; return 0; }
    for package in "$@"; do
        dpkg-query -W -f '${Status}' "$package" 2>/dev/null | grep -q 'ok installed' || missing+=("$package")
    done
    [ ${#missing[@]} -eq 0 ] && return 0
    if [ "$(id -u)" -ne 0 ]; then
        say "Some build packages are missing. Type this, then start again:"
        say "    sudo apt-get update && sudo apt-get install -y --no-install-recommends ${missing[*]}"
        exit 1
    fi
    say "Installing what is missing: ${missing[*]}"
    local log; log=$(mktemp)
    if ! { apt-get update && DEBIAN_FRONTEND=noninteractive apt-get install -y --no-install-recommends "${missing[@]}"; } \
            >"$log" 2>&1 </dev/null; then
        tail -n 20 "$log" >&2
        fail "The packages could not be installed; the lines above say why. Mend that and start again."
    fi
    rm -f "$log"
}

BUILD_PACKAGES="g++ cmake ninja-build libxxhash-dev libsqlite3-dev nlohmann-json3-dev libcli11-dev"
BENCH_PACKAGES="libbenchmark-dev"
TEST_PACKAGES="libgtest-dev pkg-config clang-format-14 locales"

# follow LOG LABEL PID: a line of progress for a running build, from the "[3/120]" that ninja writes.
follow() {
    local log=$1 label=$2 pid=$3 last="" now shown=-1 percent
    while kill -0 "$pid" 2>/dev/null; do
        now=$(grep -oE '^\[[0-9]+/[0-9]+\]' "$log" 2>/dev/null | tail -n 1)
        if [ -n "$now" ] && [ "$now" != "$last" ]; then
            last=$now
            if [ -t 2 ]; then
                printf '\r%s %s ' "$label" "$now" >&2
            else
                percent=$(echo "$now" | tr -d '[]' | awk -F/ '{print int(4 * $1 / $2) * 25}')
                [ "$percent" -ne "$shown" ] && { shown=$percent; say "$label $percent %"; }
            fi
        fi
        sleep 0.3
    done
    [ -t 2 ] && [ -n "$last" ] && printf '\r\033[K' >&2
    return 0
}

# build PRESET LABEL OPTIONS [TARGET...]: configures with CMake's options (-DNAME=VALUE, one word each) and builds. On
# failure the compiler's words are shown.
build() {
    local preset=$1 label=$2 options=$3 log status; shift 3
    mkdir -p build; log=build/$preset.log
    # From nothing it is quicker to compile several sources at a time; who changes one changes what was chosen.
    [ -f "build/$preset/CMakeCache.txt" ] || options="-DQUILLMARCH_UNITY=ON $options"
    # shellcheck disable=SC2086
    if ! cmake --preset "$preset" $options >"$log" 2>&1; then
        tail -n 30 "$log" >&2
        fail "Configuring failed; the lines above and $log say why."
    fi
    local targets=()
    [ $# -gt 0 ] && targets=(--target "$@")
    NINJA_STATUS="[%f/%t] " cmake --build --preset "$preset" -j "$(jobs)" "${targets[@]}" >"$log" 2>&1 &
    local pid=$!
    follow "$log" "$label" $pid
    wait $pid; status=$?
    if [ $status -ne 0 ]; then
        grep -vE '^\[[0-9]+/[0-9]+\] (Building|Linking|Creating)' "$log" | tail -n 60 >&2
        fail "Building failed; the lines above and $log say why."
    fi
}
