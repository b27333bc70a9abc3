#!/bin/sh
# The demo's videos, made by the media tool from generated frames (the same bytes every
# time): the intro before the main menu, and a lamp's glow with its alpha track for the
# level's window. stage-run.sh makes them for `make run`; the headless tests start without
# them, so the game goes straight to its menu there.
#
#   games/demo/make-videos.sh [TOOLS_DIR [OUT_DIR]]
#
# TOOLS_DIR holds oxmedia (default: build/tools of the repository); the videos go to
# OUT_DIR/video (default: this folder).
set -eu
here=$(cd "$(dirname "$0")" && pwd)
tools=${1:-$here/../../build/tools}
out=${2:-$here}
mkdir -p "$out/video"
"$tools/oxmedia" ogv "$out/video/intro.ogv" --size 512x384 --frames 75 --fps 25 --pattern bars --quality 40 >/dev/null
"$tools/oxmedia" ogv "$out/video/lamp.ogv" --size 96x96 --frames 50 --fps 25 --pattern disc >/dev/null
"$tools/oxmedia" ogv "$out/video/lamp_alpha.ogv" --size 96x96 --frames 50 --fps 25 --pattern disc --layout alpha \
    >/dev/null
