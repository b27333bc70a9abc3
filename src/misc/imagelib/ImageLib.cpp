#include "misc/imagelib/ImageLib.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/GamePack.h"
#include "misc/sys/Path.h"

#include <algorithm>
#include <cstring>
#include <strings.h>

namespace ox::misc::imagelib {

namespace {

constexpr uint64_t kDefaultMaxPixels = uint64_t(kMaxImageSide) * kMaxImageSide / 4;
uint64_t g_MaxPixels = kDefaultMaxPixels;

// The text behind the last '.', or null.
const char* Extension(const char* path)
{
    const char* dot = strrchr(path, '.');
    return dot ? dot + 1 : nullptr;
}

// Reads a whole file through the game pack and hands it to `use`.
template <class Use>
bool WithFile(const char* path, Use use)
{
    CGamePack& pack = g_GamePack::Instance();
    unsigned size = 0;
    const void* data = pack.Open(path, &size);
    if (!data)
        return false;
    bool result = use(data, size);
    pack.Close(data);
    return result;
}

} // namespace

void SetMaxImagePixels(uint64_t pixels) { g_MaxPixels = pixels ? pixels : kDefaultMaxPixels; }
uint64_t GetMaxImagePixels() { return g_MaxPixels; }

bool CImageDecoder::GetInfo(const void*, size_t, uint32_t&, uint32_t&) { return false; }
bool CImageDecoder::Decode(const void*, size_t, Image&) { return false; }

bool CImageDecoder::GetInfoFromFile(const char* path, uint32_t& width, uint32_t& height)
{
    m_Name = path;
    bool result = WithFile(path, [&](const void* data, unsigned size) { return GetInfo(data, size, width, height); });
    m_Name.clear();
    return result;
}

bool CImageDecoder::DecodeFromFile(const char* path, Image& image)
{
    image = Image{};
    m_Name = path;
    bool result = WithFile(path, [&](const void* data, unsigned size) { return Decode(data, size, image); });
    m_Name.clear();
    return result;
}

void CImageDecoder::SetSource(const void* data, size_t size)
{
    m_Data = static_cast<const uint8_t*>(data);
    m_Size = data ? size : 0;
    m_Position = 0;
}

size_t CImageDecoder::Read(void* buffer, size_t count)
{
    size_t n = std::min(count, Remaining());
    if (n) {
        memcpy(buffer, m_Data + m_Position, n);
        m_Position += n;
    }
    return n;
}

std::unique_ptr<CImageDecoder> MakeDecoder(const char* path)
{
    const char* extension = path ? Extension(path) : nullptr;
    if (!extension)
        return nullptr;
    if (strcasecmp(extension, "png") == 0)
        return std::make_unique<CPNGDecoder>();
    if (strcasecmp(extension, "jpg") == 0)
        return std::make_unique<CJPEGDecoder>();
    return nullptr;
}

bool GetImageInfo(const char* path, uint32_t& width, uint32_t& height)
{
    std::unique_ptr<CImageDecoder> decoder = MakeDecoder(path);
    return decoder && decoder->GetInfoFromFile(path, width, height);
}

bool LoadImage(const char* path, Image& image)
{
    OX_ASSERT_A(path && strrchr(path, '.'));
    std::unique_ptr<CImageDecoder> decoder = MakeDecoder(path);
    if (!decoder) {
        OX_LOG("imagelib", diag::LogError, "Unknown image type: \"%s\"", path ? path : "");
        return false;
    }
    return decoder->DecodeFromFile(path, image);
}

bool DecodeImageOnDisk(const std::string& path, Image& image, std::string& error)
{
    std::unique_ptr<CImageDecoder> decoder = MakeDecoder(path.c_str());
    std::string data;
    if (!decoder) {
        error = path + ": only .png and .jpg images can be read";
        return false;
    }
    if (!sys::ReadWholeFile(path, data)) {
        error = "cannot read " + path;
        return false;
    }
    decoder->SetName(path);
    if (!decoder->Decode(data.data(), data.size(), image)) {
        error = path + " is not a valid image";
        return false;
    }
    return true;
}

void ResampleImage(const uint32_t* _source, uint32_t _width, uint32_t _height, uint32_t* _destination,
                   uint32_t _new_width, uint32_t _new_height)
{
    if (_new_width == 0 || _new_height < 1 || _width == 0 || _height == 0)
        return;
    const float stepX = float(_width) / float(_new_width);
    const float stepY = float(_height) / float(_new_height);
    const int boxW = std::max(1, int(stepX));
    const int boxH = std::max(1, int(stepY));
    const uint64_t count = uint64_t(boxW) * uint64_t(boxH);

    float suby = 0.0f;
    for (uint32_t y = 0; y < _new_height; ++y, suby += stepY) {
        float subx = 0.0f;
        for (uint32_t x = 0; x < _new_width; ++x, subx += stepX) {
            uint64_t a = 0, r = 0, g = 0, b = 0;
            for (int sy = 0; sy < boxH; ++sy) {
                OX_ASSERT(int(sy + suby) < int(_height));
                uint32_t row = std::min(uint32_t(sy + suby), _height - 1);
                for (int sx = 0; sx < boxW; ++sx) {
                    OX_ASSERT(int(sx + subx) < int(_width));
                    uint32_t column = std::min(uint32_t(sx + subx), _width - 1);
                    uint32_t p = _source[size_t(row) * _width + column];
                    a += p >> 24;
                    r += (p >> 16) & 0xFF;
                    g += (p >> 8) & 0xFF;
                    b += p & 0xFF;
                }
            }
            _destination[size_t(y) * _new_width + x] =
                uint32_t((a / count) << 24 | (r / count) << 16 | (g / count) << 8 | (b / count));
        }
    }
}

} // namespace ox::misc::imagelib
