// oxfont: makes an engine font from a TrueType or OpenType file: the glyph texture (PNG),
// the properties file, its bindump and the declaration line for properties/fonts.xml.
// The same input gives the same bytes.
#include "graphics/Font.h"
#include "graphics/Texture.h"
#include "misc/CharClass.h"
#include "misc/Unicode.h"
#include "misc/XmlWriter.h"
#include "misc/imagelib/MediaWriter.h"

#include <ft2build.h>
#include FT_FREETYPE_H

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <map>
#include <set>
#include <sstream>
#include <string>
#include <vector>

namespace fs = std::filesystem;
using ox::wchar;
using ox::wstring;

using ox::misc::EscapeXml;

namespace {

const char* kUsage =
    "usage: oxfont --font FILE --size PIXELS --name PATH [options]\n"
    "\n"
    "Makes a bitmap font for the engine from a TrueType or OpenType file. Under the game\n"
    "folder (--dir) it writes PATH.png (white glyphs, coverage in alpha), PATH.xml (the\n"
    "font properties file) and PATH.xml.bindump (the same metrics, precompiled), and\n"
    "prints the declaration line for properties/fonts.xml. The same input gives the same\n"
    "bytes.\n"
    "\n"
    "  --font FILE          the TrueType/OpenType file\n"
    "  --face N             face index in a collection (default 0)\n"
    "  --size PIXELS        the pixel size of the em\n"
    "  --name PATH          game path of the font without extension, e.g. fonts/small\n"
    "  --dir DIR            the game folder the files are written under (default .)\n"
    "  --chars RANGES       characters: ranges and single codes separated by commas,\n"
    "                       decimal, 0x hex or U+ hex: 32-126,0x410-0x44F,U+2026\n"
    "  --text FILE          every character of a UTF-8 text file (strings.xml, ...)\n"
    "                       --chars and --text may repeat; without either: 32-126\n"
    "  --id ID              the font's id in fonts.xml (default: last part of --name)\n"
    "  --image ID           the texture id of the glyph image (default: --name)\n"
    "  --color ARGB         default colour of the declaration, hex 0xAARRGGBB\n"
    "  --padding N          transparent margin around every glyph cell (default 1)\n"
    "  --symbol-gap N       added to every advance (default 0)\n"
    "  --line-gap N         added to the line pitch (default: the font's line gap)\n"
    "  --texture-width N    width of the glyph image (default: the smallest power of\n"
    "                       two that keeps the image about square)\n"
    "  --no-kerning         leave the kerning pairs out\n"
    "  --help               this text\n";

// An attribute value the engine reads must stay under 32,768 bytes.
constexpr size_t kMaxAttribute = 32000;

struct Options {
    std::string font;
    int face = 0;
    int size = 0;
    std::string name;
    std::string dir = ".";
    std::set<wchar> chars;
    std::string id;
    std::string image;
    bool hasColor = false;
    uint32_t color = 0xFFFFFFFF;
    int padding = 1;
    int symbolGap = 0;
    bool hasLineGap = false;
    int lineGap = 0;
    int textureWidth = 0;
    bool kerning = true;
};

struct Glyph {
    wchar code = 0;
    unsigned index = 0;  // in the face
    int advance = 0;
    int left = 0, top = 0;
    int width = 0, rows = 0;
    std::vector<uint8_t> coverage;
    // The cell in the texture.
    int x = 0, y = 0, cellWidth = 0;
};

bool Fail(const std::string& message)
{
    fprintf(stderr, "oxfont: %s\n", message.c_str());
    return false;
}

bool ParseInt(const std::string& text, long& value)
{
    if (text.empty())
        return false;
    char* end = nullptr;
    errno = 0;
    value = strtol(text.c_str(), &end, 0);
    return errno == 0 && end && *end == 0;
}

bool ParseCode(std::string text, long& value)
{
    if (text.size() > 2 && (text[0] == 'U' || text[0] == 'u') && text[1] == '+')
        text = "0x" + text.substr(2);
    return ParseInt(text, value) && value >= 0 && value <= 0xFFFF;
}

// Characters a font can hold: no controls, no lone surrogates, no non-characters.
bool Wanted(long code)
{
    return code >= 32 && !(code >= 0x7F && code <= 0x9F) && !(code >= 0xD800 && code <= 0xDFFF) && code < 0xFFFE;
}

bool AddRanges(const std::string& text, std::set<wchar>& chars)
{
    std::stringstream stream(text);
    std::string item;
    while (std::getline(stream, item, ',')) {
        if (item.empty())
            continue;
        long first = 0, last = 0;
        const size_t dash = item.find('-');
        if (dash == std::string::npos) {
            if (!ParseCode(item, first))
                return Fail("bad character code '" + item + "'");
            last = first;
        } else if (!ParseCode(item.substr(0, dash), first) || !ParseCode(item.substr(dash + 1), last) ||
                   last < first) {
            return Fail("bad character range '" + item + "'");
        }
        for (long code = first; code <= last; ++code)
            if (Wanted(code))
                chars.insert(static_cast<wchar>(code));
    }
    return true;
}

bool AddText(const std::string& path, std::set<wchar>& chars)
{
    std::ifstream file(path, std::ios::binary);
    if (!file)
        return Fail("cannot read '" + path + "'");
    std::stringstream content;
    content << file.rdbuf();
    for (wchar code : ox::misc::Utf8ToWide(content.str()))
        if (Wanted(code) && code != 0xFFFD)
            chars.insert(code);
    return true;
}

bool ParseArguments(int argc, char** argv, Options& options, bool& help)
{
    bool anyChars = false;
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        if (arg == "--help" || arg == "-h") {
            help = true;
            return true;
        }
        if (arg == "--no-kerning") {
            options.kerning = false;
            continue;
        }
        if (arg.rfind("--", 0) != 0 || i + 1 >= argc)
            return Fail(arg.rfind("--", 0) == 0 ? "missing value after " + arg : "unexpected argument '" + arg + "'");
        const std::string value = argv[++i];
        long number = 0;
        auto integer = [&](long low, long high) {
            if (!ParseInt(value, number) || number < low || number > high)
                return Fail("bad value '" + value + "' for " + arg);
            return true;
        };
        if (arg == "--font") {
            options.font = value;
        } else if (arg == "--face") {
            if (!integer(0, 1000))
                return false;
            options.face = static_cast<int>(number);
        } else if (arg == "--size") {
            if (!integer(1, 1000))
                return false;
            options.size = static_cast<int>(number);
        } else if (arg == "--name") {
            options.name = value;
        } else if (arg == "--dir") {
            options.dir = value;
        } else if (arg == "--chars") {
            if (!AddRanges(value, options.chars))
                return false;
            anyChars = true;
        } else if (arg == "--text") {
            if (!AddText(value, options.chars))
                return false;
            anyChars = true;
        } else if (arg == "--id") {
            options.id = value;
        } else if (arg == "--image") {
            options.image = value;
        } else if (arg == "--color") {
            char* end = nullptr;
            const unsigned long color = strtoul(value.c_str(), &end, 16);
            if (value.empty() || !end || *end || color > 0xFFFFFFFFul)
                return Fail("bad colour '" + value + "'");
            options.hasColor = true;
            options.color = static_cast<uint32_t>(color);
        } else if (arg == "--padding") {
            if (!integer(0, 64))
                return false;
            options.padding = static_cast<int>(number);
        } else if (arg == "--symbol-gap") {
            if (!integer(-100, 100))
                return false;
            options.symbolGap = static_cast<int>(number);
        } else if (arg == "--line-gap") {
            if (!integer(-1000, 1000))
                return false;
            options.hasLineGap = true;
            options.lineGap = static_cast<int>(number);
        } else if (arg == "--texture-width") {
            if (!integer(16, 16384))
                return false;
            options.textureWidth = static_cast<int>(number);
        } else {
            return Fail("unknown option " + arg);
        }
    }
    if (options.font.empty() || options.size == 0 || options.name.empty())
        return Fail("--font, --size and --name are required (see --help)");
    if (!anyChars)
        AddRanges("32-126", options.chars);
    if (options.id.empty())
        options.id = fs::path(options.name).filename().string();
    if (options.image.empty())
        options.image = options.name;
    return true;
}

