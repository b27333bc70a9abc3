#!/bin/sh
# Regenerates every generated file of the demo in this folder, in the order they depend on
# each other: the levels' pictures, the sounds, the fonts, then the textures and the dumps,
# which take the pictures' and glyph images' sizes and masks. The videos are made at staging
# time (stage-run.sh). Needs a build of the tools and ImageMagick.
#
#   games/demo/make-content.sh [TOOLS_DIR]
#
# TOOLS_DIR holds the content tools (default: build/tools of the repository).
set -eu
here=$(cd "$(dirname "$0")" && pwd)
tools=${1:-$here/../../build/tools}
"$here/make-level-art.sh"
"$here/make-sounds.sh" "$tools"
"$here/make-fonts.sh" "$tools"
"$here/make-textures.sh" "$tools"
