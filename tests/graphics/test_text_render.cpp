// Text layout on a font with round numbers: every glyph advances 10 + SymbolGap 1, the
// blank 5 + 1, "AV" kerns by -3, lines are 20 apart and 20 high; padding left 2.
#include "graphics/Font.h"
#include "graphics/Renderer.h"
#include "graphics/TextRender.h"
#include "graphics/Texture.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

using namespace ox::graphics;
using ox::misc::IntRect;
using ox::misc::IntVector;
using ox::wstring;
using oxtest::RecordingBackend;
using R = CRenderer;

namespace {

const char* kFontXml = R"(<?xml version="1.0"?>
<Font Padding="2 1 0 1" Space="5" PixHeight="20" Baseline="6" SymbolGap="1" LineGap="2" KernPairs="AV" KernData="-3">
  <Char Code="a" Width="10" Rect="0 0 12 19"/>
  <Char Code="b" Width="10" Rect="16 0 28 19"/>
  <Char Code="c" Width="10" Rect="32 0 44 19"/>
  <Char Code="d" Width="10" Rect="48 0 60 19"/>
  <Char Code="A" Width="10" Rect="64 0 76 19"/>
  <Char Code="V" Width="10" Rect="80 0 92 19"/>
</Font>)";

struct TextFixture : ::testing::Test {
    RecordingBackend* backend = nullptr;
    std::unique_ptr<CRenderer> renderer;
    std::unique_ptr<CSurface> surface;
    std::unique_ptr<CTexture> texture;
    FontBlock block;
    CFont font;

    void SetUp() override
    {
        renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
        ASSERT_TRUE(renderer->BeginScene());
        surface = std::make_unique<CSurface>(128, 32);
        texture = std::make_unique<CTexture>(surface.get());
        ASSERT_TRUE(BuildFontBlock(kFontXml, strlen(kFontXml), "test", "test.xml", texture.get(), block));
        font.Attach(block.data());
        font.Texture = texture.get();
        backend->ClearRecord();
    }
    void TearDown() override
    {
        texture.reset();
        surface.reset();
    }

    CTextRender& Text() { return renderer->GetTextRender(); }
    // Where each character lands, by GetCharRect; (-1, -1) for one that has no place.
    std::vector<IntVector> Places(const wstring& text, IntRect box, unsigned flags)
    {
        std::vector<IntVector> places;
        for (unsigned i = 0; i < text.size(); ++i) {
            IntRect r;
            places.push_back(Text().GetCharRect(&font, text.c_str(), box, flags, 0, i, r) ? IntVector(r.X, r.Y)
                                                                                          : IntVector(-1, -1));
        }
        return places;
    }
    std::vector<RecordingBackend::Draw> Draws()
    {
        renderer->Flush();
        return backend->draws;
    }
};

using P = std::vector<IntVector>;

} // namespace

TEST_F(TextFixture, WordWrapAtBlanksAtTheEdgeAndInsideLongWords)
{
    // "aa bb cc" in 50: the second b reaches 50, so the line breaks at the blank before it,
    // which is consumed but still placed at the end of its line.
    EXPECT_EQ(Places(u"aa bb cc", {0, 0, 50, 100}, R::TextWordWrap),
              (P {{0, 0}, {11, 0}, {22, 0}, {0, 20}, {11, 20}, {22, 20}, {0, 40}, {11, 40}}));
    // A word as wide as the box stays whole; a longer one breaks after the character that
    // crossed the edge, which stays on the line.
    EXPECT_EQ(Places(u"aa", {0, 0, 22, 100}, R::TextWordWrap), (P {{0, 0}, {11, 0}}));
    EXPECT_EQ(Places(u"aaaaaa", {0, 0, 30, 100}, R::TextWordWrap),
              (P {{0, 0}, {11, 0}, {22, 0}, {0, 20}, {11, 20}, {22, 20}}));
    // A no-break space is no place to break.
    EXPECT_EQ(Places(u"ab\u00A0ab", {0, 0, 30, 100}, R::TextWordWrap), (P {{0, 0}, {11, 0}, {22, 0}, {22, 0}, {0, 20}}));
    // Without the wrap flag only line feeds break; the box origin moves everything.
    EXPECT_EQ(Places(u"aa bb\ncc", {5, 7, 20, 100}, 0),
              (P {{5, 7}, {16, 7}, {27, 7}, {33, 7}, {44, 7}, {55, 7}, {5, 27}, {16, 27}}));
    // Kerning pulls V towards A; a character the font lacks takes no room and breaks the pair.
    EXPECT_EQ(Places(u"AVa", {0, 0, 200, 100}, 0), (P {{0, 0}, {8, 0}, {19, 0}}));
    EXPECT_EQ(Places(u"A?V", {0, 0, 200, 100}, 0), (P {{0, 0}, {11, 0}, {11, 0}}));
}

