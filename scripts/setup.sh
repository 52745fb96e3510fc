#!/usr/bin/env bash
# Installs the packages listed in dependencies.txt that are missing.
set -euo pipefail

list="$(dirname "$0")/dependencies.txt"
missing=()
while read -r package _; do
    [[ -z $package || $package == \#* ]] && continue
    status=$(dpkg-query -W -f '${db:Status-Status}' "$package" 2>/dev/null || true)
    [[ $status == installed ]] || missing+=("$package")
done <"$list"

((${#missing[@]} == 0)) && exit 0

echo "Installing: ${missing[*]}"
as_root=()
if ((EUID != 0)); then
    command -v sudo >/dev/null || { echo "setup.sh: needs root or sudo to install: ${missing[*]}" >&2; exit 1; }
    as_root=(sudo)
fi
export DEBIAN_FRONTEND=noninteractive
"${as_root[@]}" apt-get update -qq
"${as_root[@]}" apt-get install -y -qq --no-install-recommends "${missing[@]}" >/dev/null
