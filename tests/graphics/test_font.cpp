// Font metrics blocks, the font manager with its dumps, and fonts made by oxfont.
#include "core/Declaration.h"
#include "core/FontManager.h"
#include "graphics/Font.h"
#include "graphics/Renderer.h"
#include "graphics/TextRender.h"
#include "graphics/Texture.h"
#include "misc/GamePack.h"
#include "misc/PackWriter.h"
#include "misc/imagelib/ImageLib.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <sys/wait.h>

#include <cstring>

using namespace ox::graphics;
using ox::core::CFontManager;
using ox::wstring;
using oxtest::RecordingBackend;

namespace {

// PixHeight 20 - (1 + 4) = 15 stored, Baseline 15 - 5 = 10; "Ж" is two bytes of UTF-8; the
// second "b" replaces the first; the file's blank is replaced by the Space record.
const char* kProperties = R"(<?xml version="1.0" encoding="utf-8"?>
<FONT padding="2 1 3 4" Space="6" PixHeight="20" Baseline="5" SymbolGap="1" LineGap="3"
      KernPairs="AV x JA VA" KernData="-2 9 4 1">
  <Char Code="b" Width="5" Rect="0 0 1 1"/>
  <Char Code="V" Width="8.9" Rect="20 0 28 19"/>
  <char code="Ж" width="11" rect="30 10 42 29"/>
  <Char Code="A" Width="9" Rect="0 0 10 19"/>
  <Char Code="b" Width="7" Rect="10 20 17 39"/>
  <Char Code=" " Width="99" Rect="1 1 5 5"/>
</FONT>)";

struct OwnedTexture {
    CSurface surface;
    CTexture texture;
    OwnedTexture(uint16_t w, uint16_t h) : surface(w, h), texture(&surface) {}
};

const FontChar& Char(const CFont& font, ox::wchar code)
{
    const FontChar* ch = font.GetChar(code);
    EXPECT_NE(ch, nullptr) << static_cast<int>(code);
    static const FontChar none {};
    return ch ? *ch : none;
}

std::vector<uint32_t> Aligned(const std::string& bytes)
{
    std::vector<uint32_t> words((bytes.size() + 3) / 4);
    memcpy(words.data(), bytes.data(), bytes.size());
    return words;
}

} // namespace

