#!/usr/bin/env bash
# Compares whole jobs with peer programs in the same run, then measures start-up and runs the benchmarks of parts.
# Arguments are passed to bench/jobs/jobs.py, and then only that runs: scripts/bench.sh --minutes 2 --only FLAC
set -euo pipefail

cd "$(dirname "$0")/.."
scripts/build.sh release
python3 bench/jobs/jobs.py build/release "$@"
(($# == 0)) || exit 0
for benchmark in build/release/bin/*_bench; do
    printf '\n%s\n' "$(basename "$benchmark")"
    "$benchmark" --benchmark_min_time=0.2
done
