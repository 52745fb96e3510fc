#!/usr/bin/env bash
# Runs each fuzz target over its seeds and a bounded number of new inputs: fuzz.sh [RUNS]
set -euo pipefail

cd "$(dirname "$0")/.."
runs=${1:-20000}
scripts/build.sh fuzz
for target in build/fuzz/bin/fuzz_*; do
    name=$(basename "$target")
    found=$(mktemp -d)
    echo "$name: $runs inputs"
    "$target" -runs="$runs" -max_len=4096 -timeout=10 -rss_limit_mb=2048 -verbosity=0 -artifact_prefix="$found/" \
        "$found" "fuzz/corpus/$name" || { echo "$name failed; the input lies in $found" >&2; exit 1; }
    rm -rf "$found"
done
