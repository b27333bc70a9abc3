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
"$tools/oxdump" sounds "$here/properties/sounds.xml" "$out/properties/sounds.bindump" >/dev/null
