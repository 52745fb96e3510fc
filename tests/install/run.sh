#!/usr/bin/env bash
# Installs to a temporary folder, builds a small C host with pkg-config and with the CMake package, converts a file
# with each, and builds and runs a C++ host of the tag library: run.sh BUILD_DIR SOURCE_DIR CMAKE
set -euo pipefail

build=$1 source=$2 cmake=$3
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
"$cmake" --install "$build" --prefix "$work/usr" >"$work/install.log"

export PKG_CONFIG_PATH=$work/usr/lib/pkgconfig
read -ra flags < <(pkg-config --cflags --libs tonewright)
cc -std=c11 -Wall -Wextra -Werror "$source/host.c" -o "$work/by-pkg-config" "${flags[@]}" "-Wl,-rpath,$work/usr/lib"

"$cmake" -S "$source/host" -B "$work/build" -G Ninja "-DCMAKE_PREFIX_PATH=$work/usr" \
    "-DEXAMPLES=$source/../../docs/examples" >"$work/configure.log"
"$cmake" --build "$work/build" >"$work/build.log" || { cat "$work/build.log"; exit 1; }

sox -n -r 44100 -c 2 -b 16 "$work/tone.wav" synth 1 sine 440
for host in "$work/by-pkg-config" "$work/build/host"; do
    rm -f "$work/tone.flac"
    (cd "$work" && env -u TONEWRIGHT_PLUGIN_PATH -u TONEWRIGHT_COMPANION_PATH "$host" tone.wav tone.flac)
    flac -t -s "$work/tone.flac"
done

# The installed program finds its libraries, plug-ins and companions without help from the environment.
"$work/usr/bin/tonewright" convert --force "$work/tone.wav" -o "$work/tone.flac"
flac -t -s "$work/tone.flac"

ffmpeg -v error -f lavfi -i color=red:s=16x16 -frames:v 1 "$work/red.png"
"$work/build/covers" add "$work/tone.flac" "$work/red.png"
"$work/build/covers" list "$work/tone.flac" | grep -q "^0 front image/png"
