#!/usr/bin/env bash
# Runs the tests of a build that is there: scripts/ctest.sh PRESET [OPTION...]; each OPTION goes to ctest. On a terminal it
# shows how far the tests are. Elsewhere it prints a line for every 500 tests that have passed, and what ctest says of all
# others. Both end with the summary of ctest.
set -euo pipefail
cd "$(dirname "$0")/.."
preset=$1
shift

if [ -t 1 ]; then
    exec ctest --preset "$preset" --progress --no-tests=error "$@"
fi
ctest --preset "$preset" --no-tests=error "$@" | awk '
    /^ *Start +[0-9]+: / { next }
    / Passed +[0-9.]+ sec *$/ { if (++passed % 500 == 0) { print passed " tests have passed"; fflush() } next }
    /^ *[0-9]+\/[0-9]+ Test +#/ { sub(/ \.\.\.+/, ": ") }
    { print; fflush() }'
