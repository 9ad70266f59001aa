#!/bin/sh
# Runs inside a Debian that has g++ and in /srv the packages: see scripts/package.sh.
set -eu
cd /srv
apt-get install -y -qq --no-install-recommends ./packages/*.deb >/dev/null

awk '/^```/ { inside = !inside && $0 == "```cpp"; next } inside' README.md >example.cpp
g++ -std=c++20 example.cpp -lZULMetaDataSession -lZULMetaDataBridge -lZULMetaData -o example
printf '\0\0\0\20ftypmp42\0\0\0\0' >Movie.mp4

{
    ./example
    zulm --version
    zulm info Movie.mp4
    zulm verify Movie.mp4
} >printed.txt
zulm view Movie.mp4 -o Movie.html
if zulm record -o Screen.mp4 2>refused.txt || [ $? -ne 2 ]; then
    echo "zulm record is not refused without a display" >&2
    exit 1
fi
cat refused.txt >>printed.txt
[ ! -e Screen.mp4.recording ]
zulm record --help | grep -q -e --recover
ls /usr/share/man/man1/zulm-record.1* >/dev/null
zulm render --help | grep -q -e --remove-idle
if zulm render Movie.mp4 -o Film.mp4 2>refused.txt || [ $? -ne 1 ]; then
    echo "zulm render is not refused without pictures" >&2
    exit 1
fi
cat refused.txt >>printed.txt
[ ! -e Film.mp4 ]
grep -qx 'at 0.5 s the cursor is at (640,360)' printed.txt
grep -qx 'on top: Editor' printed.txt
grep -q '^ *cursorLocation .* 2 ' printed.txt

apt-get purge -y -qq zulm-record zulm-render zulm-tools libzulmetadata-dev libzulmetadata1 >/dev/null
if find /usr -iname '*zulm*' | grep .; then
    echo "the packages leave files behind" >&2
    exit 1
fi
