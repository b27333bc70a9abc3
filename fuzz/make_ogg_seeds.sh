#!/bin/sh
# Regenerates the seeds of fuzz_ogg with the media tool:
#   fuzz/make_ogg_seeds.sh build/tools/oxmedia fuzz/corpus/fuzz_ogg
set -eu
tool=$(cd "$(dirname "$1")" && pwd)/$(basename "$1")
out=$2
mkdir -p "$out"
cd "$out"
"$tool" ogg mono.ogg --rate 8000 --channels 1 --seconds 0.1 --quality -0.1 >/dev/null
"$tool" ogg stereo.ogg --rate 11025 --tone 300:0.05,0:0.02,900:0.05 --quality 0 >/dev/null
"$tool" ogg noend.ogg --rate 8000 --channels 1 --seconds 0.2 --quality -0.1 --no-end >/dev/null
