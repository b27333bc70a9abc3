#pragma once
// The legacy PowerVR texture container (.pvr) and its LZO-compressed form (.pvrlzo): a
// 52-byte little-endian header and the pre-encoded texture bits, handed to the surface
// as they are.
#include <cstddef>
#include <cstdint>
#include <functional>

namespace ox::misc {
class CGamePack;
}

namespace ox::misc::imagelib {

struct PvrHeader {
    uint32_t header_size;
    uint32_t height;
    uint32_t width;
    uint32_t mipmap_count;
    uint32_t flags;  // the low byte is the pixel format
    uint32_t data_size;
    uint32_t bit_count;
    uint32_t red_mask;
    uint32_t green_mask;
    uint32_t blue_mask;
    uint32_t alpha_mask;
    char magic[4];  // "PVR!"
    uint32_t surface_count;
};
static_assert(sizeof(PvrHeader) == 52);
static_assert(offsetof(PvrHeader, flags) == 16 && offsetof(PvrHeader, magic) == 44);

// The trailer word of a .pvrlzo file, in front of the decompressed size.
constexpr uint32_t g_LzoMagicNumber = 0x7D620ABD;
// Decompressed files up to this size use one reused buffer instead of an allocation.
constexpr size_t kLzoStaticBufferSize = 0x40000;

// Pixel formats of the container (the low byte of the flags).
enum PvrPixelFormat : unsigned {
    PvrARGB4444 = 0,
    PvrARGB1555 = 1,
    PvrRGB565 = 2,
    PvrARGB8888 = 5,
    PvrRGBA4444 = 16,
    PvrRGBA5551 = 17,
    PvrRGBA8888 = 18,
    PvrRGB565b = 19,
    PvrPVRTC2 = 24,
    PvrPVRTC4 = 25,
    PvrDXT1 = 32,
    PvrDXT3 = 34,
    PvrDXT5 = 36,
    PvrETC = 54,
};

// The surface format for a container pixel format; 0 for one that is not supported.
unsigned PvrInternalFormat(unsigned pixel_format);
// The bytes a top-level image of this surface format and size needs; 0 if unknown.
size_t PvrTextureBytes(unsigned internal_format, uint32_t width, uint32_t height);

// The top level of a texture as LoadBits takes it.
struct PvrTexture {
    const void* data = nullptr;
    size_t size = 0;
    uint32_t width = 0;
    uint32_t height = 0;
    unsigned internal_format = 0;
};

// Reads a container image in memory (decompressed). Checks the magic, the format and
// that the data the texture needs lies inside `size`; `name` is for the log lines.
bool PvrParse(const void* file, size_t size, const char* name, PvrTexture& texture);

// Decompresses a .pvrlzo image in memory and hands the result to `use`. The output is
// only valid during the call (a small one lives in a buffer the next call reuses).
bool PvrDecompressLzo(const void* file, size_t size, const char* name,
                      const std::function<bool(const void* data, size_t size)>& use);
// Whether a pointer lies in the reused decompression buffer (for tests).
bool PvrIsInLzoStaticBuffer(const void* pointer);

// The size and surface format of a .pvr or .pvrlzo file read through `pack` (the
// process-wide game pack when null).
bool PvrGetInfo(const char* path, uint32_t& width, uint32_t& height, unsigned& internal_format,
                CGamePack* pack = nullptr);
// Reads a file through `pack` (the process-wide game pack when null) and hands its top level
// to `load`, returning what it returns; false without calling it when the file is missing
// or bad.
bool PvrLoadBits(const char* path, const std::function<bool(const PvrTexture&)>& load, CGamePack* pack = nullptr);

// Loads a container file into a surface through its LoadBits(data, size, width, height,
// internal_format).
template <class Surface>
bool PvrLoad(const char* path, Surface* surface)
{
    return PvrLoadBits(path, [surface](const PvrTexture& t) {
        return surface->LoadBits(t.data, t.size, t.width, t.height, t.internal_format);
    });
}

} // namespace ox::misc::imagelib