TEST_F(TextFixture, AlignmentJustifyAndTrailingLineFeed)
{
    const IntRect box {0, 0, 100, 100};
    // Centre and right take the free width; "ab" is 22 wide.
    EXPECT_EQ(Places(u"ab", box, R::TextCenterH)[0], IntVector(39, 0));
    EXPECT_EQ(Places(u"ab", box, R::TextRight)[0], IntVector(78, 0));
    EXPECT_EQ(Places(u"ab", {0, 0, 10, 100}, R::TextRight)[0], IntVector(0, 0)) << "overflow stays left";
    // Vertically: one line of pitch 20; a trailing line feed counts a second line.
    EXPECT_EQ(Places(u"ab", box, R::TextCenterV)[0], IntVector(0, 40));
    EXPECT_EQ(Places(u"ab", box, R::TextBottom)[0], IntVector(0, 80));
    EXPECT_EQ(Places(u"ab\n", box, R::TextBottom)[0], IntVector(0, 60));
    EXPECT_EQ(Places(u"a\nb\nc\nd\na\nb", {0, 0, 100, 90}, R::TextBottom)[0], IntVector(0, 0))
        << "text taller than the box starts at the top";
    IntVector size;
    ASSERT_TRUE(Text().GetTextSize(&font, u"ab\n", box, 0, 0, size));
    EXPECT_EQ(size, IntVector(22, 20)) << "the empty last line is not laid out";

    // Justify spreads (104 - 62) / 3 over the three blanks; two words stay as they are.
    EXPECT_EQ(Places(u"a b c d", {0, 0, 104, 100}, R::TextJustify),
              (P {{0, 0}, {11, 0}, {31, 0}, {42, 0}, {62, 0}, {73, 0}, {93, 0}}));
    EXPECT_EQ(Places(u"a b", box, R::TextJustify)[2], IntVector(17, 0));

    // Conflicting flags refuse the call with a log line and draw nothing.
    oxtest::LogCapture log;
    IntRect r;
    EXPECT_FALSE(Text().GetCharRect(&font, u"ab", box, R::TextLeft | R::TextRight, 0, 0, r));
    EXPECT_FALSE(Text().GetCharRect(&font, u"ab", box, R::TextTop | R::TextBottom, 0, 0, r));
    EXPECT_FALSE(Text().GetCharRect(&font, u"ab", box, R::TextNoWrap | R::TextWordWrap, 0, 0, r));
    renderer->RenderText(font, u"ab", box, R::TextCenterH | R::TextJustify);
    EXPECT_TRUE(Draws().empty());
    EXPECT_EQ(log.Entries(), (std::vector<std::string> {"log|1|log created", "graphics|2|Invalid horizontal text alignment",
                                                        "graphics|2|Invalid vertical text alignment",
                                                        "graphics|2|Invalid text wrapping flags",
                                                        "graphics|2|Invalid horizontal text alignment"}));
    // Measuring clears alignment and wrapping, so the same flags are fine there.
    EXPECT_TRUE(Text().GetTextSize(&font, u"aa bb cc", {0, 0, 20, 20}, R::TextWordWrap | R::TextCenterH, 0, size));
    EXPECT_EQ(size, IntVector(78, 20));
    EXPECT_CONTRACT_FAILURE(Text().GetTextSize(&font, u"a", box, R::TextWordEllipsis, 0, size),
                            "!(_draw_flags & CRenderer::TextWordEllipsis)");
    // Empty text: the corner of the box; an index past the end has no rectangle.
    EXPECT_TRUE(Text().GetCharRect(&font, u"", {3, 4, 10, 10}, 0, 0, 0, r));
    EXPECT_EQ(r, IntRect(3, 4, 0, 0));
    EXPECT_FALSE(Text().GetCharRect(&font, u"ab", box, 0, 0, 2, r));
}

