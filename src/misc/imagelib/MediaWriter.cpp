#include "misc/imagelib/MediaWriter.h"

#include "diag/Log.h"
#include "misc/imagelib/PvrContainer.h"

#include <algorithm>
#include <cmath>
#include <csetjmp>
#include <cstring>
#include <lzo/lzo1x.h>
#include <map>
#include <png.h>

namespace ox::misc::imagelib {

namespace {

constexpr const char* kChannel = "imagelib";

uint8_t Alpha(uint32_t p) { return uint8_t(p >> 24); }
uint8_t Red(uint32_t p) { return uint8_t(p >> 16); }
uint8_t Green(uint32_t p) { return uint8_t(p >> 8); }
uint8_t Blue(uint32_t p) { return uint8_t(p); }
uint8_t Luma(uint32_t p) { return uint8_t((299 * Red(p) + 587 * Green(p) + 114 * Blue(p) + 500) / 1000); }

// ---- PNG ----

void PngWrite(png_structp png, png_bytep data, size_t length)
{
    auto* out = static_cast<std::vector<uint8_t>*>(png_get_io_ptr(png));
    out->insert(out->end(), data, data + length);
}

void PngFlush(png_structp) {}

void PngWriteError(png_structp png, png_const_charp message)
{
    OX_LOG(kChannel, diag::LogError, "PNG write error: %s", message);
    png_longjmp(png, 1);
}

// Writes prepared rows; the palette and transparency table are set by the caller. Nothing
// here has a destructor: a library error jumps back to the setjmp.
bool WritePngRows(png_structp png, png_infop info, uint32_t width, uint32_t height, int depth, int colorType,
                  bool interlaced, const png_color* palette, int paletteSize, const png_byte* alphas,
                  int alphaCount, png_bytepp rows)
{
    if (setjmp(png_jmpbuf(png)))
        return false;
    png_set_IHDR(png, info, width, height, depth, colorType,
                 interlaced ? PNG_INTERLACE_ADAM7 : PNG_INTERLACE_NONE, PNG_COMPRESSION_TYPE_DEFAULT,
                 PNG_FILTER_TYPE_DEFAULT);
    if (paletteSize)
        png_set_PLTE(png, info, palette, paletteSize);
    if (alphaCount)
        png_set_tRNS(png, info, alphas, alphaCount, nullptr);
    png_write_info(png, info);
    // Rows below 8 bits hold one sample a byte; the library packs them.
    if (depth < 8)
        png_set_packing(png);
    png_write_image(png, rows);
    png_write_end(png, nullptr);
    return true;
}

struct PngWriteGuard {
    png_structp png = nullptr;
    png_infop info = nullptr;
    ~PngWriteGuard() { png_destroy_write_struct(&png, info ? &info : nullptr); }
};

void PutSample(std::vector<uint8_t>& row, uint8_t value, int depth)
{
    if (depth == 16) {
        row.push_back(value);
        row.push_back(value);  // v * 257, big-endian
    } else {
        row.push_back(uint8_t(value >> (8 - depth)));
    }
}

// ---- PVR ----

uint16_t To565(uint32_t p) { return uint16_t((Red(p) >> 3) << 11 | (Green(p) >> 2) << 5 | Blue(p) >> 3); }

uint32_t From565(uint16_t c)
{
    uint32_t r = (c >> 11) & 31, g = (c >> 5) & 63, b = c & 31;
    return 0xFF000000u | ((r << 3) | (r >> 2)) << 16 | ((g << 2) | (g >> 4)) << 8 | ((b << 3) | (b >> 2));
}

int Distance(uint32_t a, uint32_t b)
{
    int dr = Red(a) - Red(b), dg = Green(a) - Green(b), db = Blue(a) - Blue(b);
    return dr * dr + dg * dg + db * db;
}

uint32_t Mix(uint32_t a, uint32_t b, int wa, int wb)
{
    int d = wa + wb;
    return 0xFF000000u | uint32_t((Red(a) * wa + Red(b) * wb) / d) << 16 |
           uint32_t((Green(a) * wa + Green(b) * wb) / d) << 8 | uint32_t((Blue(a) * wa + Blue(b) * wb) / d);
}

void Put16(std::vector<uint8_t>& out, uint16_t v)
{
    out.push_back(uint8_t(v));
    out.push_back(uint8_t(v >> 8));
}

void Put32(std::vector<uint8_t>& out, uint32_t v)
{
    for (int i = 0; i < 4; ++i)
        out.push_back(uint8_t(v >> (8 * i)));
}

// One DXT colour block: endpoints at the corners of the colours' box, each pixel the
// nearest of the four (or three and transparent) colours.
void ColorBlock(const uint32_t block[16], bool transparentMode, std::vector<uint8_t>& out)
{
    uint8_t lo[3] = {255, 255, 255}, hi[3] = {0, 0, 0};
    bool any = false;
    for (int i = 0; i < 16; ++i) {
        if (transparentMode && Alpha(block[i]) < 128)
            continue;
        any = true;
        const uint8_t c[3] = {Red(block[i]), Green(block[i]), Blue(block[i])};
        for (int k = 0; k < 3; ++k) {
            lo[k] = std::min(lo[k], c[k]);
            hi[k] = std::max(hi[k], c[k]);
        }
    }
    if (!any)
        lo[0] = lo[1] = lo[2] = hi[0] = hi[1] = hi[2] = 0;
    uint16_t a = To565(uint32_t(hi[0]) << 16 | uint32_t(hi[1]) << 8 | hi[2]);
    uint16_t b = To565(uint32_t(lo[0]) << 16 | uint32_t(lo[1]) << 8 | lo[2]);
    // Four colours need color0 > color1; three and transparent need color0 <= color1.
    uint16_t c0 = transparentMode ? std::min(a, b) : std::max(a, b);
    uint16_t c1 = transparentMode ? std::max(a, b) : std::min(a, b);
    uint32_t palette[4] = {From565(c0), From565(c1), 0, 0};
    int colors = 4;
    if (c0 > c1) {
        palette[2] = Mix(palette[0], palette[1], 2, 1);
        palette[3] = Mix(palette[0], palette[1], 1, 2);
    } else {
        palette[2] = Mix(palette[0], palette[1], 1, 1);
        colors = 3;
    }
    uint32_t indices = 0;
    for (int i = 0; i < 16; ++i) {
        int best = 0;
        if (transparentMode && Alpha(block[i]) < 128) {
            best = 3;
        } else if (c0 != c1) {
            for (int k = 1; k < colors; ++k)
                if (Distance(block[i], palette[k]) < Distance(block[i], palette[best]))
                    best = k;
        }
        indices |= uint32_t(best) << (2 * i);
    }
    Put16(out, c0);
    Put16(out, c1);
    Put32(out, indices);
}

void AlphaBlockDxt3(const uint32_t block[16], std::vector<uint8_t>& out)
{
    uint64_t bits = 0;
    for (int i = 0; i < 16; ++i)
        bits |= uint64_t(Alpha(block[i]) >> 4) << (4 * i);
    for (int i = 0; i < 8; ++i)
        out.push_back(uint8_t(bits >> (8 * i)));
}

void AlphaBlockDxt5(const uint32_t block[16], std::vector<uint8_t>& out)
{
    uint8_t a0 = 0, a1 = 255;
    for (int i = 0; i < 16; ++i) {
        a0 = std::max(a0, Alpha(block[i]));
        a1 = std::min(a1, Alpha(block[i]));
    }
    int palette[8] = {a0, a1};
    for (int k = 1; k < 7; ++k)
        palette[k + 1] = ((7 - k) * a0 + k * a1) / 7;
    uint64_t bits = 0;
    for (int i = 0; i < 16 && a0 != a1; ++i) {
        int best = 0;
        for (int k = 1; k < 8; ++k)
            if (std::abs(palette[k] - Alpha(block[i])) < std::abs(palette[best] - Alpha(block[i])))
                best = k;
        bits |= uint64_t(best) << (3 * i);
    }
    out.push_back(a0);
    out.push_back(a1);
    for (int i = 0; i < 6; ++i)
        out.push_back(uint8_t(bits >> (8 * i)));
}

void EncodeBlocks(const uint32_t* pixels, uint32_t width, uint32_t height, unsigned format, std::vector<uint8_t>& out)
{
    for (uint32_t by = 0; by < height; by += 4) {
        for (uint32_t bx = 0; bx < width; bx += 4) {
            // A block past the image's edge repeats its last row and column.
            uint32_t block[16];
            for (uint32_t i = 0; i < 16; ++i) {
                uint32_t x = std::min(bx + i % 4, width - 1), y = std::min(by + i / 4, height - 1);
                block[i] = pixels[size_t(y) * width + x];
            }
            if (format == PvrDXT3)
                AlphaBlockDxt3(block, out);
            else if (format == PvrDXT5)
                AlphaBlockDxt5(block, out);
            ColorBlock(block, format == PvrDXT1 && std::any_of(block, block + 16, [](uint32_t p) {
                                  return Alpha(p) < 128;
                              }), out);
        }
    }
}

struct FormatName {
    const char* name;
    unsigned format;
    const char* meaning;
};

constexpr FormatName kFormats[] = {
    {"argb8888", PvrARGB8888, "32-bit, A8R8G8B8 (the default)"},
    {"argb4444", PvrARGB4444, "16-bit, A4R4G4B4"},
    {"argb1555", PvrARGB1555, "16-bit, A1R5G5B5"},
    {"rgb565", PvrRGB565, "16-bit, R5G6B5, no alpha"},
    {"rgba8888", PvrRGBA8888, "32-bit, bytes R, G, B, A (OpenGL order)"},
    {"rgba4444", PvrRGBA4444, "16-bit, R4G4B4A4 (OpenGL order)"},
    {"rgba5551", PvrRGBA5551, "16-bit, R5G5B5A1 (OpenGL order)"},
    {"dxt1", PvrDXT1, "4 bits a pixel, 1-bit alpha"},
    {"dxt3", PvrDXT3, "8 bits a pixel, 4-bit alpha"},
    {"dxt5", PvrDXT5, "8 bits a pixel, interpolated alpha"},
};

} // namespace

bool EncodePng(const uint32_t* pixels, uint32_t width, uint32_t height, std::vector<uint8_t>& out,
               const PngOptions& options)
{
    out.clear();
    const PngLayout layout = options.layout;
    int depth = options.bit_depth;
    bool depthOk = depth == 8 || depth == 16 || (layout == PngLayout::Grey && (depth == 1 || depth == 2 || depth == 4));
    if (layout == PngLayout::Palette)
        depthOk = true;
    if (!pixels || width == 0 || height == 0 || !depthOk) {
        OX_LOG(kChannel, diag::LogError, "PNG: cannot write %ux%u pixels at depth %d", width, height, depth);
        return false;
    }

    // The palette: colours in order of first use.
    std::vector<png_color> palette;
    std::vector<png_byte> alphas;
    std::map<uint32_t, uint8_t> indexOf;
    if (layout == PngLayout::Palette) {
        for (size_t i = 0; i < size_t(width) * height; ++i) {
            if (indexOf.count(pixels[i]))
                continue;
            if (indexOf.size() == 256) {
                OX_LOG(kChannel, diag::LogError, "PNG: more than 256 colours for a palette");
                return false;
            }
            indexOf[pixels[i]] = uint8_t(palette.size());
            palette.push_back(png_color{Red(pixels[i]), Green(pixels[i]), Blue(pixels[i])});
            alphas.push_back(Alpha(pixels[i]));
        }
        depth = palette.size() <= 2 ? 1 : palette.size() <= 4 ? 2 : palette.size() <= 16 ? 4 : 8;
        // The transparency table may stop after the last entry that is not opaque.
        while (!alphas.empty() && alphas.back() == 255)
            alphas.pop_back();
    }

    int colorType = PNG_COLOR_TYPE_RGB_ALPHA;
    switch (layout) {
    case PngLayout::Rgba: colorType = PNG_COLOR_TYPE_RGB_ALPHA; break;
    case PngLayout::Rgb: colorType = PNG_COLOR_TYPE_RGB; break;
    case PngLayout::Palette: colorType = PNG_COLOR_TYPE_PALETTE; break;
    case PngLayout::Grey: colorType = PNG_COLOR_TYPE_GRAY; break;
    case PngLayout::GreyAlpha: colorType = PNG_COLOR_TYPE_GRAY_ALPHA; break;
    }

    // One byte a sample below 8 bits (packed by the library), two big-endian bytes at 16.
    std::vector<std::vector<uint8_t>> rows(height);
    for (uint32_t y = 0; y < height; ++y) {
        std::vector<uint8_t>& row = rows[y];
        for (uint32_t x = 0; x < width; ++x) {
            uint32_t p = pixels[size_t(y) * width + x];
            switch (layout) {
            case PngLayout::Rgba:
            case PngLayout::Rgb:
                PutSample(row, Red(p), depth);
                PutSample(row, Green(p), depth);
                PutSample(row, Blue(p), depth);
                if (layout == PngLayout::Rgba)
                    PutSample(row, Alpha(p), depth);
                break;
            case PngLayout::Palette: row.push_back(indexOf[p]); break;
            case PngLayout::Grey: PutSample(row, Luma(p), depth); break;
            case PngLayout::GreyAlpha:
                PutSample(row, Luma(p), depth);
                PutSample(row, Alpha(p), depth);
                break;
            }
        }
    }
    std::vector<png_bytep> rowPointers(height);
    for (uint32_t y = 0; y < height; ++y)
        rowPointers[y] = rows[y].data();

    PngWriteGuard guard;
    guard.png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, PngWriteError, nullptr);
    if (guard.png)
        guard.info = png_create_info_struct(guard.png);
    if (!guard.info)
        return false;
    png_set_write_fn(guard.png, &out, PngWrite, PngFlush);
    bool ok = WritePngRows(guard.png, guard.info, width, height, depth, colorType, options.interlaced,
                           palette.data(), int(palette.size()), alphas.data(), int(alphas.size()),
                           rowPointers.data());
    if (!ok)
        out.clear();
    return ok;
}