std::string Utf8(wchar code) { return ox::misc::WideToUtf8(wstring(1, code)); }

class FreeType {
public:
    ~FreeType()
    {
        if (face)
            FT_Done_Face(face);
        if (library)
            FT_Done_FreeType(library);
    }
    FT_Library library = nullptr;
    FT_Face face = nullptr;
};

// The integer pixels of a 26.6 value, rounded up or to the nearest.
int Ceil26(long v) { return static_cast<int>((v + 63) >> 6); }
int Round26(long v) { return static_cast<int>((v + 32) >> 6); }

struct Font {
    std::vector<Glyph> glyphs;
    std::vector<wchar> missing;
    int ascent = 0, descent = 0, lineGap = 0, space = 0;
    std::map<std::pair<wchar, wchar>, int> kerning;  // (previous, current) -> pixels
};

bool Render(const Options& options, Font& font)
{
    FreeType ft;
    if (FT_Init_FreeType(&ft.library))
        return Fail("FreeType did not start");
    if (FT_New_Face(ft.library, options.font.c_str(), options.face, &ft.face))
        return Fail("cannot read the font '" + options.font + "'");
    if (FT_Set_Pixel_Sizes(ft.face, 0, static_cast<FT_UInt>(options.size)))
        return Fail("the font has no size " + std::to_string(options.size));
    const FT_Size_Metrics& metrics = ft.face->size->metrics;
    font.ascent = Ceil26(metrics.ascender);
    font.descent = Ceil26(-metrics.descender);
    const int height = Round26(metrics.height);

    for (wchar code : options.chars) {
        const FT_UInt index = FT_Get_Char_Index(ft.face, code);
        if (index == 0) {
            if (code != 32)
                font.missing.push_back(code);
            continue;
        }
        if (FT_Load_Glyph(ft.face, index, FT_LOAD_RENDER | FT_LOAD_NO_BITMAP | FT_LOAD_TARGET_NORMAL))
            return Fail("cannot render U+" + ox::misc::Format("%04X", code));
        const FT_GlyphSlot slot = ft.face->glyph;
        if (code == 32) {
            font.space = Round26(slot->advance.x);
            continue;
        }
        const FT_Bitmap& bitmap = slot->bitmap;
        if (bitmap.pixel_mode != FT_PIXEL_MODE_GRAY && bitmap.width > 0)
            return Fail("U+" + ox::misc::Format("%04X", code) + " did not render in grey levels");
        Glyph glyph;
        glyph.code = code;
        glyph.index = index;
        glyph.advance = Round26(slot->advance.x);
        glyph.left = slot->bitmap_left;
        glyph.top = slot->bitmap_top;
        glyph.width = static_cast<int>(bitmap.width);
        glyph.rows = static_cast<int>(bitmap.rows);
        glyph.coverage.resize(static_cast<size_t>(glyph.width) * glyph.rows);
        for (int y = 0; y < glyph.rows; ++y)
            for (int x = 0; x < glyph.width; ++x)
                glyph.coverage[static_cast<size_t>(y) * glyph.width + x] = bitmap.buffer[y * bitmap.pitch + x];
        if (glyph.rows > 0) {
            font.ascent = std::max(font.ascent, glyph.top);
            font.descent = std::max(font.descent, glyph.rows - glyph.top);
        }
        font.glyphs.push_back(std::move(glyph));
    }
    if (font.space == 0) {
        const FT_UInt index = FT_Get_Char_Index(ft.face, 32);
        if (index && !FT_Load_Glyph(ft.face, index, FT_LOAD_DEFAULT))
            font.space = Round26(ft.face->glyph->advance.x);
        else
            font.space = std::max(1, options.size / 3);
    }
    font.lineGap = options.hasLineGap ? options.lineGap : std::max(0, height - (font.ascent + font.descent));

    if (options.kerning && FT_HAS_KERNING(ft.face)) {
        for (const Glyph& previous : font.glyphs)
            for (const Glyph& current : font.glyphs) {
                if (ox::misc::IsBreakSpace(previous.code) || ox::misc::IsBreakSpace(current.code))
                    continue;
                FT_Vector delta {};
                if (FT_Get_Kerning(ft.face, previous.index, current.index, FT_KERNING_DEFAULT, &delta))
                    continue;
                const int value = Round26(delta.x);
                if (value != 0)
                    font.kerning[{previous.code, current.code}] = value;
            }
    }
    return true;
}

