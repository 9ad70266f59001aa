#!/usr/bin/env bash
# Fails if programs that were linked with the shared libraries that packaging/abi describes would not work with the
# current ones. Usage: scripts/check-abi.sh [update]; update writes new descriptions, after a release or after
# ZULMETADATA_ABI_VERSION was raised. The descriptions are for x86-64 and Debian's compiler.
set -euo pipefail
cd "$(dirname "$0")/.."
build=${BUILD:-build/abi}

scripts/install.sh build abi
cmake --preset release -B "$build" -DCMAKE_BUILD_TYPE=RelWithDebInfo -DBUILD_SHARED_LIBS=ON \
    -DCMAKE_UNITY_BUILD=OFF -DZULMETADATA_BUILD_TESTS=OFF -DZULMETADATA_BUILD_TOOLS=OFF >/dev/null
cmake --build "$build" -- --quiet
rm -rf "$build/installed"
cmake --install "$build" --prefix "$build/installed" >/dev/null

changed=0
for library in libZULMetaData libZULMetaDataBridge libZULMetaDataSession; do
    described=packaging/abi/$library.abi
    now=$build/$library.abi
    abidw --headers-dir "$build/installed/include" --suppressions packaging/abi/inside.ini --exported-interfaces-only \
        --drop-private-types --no-show-locs --no-corpus-path --no-comp-dir-path --out-file "$now" "$build"/installed/lib*/$library.so
    sed -i -E "s# path='[^']*/((SharedDependencies|ZULMetaData|ZULMetaDataBridge|ZULMetaDataSession|Platform)/)# path='\\1#" "$now"
    if [ "${1:-}" = update ]; then
        cp "$now" "$described"
    else
        echo "== $library"
        abidiff --no-added-syms "$described" "$now" || changed=1
    fi
done
exit $changed