bool EncodePvr(const uint32_t* pixels, uint32_t width, uint32_t height, unsigned pixel_format,
               std::vector<uint8_t>& out)
{
    out.clear();
    if (!pixels || width == 0 || height == 0 || width > 0xFFFF || height > 0xFFFF) {
        OX_LOG(kChannel, diag::LogError, "PVR: cannot write %ux%u pixels", width, height);
        return false;
    }
    std::vector<uint8_t> data;
    const size_t count = size_t(width) * height;
    switch (pixel_format) {
    case PvrARGB8888:
        for (size_t i = 0; i < count; ++i)
            Put32(data, pixels[i]);
        break;
    case PvrRGBA8888:
        for (size_t i = 0; i < count; ++i)
            Put32(data, uint32_t(Red(pixels[i])) | uint32_t(Green(pixels[i])) << 8 | uint32_t(Blue(pixels[i])) << 16 |
                            uint32_t(Alpha(pixels[i])) << 24);
        break;
    case PvrARGB4444:
    case PvrRGBA4444:
        for (size_t i = 0; i < count; ++i) {
            uint32_t p = pixels[i];
            uint16_t a = Alpha(p) >> 4, r = Red(p) >> 4, g = Green(p) >> 4, b = Blue(p) >> 4;
            Put16(data, pixel_format == PvrARGB4444 ? uint16_t(a << 12 | r << 8 | g << 4 | b)
                                                    : uint16_t(r << 12 | g << 8 | b << 4 | a));
        }
        break;
    case PvrARGB1555:
    case PvrRGBA5551:
        for (size_t i = 0; i < count; ++i) {
            uint32_t p = pixels[i];
            uint16_t a = Alpha(p) >> 7, r = Red(p) >> 3, g = Green(p) >> 3, b = Blue(p) >> 3;
            Put16(data, pixel_format == PvrARGB1555 ? uint16_t(a << 15 | r << 10 | g << 5 | b)
                                                    : uint16_t(r << 11 | g << 6 | b << 1 | a));
        }
        break;
    case PvrRGB565:
    case PvrRGB565b:
        for (size_t i = 0; i < count; ++i)
            Put16(data, To565(pixels[i]));
        break;
    case PvrDXT1:
    case PvrDXT3:
    case PvrDXT5: EncodeBlocks(pixels, width, height, pixel_format, data); break;
    default:
        OX_LOG(kChannel, diag::LogError, "PVR: the pixel format %u cannot be encoded here", pixel_format);
        return false;
    }
    EncodePvrRaw(pixel_format, width, height, data.data(), data.size(), out);
    return true;
}

