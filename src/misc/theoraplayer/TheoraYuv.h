#pragma once
// 4:2:0 Y'CbCr to 32-bit pixels (0xAARRGGBB words: bytes B, G, R, A), BT.601 studio range,
// in integers with 13 fractional bits through tables indexed by the 8-bit sample, so the
// per-pixel work has no multiplication. Shared by the threaded library and the main-thread
// videos.
#include <theora/codec.h>

#include <cstdint>

// The largest frame side either decoder takes: beyond the texture sizes devices give.
constexpr unsigned kTheoraMaxSide = 8192;

// The visible picture inside the decoder's (16-aligned) frame.
struct TheoraPicture {
    unsigned x = 0, y = 0, width = 0, height = 0;
};

// Writes the picture's colour into `out` (rows of `outStride` words). The alpha byte of each
// word is kept as it is (kAlphaKeep), or set to 255 (kAlphaOpaque).
enum TheoraAlphaMode { kAlphaKeep, kAlphaOpaque };
void TheoraYuvToRgb(const th_ycbcr_buffer planes, const TheoraPicture& picture, uint32_t* out, unsigned outStride,
                    TheoraAlphaMode mode);

// Writes the alpha byte of each word from the luma of `planes`, studio range to full range:
// 0 up to 16, 255 from 235, (Y - 16) * 255 / 219 between.
void TheoraLumaToAlpha(const th_ycbcr_buffer planes, const TheoraPicture& picture, uint32_t* out,
                       unsigned outStride);

// The 8-bit alpha of one studio-range luma value.
uint8_t TheoraStudioToFull(uint8_t luma);
