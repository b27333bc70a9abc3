#!/bin/sh
# Draws the pictures of the demo's levels (their scenes, close-ups and the things to find) with
# ImageMagick's drawing primitives. The same commands give the same bytes: PNG time chunks are
# left out.
#
#   games/demo/make-level-art.sh [OUT_DIR]
#
# OUT_DIR is where textures/level/ (level1) and textures/level2/ are written (default: this
# folder).
set -eu
here=$(cd "$(dirname "$0")" && pwd)
base=${1:-$here}/textures
out=$base/level
mkdir -p "$out" "$base/level2"

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

# Level 2, the mill by the river -----------------------------------------------------------------
out=$base/level2

# The river at night: a stone bridge, reeds, and the mill with its wheel and door on the right.
png bridge 1024x600 \
    -fill '#0c1630' -draw 'rectangle 0,0 1023,599' \
    -fill '#e8e4c8' -draw 'circle 880,80 880,52' \
    -fill '#1c3020' -draw 'polygon 0,330 200,260 420,300 640,250 1023,320 1023,420 0,420' \
    -fill '#183a5c' -draw 'rectangle 0,420 1023,599' \
    -stroke '#2c5a82' -strokewidth 2 -draw 'line 40,470 200,470' -draw 'line 300,520 520,520' -draw 'line 640,560 900,560' \
    -stroke none -fill '#6a6458' -draw 'polygon 260,420 560,420 520,360 300,360' \
    -fill '#0c1630' -draw 'ellipse 410,425 70,50 180,360' \
    -fill '#4a3a2a' -draw 'rectangle 760,180 1000,440' -fill '#6a2a1c' -draw 'polygon 740,180 880,100 1020,180' \
    -fill '#2a1a10' -draw 'rectangle 860,300 940,440' -fill '#e8c040' -draw 'circle 928,372 928,366' \
    -fill '#3a2a1a' -draw 'circle 740,380 740,310' -fill '#0c1630' -draw 'circle 740,380 740,330' \
    -fill '#2e5a34' -draw 'rectangle 0,400 140,430' -draw 'rectangle 20,340 26,420' -draw 'rectangle 60,320 66,420' \
    -draw 'rectangle 100,350 106,420'

# Inside the mill: boards, two great gears on the wall, the millstone and a window.
png mill 1024x600 \
    -fill '#3c2c1e' -draw 'rectangle 0,0 1023,599' \
    -stroke '#2a1c12' -strokewidth 3 -draw 'line 120,0 120,460' -draw 'line 340,0 340,460' -draw 'line 660,0 660,460' \
    -draw 'line 880,0 880,460' \
    -stroke none -fill '#5c4632' -draw 'rectangle 0,460 1023,599' \
    -fill '#6a5a40' -stroke '#3a2c1c' -strokewidth 6 -draw 'circle 250,200 250,110' -draw 'circle 400,140 400,90' \
    -fill '#3c2c1e' -draw 'circle 250,200 250,180' -draw 'circle 400,140 400,128' \
    -stroke none -fill '#8a8478' -draw 'ellipse 500,480 140,40 0,360' -fill '#6a6458' -draw 'ellipse 500,470 140,40 0,360' \
    -fill '#0c1630' -draw 'rectangle 720,80 860,220' -fill '#e8e4c8' -draw 'circle 800,120 800,106' \
    -fill '#5a4024' -draw 'rectangle 785,80 795,220' \
    -fill '#2a1a10' -draw 'rectangle 20,300 110,470'

# The cellar: stone walls, barrels and a ladder up to the mill.
png cellar 1024x600 \
    -fill '#262628' -draw 'rectangle 0,0 1023,599' \
    -stroke '#1a1a1c' -strokewidth 3 -draw 'line 0,120 1023,120' -draw 'line 0,240 1023,240' -draw 'line 0,360 1023,360' \
    -draw 'line 200,0 200,120' -draw 'line 500,120 500,240' -draw 'line 800,0 800,120' -draw 'line 350,240 350,360' \
    -stroke none -fill '#3a3430' -draw 'rectangle 0,460 1023,599' \
    -fill '#6a4a2a' -draw 'ellipse 640,420 60,80 0,360' -draw 'ellipse 960,420 60,80 0,360' \
    -fill '#5a4024' -draw 'rectangle 70,40 80,300' -draw 'rectangle 140,40 150,300' \
    -draw 'rectangle 70,80 150,88' -draw 'rectangle 70,150 150,158' -draw 'rectangle 70,220 150,228'

