#!/usr/bin/env bash
# A first demonstration: installs missing packages, builds, converts real recordings to four formats, mixes three of
# them and paints a design of covers. The results go to the given folder, by default build/demo.
set -euo pipefail

target=$(realpath -m -- "${1:-$(dirname "$0")/../build/demo}")
cd "$(dirname "$0")/.."
scripts/build.sh release tonewright_host tonewright_covers companions/all plugins/all
tonewright=build/release/bin/tonewright
mkdir -p "$target"

recordings=(
    /usr/share/sounds/alsa/{Front_Center,Front_Left,Rear_Right}.wav
    /usr/share/sounds/freedesktop/stereo/{alarm-clock-elapsed,phone-incoming-call}.oga
)
for format in flac mp3 ogg wav; do
    "$tonewright" convert "${recordings[@]}" --to "$format" --directory "$target" --force --json
done | python3 -c '
import json, os, sys

print("%-28s %-12s %9s %10s %14s" % ("file", "codec", "seconds", "bytes", "x real time"))
for line in sys.stdin:
    event = json.loads(line)
    if event["event"] == "done":
        speed = event["duration"] / max(event["seconds"], 1e-6)
        name = os.path.basename(event["output"])
        print("%-28s %-12s %9.2f %10d %14.0f" % (name, event["codec"], event["duration"], event["bytes"], speed))
'

# An alarm that fades in and out with a voice over it and, after a gap, a telephone at half level.
arrangement=docs/examples/arrangement.xml
printf '\n%s mixed:\n' "$arrangement"
"$tonewright" mix "$arrangement" -o "$target/mixed.flac" --force
"$tonewright" waveform "$target/mixed.flac" -o "$target/mixed.png" --force

# Every type of element: as XML, as a project, and painted.
covers=build/release/bin/tonewright-covers
printf '\nA design for covers:\n'
python3 docs/examples/showcase.py "$target/showcase.xml"
"$covers" convert "$target/showcase.xml" -o "$target/showcase.cedprj" --force
"$covers" info "$target/showcase.cedprj"
"$covers" render "$target/showcase.cedprj" --item 1 -o "$target/front.png" --force
"$covers" render "$target/showcase.cedprj" --item 2 -o "$target/back.pdf" --force
"$covers" render "$target/showcase.cedprj" --target disc -o "$target/disc.svg" --force

cat <<TEXT
The waveform of the mix is in $target/mixed.png.

The files are in $target. Some commands to try next:
  $tonewright --help
  $tonewright convert YOUR.flac -o YOUR.mp3 --quality 0.8
  $tonewright info $target/*
  $tonewright mix $arrangement -o mixed.mp3
  $tonewright waveform $target/Front_Center.flac -o wave.png
  $covers render $target/showcase.cedprj -o front.pdf
TEXT
