#include "misc/StringTable.h"
#include "support/TestSupport.h"

using ox::misc::CStringTable;
using ox::wstring;

namespace {
std::vector<std::pair<int, wstring>> Sample()
{
    return {{5, u"five"}, {1, u"one"}, {3, u"three"}, {0, u"zero"}, {3, u"three again"}, {12, u"\u0416"}};
}
} // namespace

TEST(StringTable, LookupsAndReferences)
{
    CStringTable table;
    EXPECT_EQ(wstring(table.GetString(7)), u"String \"$7\" has not found!") << "no table at all";
    table.BuildFromTexts(Sample());
    EXPECT_EQ(table.GetCount(), 6u) << "duplicates stay";
    EXPECT_EQ(wstring(table.GetString(1)), u"one");
    EXPECT_EQ(wstring(table.GetString(12)), u"\u0416");
    wstring three = table.GetString(3);
    EXPECT_TRUE(three == u"three" || three == u"three again");
    EXPECT_EQ(wstring(table.GetString(-4)), u"String \"$-4\" has not found!");

    EXPECT_EQ(table.FormatByStringsID(wstring(u"100$$")), u"100$");
    EXPECT_EQ(table.FormatByStringsID(wstring(u"a$5b")), u"afiveb");
    EXPECT_EQ(table.FormatByStringsID(wstring(u"a$")), u"azero");
    EXPECT_EQ(table.FormatByStringsID(wstring(u"$1$5")), u"onefive");
    EXPECT_EQ(table.FormatByStringsID(wstring(u"$$5 $99")), u"$5 String \"$99\" has not found!");
    EXPECT_EQ(table.FormatByStringsID(std::string("x$12")), u"x\u0416");
    EXPECT_EQ(table.FormatByStringsID(static_cast<const char*>(nullptr)), u"");

    CStringTable single;
    single.BuildFromTexts({{42, u"only"}});
    EXPECT_EQ(wstring(single.GetString(42)), u"only");
    EXPECT_EQ(wstring(single.GetString(41)), u"String \"$41\" has not found!");
}

TEST(StringTable, InPlaceTablesAreCheckedBeforeUse)
{
    oxtest::LogCapture log;
    std::vector<uint8_t> good = CStringTable::BuildBinary16(Sample(), "S16\x01");
    CStringTable table;
    ASSERT_TRUE(table.UseTable(good.data(), good.size(), "strings.bindump"));
    EXPECT_EQ(reinterpret_cast<const uint8_t*>(table.GetString(0)) - good.data() > 0, true) << "used in place";
    EXPECT_EQ(wstring(table.GetString(5)), u"five");

    std::vector<uint8_t> badMagic = good;
    badMagic[3] = 'X';
    EXPECT_FALSE(table.UseTable(badMagic.data(), badMagic.size(), "strings.bindump"));
    std::vector<uint8_t> truncated(good.begin(), good.begin() + good.size() - 3);
    EXPECT_FALSE(table.UseTable(truncated.data(), truncated.size(), "strings.bindump"));
    std::vector<uint8_t> hugeCount = good;
    hugeCount[7] = 0x7F;
    EXPECT_FALSE(table.UseTable(hugeCount.data(), hugeCount.size(), "strings.bindump"));
    EXPECT_TRUE(log.Contains("strings.bindump: entry"));
    EXPECT_TRUE(log.Contains("do not fit"));
    EXPECT_EQ(wstring(table.GetString(5)), u"five") << "a refused table leaves the old one";
}

TEST(StringTable, TextsLongerThanAChunkAreKept)
{
    // 16,377 units and a terminator are more than a 32,768-byte chunk holds beside its header.
    const std::string longText(16377, 'a'), longer(40000, 'b');
    const std::string xml = "<?xml version=\"1.0\"?><strings><s id=\"1\">" + longText + "</s><s id=\"2\">short</s>" +
                            "<s id=\"3\">" + longer + "</s></strings>";
    oxtest::AssertCapture asserts;
    std::vector<std::pair<int, wstring>> texts;
    EXPECT_TRUE(CStringTable::ParseXml(xml.data(), xml.size(), "strings.xml", texts));
    EXPECT_EQ(asserts.Count(), 0u);
    ASSERT_EQ(texts.size(), 3u);
    EXPECT_EQ(texts[0].second, wstring(longText.begin(), longText.end()));
    EXPECT_EQ(texts[1].second, u"short");
    EXPECT_EQ(texts[2].second.size(), longer.size());
}

