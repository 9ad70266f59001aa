#!/usr/bin/env bash
# Checks that recorded data is not lost and that hostile files do no harm: runs every check of Tests/Reliability and
# prints one table. Usage: scripts/reliability.sh [quick|full] [CHECK...] [--document]
# quick takes minutes, full an hour or more. --document writes the table into Docs/reliability.md.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/install.sh build media test check reliability record desktop passwords sound browser
echo "== building" >&2
cmake --preset release -DZULMETADATA_BUILD_TESTS=ON -DZULM_BUILD_VIEWER=OFF >/dev/null
cmake --build --preset release --target zulm reliability_programs >&2
if [ ! -f build/dev/CMakeCache.txt ]; then # for valgrind, which takes what scripts/test.sh has built
    cmake --preset dev -DZULM_BUILD_VIEWER=OFF -DZULMETADATA_TEST_CONSUMERS=OFF -DZULMETADATA_BUILD_PYTHON=OFF >/dev/null
fi
cmake --preset dev -DZULMETADATA_BUILD_TESTS=ON >/dev/null # a build without them may be there
cmake --build --preset dev >&2

python3 Tests/Reliability/run.py --build build/release "$@"
