#!/usr/bin/env bash
# Installs missing packages, configures and builds: build.sh [PRESET [TARGET...]]
set -euo pipefail

cd "$(dirname "$0")/.."
preset=${1:-release}
shift || true
scripts/setup.sh
log=$(mktemp)
trap 'rm -f "$log"' EXIT
cmake --preset "$preset" >"$log" 2>&1 || { cat "$log" >&2; exit 1; }
cmake --build --preset "$preset" ${@:+--target "$@"}
