#!/bin/sh
# Makes the demo game's two fonts with oxfont from the DejaVu fonts of Debian
# (fonts-dejavu-core): `small` (DejaVu Sans 16 px: ASCII and every letter of the string tables,
# the Russian one under !langs/ru too) and `title` (DejaVu Serif Bold 30 px: ASCII and the
# Cyrillic alphabet). The same FreeType and DejaVu versions give the same bytes.
#
#   games/demo/make-fonts.sh [TOOLS_DIR [OUT_DIR]]
#
# TOOLS_DIR holds oxfont (default: build/tools of the repository); OUT_DIR is where fonts/ is
# written (default: this folder). Run make-textures.sh afterwards: it takes the glyph images'
# sizes and masks.
set -eu
here=$(cd "$(dirname "$0")" && pwd)
tools=${1:-$here/../../build/tools}
out=${2:-$here}
dejavu=/usr/share/fonts/truetype/dejavu
mkdir -p "$out/fonts"

"$tools/oxfont" --font "$dejavu/DejaVuSans.ttf" --size 16 --name fonts/small --dir "$out" \
    --chars 32-126 --text "$here/properties/strings.xml" --text "$here/!langs/ru/properties/strings.xml" >/dev/null
"$tools/oxfont" --font "$dejavu/DejaVuSerif-Bold.ttf" --size 30 --name fonts/title --dir "$out" \
    --chars 32-126,0x401,0x410-0x44F,0x451 --color 0xFFF0D890 >/dev/null
