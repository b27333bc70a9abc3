#!/bin/sh
# Draws the pictures of the demo's level (two scenes, a close-up and the things to find) with
# ImageMagick's drawing primitives. The same commands give the same bytes: PNG time chunks are
# left out.
#
#   games/demo/make-level-art.sh [OUT_DIR]
#
# OUT_DIR is where textures/level/ is written (default: this folder).
set -eu
here=$(cd "$(dirname "$0")" && pwd)
out=${1:-$here}/textures/level
mkdir -p "$out"

png() { # png NAME SIZE DRAWING...
    name=$1 size=$2
    shift 2
    convert -size "$size" xc:none "$@" -define png:exclude-chunks=date,time +set date:create +set date:modify \
        "PNG32:$out/$name.png"
}

# The garden at night: sky, moon, hills, a path, a fence and a shed door on the right.
png garden 1024x600 \
    -fill '#101a38' -draw 'rectangle 0,0 1023,599' \
    -fill '#1a2a50' -draw 'rectangle 0,220 1023,599' \
    -fill '#f4eec0' -draw 'circle 150,100 150,60' -fill '#101a38' -draw 'circle 168,92 168,58' \
    -fill '#223c28' -draw 'ellipse 250,420 420,180 180,360' -draw 'ellipse 800,440 460,200 180,360' \
    -fill '#2e5a34' -draw 'rectangle 0,430 1023,599' \
    -fill '#6a5438' -draw 'polygon 430,599 600,599 540,430 500,430' \
    -fill '#5a4024' -draw 'rectangle 20,380 380,392' -draw 'rectangle 20,410 380,422' \
    -draw 'rectangle 40,360 52,440' -draw 'rectangle 140,360 152,440' -draw 'rectangle 240,360 252,440' \
    -draw 'rectangle 340,360 352,440' \
    -fill '#4a3626' -draw 'rectangle 820,250 1000,460' -fill '#7a2e20' -draw 'polygon 800,250 910,170 1020,250' \
    -fill '#2a1a10' -draw 'rectangle 880,330 950,460' -fill '#e8c040' -draw 'circle 940,400 940,394'

# Inside the shed: planks, a shelf, a window with the moon.
png shed 1024x600 \
    -fill '#3a2a1c' -draw 'rectangle 0,0 1023,599' \
    -stroke '#2a1c12' -strokewidth 4 \
    -draw 'line 0,100 1023,100' -draw 'line 0,200 1023,200' -draw 'line 0,300 1023,300' -draw 'line 0,400 1023,400' \
    -stroke none -fill '#5a4430' -draw 'rectangle 0,470 1023,599' \
    -fill '#6a5034' -draw 'rectangle 100,250 520,266' \
    -fill '#101a38' -draw 'rectangle 640,80 860,240' -fill '#f4eec0' -draw 'circle 700,130 700,110' \
    -fill '#5a4024' -draw 'rectangle 745,80 755,240' -draw 'rectangle 640,155 860,165' \
    -fill '#2a1a10' -draw 'rectangle 20,300 110,470'

# The close-up: the inside of the chest, velvet with a brass rim and a small X to close it.
png chest_inside 480x300 \
    -fill '#b08838' -draw 'rectangle 0,0 479,299' \
    -fill '#5a1028' -draw 'rectangle 14,14 465,285' \
    -fill '#48081c' -draw 'rectangle 30,30 449,269' \
    -stroke '#f0e0b0' -strokewidth 5 -draw 'line 440,16 462,38' -draw 'line 462,16 440,38'

# The things to find, each on its own.
png coin 64x64 -fill '#e8c040' -stroke '#8a6a10' -strokewidth 3 -draw 'circle 32,32 32,8' \
    -fill none -draw 'circle 32,32 32,18'
png feather 64x64 -fill '#e0e8f0' -stroke '#8090a0' -strokewidth 2 -draw 'ellipse 32,32 10,28 0,360' \
    -draw 'line 32,4 32,62'
png apple 64x64 -fill '#c82828' -stroke '#701010' -strokewidth 2 -draw 'circle 32,36 32,12' \
    -stroke '#5a3a10' -strokewidth 3 -draw 'line 32,14 36,4' -stroke none -fill '#40a040' -draw 'ellipse 42,10 8,4 0,360'
png leaf 64x64 -fill '#58b038' -stroke '#2a6018' -strokewidth 2 -draw 'ellipse 32,32 14,28 0,360' \
    -draw 'line 32,6 32,60'
png key 64x64 -fill '#d8b040' -stroke '#7a5a10' -strokewidth 2 -draw 'circle 16,32 16,20' \
    -draw 'rectangle 26,28 60,36' -draw 'rectangle 48,36 54,46' -draw 'rectangle 38,36 43,44' \
    -fill none -draw 'circle 16,32 16,26'
png bottle 64x64 -fill '#3a8ac0' -stroke '#1a4a70' -strokewidth 2 -draw 'rectangle 18,24 46,60' \
    -draw 'rectangle 26,6 38,24' -fill '#a06030' -draw 'rectangle 25,2 39,8'
png candle 64x64 -fill '#f0ead8' -stroke '#a09880' -strokewidth 2 -draw 'rectangle 22,22 42,62' \
    -stroke none -fill '#ffb020' -draw 'ellipse 32,12 6,10 0,360' -fill '#fff0a0' -draw 'ellipse 32,14 3,5 0,360'
png shell 64x64 -fill '#f0b8a0' -stroke '#a06050' -strokewidth 2 -draw 'polygon 32,56 6,22 18,10 32,6 46,10 58,22' \
    -draw 'line 32,56 18,12' -draw 'line 32,56 32,8' -draw 'line 32,56 46,12'
png ring 64x64 -fill none -stroke '#e8c040' -strokewidth 7 -draw 'circle 32,36 32,16' \
    -stroke none -fill '#60d0f0' -draw 'polygon 32,2 42,12 32,22 22,12'
png gem 64x64 -fill '#d03080' -stroke '#701040' -strokewidth 2 -draw 'polygon 32,58 6,24 18,8 46,8 58,24' \
    -fill '#f070b0' -draw 'polygon 18,8 46,8 40,24 24,24'
png chest_closed 160x120 -fill '#7a4a20' -stroke '#3a2008' -strokewidth 3 -draw 'rectangle 6,40 154,116' \
    -draw 'rectangle 6,10 154,44' -fill '#b08838' -draw 'rectangle 70,36 90,62' -fill '#2a1a10' -draw 'circle 80,50 80,46'
png chest_open 160x120 -fill '#7a4a20' -stroke '#3a2008' -strokewidth 3 -draw 'rectangle 6,40 154,116' \
    -fill '#48081c' -draw 'rectangle 14,40 146,60' -fill '#7a4a20' -draw 'polygon 6,40 154,40 140,2 20,2'
