#!/usr/bin/env bash
# Measures what users do, each task beside a raw baseline in the same run, and prints one table. Ends with 1 if a target
# is missed by more than a tenth. Usage: scripts/bench.sh [TASK] [--document]
# With TASK it measures only tasks whose name contains that text. --document writes the table into Docs/performance.md,
# and that of many recordings into Docs/many.md. MOST_RECORDINGS is how many of them there are: 20,000, if it is not set.
set -euo pipefail
cd "$(dirname "$0")/.."

task=
document=
for argument in "$@"; do
    case $argument in
    --document) document=1 ;;
    -*) echo "usage: scripts/bench.sh [TASK] [--document]" >&2 && exit 2 ;;
    *) task=$argument ;;
    esac
done

scripts/install.sh build media render bench python many
echo "== building" >&2
cmake --preset release -DZULMETADATA_BUILD_TESTS=OFF -DZULM_BUILD_VIEWER=OFF \
    -DZULMETADATA_BUILD_PYTHON=ON >/dev/null
cmake --build --preset release --target zulm benchmarks zulmetadata_python >&2

table=$(mktemp)
trap 'rm -f "$table"' EXIT
missed=0
printf '| task | beside | measured | target | |\n|---|---|---|---|---|\n' | tee "$table"
for benchmark in Append Session Read Recording Scan Save List Image Load Insights Retiming Render; do
    "build/release/Benchmarks/${benchmark}Benchmark" "$task" | tee -a "$table" || missed=1
done
PYTHONPATH=build/release/Bindings/Python/package /usr/bin/python3 Benchmarks/many_recordings.py \
    build/release/Tools/zulm/zulm build/many-recordings "$task" --most "${MOST_RECORDINGS:-20000}" \
    ${document:+--document Docs/many.md} | tee -a "$table" || missed=1
[ -z "$document" ] || python3 scripts/put_table.py Docs/performance.md <"$table"
exit "$missed"
