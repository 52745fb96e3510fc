#!/usr/bin/env bash
# Whole jobs against their peers in one run, as ratios, then where start-up time goes and the benchmarks of parts.
# Arguments go to bench/jobs/jobs.py: scripts/bench.sh --minutes 2 --only FLAC
set -euo pipefail

cd "$(dirname "$0")/.."
scripts/build.sh release
python3 bench/jobs/jobs.py build/release "$@"
(($# == 0)) || exit 0
for benchmark in build/release/bin/*_bench; do
    printf '\n%s\n' "$(basename "$benchmark")"
    "$benchmark" --benchmark_min_time=0.2
done
