#include "misc/imagelib/MediaWriter.h"
#include "misc/imagelib/PvrContainer.h"
#include "misc/sys/MemMap.h"
#include "support/TestSupport.h"

#include <cstring>

using namespace ox::misc::imagelib;

namespace {

// Stands in for a surface: keeps what LoadBits was given.
struct FakeSurface {
    std::vector<uint8_t> bits;
    uint32_t width = 0, height = 0;
    unsigned format = 0;
    bool fromStaticBuffer = false;
    bool result = true;
    int calls = 0;

    bool LoadBits(const void* data, size_t size, uint32_t w, uint32_t h, unsigned internal_format)
    {
        ++calls;
        const auto* p = static_cast<const uint8_t*>(data);
        bits.assign(p, p + size);
        width = w;
        height = h;
        format = internal_format;
        fromStaticBuffer = PvrIsInLzoStaticBuffer(data);
        return result;
    }
};

std::string Bytes(const std::vector<uint8_t>& data) { return std::string(data.begin(), data.end()); }

std::vector<uint8_t> Lzo(const std::vector<uint8_t>& data)
{
    std::vector<uint8_t> out;
    EXPECT_TRUE(CompressPvrLzo(data.data(), data.size(), out));
    return out;
}

uint16_t Word16(const std::vector<uint8_t>& bits, size_t i) { return uint16_t(bits[2 * i] | bits[2 * i + 1] << 8); }

// Decodes a DXT colour block's pixel (4-colour mode, as the encoder writes it for opaque blocks).
uint32_t DxtColor(const uint8_t* block, int i)
{
    auto expand = [](uint16_t c) {
        uint32_t r = (c >> 11) & 31, g = (c >> 5) & 63, b = c & 31;
        return int((r << 3) | (r >> 2)) << 16 | int((g << 2) | (g >> 4)) << 8 | int((b << 3) | (b >> 2));
    };
    uint16_t c0 = uint16_t(block[0] | block[1] << 8), c1 = uint16_t(block[2] | block[3] << 8);
    int a = expand(c0), b = expand(c1);
    int index = (block[4 + i / 4] >> (2 * (i % 4))) & 3;
    int wa[4] = {3, 0, 2, 1};
    uint32_t out = 0;
    for (int shift = 0; shift < 24; shift += 8)
        out |= uint32_t((((a >> shift) & 0xFF) * wa[index] + ((b >> shift) & 0xFF) * (3 - wa[index])) / 3) << shift;
    return out;
}

} // namespace

TEST(PvrContainer, EveryEncodableFormatRoundTripsPlainAndCompressed)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    const uint32_t w = 8, h = 4;
    std::vector<uint32_t> pixels;
    ASSERT_TRUE(MakePattern("noise", w, h, pixels));
    pixels[0] = 0xF1E2D3C4;

    struct Case {
        unsigned pixel;
        unsigned internal;
        size_t bytes;
        uint32_t firstWord;  // the first pixel as the format stores it
    } cases[] = {
        {PvrARGB8888, 1, 128, 0xF1E2D3C4}, {PvrRGBA8888, 2, 128, 0xF1C4D3E2}, {PvrARGB4444, 3, 64, 0xFEDC},
        {PvrRGBA4444, 4, 64, 0xEDCF},      {PvrRGB565, 5, 64, 0xE698},        {PvrRGB565b, 5, 64, 0xE698},
        {PvrARGB1555, 6, 64, 0xF358},      {PvrRGBA5551, 7, 64, 0xE6B1},      {PvrDXT1, 11, 16, 0},
        {PvrDXT3, 13, 32, 0},              {PvrDXT5, 15, 32, 0},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.pixel);
        std::vector<uint8_t> pvr;
        ASSERT_TRUE(EncodePvr(pixels.data(), w, h, c.pixel, pvr));
        ASSERT_EQ(pvr.size(), 52 + c.bytes);
        if (c.firstWord > 0xFFFF) {
            EXPECT_EQ(uint32_t(pvr[52] | pvr[53] << 8 | pvr[54] << 16 | uint32_t(pvr[55]) << 24), c.firstWord);
        } else if (c.firstWord) {
            EXPECT_EQ(uint32_t(pvr[52] | pvr[53] << 8), c.firstWord);
        }
        dir.Write("t.pvr", Bytes(pvr));
        dir.Write("t.pvrlzo", Bytes(Lzo(pvr)));
        for (const char* path : {"t.pvr", "t.pvrlzo"}) {
            uint32_t iw = 0, ih = 0;
            unsigned format = 0;
            ASSERT_TRUE(PvrGetInfo(path, iw, ih, format)) << path;
            EXPECT_EQ(iw, w);
            EXPECT_EQ(ih, h);
            EXPECT_EQ(format, c.internal);
            FakeSurface surface;
            ASSERT_TRUE(PvrLoad(path, &surface)) << path;
            EXPECT_EQ(surface.bits, std::vector<uint8_t>(pvr.begin() + 52, pvr.end())) << path;
            EXPECT_EQ(surface.format, c.internal);
            EXPECT_EQ(surface.width, w);
        }
    }
    // Formats without an encoder still pass through the container as bits made elsewhere.
    for (unsigned pixel : {unsigned(PvrETC), unsigned(PvrPVRTC2), unsigned(PvrPVRTC4)}) {
        std::vector<uint8_t> bits(32, 0x5A), pvr;
        EXPECT_FALSE(EncodePvr(pixels.data(), w, h, pixel, pvr));
        EncodePvrRaw(pixel, 8, 4, bits.data(), bits.size(), pvr);
        dir.Write("raw.pvr", Bytes(pvr));
        FakeSurface surface;
        ASSERT_TRUE(PvrLoad("raw.pvr", &surface)) << pixel;
        EXPECT_EQ(surface.format, PvrInternalFormat(pixel));
        EXPECT_EQ(surface.bits.size(), 32u);
    }
    // A surface that refuses the bits makes the load fail.
    FakeSurface refusing;
    refusing.result = false;
    EXPECT_FALSE(PvrLoad("t.pvr", &refusing));
    EXPECT_EQ(refusing.calls, 1);
}