TEST_F(TextFixture, DrawnGlyphsSitWhereTheyAreMeasured)
{
    const IntRect box {100, 50, 300, 100};
    const wstring text = u"AVa b\nd";
    const P places = Places(text, box, R::TextCenterH);
    renderer->SetColor(Color(0xFF808080u));
    font.Color = Color(0xFFFF0000u);
    renderer->RenderText(font, text, box, R::TextCenterH, 0, Color(0x80FFFFFFu));
    auto draws = Draws();
    // One quad for every character the font has: the blank and the line feed included.
    ASSERT_EQ(draws.size(), 1u) << "one texture, one state: one batch";
    const auto& v = draws[0].vertices;
    ASSERT_EQ(v.size(), 7u * 6);
    const unsigned glyphs[7] = {0, 1, 2, 3, 4, 5, 6};
    for (unsigned i : glyphs) {
        SCOPED_TRACE(i);
        const Vertex* q = &v[i * 6];
        const FontChar& ch = font.GetCharOrEmpty(text[i]);
        // The cell starts the left padding before the pen, and is line_height (20) tall.
        EXPECT_FLOAT_EQ(q[0].x + 0.5f, places[i].X - 2.0f);
        EXPECT_FLOAT_EQ(q[0].y + 0.5f, static_cast<float>(places[i].Y));
        EXPECT_FLOAT_EQ(q[5].x - q[0].x, ch.W);
        EXPECT_FLOAT_EQ(q[5].y - q[0].y, 20.0f);
        EXPECT_FLOAT_EQ(q[0].u, ch.u1);
        EXPECT_FLOAT_EQ(q[5].v, ch.v2);
        // Text colour x current colour x the font's colour.
        EXPECT_EQ(q[0].diffuse, 0x80800000u);
    }
    EXPECT_FLOAT_EQ(v[6].u, 80 / 128.0f) << "the second glyph is V";

    // RenderString: a right-justified string ends at x.
    backend->ClearRecord();
    renderer->RenderString(&font, u"ab", 500, 300, JustifyRight, JustifyBottom);
    draws = Draws();
    ASSERT_EQ(draws.size(), 1u);
    EXPECT_FLOAT_EQ(draws[0].vertices[0].x + 0.5f, 500 - 22 - 2.0f);
    EXPECT_FLOAT_EQ(draws[0].vertices[0].y + 0.5f, 300 - 20.0f);
    backend->ClearRecord();
    renderer->RenderString(nullptr, u"ab", 0, 0);
    renderer->RenderString(&font, u"", 0, 0);
    EXPECT_TRUE(Draws().empty());
}