void EncodePvrRaw(unsigned pixel_format, uint32_t width, uint32_t height, const void* data, size_t size,
                  std::vector<uint8_t>& out)
{
    PvrHeader header{};
    header.header_size = sizeof(PvrHeader);
    header.height = height;
    header.width = width;
    header.flags = pixel_format & 0xFF;
    header.data_size = uint32_t(size);
    const unsigned format = PvrInternalFormat(pixel_format);
    header.bit_count = format == 1 || format == 2 ? 32 : format >= 3 && format <= 7 ? 16 : 0;
    memcpy(header.magic, "PVR!", 4);
    header.surface_count = 1;
    out.resize(sizeof(header) + size);
    memcpy(out.data(), &header, sizeof(header));
    if (size)
        memcpy(out.data() + sizeof(header), data, size);
}

bool CompressPvrLzo(const void* data, size_t size, std::vector<uint8_t>& out)
{
    out.clear();
    if (lzo_init() != LZO_E_OK || size > 0xFFFFFFFFu)
        return false;
    std::vector<uint8_t> work(LZO1X_1_MEM_COMPRESS);
    out.resize(size + size / 16 + 64 + 3 + 8);
    lzo_uint written = 0;
    if (lzo1x_1_compress(static_cast<const uint8_t*>(data), size, out.data(), &written, work.data()) != LZO_E_OK) {
        out.clear();
        return false;
    }
    out.resize(written);
    Put32(out, g_LzoMagicNumber);
    Put32(out, uint32_t(size));
    return true;
}

