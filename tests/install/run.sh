#!/usr/bin/env bash
# Installs a build to a temporary root, builds hosts and a plug-in against that copy, and converts with all of them. Also
# builds users of the source tree as a subproject. Works for every layout, with libraries in lib or in
# lib/<architecture>: run.sh BUILD_DIR SOURCE_DIR CMAKE
set -euo pipefail

build=$1 source=$2 cmake=$3
examples=$source/../../docs/examples
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
unset TONEWRIGHT_PLUGIN_PATH TONEWRIGHT_COMPANION_PATH TONEWRIGHT_LIBRARY LD_LIBRARY_PATH
fail() { echo "$*" >&2; exit 1; }
quietly() { "$@" >"$work/log" 2>&1 || { cat "$work/log"; fail "failed: $*"; }; }

DESTDIR=$work/root quietly "$cmake" --install "$build"
program=$(find "$work/root" -path '*/bin/tonewright')
prefix=${program%/bin/tonewright}
library=$(find "$prefix" -name 'libtonewright.so')
libdir=${library%/libtonewright.so}

# Nothing refers to the build tree or to the working directory, and everything finds its libraries by itself.
find "$prefix" -type f -perm -u+x -o -name '*.so*' -type f | while read -r file; do
    path=$(readelf -d "$file" | sed -n 's/.*runpath: \[\(.*\)\]/\1/p')
    [[ $path =~ ^(\$ORIGIN[^:]*(:\$ORIGIN[^:]*)*)?$ ]] || fail "run path of $file: '$path'"
    ! ldd "$file" | grep 'not found' || fail "$file lacks libraries"
done
! grep -rl '\.\./\|/posix/' "$prefix/include" "$libdir/pkgconfig" || fail "relative or internal paths are installed"

# pkg-config puts DESTDIR in front of the paths, as a build of a dependent package does.
read -ra flags < <(PKG_CONFIG_SYSROOT_DIR=$work/root PKG_CONFIG_PATH=$libdir/pkgconfig \
    PKG_CONFIG_ALLOW_SYSTEM_CFLAGS=1 PKG_CONFIG_ALLOW_SYSTEM_LIBS=1 pkg-config --cflags --libs tonewright)
quietly cc -std=c11 -Wall -Wextra -Werror "$source/host.c" -o "$work/by-pkg-config" "${flags[@]}" "-Wl,-rpath,$libdir"
read -ra flags < <(PKG_CONFIG_SYSROOT_DIR=$work/root PKG_CONFIG_PATH=$libdir/pkgconfig \
    PKG_CONFIG_ALLOW_SYSTEM_CFLAGS=1 PKG_CONFIG_ALLOW_SYSTEM_LIBS=1 pkg-config --cflags --libs tonewright-host)
quietly cc -std=c11 -Wall -Wextra -Werror "$source/support.c" -o "$work/support" "${flags[@]}" "-Wl,-rpath,$libdir"
quietly "$work/support"
for project in "$source/host" "$source/cpp" "$examples/plugin"; do
    quietly "$cmake" -S "$project" -B "$work/$(basename "$project")" -G Ninja "-DCMAKE_PREFIX_PATH=$prefix" "-DEXAMPLES=$examples"
    quietly "$cmake" --build "$work/$(basename "$project")"
done

quietly "$cmake" -S "$source/subproject" -B "$work/enclosing" -G Ninja "-DEXAMPLES=$examples"
quietly "$cmake" --build "$work/enclosing" --target users

cd "$work"
sox -n -r 44100 -c 2 -b 16 tone.wav synth 1 sine 440
for host in ./by-pkg-config host/host "$program convert --force -o"; do
    rm -f tone.flac
    if [[ $host == *-o ]]; then quietly $host tone.flac tone.wav; else quietly $host tone.wav tone.flac; fi
    flac -t -s tone.flac
done

# A plug-in in a folder of the search path both reads and writes; the standard plug-ins may be there as well.
plugins=$(dirname "$(find "$prefix" -name sonora2_wav.so)")
export TONEWRIGHT_PLUGIN_PATH=$work/plugin:$plugins:$build/lib
quietly "$program" convert tone.flac -o tone.s16
quietly "$program" convert tone.s16 -o back.wav
cmp <(sox tone.wav -t raw -) tone.s16
cmp <(sox tone.wav -t raw -) <(sox back.wav -t raw -)

ffmpeg -v error -f lavfi -i color=red:s=16x16 -frames:v 1 red.png
cpp/covers add tone.flac red.png
cpp/covers list tone.flac | grep -q "^0 front image/png"
[[ $(cpp/record 2>&1) == usage* ]] || fail "the recorder does not start"
