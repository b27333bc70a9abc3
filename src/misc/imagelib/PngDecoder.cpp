// PNG through libpng. Library errors come back through our error function, which logs and
// jumps to the setjmp of the step that was running; that step then gives false. The steps
// are plain functions holding nothing with a destructor, so a jump never skips one; the
// C++ objects (pixels, row table, the guard that frees the library state) live in the
// callers, outside every jump.
#include "misc/imagelib/ImageLib.h"

#include "diag/Log.h"

#include <csetjmp>
#include <png.h>

namespace ox::misc::imagelib {

namespace {

constexpr const char* kChannel = "imagelib";
// Deflate expands at most 1032 to 1: image data beyond that cannot be in the file.
constexpr uint64_t kMaxDeflateRatio = 1032;

bool ReadHeader(png_structp png, png_infop info, uint32_t* width, uint32_t* height)
{
    if (setjmp(png_jmpbuf(png)))
        return false;
    png_read_info(png, info);
    *width = png_get_image_width(png, info);
    *height = png_get_image_height(png, info);
    return true;
}

// Every colour type to 8-bit B, G, R, A bytes: the little-endian 0xAARRGGBB word.
bool SetUpTransforms(png_structp png, png_infop info, size_t* rawRowBytes, size_t* rowBytes)
{
    if (setjmp(png_jmpbuf(png)))
        return false;
    *rawRowBytes = png_get_rowbytes(png, info);
    const int colorType = png_get_color_type(png, info);
    const int depth = png_get_bit_depth(png, info);
    const bool transparencyTable = png_get_valid(png, info, PNG_INFO_tRNS) != 0;

    if (colorType == PNG_COLOR_TYPE_PALETTE)
        png_set_palette_to_rgb(png);
    if (colorType == PNG_COLOR_TYPE_GRAY && depth < 8)
        png_set_expand_gray_1_2_4_to_8(png);
    if (transparencyTable)
        png_set_tRNS_to_alpha(png);
    if (depth == 16)
        png_set_strip_16(png);
    if (!(colorType & PNG_COLOR_MASK_ALPHA) && !transparencyTable)
        png_set_filler(png, 0xFF, PNG_FILLER_AFTER);
    if (colorType == PNG_COLOR_TYPE_GRAY || colorType == PNG_COLOR_TYPE_GRAY_ALPHA)
        png_set_gray_to_rgb(png);
    png_set_bgr(png);
    png_set_interlace_handling(png);
    png_read_update_info(png, info);
    *rowBytes = png_get_rowbytes(png, info);
    return true;
}

bool ReadRows(png_structp png, png_bytepp rows)
{
    if (setjmp(png_jmpbuf(png)))
        return false;
    png_read_image(png, rows);
    return true;
}

// Frees the library state whatever way a decode ends.
struct PngGuard {
    png_structp png = nullptr;
    png_infop info = nullptr;
    ~PngGuard() { png_destroy_read_struct(&png, info ? &info : nullptr, nullptr); }
};

} // namespace

struct CPNGDecoder::Callbacks {
    static void Read(png_structp png, png_bytep out, size_t length)
    {
        auto* self = static_cast<CPNGDecoder*>(png_get_io_ptr(png));
        if (self->Read(out, length) != length)
            png_error(png, "Read Error");
    }

    static void Error(png_structp png, png_const_charp message)
    {
        auto* self = static_cast<CPNGDecoder*>(png_get_error_ptr(png));
        OX_LOG(kChannel, diag::LogError, "PNG error in \"%s\": %s", self->SourceName(), message);
        png_longjmp(png, 1);
    }

    static void Warning(png_structp png, png_const_charp message)
    {
        auto* self = static_cast<CPNGDecoder*>(png_get_error_ptr(png));
        OX_LOG(kChannel, diag::LogWarning, "PNG warning in \"%s\": %s", self->SourceName(), message);
    }

    // Creates the library state reading from `self`; false when it cannot be made.
    static bool Open(CPNGDecoder* self, PngGuard& guard)
    {
        guard.png = png_create_read_struct(PNG_LIBPNG_VER_STRING, self, Error, Warning);
        if (!guard.png)
            return false;
        guard.info = png_create_info_struct(guard.png);
        if (!guard.info)
            return false;
        png_set_read_fn(guard.png, self, Read);
        png_set_user_limits(guard.png, kMaxImageSide, kMaxImageSide);
        if (!self->m_CheckCrc) {
            png_set_crc_action(guard.png, PNG_CRC_QUIET_USE, PNG_CRC_QUIET_USE);
#ifdef PNG_IGNORE_ADLER32
            png_set_option(guard.png, PNG_IGNORE_ADLER32, PNG_OPTION_ON);
#endif
        }
        return true;
    }
};

bool CPNGDecoder::GetInfo(const void* data, size_t size, uint32_t& width, uint32_t& height)
{
    SetSource(data, size);
    PngGuard guard;
    if (!Callbacks::Open(this, guard)) {
        OX_LOG(kChannel, diag::LogError, "PNG: cannot create the reader for \"%s\"", SourceName());
        return false;
    }
    uint32_t w = 0, h = 0;
    if (!ReadHeader(guard.png, guard.info, &w, &h))
        return false;
    width = w;
    height = h;
    return true;
}

bool CPNGDecoder::Decode(const void* data, size_t size, Image& image)
{
    image = Image{};
    SetSource(data, size);
    PngGuard guard;
    if (!Callbacks::Open(this, guard)) {
        OX_LOG(kChannel, diag::LogError, "PNG: cannot create the reader for \"%s\"", SourceName());
        return false;
    }
    uint32_t width = 0, height = 0;
    size_t rawRowBytes = 0, rowBytes = 0;
    if (!ReadHeader(guard.png, guard.info, &width, &height) ||
        !SetUpTransforms(guard.png, guard.info, &rawRowBytes, &rowBytes))
        return false;

    const uint64_t pixelCount = uint64_t(width) * height;
    if (width == 0 || height == 0 || pixelCount > GetMaxImagePixels()) {
        OX_LOG(kChannel, diag::LogError, "PNG error in \"%s\": %ux%u pixels are not accepted", SourceName(),
               width, height);
        return false;
    }
    if (uint64_t(height) * (rawRowBytes + 1) > uint64_t(Remaining()) * kMaxDeflateRatio + 4096) {
        OX_LOG(kChannel, diag::LogError, "PNG error in \"%s\": the file is too short for %ux%u pixels",
               SourceName(), width, height);
        return false;
    }
    if (rowBytes != size_t(width) * 4) {
        OX_LOG(kChannel, diag::LogError, "PNG error in \"%s\": unexpected row size %zu", SourceName(), rowBytes);
        return false;
    }

    std::vector<uint32_t> pixels(pixelCount);
    std::vector<png_bytep> rows(height);
    for (uint32_t y = 0; y < height; ++y)
        rows[y] = reinterpret_cast<png_bytep>(pixels.data() + size_t(y) * width);
    if (!ReadRows(guard.png, rows.data()))
        return false;

    image.width = width;
    image.height = height;
    image.pixels = std::move(pixels);
    return true;
}

} // namespace ox::misc::imagelib
