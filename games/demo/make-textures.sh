#!/bin/sh
# Regenerates the demo game's textures, texture dumps, clips and particles dumps with the content tools;
# the same tools give the same bytes, so the files in this folder can be checked against a run.
#
#   games/demo/make-textures.sh [TOOLS_DIR [OUT_DIR]]
#
# TOOLS_DIR holds oxmedia and oxdump (default: build/tools of the repository); OUT_DIR is
# where textures/ and properties/ are written (default: this folder).
set -eu
here=$(cd "$(dirname "$0")" && pwd)
tools=${1:-$here/../../build/tools}
out=${2:-$here}
mkdir -p "$out/textures" "$out/properties"
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT

"$tools/oxmedia" png "$out/textures/demo_spinner.png" --size 384x48 --pattern spinner
"$tools/oxmedia" png "$out/textures/demo_disc.png" --size 96x96 --pattern circle
"$tools/oxmedia" png "$out/textures/demo_frame.png" --size 48x48 --pattern checker
"$tools/oxmedia" png "$scratch/stone.png" --size 64x64 --pattern gradient
"$tools/oxmedia" pvr "$scratch/stone.png" "$out/textures/demo_stone.pvr" --format dxt1
# The menus' controls: a button strip of four states (normal, over, pressed, disabled) whose
# red rises from state to state, a check box and its tick, a progress bar's frame and bar,
# the menu windows' background and the tool tips' back.
"$tools/oxmedia" png "$out/textures/menu_button.png" --size 640x40 --pattern gradient
"$tools/oxmedia" png "$out/textures/menu_box.png" --size 24x24 --pattern checker
"$tools/oxmedia" png "$out/textures/menu_tick.png" --size 16x16 --pattern circle
"$tools/oxmedia" png "$out/textures/menu_bar_frame.png" --size 400x12 --pattern stripes
"$tools/oxmedia" png "$out/textures/menu_bar.png" --size 400x12 --pattern gradient
"$tools/oxmedia" png "$out/textures/menu_back.png" --size 64x64 --pattern gradient
"$tools/oxmedia" png "$out/textures/menu_tip_back.png" --size 16x16 --pattern checker
# The arrow of the options' combo box and of scroll bars: four 24 x 24 states side by side.
"$tools/oxmedia" png "$out/textures/menu_arrow.png" --size 96x24 --pattern gradient

# The declarations read image sizes from the files, so they come after the images. The fonts'
# glyph images are declared too; they are made by oxfont (see README.md), not here.
[ "$out" = "$here" ] || cp -r "$here/fonts" "$out/"
# The level's pictures are drawn by make-level-art.sh; their masks and sizes are taken here.
[ "$out" = "$here" ] || cp -r "$here/textures/level" "$here/textures/level2" "$out/textures/"
"$tools/oxdump" resources "$here/properties/resources.xml" "$out/properties/resources.bindump" --root "$out" >/dev/null
"$tools/oxdump" texturesalpha "$out/textures" "$out/properties/texturesalpha.bindump" >/dev/null
"$tools/oxdump" clips "$here/properties/clips.xml" "$out/properties/clips.bindump" >/dev/null
"$tools/oxdump" particles "$here/properties/particle.xml" "$out/properties/particles.bindump" >/dev/null