TEST(PvrContainer, DxtBlocksKeepColoursAndAlpha)
{
    // Two colours in one block come back exactly: they are the endpoints, and 565-exact.
    std::vector<uint32_t> pixels(16);
    for (int i = 0; i < 16; ++i)
        pixels[i] = (i % 3 ? 0xFF848284u : 0xFF000000u) & (i == 5 ? 0x00FFFFFFu : 0xFFFFFFFFu);
    std::vector<uint8_t> dxt1, dxt5;
    ASSERT_TRUE(EncodePvr(pixels.data(), 4, 4, PvrDXT1, dxt1));
    ASSERT_TRUE(EncodePvr(pixels.data(), 4, 4, PvrDXT5, dxt5));
    // DXT1 with a transparent pixel: three-colour mode, index 3 at that pixel.
    EXPECT_LE(Word16(std::vector<uint8_t>(dxt1.begin() + 52, dxt1.end()), 0),
              Word16(std::vector<uint8_t>(dxt1.begin() + 52, dxt1.end()), 1));
    EXPECT_EQ((dxt1[52 + 4 + 1] >> 2) & 3, 3);
    // DXT5: alpha endpoints 255 and 0, colours in the second half.
    EXPECT_EQ(dxt5[52], 255);
    EXPECT_EQ(dxt5[53], 0);
    for (int i = 0; i < 16; ++i)
        EXPECT_EQ(DxtColor(&dxt5[52 + 8], i), pixels[i] & 0xFFFFFF) << i;
}

TEST(PvrContainer, PvrtcSizesAreComputedWithTwoBlocksAtLeast)
{
    EXPECT_EQ(PvrTextureBytes(9, 4, 4), 32u);     // format 24: 8 x 4 blocks
    EXPECT_EQ(PvrTextureBytes(8, 8, 8), 32u);     // format 25: 4 x 4 blocks
    EXPECT_EQ(PvrTextureBytes(8, 32, 16), 256u);  // 8 x 4 blocks of 8 bytes
    EXPECT_EQ(PvrTextureBytes(9, 64, 4), 128u);   // 8 x 2
    EXPECT_EQ(PvrTextureBytes(11, 5, 5), 32u);    // DXT1 rounds partial blocks up

    // The header's size is ignored for PVRTC; a file shorter than the computed size is refused.
    std::vector<uint8_t> bits(31), pvr;
    EncodePvrRaw(PvrPVRTC2, 4, 4, bits.data(), bits.size(), pvr);
    PvrTexture texture;
    oxtest::LogCapture log;
    EXPECT_FALSE(PvrParse(pvr.data(), pvr.size(), "short.pvr", texture));
    EXPECT_TRUE(log.Contains("\"short.pvr\" is truncated"));
    pvr.push_back(0);
    ASSERT_TRUE(PvrParse(pvr.data(), pvr.size(), "ok.pvr", texture));
    EXPECT_EQ(texture.size, 32u);
}

