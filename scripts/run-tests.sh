#!/usr/bin/env bash
# Runs the tests that a preset has built: run-tests.sh PRESET [ARGUMENT...]. The arguments are passed to ctest.
#
# Tests with a label that ends in _realtime compare sound played or recorded in real time sample by sample. A machine that has no
# processor free in time loses samples, so these run after the others, one at a time, and pass if one of three runs does.
set -uo pipefail

cd "$(dirname "$0")/.."
preset=$1
shift
strict=()
(($#)) || strict=(--no-tests=error)
ctest --preset "$preset" -j "$(nproc)" -LE '_realtime$' "${strict[@]}" "$@"
others=$?
ctest --preset "$preset" -L '_realtime$' --repeat until-pass:3 "${strict[@]}" "$@"
realtime=$?
((others == 0 && realtime == 0))