# The close-up: the inside of the crate, straw on boards, with an X to close it.
png crate_inside 480x300 \
    -fill '#8a6a3a' -draw 'rectangle 0,0 479,299' \
    -fill '#c8a858' -draw 'rectangle 14,14 465,285' \
    -stroke '#a08840' -strokewidth 2 -draw 'line 30,60 200,90' -draw 'line 250,40 440,80' -draw 'line 40,220 230,250' \
    -draw 'line 260,200 450,260' \
    -stroke '#f0e0b0' -strokewidth 5 -draw 'line 440,16 462,38' -draw 'line 462,16 440,38'

# Its things to find, the crank that opens the trapdoor, the trapdoor's two states and the crate.
png fish 64x64 -fill '#a0b8c8' -stroke '#506878' -strokewidth 2 -draw 'ellipse 28,32 22,12 0,360' \
    -draw 'polygon 48,32 62,20 62,44' -fill '#102030' -draw 'circle 16,29 16,27'
png boot 64x64 -fill '#6a4028' -stroke '#3a2010' -strokewidth 2 -draw 'polygon 18,4 38,4 38,40 60,44 60,60 18,60'
png lily 64x64 -fill '#3a8a3a' -stroke '#1a4a1a' -strokewidth 2 -draw 'ellipse 32,40 28,18 0,360' \
    -fill '#f0d0e0' -stroke '#b07090' -draw 'polygon 32,14 40,30 32,36 24,30'
png crank 64x64 -fill '#a0a0a8' -stroke '#505058' -strokewidth 2 -draw 'rectangle 8,28 56,36' \
    -draw 'rectangle 48,8 56,36' -fill '#7a4a20' -draw 'rectangle 44,2 60,12' -fill '#505058' -draw 'circle 10,32 10,24'
png sack 64x64 -fill '#c8b080' -stroke '#7a6440' -strokewidth 2 -draw 'ellipse 32,40 22,22 0,360' \
    -draw 'polygon 24,20 40,20 44,8 20,8'
png hammer 64x64 -fill '#7a4a20' -stroke '#3a2008' -strokewidth 2 -draw 'rectangle 28,14 36,62' \
    -fill '#8a8a90' -stroke '#404048' -draw 'rectangle 10,4 54,18'
png bell 64x64 -fill '#d8b040' -stroke '#7a5a10' -strokewidth 2 -draw 'polygon 32,6 46,16 50,48 56,54 8,54 14,48 18,16' \
    -fill '#7a5a10' -draw 'circle 32,58 32,54'
png jar 64x64 -fill '#80b890' -stroke '#406850' -strokewidth 2 -draw 'rectangle 14,16 50,60' \
    -fill '#a06030' -draw 'rectangle 18,6 46,16'
png clock 64x64 -fill '#f0ead8' -stroke '#6a5a3a' -strokewidth 4 -draw 'circle 32,32 32,6' \
    -strokewidth 3 -draw 'line 32,32 32,14' -draw 'line 32,32 44,36'
png map 64x64 -fill '#e8d8a8' -stroke '#8a7040' -strokewidth 2 -draw 'polygon 4,10 24,4 40,10 60,4 60,54 40,60 24,54 4,60' \
    -stroke '#c03020' -strokewidth 3 -fill none -draw 'line 16,20 30,36' -draw 'line 30,16 16,36'
png compass 64x64 -fill '#c8a050' -stroke '#6a5020' -strokewidth 3 -draw 'circle 32,32 32,4' \
    -fill '#f0ead8' -draw 'circle 32,32 32,12' -stroke none -fill '#c02020' -draw 'polygon 32,12 37,32 27,32' \
    -fill '#303030' -draw 'polygon 32,52 37,32 27,32'
png hatch_closed 200x100 -fill '#6a4a28' -stroke '#3a2410' -strokewidth 3 -draw 'rectangle 4,10 196,96' \
    -draw 'line 4,40 196,40' -draw 'line 4,70 196,70' -fill '#8a8a90' -stroke '#404048' -draw 'circle 170,24 170,14' \
    -fill '#303034' -draw 'rectangle 166,20 174,28'
png hatch_open 200x100 -fill '#101010' -stroke '#3a2410' -strokewidth 3 -draw 'rectangle 4,40 196,96' \
    -fill '#6a4a28' -draw 'polygon 4,40 196,40 180,4 20,4' -fill '#5a4024' -draw 'rectangle 60,50 70,96' \
    -draw 'rectangle 130,50 140,96' -draw 'rectangle 60,70 140,76'
png crate 160x120 -fill '#9a7a48' -stroke '#5a4020' -strokewidth 3 -draw 'rectangle 6,10 154,116' \
    -draw 'line 6,10 154,116' -draw 'line 154,10 6,116' -draw 'line 6,63 154,63'
