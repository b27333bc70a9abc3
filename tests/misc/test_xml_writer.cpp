#include "core/Settings.h"
#include "core/SettingsReaders.h"
#include "misc/ChunkBuffer.h"
#include "misc/Unicode.h"
#include "misc/XmlWriter.h"
#include "support/TestSupport.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <fstream>

using namespace ox::misc;
using ox::graphics::Color;

namespace {

std::string Text(const CXmlWriter& writer)
{
    void* data = nullptr;
    unsigned size = 0;
    if (!writer.GetBuffer(&data, &size))
        return "<no text>";
    std::string text(static_cast<char*>(data), size);
    free(data);
    return text;
}

} // namespace

TEST(XmlWriter, ElementsWriteTheirTagsInOnePass)
{
    CXmlWriter writer(true);
    {
        CXmlElement root(writer, "root");
        root.Attr("n", "a<b");
        root.Attr("w", u"x<&\"\n\u0416");
        {
            CXmlElement child(root, "child");
            CXmlElement grandchild(child, "leaf");
        }
        CXmlElement bare(root, "bare");
        bare.Flush();
        bare.Flush();
    }
    EXPECT_EQ(Text(writer), "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
                            "<root n=\"a<b\" w=\"x&lt;&amp;&quot;&#x0A;\xD0\x96\" >\n"
                            "<child >\n"
                            "<leaf />\n"
                            "</child>\n"
                            "<bare />\n"
                            "</root>\n");

    CXmlWriter plain(false);
    EXPECT_FALSE(plain.GetBuffer(nullptr, nullptr)) << "no chunk, no buffer";
    plain.Write(u"'>\x01");
    plain.Write("abc", 2);
    EXPECT_EQ(Text(plain), "&apos;&gt;&#x01;ab");
}

TEST(XmlWriter, ChunksSplitWithoutLossAndNoEmptyTail)
{
    CXmlWriter writer(false);
    std::string big(300000, 'x');
    for (size_t i = 0; i < big.size(); i += 7)
        big[i] = static_cast<char>('a' + i % 26);
    writer.Write("head");
    writer.Write(big.c_str());
    EXPECT_EQ(writer.GetChunkCount(), 2u);
    EXPECT_EQ(Text(writer), "head" + big);

    CXmlWriter exact(false);
    std::string chunk(CXmlWriter::ChunkSize, 'q');
    exact.Write(chunk.c_str(), static_cast<int>(chunk.size()) - 10);
    exact.Write(chunk.c_str(), 10);
    exact.Write(chunk.c_str(), static_cast<int>(chunk.size()));
    EXPECT_EQ(exact.GetChunkCount(), 2u);
    EXPECT_EQ(exact.GetSize(), 2u * CXmlWriter::ChunkSize);
    EXPECT_EQ(Text(exact), chunk + chunk);
}

TEST(XmlWriter, SaveReplacesTheFileAtomically)
{
    oxtest::TempDir dir;
    const auto path = dir.Write("saves/options.xml", "old content");
    const ox::wstring widePath = ox::misc::Utf8ToWide(path.string());

    CXmlWriter empty(false);
    empty.SaveToFile(ox::misc::Utf8ToWide((dir / "none.xml").string()));
    EXPECT_FALSE(std::filesystem::exists(dir / "none.xml")) << "nothing to save, no file";

    std::ifstream before(path, std::ios::binary); // a reader holding the old file
    CXmlWriter writer(true);
    { CXmlElement options(writer, "options"); options.Attr("volume", ToXmlValue(75)); }
    writer.SaveToFile(widePath);
    writer.SaveToFile(widePath); // the text stays in the writer
    std::string old((std::istreambuf_iterator<char>(before)), std::istreambuf_iterator<char>());
    EXPECT_EQ(old, "old content") << "the old file was replaced, not rewritten in place";
    EXPECT_EQ(oxtest::ReadFile(path), Text(writer));
    EXPECT_FALSE(std::filesystem::exists(path.string() + ".tmp"));

    // The temporary file cannot be made: logged, the old file stays whole.
    std::filesystem::create_directory(path.string() + ".tmp");
    oxtest::LogCapture log;
    CXmlWriter other(false);
    other.Write("new");
    other.SaveToFile(widePath);
    EXPECT_EQ(oxtest::ReadFile(path), Text(writer));
    EXPECT_TRUE(log.Contains("[xmlwriter][3]: Cannot open file to save (\"" + path.string() + "\")"));
}