TEST(PvrContainer, LzoOutputUpTo256KiBUsesTheStaticBuffer)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    // 255 x 256 pixels of 4 bytes, and data padded so that the file is exactly 262,144 bytes.
    for (size_t total : {size_t(0x40000), size_t(0x40001)}) {
        std::vector<uint8_t> bits(total - 52, 0x3C), pvr;
        EncodePvrRaw(PvrARGB8888, 255, 256, bits.data(), bits.size(), pvr);
        ASSERT_EQ(pvr.size(), total);
        dir.Write("limit.pvrlzo", Bytes(Lzo(pvr)));
        FakeSurface surface;
        ASSERT_TRUE(PvrLoad("limit.pvrlzo", &surface));
        EXPECT_EQ(surface.fromStaticBuffer, total == 0x40000) << total;
        EXPECT_EQ(surface.bits, bits);
    }
}

TEST(PvrContainer, BrokenFilesAreRefusedWithALogLine)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    std::vector<uint32_t> pixels;
    ASSERT_TRUE(MakePattern("gradient", 16, 16, pixels));
    std::vector<uint8_t> pvr;
    ASSERT_TRUE(EncodePvr(pixels.data(), 16, 16, PvrARGB4444, pvr));
    const std::vector<uint8_t> lzo = Lzo(pvr);
    const size_t mapped = ox::misc::sys::MappedFileCount();

    auto refused = [&](const char* name, const std::vector<uint8_t>& data, const char* text) {
        SCOPED_TRACE(name);
        dir.Write(name, Bytes(data));
        oxtest::LogCapture log;
        uint32_t w, h;
        unsigned format;
        FakeSurface surface;
        EXPECT_FALSE(PvrGetInfo(name, w, h, format));
        EXPECT_FALSE(PvrLoad(name, &surface));
        EXPECT_EQ(surface.calls, 0);
        EXPECT_TRUE(log.Contains(std::string("\"") + name + "\"")) << "the line names the file";
        EXPECT_TRUE(log.Contains(text)) << text;
    };
    for (size_t cut : {size_t(1), size_t(44), size_t(51), size_t(52), size_t(300), pvr.size() - 1})
        refused("cut.pvr", std::vector<uint8_t>(pvr.begin(), pvr.begin() + cut), cut < 52 ? "short" : "truncated");
    std::vector<uint8_t> bad = pvr;
    bad[46] = 'X';
    refused("mark.pvr", bad, "PVR!");
    bad = pvr;
    bad[16] = 3;
    refused("format.pvr", bad, "unsupported pixel format 3");
    bad = pvr;
    bad[20] = 0x10;  // the header claims less data than 16 x 16 pixels need
    bad[21] = 0;
    refused("small.pvr", bad, "truncated");
    bad = pvr;
    bad[8] = 0;  // width 0
    refused("empty.pvr", bad, "size 0x16");

    for (size_t cut : {size_t(3), size_t(8), size_t(20), lzo.size() / 2, lzo.size() - 9}) {
        std::vector<uint8_t> cutLzo(lzo.begin(), lzo.begin() + cut);
        refused("cut.pvrlzo", cutLzo, "LZO file");
        // Keep the trailer but drop compressed bytes in front of it.
        if (cut > 8) {
            std::vector<uint8_t> shortened(lzo.begin(), lzo.begin() + cut - 8);
            shortened.insert(shortened.end(), lzo.end() - 8, lzo.end());
            refused("short.pvrlzo", shortened, "corrupt");
        }
    }
    bad = lzo;
    bad[bad.size() - 4] ^= 1;  // the size word disagrees with the data
    refused("size.pvrlzo", bad, "LZO file");
    bad = lzo;
    bad[bad.size() - 1] = 0x7F;  // claims far more than the data can give
    refused("huge.pvrlzo", bad, "claims");
    bad = lzo;
    for (size_t i = 1; i + 8 < bad.size(); i += 7)
        bad[i] ^= 0xA5;
    refused("noise.pvrlzo", bad, "LZO file");
    EXPECT_EQ(ox::misc::sys::MappedFileCount(), mapped) << "every file is released";

    uint32_t w, h;
    unsigned format;
    EXPECT_FALSE(PvrGetInfo("missing.pvr", w, h, format));
}
