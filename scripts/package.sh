#!/usr/bin/env bash
# Builds the Debian packages in dist/ with the file layout of the distribution, and checks an installed copy and, if
# lintian is there, the packages.
set -euo pipefail

cd "$(dirname "$0")/.."
scripts/build.sh package
tests/install/run.sh "$PWD/build/package" "$PWD/tests/install" cmake
rm -rf dist
(cd build/package && cpack -G DEB -Wno-dev)
rm -rf dist/_CPack_Packages
if command -v lintian >/dev/null; then
    lintian --fail-on error dist/*.deb
fi
ls -l dist
