#!/usr/bin/env bash
# Compares Tonewright with ffmpeg and mutagen on every sound file below a folder, as a check before a release:
# corpus.sh FOLDER [--jobs N]. Changes nothing in the folder. Exit code 0: no differences.
set -euo pipefail

(($# > 0)) || { sed -n '2,3s/^# //p' "$0" >&2; exit 2; }
folder=$(realpath -- "$1")
shift
cd "$(dirname "$0")/.."
scripts/build.sh release tonewright_host companions/all plugins/all
exec /usr/bin/python3 scripts/corpus.py build/release/bin/tonewright "$folder" "$@"