TEST(StringTable, BinaryDumpsRoundTrip)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    CStringTable empty;
    EXPECT_FALSE(empty.SaveBinaryDumps());

    CStringTable table;
    table.BuildFromTexts(Sample());
    ASSERT_TRUE(table.SaveBinaryDumps());
    std::string utf16 = oxtest::ReadFile(dir / "strings.xml.bin_utf16le");
    std::string utf32 = oxtest::ReadFile(dir / "strings.xml.bin_utf32le");
    ASSERT_EQ(utf16.substr(0, 4), "S16L");
    ASSERT_EQ(utf32.substr(0, 4), "S32L");

    CStringTable reread;
    ASSERT_TRUE(reread.UseTable(reinterpret_cast<const uint8_t*>(utf16.data()), utf16.size(), "utf16"));
    EXPECT_EQ(wstring(reread.GetString(12)), u"\u0416");
    // The 32-bit form: same index, offsets to 4-byte characters.
    uint32_t offset;
    memcpy(&offset, utf32.data() + 8 + 8 * 5 + 4, 4); // the entry with id 12, last after sorting
    uint32_t ch;
    memcpy(&ch, utf32.data() + offset, 4);
    EXPECT_EQ(ch, 0x0416u);
    memcpy(&ch, utf32.data() + offset + 4, 4);
    EXPECT_EQ(ch, 0u);
}

#include "misc/GamePack.h"
#include "misc/PackWriter.h"

namespace {
// A pack image aligned for in-place reading.
struct PackImage {
    std::vector<uint32_t> words;
    size_t size = 0;
    explicit PackImage(ox::misc::CPackWriter& writer)
    {
        std::string image;
        EXPECT_TRUE(writer.Build(image));
        size = image.size();
        words.resize((size + 3) / 4);
        memcpy(words.data(), image.data(), size);
    }
};
ox::misc::GamePackConfig NoLanguage(const oxtest::TempDir& dir)
{
    ox::misc::GamePackConfig config;
    config.folder = dir.Path().string();
    config.language = "";
    return config;
}
} // namespace

TEST(StringTable, LoadPrefersTheBindumpAndUsesItInPlace)
{
    oxtest::TempDir dir;
    ox::misc::CPackWriter writer;
    std::vector<uint8_t> bindump = CStringTable::BuildBinary16(Sample(), "S16\x01");
    writer.AddData("properties/strings.bindump", std::string(bindump.begin(), bindump.end()));
    writer.AddData("properties/strings.xml", "<?xml version=\"1.0\"?><s><t id=\"5\">from xml</t></s>");
    PackImage image(writer);
    ox::misc::CGamePack pack(image.words.data(), image.size, NoLanguage(dir));

    CStringTable table;
    table.Load(pack);
    const auto* text = reinterpret_cast<const uint8_t*>(table.GetString(5));
    const auto* base = reinterpret_cast<const uint8_t*>(image.words.data());
    EXPECT_EQ(wstring(table.GetString(5)), u"five");
    EXPECT_TRUE(text > base && text < base + image.size) << "the table is read inside the pack";
}

TEST(StringTable, WrongMagicShowsTheBoxAndFallsBackToXml)
{
    oxtest::TempDir dir;
    oxtest::LogCapture log;
    oxtest::MessageCapture boxes;
    dir.Write("properties/strings.xml.bin_utf16le", "S16Xjunk");
    dir.Write("properties/strings.xml",
              "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<strings>\n"
              "<s id=\"5\">Hello &amp; bye</s>\n<s id=\"1\"/>\n<s>\xD0\x96</s>\n<s ID=\"3\">three</s>\n</strings>\n");
    ox::misc::CGamePack pack(NoLanguage(dir));
    CStringTable table;
    table.Load(pack);
    ASSERT_EQ(boxes.Boxes().size(), 1u);
    EXPECT_EQ(boxes.Boxes()[0].caption, "Error");
    EXPECT_EQ(boxes.Boxes()[0].text, "strings.bindump is corrupted or contains wrong encoding.");
    EXPECT_EQ(wstring(table.GetString(5)), u"Hello & bye");
    EXPECT_EQ(wstring(table.GetString(1)), u"\u0416") << "an id without text waits for the next text";
    EXPECT_EQ(wstring(table.GetString(3)), u"three") << "the id attribute ignores case";

    ox::misc::CGamePack empty(NoLanguage(oxtest::TempDir()));
    CStringTable none;
    none.Load(empty);
    EXPECT_FALSE(none.HasTable());
    EXPECT_TRUE(log.Contains("[StringTable][3]: Failed to load StringTable data"));
}
