#!/usr/bin/env bash
# Checks the given files with clang-tidy, by default all sources except tests. Uses a build folder of its own, which is
# only configured: clang cannot read the precompiled headers of GCC in build/release.
set -euo pipefail

cd "$(dirname "$0")/.."
cmake --preset lint >/dev/null
if [ $# = 0 ]; then
    mapfile -t files < <(git ls-files 'src/*.cpp' 'plugins/*.cpp' 'companions/*.cpp' 'host/*.cpp')
    set -- "${files[@]}"
fi
printf '%s\0' "$@" | xargs -0 -P"$(nproc)" -n4 clang-tidy-14 -p build/lint --quiet