// Shelf packing in code order: every cell has the same height.
bool Pack(const Options& options, Font& font, int cellHeight, int& padLeft, int& width, int& height)
{
    const int pad = options.padding;
    padLeft = pad;
    for (const Glyph& glyph : font.glyphs)
        if (glyph.width > 0)
            padLeft = std::max(padLeft, pad - glyph.left);
    long area = 0;
    int widest = 1;
    for (Glyph& glyph : font.glyphs) {
        glyph.cellWidth = padLeft + std::max(0, glyph.left + glyph.width) + pad;
        area += static_cast<long>(glyph.cellWidth) * cellHeight;
        widest = std::max(widest, glyph.cellWidth);
    }
    width = options.textureWidth;
    if (width == 0) {
        width = 64;
        while (static_cast<long>(width) * width < area)
            width *= 2;
    }
    if (width < widest)
        return Fail("--texture-width " + std::to_string(width) + " is narrower than a glyph cell (" +
                    std::to_string(widest) + ")");
    int x = 0, y = 0;
    for (Glyph& glyph : font.glyphs) {
        if (x + glyph.cellWidth > width) {
            x = 0;
            y += cellHeight;
        }
        glyph.x = x;
        glyph.y = y;
        x += glyph.cellWidth;
    }
    height = font.glyphs.empty() ? cellHeight : y + cellHeight;
    if (height > 32767 || width > 32767)
        return Fail("the glyph image would be larger than 32767 pixels; use a smaller set or size");
    return true;
}