TEST(FontBlock, BuiltFromThePropertiesFile)
{
    OwnedTexture tex(128, 64);
    FontBlock block;
    ASSERT_TRUE(BuildFontBlock(kProperties, strlen(kProperties), "f", "f.xml", &tex.texture, block));
    const size_t bytes = block.size() * 4;
    // Characters 10, 32, A, V, b, Ж; kerning on V (after A) and A (after J and after V).
    EXPECT_EQ(bytes, 48u + 36 * 6 + 4 * 3);
    ASSERT_TRUE(CheckFontBlock(block.data(), bytes));
    CFont font;
    font.Attach(block.data());
    EXPECT_EQ(font.m_Data->magic, 0x01544E46u);
    EXPECT_EQ(font.m_Data->size, bytes);
    EXPECT_EQ(font.PixHeight, 15);
    EXPECT_EQ(font.Baseline, 10);
    EXPECT_EQ(font.Space, 6);
    EXPECT_EQ(font.LineGap, 3);
    EXPECT_EQ(font.SymbolGap, 1);
    // The header keeps left, right, top, bottom; the file says left, top, right, bottom.
    EXPECT_EQ(font.PaddingLeft, 2);
    EXPECT_EQ(font.PaddingRight, 3);
    EXPECT_EQ(font.PaddingTop, 1);
    EXPECT_EQ(font.PaddingBottom, 4);

    std::vector<uint16_t> codes;
    for (uint32_t i = 0; i < font.CharCount(); ++i)
        codes.push_back(font.Chars()[i].Code);
    EXPECT_EQ(codes, (std::vector<uint16_t> {10, 32, 'A', 'V', 'b', 0x416}));
    EXPECT_EQ(Char(font, 32).Width, 6) << "the blank advances by Space";
    EXPECT_EQ(Char(font, 32).W, 0);
    EXPECT_EQ(Char(font, 10).Width, 0);
    EXPECT_EQ(Char(font, 'V').Width, 8) << "widths are truncated";
    const FontChar& b = Char(font, 'b');
    EXPECT_EQ(b.Width, 7);
    // The rectangle's right edge is outside the glyph, its bottom edge inside.
    EXPECT_EQ(b.X, 10);
    EXPECT_EQ(b.W, 7);
    EXPECT_EQ(b.H, 20);
    EXPECT_FLOAT_EQ(b.u1, 10 / 128.0f);
    EXPECT_FLOAT_EQ(b.v1, 20 / 64.0f);
    EXPECT_FLOAT_EQ(b.u2, 17 / 128.0f);
    EXPECT_FLOAT_EQ(b.v2, 40 / 64.0f);
    EXPECT_EQ(Char(font, 0x416).H, 20);

    // One-character tokens give nothing; entries are sorted by the previous character.
    EXPECT_EQ(font.GetKern(Char(font, 'V'), 'A'), -2);
    EXPECT_EQ(font.GetKern(Char(font, 'A'), 'J'), 4);
    EXPECT_EQ(font.GetKern(Char(font, 'A'), 'V'), 1);
    EXPECT_EQ(font.GetKern(Char(font, 'A'), 'x'), 0);
    EXPECT_EQ(Char(font, 'A').KernCount, 2u);
    EXPECT_EQ(font.GetChar('?'), nullptr);
    EXPECT_EQ(font.GetCharOrEmpty('?').Width, 0);

    // Width + SymbolGap + kerning; the first character has none; a missing one adds
    // nothing but still counts as the previous one; a line feed adds the gap.
    EXPECT_EQ(font.GetStringWidth(u""), 0u);
    EXPECT_EQ(font.GetStringWidth(u"VA"), 9u + 10 + 1);
    EXPECT_EQ(font.GetStringWidth(u"AV"), 10u + 9 - 2);
    EXPECT_EQ(font.GetStringWidth(u"A?V"), 10u + 9);
    EXPECT_EQ(font.GetStringWidth(u"b\nb"), 8u + 1 + 8);
    CFont empty;
    EXPECT_CONTRACT_FAILURE(empty.GetStringWidth(u"a"), "m_Data");
}

TEST(FontBlock, RefusedInputs)
{
    OwnedTexture tex(128, 64);
    FontBlock block;
    ASSERT_TRUE(BuildFontBlock(kProperties, strlen(kProperties), "f", "f.xml", &tex.texture, block));
    const size_t bytes = block.size() * 4;
    auto broken = [&](auto change) {
        FontBlock copy = block;
        auto* base = reinterpret_cast<uint8_t*>(copy.data());
        size_t size = bytes;
        change(base, size);
        return !CheckFontBlock(copy.data(), size);
    };
    EXPECT_TRUE(broken([](uint8_t* b, size_t&) { b[3] = 2; })) << "another revision";
    EXPECT_TRUE(broken([](uint8_t*, size_t& size) { size -= 4; })) << "truncated";
    EXPECT_TRUE(broken([](uint8_t* b, size_t&) { b[44] = 200; })) << "count past the end";
    EXPECT_TRUE(broken([](uint8_t* b, size_t&) { std::swap(b[48], b[84]); })) << "unsorted codes";
    // The kerning offset of 'V' (the fourth character) points past the block.
    EXPECT_TRUE(broken([&](uint8_t* b, size_t&) { b[48 + 36 * 3 + 33] = 0x40; }));
    EXPECT_FALSE(CheckFontBlock(block.data(), 20));

    // A texture of several parts cannot hold glyphs; an over-long value is skipped.
    CSurface surface(64, 64);
    CTexture parts(&surface, {{0, 0, 0.5f, 1}, {0.5f, 0, 1, 1}}, 32, 64);
    oxtest::LogCapture log;
    EXPECT_FALSE(BuildFontBlock(kProperties, strlen(kProperties), "f", "f.xml", &parts, block));
    EXPECT_TRUE(log.Contains("assertion failed \"context->CurrPart < context->CurrFont->Texture->EnumSurfaceParts()\""));
    const std::string longValue = "<?xml version=\"1.0\"?><Font Space=\"3\" KernPairs=\"" + std::string(40000, 'a') + "\"/>";
    EXPECT_TRUE(BuildFontBlock(longValue.data(), longValue.size(), "f", "f.xml", &tex.texture, block));
    EXPECT_TRUE(log.Contains("assertion failed \"_value->size < buffer_size\""));
    EXPECT_FALSE(BuildFontBlock(kProperties, strlen(kProperties), "f", "f.xml", nullptr, block));
    EXPECT_TRUE(log.Contains("Font 'f' has no texture"));
}

