#!/usr/bin/env bash
# Checks the given files with clang-tidy, by default all sources except tests.
set -euo pipefail

cd "$(dirname "$0")/.."
cmake --preset release >/dev/null
if [ $# = 0 ]; then
    mapfile -t files < <(git ls-files 'src/*.cpp' 'plugins/*.cpp' 'companions/*.cpp' 'host/*.cpp')
    set -- "${files[@]}"
fi
printf '%s\0' "$@" | xargs -0 -P"$(nproc)" -n4 clang-tidy-14 -p build/release --quiet
