#!/usr/bin/env bash
# Kills slaves at random moments of decoding and encoding: isolation.sh [PRESET [COUNT]], by default 1000 times each with the
# release build. The host must survive, and nothing of the slaves may be left.
set -euo pipefail

cd "$(dirname "$0")/.."
preset=${1:-release}
cmake --build --preset "$preset" --target isolation_tests
TONEWRIGHT_TEST_KILLS=${2:-1000} "build/$preset/bin/isolation_tests" --gtest_filter='Boxed.SlavesMayBeKilledAtAnyMoment'
