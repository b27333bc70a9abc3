#!/bin/sh
# Regenerates the demo game's sounds and the sound declarations' dump with the content
# tools; the same tools (and the same libvorbis) give the same bytes.
#
#   games/demo/make-sounds.sh [TOOLS_DIR [OUT_DIR]]
#
# TOOLS_DIR holds oxmedia and oxdump (default: build/tools of the repository); OUT_DIR is
# where sounds/ and properties/ are written (default: this folder).
set -eu
here=$(cd "$(dirname "$0")" && pwd)
tools=${1:-$here/../../build/tools}
out=${2:-$here}
mkdir -p "$out/sounds" "$out/properties"

# Eight seconds of a slow tune that loops without a seam: A minor up and down, then G.
"$tools/oxmedia" ogg "$out/sounds/music.ogg" --amplitude 0.25 --quality 0.2 --seconds 0.5 \
    --tone 220,261.63,329.63,392,440,392,329.63,261.63,196,246.94,293.66,349.23,392,349.23,293.66,246.94 >/dev/null
# Short effects: a click, a rising pair for a window opening, a bright triad for a find.
"$tools/oxmedia" ogg "$out/sounds/click.ogg" --channels 1 --rate 22050 --amplitude 0.4 --tone 1320:0.04 >/dev/null
"$tools/oxmedia" ogg "$out/sounds/window_open.ogg" --channels 1 --rate 22050 --amplitude 0.3 \
    --tone 523.25:0.08,783.99:0.12 >/dev/null
"$tools/oxmedia" ogg "$out/sounds/found.ogg" --channels 1 --rate 22050 --amplitude 0.3 \
    --tone 659.25:0.1,830.61:0.1,987.77:0.25 >/dev/null
# Each level's music, played while its window is open: level1 a slow walk in D minor, level2 a
# lilting tune in F over a rocking bass line.
"$tools/oxmedia" ogg "$out/sounds/level1_music.ogg" --channels 1 --rate 22050 --amplitude 0.22 --quality 0.1 \
    --seconds 0.4 --tone 293.66,349.23,440,349.23,293.66,261.63,220,261.63,233.08,293.66,349.23,293.66,220,277.18,329.63,277.18 >/dev/null
"$tools/oxmedia" ogg "$out/sounds/level2_music.ogg" --channels 1 --rate 22050 --amplitude 0.22 --quality 0.1 \
    --seconds 0.3 --tone 349.23,440,523.25,440,392,466.16,587.33,466.16,349.23,440,523.25,698.46,523.25,440,392,349.23 >/dev/null
# The level's effects: a hint's shimmer, its soft chime when charged again, a door between
# scenes, and a little fanfare when everything is found.
"$tools/oxmedia" ogg "$out/sounds/hint.ogg" --channels 1 --rate 22050 --amplitude 0.25 \
    --tone 1046.5:0.06,1318.51:0.06,1567.98:0.06,2093:0.12 >/dev/null
"$tools/oxmedia" ogg "$out/sounds/hint_ready.ogg" --channels 1 --rate 22050 --amplitude 0.2 --tone 1760:0.15 >/dev/null
"$tools/oxmedia" ogg "$out/sounds/door.ogg" --channels 1 --rate 22050 --amplitude 0.35 --tone 110:0.08,82.41:0.12 >/dev/null
"$tools/oxmedia" ogg "$out/sounds/complete.ogg" --channels 1 --rate 22050 --amplitude 0.3 \
    --tone 523.25:0.12,659.25:0.12,783.99:0.12,1046.5:0.4 >/dev/null
"$tools/oxdump" sounds "$here/properties/sounds.xml" "$out/properties/sounds.bindump" >/dev/null
