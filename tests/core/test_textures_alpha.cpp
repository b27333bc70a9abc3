#include "core/TexturesAlpha.h"
#include "core/TexturesAlphaWriter.h"
#include "misc/GamePack.h"
#include "misc/imagelib/MediaWriter.h"
#include "misc/sys/MemMap.h"
#include "support/TestSupport.h"

#include <cstring>

using namespace ox::core;

namespace {

AlphaMaskSource Source(const std::string& id, const char* pattern, uint32_t w, uint32_t h, int order = 0)
{
    AlphaMaskSource source;
    source.id = id;
    source.width = w;
    source.height = h;
    source.order = order;
    EXPECT_TRUE(ox::misc::imagelib::MakePattern(pattern, w, h, source.pixels));
    return source;
}

std::vector<uint8_t> Build(const std::vector<AlphaMaskSource>& sources)
{
    std::vector<uint8_t> out;
    std::string error;
    EXPECT_TRUE(BuildTexturesAlpha(sources, out, &error)) << error;
    return out;
}

// A file image with one mask of hand-made runs, in a 4-aligned block.
struct HandMade {
    std::vector<uint32_t> storage;
    size_t size = 0;
    const void* data() const { return storage.data(); }

    HandMade(uint16_t w, uint16_t h, uint8_t order, const std::vector<uint16_t>& runs)
    {
        AlphaMaskSource one;
        one.id = "hand";
        one.width = w;
        one.height = h;
        one.pixels.assign(size_t(w) * h, 0xFF000000u);
        one.pixels[0] = 0;  // not uniform, so that the record gets runs
        std::vector<uint8_t> bytes = Build({one});
        bytes.resize(8 + 112);
        uint32_t offset = uint32_t(bytes.size()), size = uint32_t(runs.size() * 2);
        memcpy(&bytes[8 + kDescOffset], &offset, 4);
        memcpy(&bytes[8 + kDescSize], &size, 4);
        bytes[8 + kDescOrder] = order;
        for (uint16_t run : runs) {
            bytes.push_back(uint8_t(run));
            bytes.push_back(uint8_t(run >> 8));
        }
        Set(bytes);
    }
    explicit HandMade(const std::vector<uint8_t>& bytes) { Set(bytes); }
    void Set(const std::vector<uint8_t>& bytes)
    {
        storage.assign((bytes.size() + 3) / 4, 0);
        memcpy(storage.data(), bytes.data(), bytes.size());
        size = bytes.size();
    }
};

constexpr uint16_t Solid(uint16_t length) { return uint16_t(length | kRunValueBit); }

} // namespace

TEST(TexturesAlpha, MasksAnswerEveryPixelInBothOrders)
{
    // Stripes have few runs by columns and many by rows; noise has random alpha.
    std::vector<AlphaMaskSource> sources = {
        Source("rows", "stripes", 19, 11, 1), Source("columns", "stripes", 19, 11, 2),
        Source("auto", "stripes", 19, 11, 0), Source("noise", "noise", 23, 9, 0),
        Source("disc", "circle", 40, 30, 1),
    };
    for (uint32_t& p : sources[3].pixels)
        p &= (p & 0x01000000u) ? 0xFFFFFFFFu : 0x00FFFFFFu;  // about half clear
    HandMade file(Build(sources));
    CTexturesAlpha store;
    ASSERT_TRUE(store.LoadFromMemory(file.data(), file.size));
    ASSERT_TRUE(store.IsAvailable());
    EXPECT_EQ(store.Count(), 5u);
    EXPECT_EQ(store.Find("rows")->order, 1);
    EXPECT_NE(store.Find("columns")->order, 1);
    EXPECT_NE(store.Find("auto")->order, 1) << "the shorter order is chosen";
    for (const AlphaMaskSource& source : sources) {
        SCOPED_TRACE(source.id);
        ASSERT_TRUE(store.HasMask(source.id.c_str()));
        for (uint32_t y = 0; y < source.height; ++y)
            for (uint32_t x = 0; x < source.width; ++x)
                ASSERT_EQ(store.IsOpaque(source.id.c_str(), int(x), int(y)),
                          (source.pixels[y * source.width + x] >> 24) != 0)
                    << x << "," << y;
        // Outside the image nothing is solid, in particular not the next row's first pixel.
        EXPECT_FALSE(store.IsOpaque(source.id.c_str(), -1, 0));
        EXPECT_FALSE(store.IsOpaque(source.id.c_str(), 0, -1));
        EXPECT_FALSE(store.IsOpaque(source.id.c_str(), int(source.width), 0));
        EXPECT_FALSE(store.IsOpaque(source.id.c_str(), 0, int(source.height)));
    }
}

