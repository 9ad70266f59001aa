#!/usr/bin/env bash
# Records somebody who works with an editor and a terminal, on an X server without a screen. Checks that everything that
# was clicked, typed and scrolled is in the recording, shows it, cuts it, and writes a page that plays it, and a film.
# Usage: scripts/demo.sh [FOLDER]; everything is left in FOLDER (demo-output if none is named).
set -euo pipefail
cd "$(dirname "$0")/.."
folder=${1:-demo-output}

scripts/install.sh build media viewer record render desktop

# The build is that of scripts/test.sh, so that neither compiles again what the other has compiled.
echo "== building"
tests=()
[ -f build/dev/CMakeCache.txt ] || tests=(-DZULMETADATA_BUILD_TESTS=OFF) # the packages that they need may be missing
cmake --preset dev "${tests[@]}" -DZULM_BUILD_VIEWER=ON >/dev/null
cmake --build --preset dev --target zulm zulm-record zulm-render
zulm=build/dev/Tools/zulm/zulm

mkdir -p "$folder"
movie=$folder/Recording.mp4
fresh=$(mktemp -d "$folder/recording.XXXXXX") # a recorder replaces nothing
trap 'rm -rf "$fresh"' EXIT

# Writes a session that is computed, for machines on which no X server can be started.
compute() {
    echo "== recording a simulated session instead, and reading it back out of the movie"
    scripts/desktop-movie.sh "$fresh/plain.mp4"
    "$zulm" demo "$folder" --movie "$fresh/plain.mp4" --force

    echo "== the movie's pictures and sound are what they were"
    local hash=(ffmpeg -v error -map 0 -c copy -f streamhash - -i)
    [ "$("${hash[@]}" "$movie")" = "$("${hash[@]}" "$fresh/plain.mp4")" ]
    echo "Its stream files are in $folder/streams."
}

echo "== recording an editor and a terminal, with somebody who uses them"
code=0
ZULM_RECORD=$PWD/build/dev/Tools/record/zulm-record python3 Tests/Tools/record/real_desktop.py "$fresh/Recording.mp4" ||
    code=$?
case $code in
    0) mv -f "$fresh/Recording.mp4" "$movie" ;;
    77) compute ;;
    *) exit 1 ;;
esac
ffprobe -v error -show_entries stream=codec_name,duration -of compact=nokey=1:print_section=0 "$movie"

echo "== what zulm shows of it"
"$zulm" info "$movie"
"$zulm" verify "$movie"

echo "== what happens in it"
"$zulm" insights "$movie"

echo "== cutting it: seconds 1 to 6, and seconds 8 to 12 twice as fast"
"$zulm" cut "$movie" --keep 1-6 --keep 8-12@2 -o "$folder/Cut.mp4" --force
"$zulm" verify "$folder/Cut.mp4"

echo "== writing pages that show them playing"
"$zulm" view "$movie" -o "$folder/Recording.html" --force
"$zulm" view "$folder/Cut.mp4" -o "$folder/Cut.html" --force

echo "== making a film of it"
"$zulm" render "$movie" -o "$folder/Film.mp4" --force
"$zulm" verify "$folder/Film.mp4"

echo
echo "The movie is $movie, and a cut of it is $folder/Cut.mp4."
echo "Open the pages in a browser: $folder/Recording.html, $folder/Cut.html"
echo "The film is $folder/Film.mp4."
