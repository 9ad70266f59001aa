#!/usr/bin/env bash
# Builds everything and runs every test. Usage: scripts/test.sh [PRESET]; PRESET is dev where none is named, asan
# for the sanitizers, clang for the other compiler, or any other preset with tests.
set -euo pipefail
cd "$(dirname "$0")/.."
preset=${1:-dev}

scripts/install.sh build media test
if [ "$preset" = clang ]; then scripts/install.sh check; fi

echo "== building ($preset)"
cmake --preset "$preset" >/dev/null
cmake --build --preset "$preset"

echo "== testing ($preset)"
ctest --preset "$preset" --progress
