#!/usr/bin/env bash
# Runs the tests that a preset has built: run-tests.sh PRESET [ARGUMENT...]. The arguments are passed to ctest.
#
# Tests with the label realtime compare sound played or recorded in real time sample by sample. A machine that has no
# processor free in time loses samples, so these run after the others, one at a time, and pass if one of three runs does.
set -uo pipefail

cd "$(dirname "$0")/.."
preset=$1
shift
ctest --preset "$preset" -j "$(nproc)" -LE '^realtime$' "$@"
others=$?
ctest --preset "$preset" -L '^realtime$' --repeat until-pass:3 "$@"
realtime=$?
((others == 0 && realtime == 0))