TEST(FontManager, SharedBlocksDumpsAndFailures)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    ox::misc::CPackWriter writer;
    writer.AddData("fonts/f.xml", kProperties);
    std::string image;
    ASSERT_TRUE(writer.Build(image));
    std::vector<uint32_t> aligned = Aligned(image);
    ox::misc::CGamePack pack(aligned.data(), image.size(), {"", "game.pack", std::string()});

    OwnedTexture big(128, 64), small(64, 32);
    auto lookup = [&](const char* id) -> const CTexture* {
        return strcmp(id, "big") == 0 ? &big.texture : strcmp(id, "small") == 0 ? &small.texture : nullptr;
    };
    const char* declarations = R"(<?xml version="1.0"?><fonts>
        <font id="one" image="big" file="fonts/f.xml" color="4278255360"/>
        <font id="two" image="small" file="fonts/f.xml"/>
        <font id="lost" image="nowhere" file="fonts/f.xml"/>
        <font id="nofile" image="big" file="fonts/none.xml"/></fonts>)";
    ox::core::CResourceDeclarations decl;
    decl.LoadFromMemory(declarations, strlen(declarations), "fonts.xml", nullptr);

    oxtest::LogCapture log;
    std::vector<uint8_t> built;
    {
        CFontManager manager(&pack);
        manager.SetTextureLookup(lookup);
        manager.LoadGroup(decl, nullptr);
        const CFont* one = manager.GetItem("one");
        const CFont* two = manager.GetItem("two");
        ASSERT_TRUE(one && two);
        EXPECT_EQ(one->m_Data, two->m_Data) << "one file, one block";
        EXPECT_EQ(two->Texture, &small.texture);
        EXPECT_FLOAT_EQ(two->GetChar('b')->u1, 10 / 128.0f) << "coordinates of the first font's texture";
        EXPECT_EQ(one->Color.GetARGB(), 0xFF00FF00u);
        EXPECT_EQ(two->Color.GetARGB(), 0xFFFFFFFFu);
        EXPECT_STREQ(one->id.c_str(), "one");
        EXPECT_EQ(manager.GetItem("lost"), nullptr);
        EXPECT_EQ(manager.GetItem("nofile"), nullptr);
        EXPECT_TRUE(log.Contains("Cannot find 'lost' font's texture 'nowhere'"));
        EXPECT_TRUE(log.Contains("Cannot find 'nofile' font's properties file 'fonts/none.xml'"));
        EXPECT_TRUE(manager.IsOwnedBlock("fonts/f.xml"));

        // The dump is the block, byte for byte.
        std::filesystem::create_directories("fonts");
        EXPECT_EQ(manager.SaveBindumps(), 1u);
        const std::string dump = oxtest::ReadFile("fonts/f.xml.bindump");
        ASSERT_EQ(dump.size(), one->m_Data->size);
        EXPECT_EQ(memcmp(dump.data(), one->m_Data, dump.size()), 0);
        built.assign(dump.begin(), dump.end());
    }
    {
        // Read from the dump (the properties file is only in the pack), used as it is.
        CFontManager manager(&pack);
        manager.SetTextureLookup(lookup);
        manager.LoadGroup(decl, nullptr);
        ASSERT_NE(manager.GetItem("one"), nullptr);
        EXPECT_FALSE(manager.IsOwnedBlock("fonts/f.xml"));
        EXPECT_EQ(memcmp(manager.GetItem("one")->m_Data, built.data(), built.size()), 0);
        EXPECT_EQ(manager.GetItem("one")->GetStringWidth(u"AV"), 17u);
    }
    {
        // A loose properties file beats the dump.
        dir.Write("fonts/f.xml", kProperties);
        CFontManager manager(&pack);
        manager.SetTextureLookup(lookup);
        manager.LoadGroup(decl, nullptr);
        EXPECT_TRUE(manager.IsOwnedBlock("fonts/f.xml"));
        std::filesystem::remove("fonts/f.xml");
    }
    {
        // A broken dump: a message, then the properties file.
        std::string dump = oxtest::ReadFile("fonts/f.xml.bindump");
        dump[4] ^= 1;
        dir.Write("fonts/f.xml.bindump", dump);
        oxtest::MessageCapture messages;
        CFontManager manager(&pack);
        manager.SetTextureLookup(lookup);
        manager.LoadGroup(decl, nullptr);
        ASSERT_EQ(messages.Boxes().size(), 1u);
        EXPECT_EQ(messages.Boxes()[0].caption, "Error");
        EXPECT_EQ(messages.Boxes()[0].text, "'fonts/f.xml.bindump' has wrong format version or is corrupted.");
        ASSERT_NE(manager.GetItem("two"), nullptr);
        EXPECT_TRUE(manager.IsOwnedBlock("fonts/f.xml"));
    }
}

