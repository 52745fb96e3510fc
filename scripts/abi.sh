#!/usr/bin/env bash
# Compares the C interfaces of a build with those of the last release, which packaging/ describes, and fails on an
# incompatible change; update writes that description at a release: abi.sh check|update [BUILD_DIR]
set -euo pipefail

command=${1:-}
[[ $command == check || $command == update ]] || { echo "usage: abi.sh check|update [BUILD_DIR]" >&2; exit 2; }
build=$(realpath "${2:-$(dirname "$0")/../build/package}")
cd "$(dirname "$0")/.."
status=0
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
for name in tonewright tonewright_host discio2; do
    library=$(find "$build" -path "$build/lib*/lib$name.so.*" -type f)
    dump=packaging/abi/lib$name.abi
    abidw --headers-dir include/tonewright --drop-private-types --exported-interfaces-only --no-corpus-path \
        --no-comp-dir-path --no-show-locs --no-elf-needed --out-file "$work/dump" "$library"
    grep -Eq "<function-decl name='(TONEWRIGHT|DISCIO)_" "$work/dump" || { echo "$library has no debug information" >&2; exit 1; }
    if [[ $command == update ]]; then
        cp "$work/dump" "$dump"
    elif [[ ! -e $dump ]]; then
        echo "$dump is missing: the next release describes lib$name.so with abi.sh update"
    # An added function is compatible.
    elif ! abidiff --no-added-syms --suppressions packaging/abi/suppressions.ini "$dump" "$work/dump"; then
        echo "lib$name.so is not compatible with the last release (see packaging/README.md)" >&2
        status=1
    fi
done
[[ $command == check ]] || cp "$build/symbols" packaging/libtonewright0.symbols
exit "$status"
