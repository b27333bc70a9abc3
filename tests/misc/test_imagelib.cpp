#include "misc/imagelib/ImageLib.h"
#include "misc/imagelib/MediaWriter.h"
#include "support/TestSupport.h"

#include <cstdlib>

using namespace ox::misc::imagelib;

namespace {

std::string Bytes(const std::vector<uint8_t>& data) { return std::string(data.begin(), data.end()); }

std::vector<uint32_t> Pattern(const char* name, uint32_t w, uint32_t h)
{
    std::vector<uint32_t> pixels;
    EXPECT_TRUE(MakePattern(name, w, h, pixels));
    return pixels;
}

bool DecodePng(const std::vector<uint8_t>& data, Image& image)
{
    CPNGDecoder decoder;
    return decoder.Decode(data.data(), data.size(), image);
}

bool Contains(const oxtest::LogCapture& log, const std::string& a, const std::string& b)
{
    for (const std::string& entry : log.Entries())
        if (entry.find(a) != std::string::npos && entry.find(b) != std::string::npos)
            return true;
    return false;
}

} // namespace

TEST(ImageLib, PngColourTypesDecodeToArgbWords)
{
    const uint32_t w = 13, h = 7;  // odd sizes catch row-size mistakes
    std::vector<uint32_t> noise = Pattern("noise", w, h);
    std::vector<uint32_t> opaque(noise.size()), grey(noise.size()), greyAlpha(noise.size()), bilevel(noise.size()),
        grey4(noise.size()), paletted(noise.size());
    const uint32_t colours[5] = {0xFF102030, 0x00000000, 0x80FF0000, 0xFF00FF00, 0x40010203};
    for (size_t i = 0; i < noise.size(); ++i) {
        uint32_t v = noise[i] & 0xFF;
        opaque[i] = noise[i] | 0xFF000000u;
        grey[i] = 0xFF000000u | v * 0x010101u;
        greyAlpha[i] = (noise[i] & 0xFF000000u) | v * 0x010101u;
        bilevel[i] = (v & 1) ? 0xFFFFFFFFu : 0xFF000000u;
        grey4[i] = 0xFF000000u | ((v >> 4) * 17) * 0x010101u;
        paletted[i] = colours[i % 5];
    }
    struct Case {
        const char* name;
        PngOptions options;
        const std::vector<uint32_t>& input;
        const std::vector<uint32_t>& expected;
    } cases[] = {
        {"rgba", {PngLayout::Rgba, 8, false}, noise, noise},
        {"rgba interlaced", {PngLayout::Rgba, 8, true}, noise, noise},
        {"rgba 16-bit", {PngLayout::Rgba, 16, false}, noise, noise},
        {"rgb gets alpha 255", {PngLayout::Rgb, 8, false}, noise, opaque},
        {"rgb 16-bit interlaced", {PngLayout::Rgb, 16, true}, noise, opaque},
        {"palette with transparency", {PngLayout::Palette, 8, false}, paletted, paletted},
        {"grey", {PngLayout::Grey, 8, false}, grey, grey},
        {"grey 1-bit", {PngLayout::Grey, 1, false}, bilevel, bilevel},
        {"grey 4-bit interlaced", {PngLayout::Grey, 4, true}, grey4, grey4},
        {"grey 16-bit", {PngLayout::Grey, 16, false}, grey, grey},
        {"grey and alpha", {PngLayout::GreyAlpha, 8, false}, greyAlpha, greyAlpha},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        std::vector<uint8_t> png;
        ASSERT_TRUE(EncodePng(c.input.data(), w, h, png, c.options));
        CPNGDecoder decoder;
        uint32_t iw = 0, ih = 0;
        EXPECT_TRUE(decoder.GetInfo(png.data(), png.size(), iw, ih));
        EXPECT_EQ(iw, w);
        EXPECT_EQ(ih, h);
        Image image;
        ASSERT_TRUE(DecodePng(png, image));
        EXPECT_EQ(image.width, w);
        EXPECT_EQ(image.height, h);
        EXPECT_EQ(image.pixels, c.expected);
    }
    std::vector<uint32_t> many = Pattern("noise", 20, 20);
    std::vector<uint8_t> png;
    EXPECT_FALSE(EncodePng(many.data(), 20, 20, png, {PngLayout::Palette, 8, false})) << "over 256 colours";
}

