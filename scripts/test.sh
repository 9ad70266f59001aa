#!/usr/bin/env bash
# Builds everything and runs every test. Usage: scripts/test.sh [PRESET]; PRESET is dev where none is named, asan
# for the sanitizers, clang for the other compiler, libcxx for the other standard library with it, arm64 for that
# processor under an emulator, or any other preset with tests.
set -euo pipefail
cd "$(dirname "$0")/.."
preset=${1:-dev}

with=()
scripts/install.sh build media test record render desktop passwords sound
[ "$preset" != dev ] || scripts/install.sh consumers python many
case "$preset" in
    dev | release) scripts/install.sh viewer browser parquet && with=(-DZULM_BUILD_VIEWER=ON -DZULM_BUILD_PARQUET=ON) ;; # others leave it out
    clang) scripts/install.sh check ;;
    libcxx | arm64) scripts/install.sh "$preset" ;;
esac

echo "== building ($preset)"
cmake --preset "$preset" -DZULMETADATA_BUILD_TESTS=ON "${with[@]}" >/dev/null # a build without them may be there
cmake --build --preset "$preset"

echo "== testing ($preset)"
scripts/ctest.sh "$preset"