int PvrFormatByName(const std::string& name)
{
    for (const FormatName& f : kFormats)
        if (name == f.name)
            return int(f.format);
    return -1;
}

std::string PvrFormatNames()
{
    std::string text;
    for (const FormatName& f : kFormats)
        text += std::string("  ") + f.name + std::string(10 - strlen(f.name), ' ') + "(" +
                std::to_string(f.format) + ") " + f.meaning + "\n";
    return text;
}

bool MakePattern(const std::string& name, uint32_t width, uint32_t height, std::vector<uint32_t>& pixels)
{
    pixels.assign(size_t(width) * height, 0);
    uint32_t seed = 0x12345678;
    for (uint32_t y = 0; y < height; ++y) {
        for (uint32_t x = 0; x < width; ++x) {
            uint32_t& p = pixels[size_t(y) * width + x];
            if (name == "checker") {
                p = ((x / 8 + y / 8) & 1) ? 0xFF2040C0u : 0xFFF0E0A0u;
            } else if (name == "gradient") {
                uint32_t r = width > 1 ? x * 255 / (width - 1) : 0, g = height > 1 ? y * 255 / (height - 1) : 0;
                p = 0xFF000000u | r << 16 | g << 8 | 0x80;
            } else if (name == "circle") {
                double dx = x + 0.5 - width / 2.0, dy = y + 0.5 - height / 2.0;
                double radius = std::min(width, height) * 0.4;
                p = dx * dx + dy * dy <= radius * radius ? 0xFFE08020u : 0x00000000u;
            } else if (name == "stripes") {
                p = x % 8 < 3 ? 0x00FFFFFFu : 0xFF3070B0u;
            } else if (name == "spinner") {
                // Square cells side by side; in cell i a dot stands at i / cells of a turn.
                const uint32_t side = std::max<uint32_t>(height, 1), cells = std::max<uint32_t>(width / side, 1);
                const uint32_t cell = std::min(x / side, cells - 1);
                const double angle = 6.283185307179586 * cell / cells;
                const double cx = side / 2.0 + side * 0.3 * std::cos(angle), cy = side / 2.0 + side * 0.3 * std::sin(angle);
                const double dx = (x - cell * side) + 0.5 - cx, dy = y + 0.5 - cy, r = side * 0.15;
                const double ring = std::hypot((x - cell * side) + 0.5 - side / 2.0, y + 0.5 - side / 2.0);
                if (dx * dx + dy * dy <= r * r)
                    p = 0xFFF0D040u;
                else if (std::fabs(ring - side * 0.3) < side * 0.04)
                    p = 0x80A0A0C0u;
                else
                    p = 0x00000000u;
            } else if (name == "noise") {
                seed = seed * 1664525u + 1013904223u;
                p = seed ^ (seed >> 15);
            } else {
                pixels.clear();
                return false;
            }
        }
    }
    return true;
}

const char* PatternNames() { return "checker, gradient, circle, stripes, noise, spinner"; }

} // namespace ox::misc::imagelib