TEST(ImageLib, BrokenPngIsRefusedWithALogLineNamingTheFile)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    std::vector<uint32_t> pixels = Pattern("noise", 40, 30);
    std::vector<uint8_t> png;
    ASSERT_TRUE(EncodePng(pixels.data(), 40, 30, png));
    const std::string whole = Bytes(png);

    for (size_t cut : {size_t(0), size_t(5), size_t(8), size_t(20), size_t(33), size_t(60), whole.size() / 2,
                       whole.size() - 13}) {
        SCOPED_TRACE(cut);
        oxtest::LogCapture log;
        dir.Write("cut.png", whole.substr(0, cut));
        Image image;
        image.width = 99;
        EXPECT_FALSE(LoadImage("cut.png", image));
        EXPECT_EQ(image.width, 0u);
        EXPECT_TRUE(image.pixels.empty());
        if (cut > 0) {  // an empty file is not even mapped
            EXPECT_TRUE(Contains(log, "imagelib|3|", "\"cut.png\"")) << cut;
        }
    }

    // A bit flipped inside the image data breaks its checksum.
    std::string flipped = whole;
    flipped[whole.size() / 2] ^= 0x10;
    dir.Write("flipped.png", flipped);
    Image image;
    oxtest::LogCapture log;
    EXPECT_FALSE(LoadImage("flipped.png", image));
    EXPECT_TRUE(Contains(log, "imagelib|3|", "flipped.png"));

    // Dropping only the end chunk still gives the whole image.
    dir.Write("noend.png", whole.substr(0, whole.size() - 12));
    ASSERT_TRUE(LoadImage("noend.png", image));
    EXPECT_EQ(image.pixels, pixels);
}

TEST(ImageLib, PngClaimingMorePixelsThanItsDataIsRefusedBeforeAllocating)
{
    std::vector<uint32_t> pixels(1, 0xFF000000u);
    std::vector<uint8_t> png;
    ASSERT_TRUE(EncodePng(pixels.data(), 1, 1, png));
    // Rewrite the header to 8000 x 8000 with a valid checksum: the data cannot hold it.
    auto put = [&](size_t at, uint32_t v) {
        for (int i = 0; i < 4; ++i)
            png[at + i] = uint8_t(v >> (24 - 8 * i));
    };
    put(16, 8000);
    put(20, 8000);
    uint32_t crc = 0xFFFFFFFFu;
    for (size_t i = 12; i < 29; ++i) {
        crc ^= png[i];
        for (int k = 0; k < 8; ++k)
            crc = (crc >> 1) ^ (0xEDB88320u & (0u - (crc & 1)));
    }
    put(29, ~crc);
    CPNGDecoder decoder;
    uint32_t w = 0, h = 0;
    ASSERT_TRUE(decoder.GetInfo(png.data(), png.size(), w, h));
    EXPECT_EQ(w, 8000u);
    oxtest::LogCapture log;
    Image image;
    EXPECT_FALSE(decoder.Decode(png.data(), png.size(), image));
    EXPECT_TRUE(log.Contains("too short"));
}

TEST(ImageLib, JpegRoundTripsWithinATolerance)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    const uint32_t w = 37, h = 21;
    std::vector<uint32_t> pixels = Pattern("gradient", w, h);
    for (uint32_t& p : pixels)
        p &= 0x80FFFFFFu;  // alpha is not written: it comes back 255
    ASSERT_TRUE(CompressJpegFile((dir / "round.jpg").c_str(), pixels.data(), w, h, 95));

    uint32_t iw = 0, ih = 0;
    ASSERT_TRUE(GetImageInfo("round.jpg", iw, ih));
    EXPECT_EQ(iw, w);
    EXPECT_EQ(ih, h);
    Image image;
    ASSERT_TRUE(LoadImage("round.jpg", image));
    ASSERT_EQ(image.pixels.size(), pixels.size());
    int worst = 0;
    for (size_t i = 0; i < pixels.size(); ++i) {
        ASSERT_EQ(image.pixels[i] >> 24, 0xFFu);
        for (int shift = 0; shift < 24; shift += 8)
            worst = std::max(worst, std::abs(int((image.pixels[i] >> shift) & 0xFF) - int((pixels[i] >> shift) & 0xFF)));
    }
    EXPECT_LE(worst, 12);

    // A greyscale file is widened to grey RGB.
    std::vector<uint8_t> greyJpeg;
    ASSERT_TRUE(EncodeJpeg(pixels.data(), w, h, 90, greyJpeg, true));
    CJPEGDecoder decoder;
    ASSERT_TRUE(decoder.Decode(greyJpeg.data(), greyJpeg.size(), image));
    for (uint32_t p : image.pixels)
        ASSERT_TRUE(((p >> 16) & 0xFF) == (p & 0xFF) && ((p >> 8) & 0xFF) == (p & 0xFF) && (p >> 24) == 0xFF);

    // Quality is capped at 100.
    std::vector<uint8_t> best, over;
    ASSERT_TRUE(EncodeJpeg(pixels.data(), w, h, 100, best));
    ASSERT_TRUE(EncodeJpeg(pixels.data(), w, h, 1000, over));
    EXPECT_EQ(best, over);
}

