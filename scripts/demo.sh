#!/usr/bin/env bash
# Records a simulated session of 20 seconds, puts it into a movie, reads it back and checks that it is the same, and
# writes a page that shows it, and a film.
# Usage: scripts/demo.sh [FOLDER]; everything is left in FOLDER (demo-output where none is named).
set -euo pipefail
cd "$(dirname "$0")/.."
folder=${1:-demo-output}

scripts/install.sh build media viewer render

# The build is that of scripts/test.sh, so that neither compiles again what the other has compiled.
echo "== building"
tests=()
[ -f build/dev/CMakeCache.txt ] || tests=(-DZULMETADATA_BUILD_TESTS=OFF) # the packages that they need may be missing
cmake --preset dev "${tests[@]}" -DZULM_BUILD_VIEWER=ON >/dev/null
cmake --build --preset dev --target zulm zulm-render
zulm=build/dev/Tools/zulm/zulm

echo "== making a movie of 20 seconds"
mkdir -p "$folder"
movie=$folder/Recording.mp4
plain=$(mktemp --suffix=.mp4)
trap 'rm -f "$plain"' EXIT
scripts/desktop-movie.sh "$plain"
packets_before=$(ffmpeg -v error -i "$plain" -map 0 -c copy -f streamhash -)

echo "== recording a session and reading it back out of the movie"
"$zulm" demo "$folder" --movie "$plain" --force

echo "== the movie's pictures and sound are what they were"
[ "$(ffmpeg -v error -i "$movie" -map 0 -c copy -f streamhash -)" = "$packets_before" ]
ffprobe -v error -show_entries stream=codec_name,duration -of compact=nokey=1:print_section=0 "$movie"

echo "== what zulm shows of it"
"$zulm" info "$movie"

echo "== writing a page that shows it playing"
"$zulm" view "$movie" -o "$folder/Recording.html" --force

echo "== making a film of it"
"$zulm" render "$movie" -o "$folder/Film.mp4" --force
"$zulm" verify "$folder/Film.mp4"

echo
echo "The movie is $movie, its stream files are in $folder/streams."
echo "Open the page in a browser: $folder/Recording.html"
echo "The film is $folder/Film.mp4."
