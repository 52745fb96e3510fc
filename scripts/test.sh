#!/usr/bin/env bash
# Builds and runs all tests. Arguments are passed to ctest: scripts/test.sh -R Strings
# TONEWRIGHT_PRESET=asan or tsan runs them under a sanitizer.
set -euo pipefail

cd "$(dirname "$0")/.."
preset=${TONEWRIGHT_PRESET:-release}
scripts/build.sh "$preset"
exec scripts/run-tests.sh "$preset" "$@"
