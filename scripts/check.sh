#!/usr/bin/env bash
# Looks at the sources without running them. Usage: scripts/check.sh [STEP...]; all steps where none is named:
#   format    clang-format
#   includes  which room includes what, and that every header that is installed compiles alone
#   shell     shellcheck
#   spelling  codespell
#   cppcheck  errors and slow or unportable code
#   tidy      clang-tidy with the checks of .clang-tidy, which takes some minutes
# BUILD names another folder than build/check. Needs no network once everything is installed.
set -euo pipefail
cd "$(dirname "$0")/.."
build=${BUILD:-build/check}
rooms=(SharedDependencies ZULMetaData Platform ZULMetaDataBridge Bindings/JavaScript Tools/zulm Tools/demo)

configure() {
    cmake --preset clang -B "$build" -DCMAKE_VERIFY_INTERFACE_HEADER_SETS=ON -DZULMETADATA_BUILD_PYTHON=AUTO >/dev/null
}

sources() {
    git ls-files "${@/%/*.cpp}"
}

check_format() {
    git ls-files '*.h' '*.cpp' | xargs clang-format --dry-run --Werror
}

check_includes() {
    python3 scripts/check_includes.py
    configure
    cmake --build "$build" --target all_verify_interface_header_sets >/dev/null
}

check_shell() {
    git ls-files '*.sh' .ci/run | xargs shellcheck
}

check_spelling() {
    git ls-files | grep -vE '^(Fuzz/corpus|Tests/Data|packaging/abi)/|package-lock\.json$' | xargs codespell
}

check_cppcheck() { # which cannot parse lambdas with template parameters yet
    cppcheck --quiet --enable=warning,performance,portability --std=c++20 --language=c++ --inline-suppr -I . \
        --suppress=missingIncludeSystem --suppress=syntaxError --suppress=internalAstError --error-exitcode=1 \
        -j "$(nproc)" "${rooms[@]}" Bindings/Python
}

check_tidy() {
    configure
    local compiled=("${rooms[@]}")
    if grep -q Bindings/Python "$build/compile_commands.json"; then compiled+=(Bindings/Python); fi
    sources "${compiled[@]/%/\/}" | grep -vE 'WasmHost|(PNG|TIFF)Structure' | # which are of other builds
        xargs -P "$(nproc)" -n 1 clang-tidy -p "$build" --quiet
}

scripts/install.sh build test lint
steps=("$@")
[ $# -gt 0 ] || steps=(format includes shell spelling cppcheck tidy)
for step in "${steps[@]}"; do
    echo "== $step"
    "check_$step"
done
