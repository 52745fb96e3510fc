#!/usr/bin/env bash
# Builds the fuzz targets and runs each over its seeds and a bounded number of inputs made from them. What was
# found stays in build/fuzz/corpus and is tried again next time. Arguments go to ctest.
set -euo pipefail

cd "$(dirname "$0")/.."
scripts/build.sh fuzz fuzz/all
exec ctest --preset fuzz -j "$(nproc)" "$@"