TEST(TexturesAlpha, UniformImagesLongRunsAndSortedIds)
{
    AlphaMaskSource solid = Source("solid", "checker", 300, 300);
    AlphaMaskSource clear = Source("clear", "checker", 5, 5);
    for (uint32_t& p : clear.pixels)
        p &= 0x00FFFFFF;
    // One hole in a big solid image: the runs around it pass 0x7FFF and must be split.
    AlphaMaskSource holed = Source("holed", "checker", 300, 300, 1);
    holed.pixels[200 * 300 + 7] = 0;
    // Ids in byte order: upper case, lower case, then a byte above 0x7F.
    std::vector<uint8_t> bytes = Build({Source("\xC3\xA9t\xC3\xA9", "circle", 8, 8), holed, solid, clear,
                                        Source("Zebra", "circle", 8, 8)});
    HandMade file(bytes);
    CTexturesAlpha store;
    ASSERT_TRUE(store.LoadFromMemory(file.data(), file.size));

    const TextureAlphaDesc* records = reinterpret_cast<const TextureAlphaDesc*>(bytes.data() + 8);
    EXPECT_STREQ(records[0].id.c_str(), "Zebra");
    EXPECT_STREQ(records[1].id.c_str(), "clear");
    EXPECT_STREQ(records[4].id.c_str(), "\xC3\xA9t\xC3\xA9");
    for (const char* id : {"Zebra", "clear", "holed", "solid", "\xC3\xA9t\xC3\xA9"})
        EXPECT_TRUE(store.HasMask(id)) << id;
    EXPECT_FALSE(store.HasMask("zebra"));
    EXPECT_FALSE(store.HasMask(std::string(100, 'a').c_str()));

    EXPECT_EQ(store.Find("solid")->uniform, 1);
    EXPECT_EQ(store.Find("solid")->size, 0u);
    EXPECT_TRUE(store.IsOpaque("solid", 299, 299));
    EXPECT_FALSE(store.IsOpaque("clear", 2, 2));
    const TextureAlphaDesc* h = store.Find("holed");
    EXPECT_EQ(h->size, 4u * 2) << "0x7FFF, the rest before the hole, the hole, the rest";
    EXPECT_FALSE(store.IsOpaque("holed", 7, 200));
    EXPECT_TRUE(store.IsOpaque("holed", 6, 200));
    EXPECT_TRUE(store.IsOpaque("holed", 8, 200));
    EXPECT_TRUE(store.IsOpaque("holed", 299, 299));

    // A texture without a mask is a data mistake: logged, not solid, and the game goes on.
    oxtest::LogCapture log;
    EXPECT_FALSE(store.IsOpaque("absent", 0, 0));
    EXPECT_TRUE(log.Contains("check failed \"desc\""));
}

TEST(TexturesAlpha, RunBoundariesAndThePastTheEndAnswer)
{
    // 4 x 3 row by row: 3 solid, 0-length (skipped), 2 clear, 5 solid; the last two pixels
    // are past the runs.
    HandMade rows(4, 3, 1, {Solid(3), Solid(0), 2, Solid(5)});
    CTexturesAlpha store;
    ASSERT_TRUE(store.LoadFromMemory(rows.data(), rows.size));
    const bool expected[12] = {1, 1, 1, 0, 0, 1, 1, 1, 1, 1, 0, 0};
    for (int i = 0; i < 12; ++i)
        EXPECT_EQ(store.IsOpaque("hand", i % 4, i / 4), expected[i]) << i;

    // The same runs by columns: index = height * x + y.
    HandMade columns(4, 3, 0, {Solid(3), Solid(0), 2, Solid(5)});
    ASSERT_TRUE(store.LoadFromMemory(columns.data(), columns.size));
    for (int i = 0; i < 12; ++i)
        EXPECT_EQ(store.IsOpaque("hand", i / 3, i % 3), expected[i]) << i;
}

TEST(TexturesAlpha, BadFilesLeaveTheStoreUnavailableWithALogLine)
{
    std::vector<uint8_t> good = Build({Source("a", "circle", 8, 8), Source("b", "stripes", 8, 8)});
    auto refused = [](const std::vector<uint8_t>& bytes, const std::string& text) {
        SCOPED_TRACE(text);
        HandMade file(bytes);
        oxtest::LogCapture log;
        CTexturesAlpha store;
        EXPECT_FALSE(store.LoadFromMemory(file.data(), file.size, "bad.bindump"));
        EXPECT_FALSE(store.IsAvailable());
        EXPECT_FALSE(store.HasMask("a"));
        EXPECT_TRUE(log.Contains(text)) << text;
    };
    std::vector<uint8_t> bad = good;
    bad[3] = 2;  // revision 2
    refused(bad, "Textures alpha bindump is corrupted or has another version. Current revision: 1, "
                 "bindump's revision2");
    refused(std::vector<uint8_t>(good.begin(), good.begin() + 6), "too short");
    bad = good;
    bad[4] = 3;  // three records in a file with two
    refused(std::vector<uint8_t>(bad.begin(), bad.begin() + 8 + 2 * 112), "3 records do not fit");
    bad = good;
    bad[8 + 112 + 4] ^= 1;  // the second id's hash
    refused(bad, "record 1 has a corrupt id");
    bad = good;
    bad[8 + 8] = 'c';  // "c" before "b"
    bad[8 + 4] = uint8_t(ox::misc::CalcHash("c", 1));
    bad[8 + 5] = uint8_t(ox::misc::CalcHash("c", 1) >> 8);
    refused(bad, "out of order");
    bad = good;
    uint32_t past = uint32_t(good.size());
    memcpy(&bad[8 + 112 + kDescOffset], &past, 4);
    refused(bad, "outside the file");
}

