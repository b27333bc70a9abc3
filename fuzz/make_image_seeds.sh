#!/bin/sh
# Regenerates the seeds of fuzz_image with the media tool:
#   fuzz/make_image_seeds.sh build/tools/oxmedia fuzz/corpus/fuzz_image
set -eu
tool=$1
out=$2
mkdir -p "$out"
cd "$out"
"$tool" png rgba.png --size 8x6 --pattern noise
"$tool" png palette.png --size 16x8 --pattern circle --layout palette --interlace
"$tool" png grey1.png --size 9x9 --pattern stripes --layout grey --depth 1
"$tool" png stripes.png --size 19x5 --pattern stripes
"$tool" png grey16.png --size 5x4 --pattern gradient --layout greyalpha --depth 16
"$tool" jpeg baseline.jpg --size 16x16 --pattern gradient --quality 50
"$tool" jpeg grey.jpg --size 17x9 --pattern checker --grey
"$tool" jpeg progressive.jpg --size 24x16 --pattern gradient --progressive
"$tool" pvr rgba.png argb4444.pvr --format argb4444
"$tool" pvr palette.png dxt5.pvr --format dxt5
"$tool" pvr palette.png dxt1.pvrlzo --format dxt1
"$tool" pvr rgba.png rgba8888.pvrlzo --format rgba8888
"$tool" alpha texturesalpha.bindump disc=palette.png bars=stripes.png solid=baseline.jpg >/dev/null
