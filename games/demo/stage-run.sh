#!/bin/sh
# Prepares the folder `make run` starts the demo in: the game's data packed into game.pack by
# oxpack, as a game ships, and the start-up pictures the game shows before its load window:
# two splash screens in fsdata/ and a logo in branch/. They stay out of games/demo, whose copies
# the headless tests start straight into the load window.
#
#   games/demo/stage-run.sh [TOOLS_DIR [OUT_DIR]]
#
# TOOLS_DIR holds oxmedia and oxpack (default: build/tools of the repository); OUT_DIR is the
# folder made (default: build/demo-run). Prints OUT_DIR. With DEMO_LOOSE=1 (`DEMO_LOOSE=1 make
# run`) the loose files are linked in instead of the pack, so that edits of scripts and
# descriptions reach the running game.
set -eu
here=$(cd "$(dirname "$0")" && pwd)
tools=${1:-$here/../../build/tools}
out=${2:-$here/../../build/demo-run}
mkdir -p "$out/fsdata" "$out/branch"
out=$(cd "$out" && pwd)
# What either way of staging left behind: the links of a loose run, an older pack.
find "$out" -maxdepth 1 -type l -exec rm -f {} +
rm -f "$out/game.pack"
# The game's data: every file of this folder but the scripts that make it, the notes and what
# a game run there wrote.
data() {
    for entry in "$here"/*; do
        case $(basename "$entry") in
            *.sh | *.md | k17_*.txt) ;;
            *) [ -e "$entry" ] && echo "$entry" ;;
        esac
    done
}
if [ "${DEMO_LOOSE:-0}" = 1 ]; then
    data | while read -r entry; do
        ln -sfn "$entry" "$out/$(basename "$entry")"
    done
else
    scratch=$(mktemp -d)
    trap 'rm -rf "$scratch"' EXIT
    data | while read -r entry; do
        cp -R "$entry" "$scratch/"
    done
    "$tools/oxpack" build "$scratch" "$out/game.pack" >/dev/null
fi
"$tools/oxmedia" jpeg "$out/fsdata/splash2.jpg" --size 1024x768 --pattern gradient --quality 80 >/dev/null
"$tools/oxmedia" jpeg "$out/fsdata/splash1.jpg" --size 800x600 --pattern circle --quality 80 >/dev/null
"$tools/oxmedia" jpeg "$out/branch/logo1.jpg" --size 512x256 --pattern stripes --quality 80 >/dev/null
echo "$out"
