#!/usr/bin/env bash
# Runs the tests that a preset has built: run-tests.sh PRESET [ARGUMENT...]. The arguments are passed to ctest.
#
# Many tests wait for other programs or for a clock, so more of them run at a time than there are processors.
#
# Tests with a label that ends in _realtime compare sound played or recorded in real time sample by sample. A machine that has no
# processor free in time loses samples, so these run after the others and pass if one of three runs does. Sanitizers take several
# times the processor time; under them these tests run one at a time.
set -uo pipefail

cd "$(dirname "$0")/.."
preset=$1
shift
strict=()
(($#)) || strict=(--no-tests=error)
# The leak sanitizer misreads the thread-local storage of libraries that are loaded later, and then crashes.
export ASAN_OPTIONS=intercept_tls_get_addr=0${ASAN_OPTIONS:+:$ASAN_OPTIONS}
if [[ $preset == release ]]; then
    jobs=$(($(nproc) * 2)) realtime_jobs=$(($(nproc) + 1))
else
    jobs=$(nproc) realtime_jobs=1
fi
ctest --preset "$preset" -j "$jobs" -LE '_realtime$' "${strict[@]}" "$@"
others=$?
ctest --preset "$preset" -j "$realtime_jobs" -L '_realtime$' --repeat until-pass:3 "${strict[@]}" "$@"
realtime=$?
((others == 0 && realtime == 0))
