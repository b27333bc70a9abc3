#include "misc/imagelib/PvrContainer.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/GamePack.h"

#include <cstring>
#include <lzo/lzo1x.h>
#include <memory>

namespace ox::misc::imagelib {

namespace {

constexpr const char* kChannel = "imagelib";
// LZO1X expands at most about 255 to 1 (a long match costs one byte per 255 of length).
constexpr uint64_t kMaxLzoRatio = 256;
// No texture file decompresses to more than this.
constexpr uint64_t kMaxLzoOutput = 256u << 20;

alignas(16) uint8_t g_LzoBuffer[kLzoStaticBufferSize];
bool g_LzoReady = false;

uint32_t ReadU32(const uint8_t* p)
{
    uint32_t value;
    memcpy(&value, p, sizeof(value));
    return value;
}

bool HasPathPart(const char* path, const char* part) { return strstr(path, part) != nullptr; }

// Reads a file through the pack, decompressing a ".pvrlzo" one, and hands the container
// image to `use`.
bool WithContainer(CGamePack* packOrNull, const char* path, const std::function<bool(const void*, size_t)>& use)
{
    CGamePack& pack = packOrNull ? *packOrNull : g_GamePack::Instance();
    unsigned size = 0;
    const void* file = pack.Open(path, &size);
    if (!file)
        return false;
    bool result = HasPathPart(path, ".pvrlzo") ? PvrDecompressLzo(file, size, path, use) : use(file, size);
    pack.Close(file);
    return result;
}

} // namespace

unsigned PvrInternalFormat(unsigned pixel_format)
{
    switch (pixel_format) {
    case PvrARGB4444: return 3;
    case PvrARGB1555: return 6;
    case PvrRGB565:
    case PvrRGB565b: return 5;
    case PvrARGB8888: return 1;
    case PvrRGBA4444: return 4;
    case PvrRGBA5551: return 7;
    case PvrRGBA8888: return 2;
    case PvrPVRTC2: return 9;
    case PvrPVRTC4: return 8;
    case PvrDXT1: return 11;
    case PvrDXT3: return 13;
    case PvrDXT5: return 15;
    case PvrETC: return 10;
    default: return 0;
    }
}

size_t PvrTextureBytes(unsigned internal_format, uint32_t width, uint32_t height)
{
    const size_t pixels = size_t(width) * height;
    const size_t blocks = size_t((width + 3) / 4) * ((height + 3) / 4);
    switch (internal_format) {
    case 1:
    case 2: return pixels * 4;
    case 3:
    case 4:
    case 5:
    case 6:
    case 7: return pixels * 2;
    case 10:
    case 11: return blocks * 8;
    case 13:
    case 15: return blocks * 16;
    case 8:
    case 9: {
        // PVRTC counts blocks of 4 x 4 (4 bits) or 8 x 4 (2 bits), at least two each way.
        size_t bx = internal_format == 9 ? width >> 3 : width >> 2;
        size_t by = height >> 2;
        return (bx < 2 ? 2 : bx) * (by < 2 ? 2 : by) * 8;
    }
    default: return 0;
    }
}

bool PvrParse(const void* file, size_t size, const char* name, PvrTexture& texture)
{
    texture = PvrTexture{};
    if (!file || size < sizeof(PvrHeader)) {
        OX_LOG(kChannel, diag::LogError, "PVR file \"%s\" is too short for its header (%zu bytes)", name, size);
        return false;
    }
    const auto* bytes = static_cast<const uint8_t*>(file);
    if (bytes[44] != 'P' || bytes[45] != 'V' || bytes[46] != 'R' || bytes[47] != '!') {
        OX_LOG(kChannel, diag::LogError, "PVR file \"%s\" has no \"PVR!\" mark", name);
        return false;
    }
    PvrHeader header;
    memcpy(&header, bytes, sizeof(header));
    const unsigned pixelFormat = header.flags & 0xFF;
    const unsigned format = PvrInternalFormat(pixelFormat);
    if (format == 0) {
        OX_LOG(kChannel, diag::LogError, "PVR file \"%s\" has the unsupported pixel format %u", name, pixelFormat);
        return false;
    }
    if (header.width == 0 || header.height == 0 || header.width > 0xFFFF || header.height > 0xFFFF) {
        OX_LOG(kChannel, diag::LogError, "PVR file \"%s\" has the size %ux%u", name, header.width, header.height);
        return false;
    }
    // The surface copies what its format and size need, so that much must be there.
    const size_t needed = PvrTextureBytes(format, header.width, header.height);
    const size_t available = size - sizeof(PvrHeader);
    const bool computed = format == 8 || format == 9;
    const size_t dataSize = computed ? needed : header.data_size;
    if (dataSize < needed || dataSize > available) {
        OX_LOG(kChannel, diag::LogError,
               "PVR file \"%s\" is truncated or corrupt: %zu bytes of data for %zu needed, %zu in the file", name,
               dataSize, needed, available);
        return false;
    }
    texture.data = bytes + sizeof(PvrHeader);
    texture.size = dataSize;
    texture.width = header.width;
    texture.height = header.height;
    texture.internal_format = format;
    return true;
}

bool PvrDecompressLzo(const void* file, size_t size, const char* name,
                      const std::function<bool(const void*, size_t)>& use)
{
    if (!g_LzoReady) {
        int result = lzo_init();
        OX_ASSERT(result == LZO_E_OK);
        if (result != LZO_E_OK)
            return false;
        g_LzoReady = true;
    }
    const auto* bytes = static_cast<const uint8_t*>(file);
    if (!file || size < 8 || ReadU32(bytes + size - 8) != g_LzoMagicNumber) {
        OX_LOG(kChannel, diag::LogError, "LZO file \"%s\" has no valid trailer", name);
        return false;
    }
    const size_t inSize = size - 8;
    const uint32_t outSize = ReadU32(bytes + size - 4);
    if (outSize == 0 || outSize > kMaxLzoOutput || outSize > uint64_t(inSize) * kMaxLzoRatio + 64) {
        OX_LOG(kChannel, diag::LogError, "LZO file \"%s\" claims %u bytes from %zu", name, outSize, inSize);
        return false;
    }

    std::unique_ptr<uint8_t[]> allocated;
    uint8_t* out = g_LzoBuffer;
    if (outSize > kLzoStaticBufferSize) {
        allocated.reset(new uint8_t[outSize]);
        out = allocated.get();
    }
    lzo_uint actual = outSize;
    int result = lzo1x_decompress_safe(bytes, inSize, out, &actual, nullptr);
    if (result != LZO_E_OK || actual != outSize) {
        OX_LOG(kChannel, diag::LogError, "LZO file \"%s\" is corrupt (result %d, %lu of %u bytes)", name, result,
               static_cast<unsigned long>(actual), outSize);
        return false;
    }
    return use(out, outSize);
}

bool PvrIsInLzoStaticBuffer(const void* pointer)
{
    const auto* p = static_cast<const uint8_t*>(pointer);
    return p >= g_LzoBuffer && p < g_LzoBuffer + kLzoStaticBufferSize;
}

bool PvrGetInfo(const char* path, uint32_t& width, uint32_t& height, unsigned& internal_format, CGamePack* pack)
{
    if (!path)
        return false;
    return WithContainer(pack, path, [&](const void* data, size_t size) {
        PvrTexture texture;
        if (!PvrParse(data, size, path, texture))
            return false;
        width = texture.width;
        height = texture.height;
        internal_format = texture.internal_format;
        return true;
    });
}

bool PvrLoadBits(const char* path, const std::function<bool(const PvrTexture&)>& load, CGamePack* pack)
{
    if (!path)
        return false;
    return WithContainer(pack, path, [&](const void* data, size_t size) {
        PvrTexture texture;
        return PvrParse(data, size, path, texture) && load(texture);
    });
}

} // namespace ox::misc::imagelib
