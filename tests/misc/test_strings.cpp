#include "misc/String.h"
#include "misc/Unicode.h"
#include "support/TestSupport.h"

using namespace ox::misc;

TEST(CalcHash, HandComputedVectors)
{
    EXPECT_EQ(CalcHash("", 0), 1);          // empty text: 0 becomes 1
    EXPECT_EQ(CalcHash("a", 1), 0x0061);    // odd length takes in the terminator
    EXPECT_EQ(CalcHash("ab", 2), 0x6261);
    EXPECT_EQ(CalcHash("abc", 3), 0xB193);  // rotate 0x6261 right -> 0xB130, + 0x0063
    const char16_t wide[] = u"ab";
    EXPECT_EQ(CalcHash(wide, 4), 0x8092);   // 0x61, rotated -> 0x8030, + 0x62
    const unsigned char toZero[] = {0x01, 0x00, 0x00, 0x80};
    EXPECT_EQ(CalcHash(toZero, 4), 1);      // sums to 0 in 16 bits
}

TEST(FixedString, LayoutAndHashAcrossCapacities)
{
    StringA24 small("resource_id");
    StringA88 big("resource_id");
    EXPECT_EQ(small.size, 11);
    EXPECT_EQ(small.max_size, 24);
    EXPECT_EQ(small.hash, 0) << "the hash is computed lazily";
    EXPECT_TRUE(big == small);
    EXPECT_EQ(small.hash, big.hash);
    EXPECT_NE(small.hash, 0);
    EXPECT_FALSE(big == StringA24("resource_ie"));

    StringW28 wide(u"\u0416ab");
    EXPECT_EQ(wide.Hash(), CalcHash(wide.c_str(), 6));
    EXPECT_EQ(wide.Find(u"ab"), 1);
    EXPECT_EQ(wide.Find(u"zz"), -1);
}

TEST(FixedString, CompareIsByUnsignedCodeUnits)
{
    StringA24 z("z");
    EXPECT_EQ(z.Compare("\xE9"), -1);
    EXPECT_EQ(StringA24("\xE9").Compare("z"), 1);
    EXPECT_EQ(StringA24("abc").Compare("abc"), 0);
    EXPECT_EQ(StringA24("ab").Compare("abc"), -1);
    EXPECT_EQ(StringA24("abc").Compare("ab"), 1);
}

TEST(FixedString, MutatorsAndTheirContracts)
{
    StringA24 s("abc");
    s.Hash();
    uint16_t before = s.hash;
    s.Remove(2, 2);
    EXPECT_EQ(s.view(), "abc");
    EXPECT_EQ(s.hash, before) << "an empty removal keeps the hash";
    s.Remove(0, 1);
    EXPECT_EQ(s.view(), "bc");
    EXPECT_EQ(s.hash, 0);

    s.Append("def");
    EXPECT_EQ(s.view(), "bcdef");
    s.Resize(7, 'x');
    EXPECT_EQ(s.view(), "bcdefxx");
    s.Resize(2);
    EXPECT_EQ(s.view(), "bc");
    EXPECT_EQ(s.c_str()[2], 0);

    StringA24 full(std::string(23, 'a'));
    EXPECT_EQ(full.size, 23);
    EXPECT_CONTRACT_FAILURE(full.Append("b"), "sz + 1 <= max_size");
    EXPECT_EQ(full.size, 23);

    oxtest::LogCapture log;
    StringA24 tooLong;
    EXPECT_CONTRACT_FAILURE(tooLong = std::string(30, 'q').c_str(), "len + 1 <= max_size");
    EXPECT_EQ(tooLong.size, 23) << "an over-long text is cut to the capacity";
    EXPECT_TRUE(log.Contains("[ox][3]: BasicString::RawAssign (len + 1 > max_size): qqqq"));

    EXPECT_CONTRACT_FAILURE(s.Resize(24), "_new_size < max_size");
    EXPECT_CONTRACT_FAILURE(s.Remove(30, 31), "_remove_from < size");
}

TEST(Unicode, RoundTripsSurrogatesAndInvalidInput)
{
    std::string utf8 = "a\xD0\x96\xE2\x82\xAC\xF0\x9F\x98\x80"; // a, U+0416, U+20AC, U+1F600
    ox::wstring wide = Utf8ToWide(utf8);
    EXPECT_EQ(wide, (ox::wstring{u'a', 0x0416, 0x20AC, 0xD83D, 0xDE00}));
    EXPECT_EQ(WideToUtf8(wide), utf8);

    EXPECT_EQ(Utf8ToWide("\xFF"), u"\uFFFD");
    EXPECT_EQ(Utf8ToWide("a\xE2\x82"), u"a\uFFFD") << "truncated sequence";
    EXPECT_EQ(Utf8ToWide("\xC0\xAFx"), u"\uFFFD\uFFFDx") << "overlong encoding";
    EXPECT_EQ(Utf8ToWide("\xED\xA0\x80"), u"\uFFFD") << "encoded surrogate";
    EXPECT_EQ(WideToUtf8(ox::wstring{0xD800, u'x'}), "\xEF\xBF\xBDx") << "lone high surrogate";
    EXPECT_EQ(WideToUtf8(ox::wstring{0xDC00}), "\xEF\xBF\xBD") << "lone low surrogate";
}

TEST(StringFormat, WidthPaddingAndUnknownTypes)
{
    ox::wchar buffer[64];
    EXPECT_EQ(StringFormat(buffer, 64, u"[%5s]", u"seventy"), 9u);
    EXPECT_EQ(ox::wstring(buffer), u"[seventy]") << "the width never cuts";
    StringFormat(buffer, 64, u"%03i|%3d|%x|%%", 7, 42);
    EXPECT_EQ(ox::wstring(buffer), u"007| 42|x|%");
    StringFormat(buffer, 64, u"%.2f %ls", 3.14159, u"pi");
    EXPECT_EQ(ox::wstring(buffer), u"3.14 pi");
    StringFormat(buffer, 64, u"%d", -15);
    EXPECT_EQ(ox::wstring(buffer), u"-15");

    EXPECT_EQ(StringFormat(buffer, 4, u"abcdef"), 3u);
    EXPECT_EQ(ox::wstring(buffer), u"abc") << "the last slot is kept for the terminator";
    EXPECT_EQ(StringFormat(buffer, 0, u"abc"), 0u);
    StringFormat(buffer, 64, u"ab%05");
    EXPECT_EQ(ox::wstring(buffer), u"ab") << "a conversion cut by the end of the format";
}

TEST(FormatWide, PlatformConventionsForWideFormats)
{
    EXPECT_EQ(FormatWide(u"%s/%ls/%S/%hs", u"w1", u"w2", "n1", "n2"), u"w1/w2/n1/n2");
    EXPECT_EQ(FormatWide(u"%-4s|%4s|%.2s", u"a", u"b", u"xyz"), u"a   |   b|xy");
    EXPECT_EQ(FormatWide(u"%d %u %x %05.1f %c %lld", -3, 4u, 255, 2.25, u'\u0416', 1LL << 40),
              u"-3 4 ff 002.2 \u0416 1099511627776");
    EXPECT_EQ(FormatString(u"%i-%s", 5, u"x"), u"5-x");
    EXPECT_EQ(Format("%s=%d", "k", 3), "k=3");
}