TEST(XmlWriter, ValueFormattersAndColorRoundTrip)
{
    EXPECT_STREQ(ToXmlValue(1.5f), "1.500");
    EXPECT_STREQ(ToXmlValue(2.0f), "2");
    EXPECT_STREQ(ToXmlValue(3.0f), "3");
    EXPECT_STREQ(ToXmlValue(0.0004f), "0.000");
    EXPECT_STREQ(ToXmlValue(0.0001f), "0.000");
    EXPECT_STREQ(ToXmlValue(-1.5f), "-1.500");
    EXPECT_STREQ(ToXmlValue(-7), "-7");
    EXPECT_STREQ(ToXmlValue(4294967295u), "-1");
    EXPECT_STREQ(ToXmlValue(true), "true");
    EXPECT_STREQ(ToXmlValue(Vector<float>(1.0f, 0.5f)), "1 0.500");
    EXPECT_STREQ(ToXmlValue(Vector<int>(3, -4)), "3 -4");
    EXPECT_STREQ(ToXmlValue(int16_t(-1), int16_t(2)), "-1 2");
    EXPECT_STREQ(ToXmlValue(Rect<float>(0, 1.25f, 1024, 768)), "0 1.250 1024 768");
    const Vector<float> poly[4] = {{-3.4e38f, 0}, {3.4e38f, 0.5f}, {1, 1}, {0, 1}};
    EXPECT_STREQ(ToXmlValue(poly), "-339999995214436424907732413799364296704 0 "
                                   "339999995214436424907732413799364296704 0.500 1 1 0 1");

    // A colour written as the signed packed value reads back equal.
    const Color colors[] = {Color(), Color(0x80102030u), Color(0x7F000000u), Color(0u)};
    for (const Color& c : colors) {
        ox::core::CSettingsGroup g;
        g.AddValue("c", ToXmlValue(c));
        EXPECT_EQ(ox::core::ReadColor(g, "c"), c) << ToXmlValue(c);
    }
    EXPECT_STREQ(ToXmlValue(Color()), "-1");

    EXPECT_EQ(EscapeXml(std::string()), "");
    EXPECT_EQ(EscapeXml(std::string("\xD0\x96&\t")), "\xD0\x96&amp;&#x09;");
    EXPECT_EQ(EscapeXml("\xFF<"), "\xEF\xBF\xBD&lt;") << "narrow text goes through wide text first";
}

TEST(ChunkBuffer, FirstFitAcrossBlocks)
{
    ChunkBuffer buffer;
    const size_t chunk = 64, room = chunk - ChunkBuffer::kHeaderSize;
    char* a = static_cast<char*>(buffer.Allocate(chunk, room - 8));
    char* b = static_cast<char*>(buffer.Allocate(chunk, 16)); // does not fit: a second block
    char* c = static_cast<char*>(buffer.Allocate(chunk, 8));  // fits the first block's rest
    EXPECT_EQ(buffer.GetBlockCount(), 2u);
    EXPECT_EQ(c, a + room - 8);
    char* d = static_cast<char*>(buffer.Allocate(chunk, 3));
    EXPECT_EQ(d, b + 16);
    memset(a, 1, room - 8);
    memset(d, 2, 3);

    // Too big for a block: a block of its own, and the others keep serving small requests.
    oxtest::AssertCapture asserts;
    char* big = static_cast<char*>(buffer.Allocate(chunk, 3 * chunk));
    ASSERT_NE(big, nullptr);
    memset(big, 3, 3 * chunk);
    EXPECT_EQ(buffer.GetBlockCount(), 3u);
    EXPECT_EQ(buffer.Allocate(chunk, 5), d + 3);
    EXPECT_EQ(buffer.Allocate(chunk, SIZE_MAX), nullptr);
    EXPECT_EQ(asserts.Count(), 0u);
    ChunkBuffer::Free(buffer);
    EXPECT_EQ(buffer.GetBlockCount(), 0u);
    EXPECT_NE(buffer.Allocate(chunk, room), nullptr);
}