std::string MakeProperties(const Options& options, const Font& font, int padLeft, int cellHeight)
{
    const int pad = options.padding;
    std::string pairs, data;
    size_t dropped = 0;
    for (const auto& [pair, value] : font.kerning) {
        const std::string token = EscapeXml(Utf8(pair.first) + Utf8(pair.second));
        const std::string number = std::to_string(value);
        if (pairs.size() + token.size() + 1 >= kMaxAttribute || data.size() + number.size() + 1 >= kMaxAttribute) {
            ++dropped;
            continue;
        }
        pairs += (pairs.empty() ? "" : " ") + token;
        data += (data.empty() ? "" : " ") + number;
    }
    if (dropped)
        fprintf(stderr, "oxfont: %zu kerning pairs left out: the list would be too long\n", dropped);

    std::string xml = "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n";
    xml += ox::misc::Format("<Font Padding=\"%d %d %d %d\" Space=\"%d\" PixHeight=\"%d\" Baseline=\"%d\" "
                            "SymbolGap=\"%d\" LineGap=\"%d\"",
                            padLeft, pad, pad, pad, font.space, cellHeight, font.descent, options.symbolGap,
                            font.lineGap);
    if (!pairs.empty())
        xml += "\n      KernPairs=\"" + pairs + "\"\n      KernData=\"" + data + "\"";
    xml += ">\n";
    for (const Glyph& glyph : font.glyphs)
        xml += ox::misc::Format("  <Char Code=\"%s\" Width=\"%d\" Rect=\"%d %d %d %d\"/>\n",
                                EscapeXml(Utf8(glyph.code)).c_str(), glyph.advance, glyph.x, glyph.y,
                                glyph.x + glyph.cellWidth, glyph.y + cellHeight - 1);
    xml += "</Font>\n";
    return xml;
}

