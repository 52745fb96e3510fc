#!/usr/bin/env bash
# Compares FLAC files that eight threads have encoded with those of a single encoder, byte for byte, and shows how the
# threads share the work: scripts/parallel-flac.sh [SHAPES [HOURS]]. Ten hours need 13 GB in $TMPDIR.
set -euo pipefail

cd "$(dirname "$0")/.."
shapes=${1:-500} hours=${2:-10}
cmake --build --preset release --target plugins_tests flac_bench tonewright_host
bin=$PWD/build/release/bin

printf '\n%s shapes of up to eight channels and 32 bits, at every level\n' "$shapes"
TEST_FLAC_SHAPES=$shapes "$bin/plugins_tests" --gtest_brief=1 --gtest_filter=SplitFlac.EqualsTheFileOfASingleEncoder

printf '\n%s hours of sound\n' "$hours"
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
seconds=$(awk "BEGIN { print int($hours * 3600) }")
# Wave64, since WAV ends at 4 GB.
sox -R -n -r 44100 -c 2 -b 16 "$work/sound.w64" synth "$seconds" pinknoise synth "$seconds" sine mix 200-2000 tremolo 0.01 90
for threads in 1 8; do
    TONEWRIGHT_THREADS=$threads "$bin/tonewright" convert --quiet "$work/sound.w64" -o "$work/$threads.flac"
done
cmp "$work/1.flac" "$work/8.flac"
flac -t -s "$work/8.flac"
echo "identical, and intact for flac"

printf '\nThe work of eight threads\n'
"$bin/flac_bench"
