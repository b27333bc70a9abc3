#include "graphics/Font.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Texture.h"
#include "misc/CharClass.h"
#include "misc/Unicode.h"
#include "misc/XmlParser.h"

#include <strings.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>

namespace ox::graphics {

// Block checks ---------------------------------------------------------------------------

bool CheckFontBlock(const void* data, size_t size, std::string* why)
{
    auto refuse = [why](const char* reason) {
        if (why)
            *why = reason;
        return false;
    };
    if (!data || size < sizeof(FontHeader))
        return refuse("shorter than the header");
    FontHeader header;
    std::memcpy(&header, data, sizeof header);
    if (header.magic != kFontMagic)
        return refuse("wrong magic");
    if (header.size != size)
        return refuse("the stored size is not the file size");
    if (header.count > (size - sizeof(FontHeader)) / sizeof(FontChar))
        return refuse("more characters than the block holds");
    const size_t kernStart = sizeof(FontHeader) + header.count * sizeof(FontChar);
    const auto* bytes = static_cast<const uint8_t*>(data);
    uint32_t previousCode = 0;
    for (uint32_t i = 0; i < header.count; ++i) {
        FontChar ch;
        std::memcpy(&ch, bytes + sizeof(FontHeader) + i * sizeof(FontChar), sizeof ch);
        if (i > 0 && ch.Code <= previousCode)
            return refuse("characters not sorted by code");
        previousCode = ch.Code;
        if (ch.KernCount == 0)
            continue;
        if (ch.KernOffset < kernStart || ch.KernOffset % 4 != 0 || ch.KernOffset > size ||
            ch.KernCount > (size - ch.KernOffset) / sizeof(FontKern))
            return refuse("kerning entries outside the block");
    }
    return true;
}

// Properties file --------------------------------------------------------------------------

namespace {

// The longest attribute value the reader takes, in bytes.
constexpr size_t kValueBufferSize = 32768;

struct ParsedChar {
    uint16_t width = 0;
    int16_t x = 0, y = 0, w = 0, h = 0;
};

struct ParseContext {
    const char* fontId = "";
    const char* path = "";
    const CTexture* texture = nullptr;
    // The texture part the glyphs are cut from: font textures have exactly one.
    unsigned CurrPart = 0;
    bool failed = false;

    int padLeft = 0, padTop = 0, padRight = 0, padBottom = 0;
    int pixHeight = 0, space = 0, lineGap = 0, symbolGap = 0, baseline = 0;
    std::vector<wstring> kernPairs;
    std::vector<long> kernData;

