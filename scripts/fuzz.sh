#!/usr/bin/env bash
# Builds the fuzz targets and runs each on its seeds and a bounded number of mutations. New inputs are stored in
# build/fuzz/corpus and used again by the next run. Arguments are passed to ctest.
set -euo pipefail

cd "$(dirname "$0")/.."
scripts/build.sh fuzz fuzz/all
exec ctest --preset fuzz -j "$(nproc)" "$@"
