#!/usr/bin/env bash
# Makes a movie of 20 seconds that looks like the screen of the simulated session, with its windows in the right places.
# Usage: scripts/desktop-movie.sh MOVIE
set -euo pipefail
movie=$1

boxes=()

# box X Y WIDTH HEIGHT COLOUR FROM TO: shown between two times
box() {
    boxes+=("drawbox=x=$1:y=$2:w=$3:h=$4:color=$5:t=fill:enable='gte(t,$6)*lt(t,$7)'")
}

# window X Y WIDTH HEIGHT COLOUR BAR FROM TO: with a bar and its three buttons
window() {
    box $(($1 + 6)) $(($2 + 10)) "$3" "$4" black@0.25 "$7" "$8"
    box "$1" "$2" "$3" "$4" "$5" "$7" "$8"
    box "$1" "$2" "$3" 30 "$6" "$7" "$8"
    local i=0
    for colour in 0xff5f57 0xfebc2e 0x28c840; do
        box $(($1 + 12 + 18 * i)) $(($2 + 10)) 10 10 "$colour" "$7" "$8"
        i=$((i + 1))
    done
}

# lines X Y COUNT STEP FROM TO COLOUR...: of text, with widths that repeat but do not look so
lines() {
    local x=$1 y=$2 count=$3 step=$4 from=$5 to=$6 i
    shift 6
    for ((i = 0; i < count; i++)); do
        local colours=("$@") indent=$((i * 7 % 4 * 22)) width=$((60 + i * 53 % 170))
        box $((x + indent)) $((y + i * step)) "$width" 8 "${colours[i % $#]}" "$from" "$to"
        box $((x + indent + width + 12)) $((y + i * step)) $((40 + i * 37 % 120)) 8 "${colours[(i + 1) % $#]}" "$from" "$to"
    done
}

editor() {
    window 40 30 900 600 0x1f2430 0x2b3140 "$1" "$2"
    box 40 60 190 570 0x191d27 "$1" "$2"
    local i
    for i in {0..8}; do box $((60 + i % 3 * 16)) $((84 + i * 26)) $((50 + i * 29 % 60)) 8 0x4a5470 "$1" "$2"; done
    lines 262 84 22 24 "$1" "$2" 0x7aa2f7 0x9aa5ce 0x9ece6a 0x565f89 0xe0af68
}

terminal() {
    window 360 210 760 460 0x0d1117 0x21262d "$1" "$2"
    lines 384 262 16 24 "$1" "$2" 0x3fb950 0x8b949e 0x8b949e
}

slides() {
    box 0 0 1280 720 0xf6f3ee "$1" "$2"
    box 90 90 520 36 0x2b3a55 "$1" "$2"
    lines 92 180 5 40 "$1" "$2" 0x8a93a5 0xb3bac7
    local i heights=(120 190 150 260 320 290)
    for i in "${!heights[@]}"; do
        box $((700 + 84 * i)) $((600 - heights[i])) 56 "${heights[i]}" 0x4c7ef3 "$1" "$2"
    done
    box 690 600 510 3 0x2b3a55 "$1" "$2"
}

box 0 0 1280 24 0x10151f@0.55 0 20
editor 0 12
terminal 6.5 12
slides 12 17.25
editor 17.25 20

filter=$(IFS=,; echo "${boxes[*]}")
ffmpeg -v error -y -f lavfi -i "gradients=s=1280x720:r=30:c0=0x1d3557:c1=0x6d597a:x0=0:y0=0:x1=1280:y1=720:nb_colors=2:speed=0.00001" \
    -f lavfi -i sine=frequency=330 -t 20 -vf "$filter" -af volume=0.1 -c:v libx264 -preset veryfast -crf 20 -pix_fmt yuv420p -c:a aac "$movie"
