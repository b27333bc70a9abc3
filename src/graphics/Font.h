#pragma once
// Bitmap fonts. A font is one texture holding the glyphs and a metrics block: a header,
// the characters sorted by code and their kerning entries. The block is the same bytes in
// memory and in a ".bindump" file and is read in place; CFont is a thin view on it.
#include "graphics/Color.h"
#include "misc/String.h"
#include "misc/WideChar.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace ox::graphics {

class CTexture;

// 'F', 'N', 'T' and the format revision 1 in the top byte.
constexpr uint32_t kFontMagic = 0x01544E46;

struct FontHeader {
    uint32_t magic;
    uint32_t size;       // of the whole block, in bytes
    int32_t PixHeight;   // the glyph cell height without the top and bottom padding
    int32_t Space;       // advance of the blank
    int32_t LineGap;     // added to the line pitch
    int32_t SymbolGap;   // added to every advance
    int32_t Baseline;    // from the top of the line to the baseline
    int32_t PaddingLeft;
    int32_t PaddingRight;
    int32_t PaddingTop;
    int32_t PaddingBottom;
    uint32_t count;      // characters
};
static_assert(sizeof(FontHeader) == 48);
static_assert(offsetof(FontHeader, PixHeight) == 8 && offsetof(FontHeader, Baseline) == 24 &&
              offsetof(FontHeader, PaddingLeft) == 28 && offsetof(FontHeader, PaddingBottom) == 40 &&
              offsetof(FontHeader, count) == 44);

struct FontChar {
    uint16_t Code;       // UTF-16 unit
    uint16_t Width;      // advance in pixels
    int16_t X, Y;        // the glyph cell in the texture
    int16_t W, H;
    float u1, v1, u2, v2;
    uint32_t KernCount;
    uint32_t KernOffset; // from the start of the block
};
static_assert(sizeof(FontChar) == 36);
static_assert(offsetof(FontChar, Width) == 2 && offsetof(FontChar, X) == 4 && offsetof(FontChar, H) == 10 &&
              offsetof(FontChar, u1) == 12 && offsetof(FontChar, v2) == 24 && offsetof(FontChar, KernCount) == 28 &&
              offsetof(FontChar, KernOffset) == 32);

// Kerning of a character after `Previous`.
struct FontKern {
    uint16_t Previous;
    int16_t Value;
};
static_assert(sizeof(FontKern) == 4);

// A block built in memory: whole 32-bit words, so that the records are aligned.
using FontBlock = std::vector<uint32_t>;

// Checks a block read from a file before it is used in place: magic, size, the character
// table inside the block and sorted, every kerning list inside the block. `why` gets the
// reason of a refusal.
bool CheckFontBlock(const void* data, size_t size, std::string* why = nullptr);

// Parses a font properties file (XML) and builds its block. The texture gives the size the
// texture coordinates are fractions of, and must have one part only. `fontId` and `path`
// name the font in log lines. False (logged) when the block cannot be built.
bool BuildFontBlock(const char* data, size_t size, const char* fontId, const char* path, const CTexture* texture,
                    FontBlock& block);

struct CFont {
    const FontHeader* m_Data = nullptr;
    misc::StringA88 id;
    graphics::Color Color;
    const CTexture* Texture = nullptr;
    int32_t PixHeight = 0;
    int32_t Space = 0;
    int32_t LineGap = 0;
    int32_t SymbolGap = 0;
    int32_t Baseline = 0;
    int32_t PaddingLeft = 0;
    int32_t PaddingRight = 0;
    int32_t PaddingTop = 0;
    int32_t PaddingBottom = 0;

    // Points the font at a checked block and copies the header fields out of it.
    void Attach(const void* block);

    // The character of a code, or null.
    const FontChar* GetChar(wchar code) const;
    // The same, with an empty character (code 0, no advance, no glyph) for a code not in
    // the font.
    const FontChar& GetCharOrEmpty(wchar code) const;
    // Kerning of `character` after `previous`; 0 without an entry.
    int GetKern(const FontChar& character, wchar previous) const;
    // The advance of a text on one line: characters not in the font add nothing.
    unsigned GetStringWidth(const wstring& text) const;

    // The height of one line's drawn cell, padding included.
    int GetLineHeight() const { return PixHeight + PaddingTop + PaddingBottom; }
    int GetSpaceWidth() const { return Space; }
    int GetLineSpacing() const { return LineGap; }

    const FontChar* Chars() const { return reinterpret_cast<const FontChar*>(m_Data + 1); }
    uint32_t CharCount() const { return m_Data ? m_Data->count : 0; }
};

} // namespace ox::graphics
