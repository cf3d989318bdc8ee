#!/usr/bin/env bash
# Attacks the library and qmedit for a number of minutes (default 5): scripts/torture.sh [MINUTES] [OPTION...]
#
#     --only ATTACK    one attack alone
#     --case NUMBER    one case of it alone
#     --seed SEED      what the cases are drawn from; the usual seed is fixed
#     --jobs N         cases at a time
#
# Ends in a table; the exit code is 1 when something was found. What the first case of each kind left is kept in
# build/torture/found. docs/reliability.md tells what is attacked and how.
set -u
cd "$(dirname "${BASH_SOURCE[0]}")/.." || exit 1
. scripts/prepare.sh

# shellcheck disable=SC2086
need $BUILD_PACKAGES $TEST_PACKAGES
build dev "Building the torture programme" -DQUILLMARCH_TESTS=ON torture

# Where writing costs nothing a case takes milliseconds; what a crash leaves is worked out, not waited for.
if [ -z "${TMPDIR:-}" ] && [ -d /dev/shm ] && [ -w /dev/shm ] && [ "$(df --output=avail -k /dev/shm | tail -n 1)" -gt 500000 ]; then
    export TMPDIR=/dev/shm
fi
case "$*" in *--case*) ;; *) rm -rf build/torture/found ;; esac
mkdir -p build/torture
exec build/dev/tests/torture/torture --found build/torture/found --jobs "$(jobs)" "$@"