    std::map<uint16_t, ParsedChar> chars;
    bool inChar = false;
    bool hasCode = false;
    uint16_t code = 0;
    ParsedChar current;
};

bool NameIs(const char* name, size_t length, const char* wanted)
{
    return strlen(wanted) == length && strncasecmp(name, wanted, length) == 0;
}

int ToInt(const std::string& value) { return static_cast<int>(strtol(value.c_str(), nullptr, 10)); }

std::vector<wstring> SplitBlanks(const wstring& text)
{
    std::vector<wstring> tokens;
    size_t i = 0;
    while (i < text.size()) {
        while (i < text.size() && misc::IsBreakSpace(text[i]))
            ++i;
        size_t start = i;
        while (i < text.size() && !misc::IsBreakSpace(text[i]))
            ++i;
        if (i > start)
            tokens.push_back(text.substr(start, i - start));
    }
    return tokens;
}

void OnStart(void* user, misc::XmlRecord* stack, int depth)
{
    auto* context = static_cast<ParseContext*>(user);
    const misc::XmlRecord& record = stack[depth];
    if (context->failed || !NameIs(record.name, record.nameLength, "Char"))
        return;
    const unsigned parts = context->texture ? context->texture->GetFramesCount() : 1;
    if (parts != 1) {
        // Glyph cells are fractions of the one surface: a texture of several parts cannot
        // be cut into glyphs.
        diag::AssertFailedA("context->CurrPart < context->CurrFont->Texture->EnumSurfaceParts()", __FILE__,
                            __LINE__);
        OX_LOG("font", diag::LogError, "Font '%s': the texture has %u parts; a font texture has one",
               context->fontId, parts);
        context->failed = true;
        return;
    }
    context->inChar = true;
    context->hasCode = false;
    context->current = ParsedChar();
}

void OnAttribute(void* user, misc::XmlRecord* stack, int depth, const char* name, size_t nameLength,
                 const char* value, size_t valueLength, bool /*utf8*/)
{
    auto* context = static_cast<ParseContext*>(user);
    if (context->failed)
        return;
    if (valueLength >= kValueBufferSize) {
        diag::AssertFailedA("_value->size < buffer_size", __FILE__, __LINE__);
        return;
    }
    const misc::XmlRecord& record = stack[depth];
    const std::string text(value, valueLength);
    if (NameIs(record.name, record.nameLength, "Font")) {
        if (NameIs(name, nameLength, "Padding")) {
            int l = 0, t = 0, r = 0, b = 0;
            sscanf(text.c_str(), "%i %i %i %i", &l, &t, &r, &b);
            context->padLeft = l;
            context->padTop = t;
            context->padRight = r;
            context->padBottom = b;
        } else if (NameIs(name, nameLength, "Space")) {
            context->space = ToInt(text);
        } else if (NameIs(name, nameLength, "PixHeight")) {
            context->pixHeight = ToInt(text) - (context->padTop + context->padBottom);
        } else if (NameIs(name, nameLength, "Baseline")) {
            context->baseline = context->pixHeight - ToInt(text);
        } else if (NameIs(name, nameLength, "SymbolGap")) {
            context->symbolGap = ToInt(text);
        } else if (NameIs(name, nameLength, "LineGap")) {
            context->lineGap = ToInt(text);
        } else if (NameIs(name, nameLength, "KernPairs")) {
            context->kernPairs = SplitBlanks(misc::Utf8ToWide(text));
        } else if (NameIs(name, nameLength, "KernData")) {
            context->kernData.clear();
            for (const wstring& token : SplitBlanks(misc::Utf8ToWide(text)))
                context->kernData.push_back(strtol(misc::WideToUtf8(token).c_str(), nullptr, 10));
        }
    } else if (context->inChar && NameIs(record.name, record.nameLength, "Char")) {
        if (NameIs(name, nameLength, "Code")) {
            const wstring code = misc::Utf8ToWide(text);
            context->hasCode = !code.empty();
            context->code = code.empty() ? 0 : static_cast<uint16_t>(code[0]);
        } else if (NameIs(name, nameLength, "Width")) {
            const double width = std::trunc(strtod(text.c_str(), nullptr));
            context->current.width = static_cast<uint16_t>(width < 0 ? 0 : (width > 65535 ? 65535 : width));
        } else if (NameIs(name, nameLength, "Rect")) {
            short x1 = 0, y1 = 0, x2 = 0, y2 = 0;
            sscanf(text.c_str(), "%hi %hi %hi %hi", &x1, &y1, &x2, &y2);
            context->current.x = x1;
            context->current.y = y1;
            // The right edge is outside the glyph, the bottom edge inside.
            context->current.w = static_cast<int16_t>(x2 - x1);
            context->current.h = static_cast<int16_t>(y2 - y1 + 1);
        }
    }
}

void OnEnd(void* user, misc::XmlRecord* stack, int depth)
{
    auto* context = static_cast<ParseContext*>(user);
    const misc::XmlRecord& record = stack[depth];
    if (context->failed || !context->inChar || !NameIs(record.name, record.nameLength, "Char"))
        return;
    context->inChar = false;
    if (!context->hasCode) {
        OX_LOG("font", diag::LogWarning, "%s: a Char without a Code is skipped", context->path);
        return;
    }
    context->chars[context->code] = context->current;
}

uint16_t ClampWidth(int width) { return static_cast<uint16_t>(width < 0 ? 0 : (width > 65535 ? 65535 : width)); }

} // namespace

bool BuildFontBlock(const char* data, size_t size, const char* fontId, const char* path, const CTexture* texture,
                    FontBlock& block)
{
    ParseContext context;
    context.fontId = fontId;
    context.path = path;
    context.texture = texture;
    misc::XmlParseProblem problem;
    if (!misc::ParseXml(data, size, &context, OnStart, OnAttribute, nullptr, OnEnd, nullptr, &problem)) {
        OX_LOG("font", diag::LogError, "%s line %u: %s", path, problem.line,
               problem.what.empty() ? "not an XML file" : problem.what.c_str());
        return false;
    }
    if (!problem.what.empty())
        OX_LOG("font", diag::LogWarning, "%s line %u: %s", path, problem.line, problem.what.c_str());
    if (context.failed)
        return false;
    const CSurface* surface = texture ? texture->GetSurface() : nullptr;
    if (!surface || surface->GetWidth() == 0 || surface->GetHeight() == 0) {
        OX_LOG("font", diag::LogError, "Font '%s' has no texture", fontId);
        return false;
    }
    const float W = surface->GetWidth(), H = surface->GetHeight();

    // The blank and the line feed always have their own records.
    context.chars[32] = ParsedChar {ClampWidth(context.space)};
    context.chars[10] = ParsedChar {};

    std::map<uint16_t, std::map<uint16_t, int16_t>> kerning;
    for (size_t i = 0; i < context.kernPairs.size() && i < context.kernData.size(); ++i) {
        const wstring& pair = context.kernPairs[i];
        if (pair.size() >= 2)
            kerning[pair[1]][pair[0]] = static_cast<int16_t>(context.kernData[i]);
    }
    size_t kernCount = 0;
    for (const auto& [code, entries] : kerning)
        if (context.chars.count(code))
            kernCount += entries.size();

    const size_t count = context.chars.size();
    const size_t bytes = sizeof(FontHeader) + count * sizeof(FontChar) + kernCount * sizeof(FontKern);
    block.assign(bytes / 4, 0);
    auto* base = reinterpret_cast<uint8_t*>(block.data());
    auto* header = reinterpret_cast<FontHeader*>(base);
    *header = FontHeader {kFontMagic,
                          static_cast<uint32_t>(bytes),
                          context.pixHeight,
                          context.space,
                          context.lineGap,
                          context.symbolGap,
                          context.baseline,
                          context.padLeft,
                          context.padRight,
                          context.padTop,
                          context.padBottom,
                          static_cast<uint32_t>(count)};
    auto* out = reinterpret_cast<FontChar*>(header + 1);
    auto* kernOut = reinterpret_cast<FontKern*>(out + count);
    for (const auto& [code, ch] : context.chars) {
        FontChar& record = *out++;
        record.Code = code;
        record.Width = ch.width;
        record.X = ch.x;
        record.Y = ch.y;
        record.W = ch.w;
        record.H = ch.h;
        record.u1 = ch.x / W;
        record.v1 = ch.y / H;
        record.u2 = (ch.x + ch.w) / W;
        record.v2 = (ch.y + ch.h) / H;
        auto found = kerning.find(code);
        if (found == kerning.end())
            continue;
        record.KernCount = static_cast<uint32_t>(found->second.size());
        record.KernOffset = static_cast<uint32_t>(reinterpret_cast<uint8_t*>(kernOut) - base);
        for (const auto& [previous, value] : found->second)
            *kernOut++ = FontKern {previous, value};
    }
    return true;
}

// CFont ----------------------------------------------------------------------------------

void CFont::Attach(const void* block)
{
    m_Data = static_cast<const FontHeader*>(block);
    if (!m_Data)
        return;
    PixHeight = m_Data->PixHeight;
    Space = m_Data->Space;
    LineGap = m_Data->LineGap;
    SymbolGap = m_Data->SymbolGap;
    Baseline = m_Data->Baseline;
    PaddingLeft = m_Data->PaddingLeft;
    PaddingRight = m_Data->PaddingRight;
    PaddingTop = m_Data->PaddingTop;
    PaddingBottom = m_Data->PaddingBottom;
}

const FontChar* CFont::GetChar(wchar code) const
{
    if (!m_Data)
        return nullptr;
    const FontChar* first = Chars();
    size_t low = 0, high = m_Data->count;
    while (low < high) {
        const size_t middle = (low + high) / 2;
        if (first[middle].Code < code)
            low = middle + 1;
        else
            high = middle;
    }
    return low < m_Data->count && first[low].Code == code ? &first[low] : nullptr;
}

const FontChar& CFont::GetCharOrEmpty(wchar code) const
{
    static const FontChar empty {};
    const FontChar* found = GetChar(code);
    return found ? *found : empty;
}

int CFont::GetKern(const FontChar& character, wchar previous) const
{
    if (!m_Data || character.KernCount == 0)
        return 0;
    const auto* entries =
        reinterpret_cast<const FontKern*>(reinterpret_cast<const uint8_t*>(m_Data) + character.KernOffset);
    size_t low = 0, high = character.KernCount;
    while (low < high) {
        const size_t middle = (low + high) / 2;
        if (entries[middle].Previous < previous)
            low = middle + 1;
        else
            high = middle;
    }
    return low < character.KernCount && entries[low].Previous == previous ? entries[low].Value : 0;
}

unsigned CFont::GetStringWidth(const wstring& text) const
{
    OX_ASSERT(m_Data);
    if (!m_Data)
        return 0;
    float width = 0.0f;
    wchar previous = 0;
    for (wchar code : text) {
        if (const FontChar* ch = GetChar(code))
            width += static_cast<float>(ch->Width + SymbolGap + GetKern(*ch, previous));
        previous = code;
    }
    return width > 0.0f ? static_cast<unsigned>(width) : 0u;
}

} // namespace ox::graphics