TEST_F(TextFixture, SelectionBackColourAndLines)
{
    // "ab cd" broken after the blank; the selection runs from b to c over the break.
    const IntRect box {10, 10, 30, 100};
    renderer->RenderText(font, u"ab cd", box, R::TextWordWrap, 0, Color(0xFF0000FFu), Color(0u),
                         Color(0xFF00FF00u), Color(0xFF202020u), 1, 3);
    auto draws = Draws();
    ASSERT_EQ(draws.size(), 2u);
    // Under the glyphs: one rectangle a line, from the first selected character to the end
    // of the last (b and the consumed blank; then c).
    const auto& fill = draws[0].vertices;
    ASSERT_EQ(fill.size(), 12u);
    EXPECT_EQ(draws[0].texture, nullptr);
    EXPECT_FLOAT_EQ(fill[0].x + 0.5f, 21.0f);
    EXPECT_FLOAT_EQ(fill[1].x + 0.5f, 37.0f) << "to the blank's own width";
    EXPECT_FLOAT_EQ(fill[2].y + 0.5f, 30.0f);
    EXPECT_FLOAT_EQ(fill[6].x + 0.5f, 10.0f);
    EXPECT_FLOAT_EQ(fill[8].x + 0.5f, 20.0f);
    EXPECT_FLOAT_EQ(fill[6].y + 0.5f, 30.0f);
    EXPECT_EQ(fill[0].diffuse, 0xFF202020u);
    // The selected glyphs take the selected text colour.
    const auto& glyphs = draws[1].vertices;
    ASSERT_EQ(glyphs.size(), 5u * 6);
    const uint32_t expected[5] = {0xFF0000FFu, 0xFF00FF00u, 0xFF00FF00u, 0xFF00FF00u, 0xFF0000FFu};
    for (int i = 0; i < 5; ++i)
        EXPECT_EQ(glyphs[i * 6].diffuse, expected[i]) << i;

    // A back colour fills each line as wide as it is measured; underline and strikethrough
    // are lines in the text colour from the baseline (18 - 6 = 12).
    backend->ClearRecord();
    renderer->RenderText(font, u"ab\nabc", box, R::TextUnderline | R::TextStrikethrough, 0, Color(0xFF112233u),
                         Color(0xFF000000u));
    draws = Draws();
    std::vector<std::vector<float>> fills, lines;
    for (const auto& d : draws)
        for (size_t i = 0; d.texture == nullptr && i < d.vertices.size();
             i += d.type == PrimitiveLineList ? 2 : 6) {
            const Vertex* p = &d.vertices[i];
            if (d.type == PrimitiveLineList)
                lines.push_back({p[0].x + 0.5f, p[0].y + 0.5f, p[1].x + 0.5f});
            else
                fills.push_back({p[0].x + 0.5f, p[0].y + 0.5f, p[2].x - p[0].x, p[2].y - p[0].y});
        }
    EXPECT_EQ(fills, (std::vector<std::vector<float>> {{10, 10, 22, 20}, {10, 30, 33, 20}}));
    EXPECT_EQ(lines, (std::vector<std::vector<float>> {{10, 30, 32}, {10, 26, 62}, {10, 50, 43}, {10, 46, 73}}));
}

TEST_F(TextFixture, HitTestsAndSizes)
{
    // Points are relative to the box, wherever the box lies.
    const IntRect box {300, 200, 100, 100};
    int index = 0;
    bool left = false, top = false;
    // Inside the second character, right and lower half.
    ASSERT_TRUE(Text().HitTest(&font, u"ab\ncd", box, 0, 0, true, {18, 15}, index, left, top));
    EXPECT_EQ(index, 1);
    EXPECT_FALSE(left);
    EXPECT_FALSE(top);
    ASSERT_TRUE(Text().HitTest(&font, u"ab\ncd", box, 0, 0, true, {2, 22}, index, left, top));
    EXPECT_EQ(index, 3);
    EXPECT_TRUE(left);
    EXPECT_TRUE(top);
    // Past the end of a line: exact finds nothing, otherwise the nearest on that line.
    EXPECT_FALSE(Text().HitTest(&font, u"ab\ncd", box, 0, 0, true, {80, 25}, index, left, top));
    EXPECT_EQ(index, -1);
    ASSERT_TRUE(Text().HitTest(&font, u"ab\ncd", box, 0, 0, false, {80, 25}, index, left, top));
    EXPECT_EQ(index, 4);
    EXPECT_FALSE(Text().HitTest(&font, u"ab", box, 0, 0, false, {5, 60}, index, left, top)) << "below every line";
    EXPECT_FALSE(Text().HitTest(&font, u"ab\ncd", box, 0, 0, true, {318, 215}, index, left, top))
        << "a canvas point is outside the box's own space";

    // Sizes never wrap: only line feeds add lines.
    IntVector size;
    ASSERT_TRUE(Text().GetTextSize(&font, u"aa bb cc dd", {0, 0, 10, 10}, R::TextWordWrap, 0, size));
    EXPECT_EQ(size, IntVector(11 * 8 + 6 * 3, 20));
    ASSERT_TRUE(Text().GetTextSize(&font, u"ab\nabcd", box, 0, 0, size));
    EXPECT_EQ(size, IntVector(44, 40));
    ASSERT_TRUE(Text().GetTextSize(&font, u"abcdef", box, 0, 3, size));
    EXPECT_EQ(size.X, 33) << "the length limit";
    EXPECT_CONTRACT_FAILURE(Text().GetTextSize(nullptr, u"ab", box, 0, 0, size), "&_font != 0");
    EXPECT_CONTRACT_FAILURE(Text().GetTextSize(&font, nullptr, box, 0, 0, size), "_string != 0");
}