TEST(ImageLib, TruncatedJpegEndsAtAnInsertedMarkerAndBrokenHeadersFail)
{
    const uint32_t w = 64, h = 64;
    std::vector<uint32_t> pixels = Pattern("noise", w, h);
    std::vector<uint8_t> jpeg;
    ASSERT_TRUE(EncodeJpeg(pixels.data(), w, h, 80, jpeg));

    // Cut inside the scan: the library warns, the rest of the image is filled, the decode ends.
    for (size_t cut : {jpeg.size() / 2, jpeg.size() - 2}) {
        oxtest::LogCapture log;
        CJPEGDecoder decoder;
        Image image;
        EXPECT_TRUE(decoder.Decode(jpeg.data(), cut, image)) << cut;
        EXPECT_EQ(image.pixels.size(), size_t(w) * h);
        EXPECT_TRUE(Contains(log, "imagelib|2|", "<memory>")) << cut;
    }
    // Cut inside the header, or no JPEG at all: an error and no image.
    for (size_t cut : {size_t(1), size_t(2), size_t(30), size_t(200)}) {
        oxtest::LogCapture log;
        CJPEGDecoder decoder;
        Image image;
        EXPECT_FALSE(decoder.Decode(jpeg.data(), cut, image)) << cut;
        EXPECT_TRUE(image.pixels.empty());
        EXPECT_TRUE(Contains(log, "imagelib|3|", "JPEG error")) << cut;
    }
    std::string text = "this is not a picture";
    CJPEGDecoder decoder;
    uint32_t iw, ih;
    EXPECT_FALSE(decoder.GetInfo(text.data(), text.size(), iw, ih));
}

TEST(ImageLib, DispatchByExtensionIgnoresCase)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    std::vector<uint32_t> pixels = Pattern("checker", 16, 8);
    std::vector<uint8_t> png, jpeg;
    ASSERT_TRUE(EncodePng(pixels.data(), 16, 8, png));
    ASSERT_TRUE(EncodeJpeg(pixels.data(), 16, 8, 90, jpeg));
    dir.Write("dir.v2/UPPER.PNG", Bytes(png));
    dir.Write("photo.JpG", Bytes(jpeg));
    dir.Write("png.jpeg", Bytes(jpeg));
    dir.Write("noext", Bytes(png));

    Image image;
    EXPECT_TRUE(LoadImage("dir.v2/UPPER.PNG", image));
    EXPECT_EQ(image.pixels, pixels);
    uint32_t w = 0, h = 0;
    EXPECT_TRUE(GetImageInfo("photo.JpG", w, h));
    EXPECT_EQ(w, 16u);
    EXPECT_FALSE(GetImageInfo("png.jpeg", w, h));
    EXPECT_FALSE(GetImageInfo("noext", w, h));
    EXPECT_FALSE(GetImageInfo("missing.png", w, h));
    // A JPEG under a PNG name is a PNG error, not a crash.
    dir.Write("liar.png", Bytes(jpeg));
    EXPECT_FALSE(LoadImage("liar.png", image));

    oxtest::LogCapture log;
    EXPECT_FALSE(LoadImage("noext", image));
    EXPECT_TRUE(log.Contains("assertion failed"));
}

TEST(ImageLib, ResampleAveragesBoxes)
{
    // 4 x 4 in 2 x 2 cells of one colour each: halving gives the cells.
    const uint32_t cells[4] = {0xFF000000, 0x80FF0000, 0x4000FF00, 0x000000FF};
    std::vector<uint32_t> source(16);
    for (uint32_t y = 0; y < 4; ++y)
        for (uint32_t x = 0; x < 4; ++x)
            source[y * 4 + x] = cells[(y / 2) * 2 + x / 2];
    std::vector<uint32_t> half(4, 0xDEADBEEF);
    ResampleImage(source.data(), 4, 4, half.data(), 2, 2);
    EXPECT_EQ(half, std::vector<uint32_t>(cells, cells + 4));

    // 5 -> 2: boxes of 2 at 0 and 2.5 (truncated to 2); channels by integer division.
    std::vector<uint32_t> row = {0x00000001, 0x00000002, 0x00000010, 0x00000020, 0xFFFFFFFF};
    std::vector<uint32_t> two(2);
    ResampleImage(row.data(), 5, 1, two.data(), 2, 1);
    EXPECT_EQ(two[0], 0x00000001u);  // (1 + 2) / 2
    EXPECT_EQ(two[1], 0x00000018u);  // (0x10 + 0x20) / 2

    // A zero target size touches nothing.
    std::vector<uint32_t> untouched(4, 7);
    ResampleImage(source.data(), 4, 4, untouched.data(), 0, 2);
    ResampleImage(source.data(), 4, 4, untouched.data(), 2, 0);
    EXPECT_EQ(untouched, std::vector<uint32_t>(4, 7));
}
