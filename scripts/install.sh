#!/usr/bin/env bash
# Installs what this project needs from Debian's packages: scripts/install.sh GROUP...
# Does nothing where it is there already.
# shellcheck disable=SC2034 # groups are used by their names
set -euo pipefail

build=(g++ cmake ninja-build ccache libpng-dev libtiff-dev libcli11-dev nlohmann-json3-dev libfmt-dev libre2-dev
    libutf8proc-dev)
media=(ffmpeg)
test=(libgtest-dev libgmock-dev libx11-dev imagemagick pngcheck libimage-exiftool-perl mediainfo groff-base python3-jsonschema zsh fish)
consumers=(clang make pkg-config binutils)
record=(libx11-dev libxtst-dev libxcb1-dev libxcb-shm0-dev libxcb-xfixes0-dev libxcb-xinput-dev libxcb-randr0-dev libxcb-composite0-dev
    libxcb-xkb-dev libxkbcommon-dev libxkbcommon-x11-dev libavcodec-dev libavformat-dev libavutil-dev libswscale-dev
    libpulse-dev libatspi2.0-dev)
render=(libavcodec-dev libavfilter-dev libavformat-dev libavutil-dev libswresample-dev libswscale-dev libcairo2-dev
    libpango1.0-dev fonts-dejavu-core)
desktop=(xvfb openbox xdotool xterm l3afpad x11-utils x11-xserver-utils x11-xkb-utils xkb-data at-spi2-core dbus ffmpeg python3)
passwords=(python3-gi gir1.2-gtk-3.0)
sound=(pulseaudio pulseaudio-utils)
python=(python3-dev python3-numpy python3-pybind11 pybind11-dev python3-pip python3-setuptools python3-wheel python3-pytest
    python3-matplotlib mypy)
many=(python3-pandas python3-dask python3-distributed) # for many recordings at once
docs=(doxygen mkdocs python3-pygments)
check=(clang clang-format git)
lint=(clang clang-format clang-tidy cppcheck shellcheck codespell git python3)
package=(dpkg-dev file mmdebstrap)
abi=(abigail-tools)
bench=(mediainfo)
reliability=(python3 valgrind strace)
coverage=(gcovr)
libcxx=(clang libc++-dev libc++abi-dev googletest)
arm64=(g++-aarch64-linux-gnu qemu-user googletest libpng-dev:arm64 libtiff-dev:arm64 libfmt-dev:arm64 libre2-dev:arm64
    libutf8proc-dev:arm64)
macos=(binutils file)
viewer=(emscripten nodejs)
parquet=(nodejs) # npm installs the rest, as Tools/parquet/package-lock.json says
browser=(chromium fonts-dejavu-core fonts-inter fonts-liberation fonts-noto-color-emoji fonts-wqy-microhei)
command -v npm >/dev/null || { macos+=(npm) viewer+=(npm) parquet+=(npm); } # Node's own packages have it inside

packages=()
for group in "$@"; do
    declare -n members=$group
    packages+=("${members[@]}")
done

missing=()
for package in "${packages[@]}"; do
    dpkg-query -W -f='${Status}' "$package" 2>/dev/null | grep -q 'install ok installed' || missing+=("$package")
done
[ ${#missing[@]} -eq 0 ] && exit 0

echo "== installing ${missing[*]}"
as_root=()
[ "$(id -u)" -eq 0 ] || as_root=(sudo)
export DEBIAN_FRONTEND=noninteractive
if [[ " ${missing[*]} " == *:arm64\ * ]]; then "${as_root[@]}" dpkg --add-architecture arm64; fi
"${as_root[@]}" apt-get update -qq
"${as_root[@]}" apt-get install -y -qq --no-install-recommends "${missing[@]}" >/dev/null