TEST(OxFont, MakesAFontTheEngineLoads)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    dir.Write("strings.xml", "<s id=\"2\">Лампа</s>");
    const std::string font = "/usr/share/fonts/truetype/dejavu/DejaVuSans.ttf";
    if (!std::filesystem::exists(font))
        GTEST_SKIP() << "fonts-dejavu-core is not installed";
    auto run = [&](const std::string& out) {
        const std::string command = std::string(OX_OXFONT_PATH) + " --font " + font +
                                    " --size 18 --name fonts/ui --id ui --chars 0x41-0x5A,U+416 --text strings.xml"
                                    " --dir " + out + " >decl.txt 2>log.txt";
        return WEXITSTATUS(system(command.c_str()));
    };
    ASSERT_EQ(run("a"), 0) << oxtest::ReadFile("log.txt");
    ASSERT_EQ(run("b"), 0);
    EXPECT_EQ(oxtest::ReadFile("decl.txt"), "<font id=\"ui\" image=\"fonts/ui\" file=\"fonts/ui.xml\"/>\n");
    for (const char* file : {"fonts/ui.png", "fonts/ui.xml", "fonts/ui.xml.bindump"})
        EXPECT_EQ(oxtest::ReadFile(dir / "a" / file), oxtest::ReadFile(dir / "b" / file)) << "reproducible: " << file;

    // The engine loads it through its declaration, with the image as the texture.
    ox::misc::imagelib::Image atlas;
    ASSERT_TRUE(ox::misc::imagelib::LoadImage("a/fonts/ui.png", atlas));
    OwnedTexture tex(static_cast<uint16_t>(atlas.width), static_cast<uint16_t>(atlas.height));
    const std::string declarations = "<?xml version=\"1.0\"?><fonts>" + oxtest::ReadFile("decl.txt") + "</fonts>";
    ox::core::CResourceDeclarations decl;
    decl.LoadFromMemory(declarations.data(), declarations.size(), "fonts.xml", nullptr);
    // In the game folder the properties file is loose, so it is read rather than the dump.
    oxtest::ScopedCwd game(dir / "a");
    ox::misc::CGamePack pack(ox::misc::GamePackConfig {"", "none.pack", std::string()});
    CFontManager manager(&pack);
    manager.SetTextureLookup([&](const char* id) { return strcmp(id, "fonts/ui") == 0 ? &tex.texture : nullptr; });
    manager.LoadGroup(decl, nullptr);
    const CFont* ui = manager.GetItem("ui");
    ASSERT_NE(ui, nullptr);
    // The tool's dump is the block the engine builds from the tool's properties file.
    EXPECT_TRUE(manager.IsOwnedBlock("fonts/ui.xml"));
    const std::string dump = oxtest::ReadFile("fonts/ui.xml.bindump");
    ASSERT_EQ(dump.size(), ui->m_Data->size);
    EXPECT_EQ(memcmp(dump.data(), ui->m_Data, dump.size()), 0);

    // Capitals, Ж and the letters of the text file; nothing else.
    for (ox::wchar code : wstring(u"AZЖЛамп"))
        EXPECT_NE(ui->GetChar(code), nullptr) << static_cast<int>(code);
    EXPECT_EQ(ui->GetChar('a'), nullptr);
    EXPECT_GT(ui->PixHeight, 14);
    EXPECT_GT(ui->Space, 2);
    // Advances as a sans face has them, summed with kerning.
    const FontChar& w = *ui->GetChar('W');
    const FontChar& i = *ui->GetChar('I');
    EXPECT_GT(w.Width, 2 * i.Width);
    EXPECT_EQ(ui->GetStringWidth(u"WI"), static_cast<unsigned>(w.Width + i.Width + ui->GetKern(i, 'W')));
    EXPECT_LT(ui->GetKern(*ui->GetChar('V'), 'A'), 0) << "DejaVu kerns AV";
    // Each glyph's cell holds ink, and the cells lie inside the image.
    for (ox::wchar code : wstring(u"AWЖ")) {
        const FontChar& ch = *ui->GetChar(code);
        ASSERT_LE(ch.X + ch.W, static_cast<int>(atlas.width));
        ASSERT_LE(ch.Y + ch.H, static_cast<int>(atlas.height));
        int ink = 0;
        for (int y = ch.Y; y < ch.Y + ch.H; ++y)
            for (int x = ch.X; x < ch.X + ch.W; ++x)
                ink += (atlas.pixels[static_cast<size_t>(y) * atlas.width + x] >> 24) > 128;
        EXPECT_GT(ink, 10) << static_cast<int>(code);
    }
    EXPECT_NE(WEXITSTATUS(system((std::string(OX_OXFONT_PATH) + " --size 0 >/dev/null 2>&1").c_str())), 0);
    EXPECT_EQ(WEXITSTATUS(system((std::string(OX_OXFONT_PATH) + " --help >/dev/null").c_str())), 0);
}