std::vector<uint32_t> MakeImage(const Font& font, int padLeft, int pad, int width, int height)
{
    // Transparent white, so that filtering at glyph edges never darkens the colour.
    std::vector<uint32_t> pixels(static_cast<size_t>(width) * height, 0x00FFFFFFu);
    for (const Glyph& glyph : font.glyphs) {
        const int originX = glyph.x + padLeft + glyph.left;
        const int originY = glyph.y + pad + font.ascent - glyph.top;
        for (int y = 0; y < glyph.rows; ++y)
            for (int x = 0; x < glyph.width; ++x) {
                const uint32_t alpha = glyph.coverage[static_cast<size_t>(y) * glyph.width + x];
                const int px = originX + x, py = originY + y;
                if (px >= 0 && py >= 0 && px < width && py < height)
                    pixels[static_cast<size_t>(py) * width + px] = alpha << 24 | 0xFFFFFFu;
            }
    }
    return pixels;
}

bool WriteFile(const fs::path& path, const void* data, size_t size)
{
    std::error_code error;
    if (path.has_parent_path())
        fs::create_directories(path.parent_path(), error);
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file.write(static_cast<const char*>(data), static_cast<std::streamsize>(size));
    file.close();
    if (!file)
        return Fail("cannot write '" + path.string() + "'");
    return true;
}

} // namespace

int main(int argc, char** argv)
{
    Options options;
    bool help = false;
    if (!ParseArguments(argc, argv, options, help))
        return 2;
    if (help) {
        fputs(kUsage, stdout);
        return 0;
    }
    Font font;
    if (!Render(options, font))
        return 1;
    if (font.glyphs.empty()) {
        Fail("none of the characters is in the font");
        return 1;
    }
    if (!font.missing.empty()) {
        std::string list;
        for (wchar code : font.missing)
            list += ox::misc::Format(" U+%04X", code);
        fprintf(stderr, "oxfont: %zu characters are not in the font and are left out:%s\n", font.missing.size(),
                list.c_str());
    }

    const int pad = options.padding;
    const int cellHeight = pad + font.ascent + font.descent + pad;
    int padLeft = 0, width = 0, height = 0;
    if (!Pack(options, font, cellHeight, padLeft, width, height))
        return 1;

    const std::string properties = MakeProperties(options, font, padLeft, cellHeight);
    const std::vector<uint32_t> pixels = MakeImage(font, padLeft, pad, width, height);
    std::vector<uint8_t> png;
    ox::misc::imagelib::PngOptions pngOptions;
    pngOptions.layout = ox::misc::imagelib::PngLayout::GreyAlpha;
    if (!ox::misc::imagelib::EncodePng(pixels.data(), static_cast<uint32_t>(width), static_cast<uint32_t>(height),
                                       png, pngOptions)) {
        Fail("the glyph image could not be encoded");
        return 1;
    }

    // The bindump is what the engine itself builds from the properties file.
    ox::graphics::CSurface surface(static_cast<uint16_t>(width), static_cast<uint16_t>(height));
    ox::graphics::CTexture texture(&surface);
    ox::graphics::FontBlock block;
    const std::string propertiesPath = options.name + ".xml";
    if (!ox::graphics::BuildFontBlock(properties.data(), properties.size(), options.id.c_str(),
                                      propertiesPath.c_str(), &texture, block)) {
        Fail("the properties file does not build");
        return 1;
    }

    const fs::path base = fs::path(options.dir) / options.name;
    if (!WriteFile(base.string() + ".png", png.data(), png.size()) ||
        !WriteFile(base.string() + ".xml", properties.data(), properties.size()) ||
        !WriteFile(base.string() + ".xml.bindump", block.data(), block.size() * sizeof(uint32_t)))
        return 1;

    std::string declaration = "<font id=\"" + EscapeXml(options.id) + "\" image=\"" + EscapeXml(options.image) +
                              "\" file=\"" + EscapeXml(propertiesPath) + "\"";
    if (options.hasColor)
        declaration += " color=\"" + std::to_string(options.color) + "\"";
    declaration += "/>";
    printf("%s\n", declaration.c_str());
    fprintf(stderr, "oxfont: %zu characters, %zu kerning pairs, image %dx%d, line height %d\n", font.glyphs.size(),
            font.kerning.size(), width, height, cellHeight);
    return 0;
}