TEST(TexturesAlpha, LoadReadsThePropertiesFileThroughThePack)
{
    oxtest::TempDir dir;
    std::vector<uint8_t> good = Build({Source("tex", "circle", 10, 10)});
    ox::misc::GamePackConfig config;
    config.folder = dir.Path().string() + "/";
    config.language = "";
    ox::misc::CGamePack pack(config);
    const size_t mapped = ox::misc::sys::MappedFileCount();
    {
        CTexturesAlpha store(&pack);
        EXPECT_FALSE(store.Load()) << "no file";
        dir.Write(kTexturesAlphaFile, std::string(good.begin(), good.end()));
        ASSERT_TRUE(store.Load());
        EXPECT_TRUE(store.IsOpaque("tex", 5, 5));
        EXPECT_FALSE(store.IsOpaque("tex", 0, 0));
        EXPECT_EQ(ox::misc::sys::MappedFileCount(), mapped + 1) << "held while the store lives";

        std::vector<uint8_t> bad = good;
        bad[0] = 'X';
        dir.Write(kTexturesAlphaFile, std::string(bad.begin(), bad.end()));
        oxtest::LogCapture log;
        EXPECT_FALSE(store.Load());
        EXPECT_FALSE(store.IsAvailable());
        EXPECT_EQ(ox::misc::sys::MappedFileCount(), mapped) << "a refused file is released";
        EXPECT_TRUE(log.Contains("Textures alpha bindump is corrupted"));
        EXPECT_FALSE(store.IsOpaque("tex", 5, 5));
        EXPECT_TRUE(log.Contains("check failed \"_from && IsAvailable()\""));
    }
    EXPECT_EQ(ox::misc::sys::MappedFileCount(), mapped);
}

TEST(TexturesAlpha, TheWriterMakesTheFileFromImagesOnDisk)
{
    oxtest::TempDir dir;
    auto png = [&](const std::string& name, const char* pattern, uint32_t w, uint32_t h) {
        AlphaMaskSource source = Source(name, pattern, w, h);
        std::vector<uint8_t> bytes;
        EXPECT_TRUE(ox::misc::imagelib::EncodePng(source.pixels.data(), w, h, bytes));
        return dir.Write(name, std::string(bytes.begin(), bytes.end())).string();
    };
    const std::string disc = png("disc.png", "circle", 12, 10), stripes = png("stripes.png", "stripes", 9, 4);
    const std::string out = (dir / "masks.bindump").string();
    std::string error;
    size_t size = 0;
    ASSERT_TRUE(WriteTexturesAlpha({{"ui/disc", disc}, {"stripes", stripes}}, AlphaMaskOrder("rows"), out, error,
                                   &size)) << error;
    const std::string table = oxtest::ReadFile(out);
    EXPECT_EQ(table.size(), size);
    HandMade file(std::vector<uint8_t>(table.begin(), table.end()));
    CTexturesAlpha store;
    ASSERT_TRUE(store.LoadFromMemory(file.data(), file.size));
    EXPECT_TRUE(store.IsOpaque("ui/disc", 6, 5));
    EXPECT_FALSE(store.IsOpaque("ui/disc", 0, 0));
    // Rows of 3 clear, 5 solid, 1 clear: the clear ends of rows join.
    EXPECT_EQ(DescribeMask(store.Records()[0]), "stripes 9x4 9 runs by rows");
    EXPECT_EQ(DescribeMask(store.Records()[1]).rfind("ui/disc 12x10 ", 0), 0u);
    AlphaMaskSource solid = Source("solid", "checker", 3, 3);
    std::vector<uint8_t> bytes = Build({solid});
    EXPECT_EQ(DescribeMask(*reinterpret_cast<const TextureAlphaDesc*>(bytes.data() + 8)), "solid 3x3 uniform solid");

    // Nothing is written when an image is missing or not an image, or an id repeats.
    std::filesystem::remove(out);
    dir.Write("junk.png", "not a picture");
    const std::pair<std::vector<AlphaMaskFile>, std::string> refused[] = {
        {{{"a", disc}, {"b", (dir / "gone.png").string()}}, "gone.png"},
        {{{"a", (dir / "junk.png").string()}}, "junk.png"},
        {{{"a", (dir / "disc.txt").string()}}, "disc.txt"},
        {{{"a", disc}, {"a", stripes}}, "\"a\" is given twice"},
    };
    for (const auto& [files, reason] : refused) {
        EXPECT_FALSE(WriteTexturesAlpha(files, 0, out, error));
        EXPECT_NE(error.find(reason), std::string::npos) << error;
        EXPECT_FALSE(std::filesystem::exists(out)) << error;
    }
    EXPECT_EQ(AlphaMaskOrder("auto"), 0);
    EXPECT_EQ(AlphaMaskOrder("columns"), 2);
    EXPECT_EQ(AlphaMaskOrder("diagonal"), -1);
}
