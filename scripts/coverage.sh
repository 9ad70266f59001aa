#!/usr/bin/env bash
# Shows how much of the library its own tests run: lines and branches of ZULMetaData/, ZULMetaDataBridge/ and
# ZULMetaDataSession/. Fails below 97 % of the lines or 90 % of the branches. Usage: scripts/coverage.sh [--html FOLDER]
#
# Branches that only an exception takes are not counted. The compiler marks those that leave a call. It does not mark
# those in cleanup code that is shared with the normal path, but they are on lines without a condition.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/install.sh build media test coverage
echo "== building"
cmake --preset coverage -DZULMETADATA_BUILD_TOOLS=OFF >/dev/null
cmake --build --preset coverage

echo "== testing"
find build/coverage -name '*.gcda' -delete
scripts/ctest.sh coverage

echo "== coverage"
page=()
if [ "${1:-}" = --html ]; then
    mkdir -p "$2"
    page=(--html-details "$2/index.html")
fi
found=build/coverage/coverage.json
without_condition='^(?!.*(\bif\b|\bwhile\b|\bfor\b|\?|&&|\|\||\bswitch\b|\bcase\b)).*[;{},]\s*(//.*)?$'
report() { gcovr --root . --filter ZULMetaData/ --filter ZULMetaDataBridge/ --filter ZULMetaDataSession/ "$@"; }
report --object-directory build/coverage --exclude-throw-branches --exclude-unreachable-branches \
    --exclude-branches-by-pattern "$without_condition" --json "$found" build/coverage
report --add-tracefile "$found" --branches
report --add-tracefile "$found" "${page[@]}" --txt --print-summary --fail-under-line 97 --fail-under-branch 90
