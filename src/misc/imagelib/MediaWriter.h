#pragma once
// Writers for the image files the game reads: PNG in every colour type, PVR containers of
// the encodable formats (with simple DXT block compression), their LZO form, and test
// patterns. Used by the content tool and by tests, which make all their media with them.
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace ox::misc::imagelib {

enum class PngLayout {
    Rgba,       // 8 or 16 bits a channel
    Rgb,        // 8 or 16 bits a channel; alpha dropped
    Palette,    // up to 256 colours, alpha in a transparency table; depth 1 to 8 as they need
    Grey,       // 1, 2, 4, 8 or 16 bits of luma
    GreyAlpha,  // 8 or 16 bits
};

struct PngOptions {
    PngLayout layout = PngLayout::Rgba;
    int bit_depth = 8;  // ignored for Palette
    bool interlaced = false;
};

// Encodes 0xAARRGGBB pixels as PNG. Luma is (299 R + 587 G + 114 B) / 1000, rounded; lower
// depths keep the top bits. False (with a log line) for a palette of more than 256
// colours or a depth the layout does not have.
bool EncodePng(const uint32_t* pixels, uint32_t width, uint32_t height, std::vector<uint8_t>& out,
               const PngOptions& options = {});

// Builds a .pvr image of the given container pixel format from 0xAARRGGBB pixels. Every
// format but PVRTC and ETC can be encoded: the 16- and 32-bit ones in both channel orders
// and DXT1/3/5 (DXT1 keeps 1-bit alpha: alpha under 128 is transparent).
bool EncodePvr(const uint32_t* pixels, uint32_t width, uint32_t height, unsigned pixel_format,
               std::vector<uint8_t>& out);
// Builds a .pvr image around texture bits made elsewhere.
void EncodePvrRaw(unsigned pixel_format, uint32_t width, uint32_t height, const void* data, size_t size,
                  std::vector<uint8_t>& out);
// Compresses a container image into the .pvrlzo form: LZO1X data, the magic word and the
// decompressed size.
bool CompressPvrLzo(const void* data, size_t size, std::vector<uint8_t>& out);

// The container pixel format for a name ("argb8888", "dxt5", ...; see PvrFormatNames), or
// -1.
int PvrFormatByName(const std::string& name);
// The encodable formats' names, one per line with their numbers.
std::string PvrFormatNames();

// Fills `pixels` with a named pattern: "checker" (opaque 8-pixel cells), "gradient"
// (opaque red and green ramps), "circle" (an opaque disc on transparent pixels), "stripes"
// (vertical stripes of alpha 0 and 255, 3 and 5 pixels wide), "noise" (every channel
// pseudo-random, the same each time), "spinner" (square cells side by side, height by
// height, each with a dot one step further round a faint ring: a sprite sheet). False for
// another name.
bool MakePattern(const std::string& name, uint32_t width, uint32_t height, std::vector<uint32_t>& pixels);
const char* PatternNames();

} // namespace ox::misc::imagelib
