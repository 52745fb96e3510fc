#!/usr/bin/env bash
# Builds the Debian packages in dist/ with the file layout of the distribution, and checks the compatibility of the C
# interfaces, an installed copy and, if lintian is there, the packages.
set -euo pipefail

cd "$(dirname "$0")/.."
scripts/build.sh package
scripts/abi.sh check build/package
tests/install/run.sh "$PWD/build/package" "$PWD/tests/install" cmake
rm -rf dist
(cd build/package && cpack -G DEB -Wno-dev)
rm -rf dist/_CPack_Packages
if command -v lintian >/dev/null; then
    # Concerns uploads to Debian only.
    lintian --fail-on error,warning --suppress-tags initial-upload-closes-no-bugs --allow-root dist/*.deb
fi
ls -l dist