TEST(FontDrawing, AFontWithoutAGlyphTextureIsReportedOncePerTexture)
{
    RecordingBackend* backend = nullptr;
    std::unique_ptr<CRenderer> renderer = oxtest::MakeRecordingRenderer(backend, 64, 64, 64, 64);
    OwnedTexture glyphs(64, 64);
    FontBlock block;
    ASSERT_TRUE(BuildFontBlock(kProperties, strlen(kProperties), "f", "f.xml", &glyphs.texture, block));
    CFont font, sibling;
    font.Attach(block.data());
    sibling.Attach(block.data());
    font.Texture = sibling.Texture = &glyphs.texture;
    backend->failCreateTexture = true;

    oxtest::LogCapture log;
    const Color white(0xFFFFFFFFu), none(0u);
    for (int frame = 0; frame < 3; ++frame) {
        ASSERT_TRUE(renderer->BeginScene());
        for (const CFont* f : {&font, &sibling})
            renderer->GetTextRender().RenderText(*renderer, f, u"AV", {0, 0, 64, 32}, 0, 0, white, none, white, none,
                                                 -1, -1);
        renderer->EndScene();
    }
    auto entries = log.Entries();
    EXPECT_EQ(std::count(entries.begin(), entries.end(), "graphics|3|Create texture failed, result: 8876017c"), 1);
    EXPECT_EQ(std::count_if(entries.begin(), entries.end(),
                            [](const std::string& e) { return e.find("glyph texture") != std::string::npos; }),
              1)
        << "two fonts on one texture";
    EXPECT_TRUE(backend->draws.empty());
}
