#!/bin/sh
# Prepares the folder `make run` starts the demo in: every file of this folder linked in (so
# edits of scripts and descriptions reach the running game), and the start-up pictures the
# game shows before its load window: two splash screens in fsdata/ and a logo in branch/,
# and the videos (make-videos.sh) in video/.
# They stay out of games/demo, whose copies the headless tests start straight into the load
# window.
#
#   games/demo/stage-run.sh [TOOLS_DIR [OUT_DIR]]
#
# TOOLS_DIR holds oxmedia (default: build/tools of the repository); OUT_DIR is the folder made
# (default: build/demo-run). Prints OUT_DIR.
set -eu
here=$(cd "$(dirname "$0")" && pwd)
tools=${1:-$here/../../build/tools}
out=${2:-$here/../../build/demo-run}
mkdir -p "$out/fsdata" "$out/branch"
out=$(cd "$out" && pwd)
for entry in "$here"/*; do
    ln -sfn "$entry" "$out/$(basename "$entry")"
done
"$tools/oxmedia" jpeg "$out/fsdata/splash2.jpg" --size 1024x768 --pattern gradient --quality 80 >/dev/null
"$tools/oxmedia" jpeg "$out/fsdata/splash1.jpg" --size 800x600 --pattern circle --quality 80 >/dev/null
"$tools/oxmedia" jpeg "$out/branch/logo1.jpg" --size 512x256 --pattern stripes --quality 80 >/dev/null
"$here/make-videos.sh" "$tools" "$out"
echo "$out"
