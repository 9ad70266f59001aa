#!/usr/bin/env bash
# Builds the Debian packages in build/package and installs them into a fresh Debian with g++ and nothing else. Compiles
# the README's example there, and looks into its recording with zulm. Usage: scripts/package.sh [OPTION...]; each OPTION
# is passed to cmake. The variable BUILD names a folder to use instead of build/package.
set -euo pipefail
cd "$(dirname "$0")/.."
build=${BUILD:-build/package}

scripts/install.sh build viewer record render package
cmake --preset release -B "$build" -DCMAKE_INSTALL_PREFIX=/usr -DBUILD_SHARED_LIBS=ON -DZULM_BUILD_VIEWER=ON \
    -DZULMETADATA_BUILD_RECORDER=ON -DZULMETADATA_BUILD_RENDERER=ON "$@" >/dev/null
cmake --build "$build"
rm -rf "$build/packages"
(cd "$build" && cpack -B packages >/dev/null)
ls -l "$build"/packages/*.deb

echo "== trying the packages in a fresh Debian"
printed=$build/packages/printed.txt
# shellcheck disable=SC2016 # mmdebstrap knows the folder
mmdebstrap --quiet --variant=apt --include=g++ \
    --customize-hook="copy-in $build/packages README.md packaging/debian/try.sh /srv" \
    --customize-hook='chroot "$1" sh /srv/try.sh' \
    --customize-hook="download /srv/printed.txt $printed" \
    bookworm /dev/null
cat "$printed"
