#!/usr/bin/env bash
# Checks the sources without running them. Usage: scripts/check.sh [STEP...]; without STEP it runs all steps:
#   format    clang-format
#   includes  which folder includes what, and that every header that is installed compiles alone
#   shell     shellcheck
#   spelling  codespell
#   cppcheck  errors and slow or unportable code
#   tidy      clang-tidy with the checks of .clang-tidy, on many sources of a library at once, so that the headers that
#             they include are parsed once for all of them
#   analyse   clang-tidy's analyser, which follows what can happen at run time and takes some minutes
# The variable BUILD names a folder to use instead of build/check. Needs no network once everything is installed.
set -euo pipefail
cd "$(dirname "$0")/.."
build=${BUILD:-build/check}

configure() { # FOLDER OPTION...
    cmake --preset clang -B "$build/$1" --no-warn-unused-cli -DZULMETADATA_BUILD_TESTS=OFF "${@:2}" >/dev/null
}

check_format() {
    git ls-files '*.h' '*.cpp' | xargs clang-format --dry-run --Werror
}

check_includes() {
    python3 scripts/check_includes.py
    configure headers -DCMAKE_VERIFY_INTERFACE_HEADER_SETS=ON
    cmake --build "$build/headers" --target all_verify_interface_header_sets -- --quiet
}

check_shell() {
    git ls-files '*.sh' .ci/run | xargs shellcheck
}

check_spelling() {
    git ls-files | grep -vE '^(Fuzz/corpus|Tests/Data|packaging/abi)/|package-lock\.json$' | xargs codespell
}

check_cppcheck() { # it cannot parse lambdas with template parameters yet
    cppcheck --quiet --enable=warning,performance,portability --std=c++20 --language=c++ --inline-suppr -I . \
        --suppress=missingIncludeSystem --suppress=syntaxError --suppress=internalAstError --error-exitcode=1 \
        -j "$(nproc)" SharedDependencies ZULMetaData Platform ZULMetaDataBridge ZULMetaDataSession Reports Bindings Tools Examples
}

run_clang_tidy() { # OPTION...
    configure tidy -DZULMETADATA_BUILD_PYTHON=AUTO -DCMAKE_UNITY_BUILD=ON -DCMAKE_UNITY_BUILD_BATCH_SIZE=20
    sed -n 's/^ *"file": "\(.*\)".*/\1/p' "$build/tidy/compile_commands.json" |
        grep -vE '/Benchmarks/|/Tools/viewer/' | # these contain the generated page
        xargs -P "$(nproc)" -n 1 clang-tidy -p "$build/tidy" --quiet "$@" 2> >(grep -v ' warnings generated' >&2)
}

check_tidy() {
    # The sources that it reads are made by CMake and include the real ones, which it would find suspicious.
    run_clang_tidy '--checks=-clang-analyzer-*,-bugprone-suspicious-include'
}

check_analyse() {
    run_clang_tidy '--checks=-*,clang-analyzer-*' --extra-arg=-Xclang --extra-arg=-analyzer-opt-analyze-headers
}

if command -v apt-get >/dev/null; then scripts/install.sh build test lint; fi # on other systems a missing tool reports itself
steps=("$@")
[ $# -gt 0 ] || steps=(format includes shell spelling cppcheck tidy analyse)
for step in "${steps[@]}"; do
    echo "== $step"
    "check_$step"
done
