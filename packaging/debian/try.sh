#!/bin/sh
# Runs inside a Debian that has g++ and in /srv the packages: see scripts/package.sh.
set -eu
cd /srv
apt-get install -y -qq --no-install-recommends ./packages/*.deb >/dev/null

has_package() {
    dpkg-query -W -f='${Status}' "$1" 2>/dev/null | grep -q 'install ok installed'
}

for package in packages/*.deb; do
    name=$(dpkg-deb --field "$package" Package)
    if ! grep -q 'rights' "/usr/share/doc/$name/copyright"; then
        echo "$name does not say who may use it" >&2
        exit 1
    fi
done

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
ls /usr/share/man/man1/zulm.1* >/dev/null
if has_package zulm-record; then
    if zulm record -o Screen.mp4 2>refused.txt || [ $? -ne 2 ]; then
        echo "zulm record is not refused without a display" >&2
        exit 1
    fi
    cat refused.txt >>printed.txt
    [ ! -e Screen.mp4.recording ]
    zulm record --help | grep -q -e --recover
    ls /usr/share/man/man1/zulm-record.1* >/dev/null
fi
if has_package zulm-render; then
    zulm render --help | grep -q -e --remove-idle
    ls /usr/share/man/man1/zulm-render.1* >/dev/null
    if zulm render Movie.mp4 -o Film.mp4 2>refused.txt || [ $? -ne 1 ]; then
        echo "zulm render is not refused without pictures" >&2
        exit 1
    fi
    cat refused.txt >>printed.txt
    [ ! -e Film.mp4 ]
fi
grep -qx 'at 0.5 s the cursor is at (640,360)' printed.txt
grep -qx 'on top: Editor' printed.txt
grep -q '^ *cursorLocation .* 2 ' printed.txt

# The X server is installed last, because it brings libraries that the packages must ask for themselves.
if has_package zulm-record; then
    apt-get install -y -qq --no-install-recommends xvfb >/dev/null
    Xvfb -displayfd 3 -screen 0 640x360x24 -nolisten tcp -noreset 3>display.txt 2>server.txt &
    server=$!
    trap 'kill "$server" 2>/dev/null || true' EXIT
    for _ in $(seq 300); do
        [ -s display.txt ] && break
        sleep 0.1
    done
    if [ ! -s display.txt ]; then
        echo "Xvfb does not start:" >&2
        cat server.txt >&2
        exit 1
    fi
    DISPLAY=:$(cat display.txt) zulm record -o Screen.mp4 --duration 2 >>printed.txt 2>&1
    kill "$server"
    zulm verify Screen.mp4 >>printed.txt
    zulm info Screen.mp4 >screen.txt
    cat screen.txt >>printed.txt
    grep -q '^ *cursorLocation ' screen.txt
    [ ! -e Screen.mp4.recording ]
    if has_package zulm-render; then
        zulm render Screen.mp4 -o Film.mp4 >>printed.txt 2>&1
        zulm verify Film.mp4 >>printed.txt
    fi
fi

for package in packages/*.deb; do
    dpkg-deb --field "$package" Package
done >names.txt
xargs apt-get purge -y -qq <names.txt >/dev/null
if find /usr -iname '*zulm*' | grep .; then
    echo "the packages leave files behind" >&2
    exit 1
fi
