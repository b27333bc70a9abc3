#pragma once
// Text in a box with a bitmap font: one walk breaks the text into lines and places every
// character; small modules decide what happens to the positions (drawing, selection
// highlight, underline, strikethrough, size, the rectangle of a character, hit tests).
#include "graphics/Color.h"
#include "misc/Rect.h"
#include "misc/Vector.h"
#include "misc/WideChar.h"

#include <memory>

namespace ox::graphics {

class CRenderer;
struct CFont;
struct FontChar;

// What one walk works on; cleared at the start of each call.
struct TextWalkContext {
    const CFont* font = nullptr;
    const wchar* text = nullptr;
    unsigned length = 0;
    const misc::IntRect* rect = nullptr;
    unsigned flags = 0;
    const Color* textColor = nullptr;
    const Color* backColor = nullptr;
    const Color* selTextColor = nullptr;
    const Color* selBackColor = nullptr;
    // First and last selected index, both inclusive.
    int sel_start = 0;
    int sel_end = 0;
    // The drawn height of a line: PixHeight and the top and bottom padding.
    float line_height = 0;
    // The renderer of a drawing walk; null while measuring.
    CRenderer* renderer = nullptr;
};

// One placed character; x and y are relative to the box.
struct TextCharInfo {
    wchar code;
    unsigned index;
    float x;
    float y;
    const FontChar* character;
};

// A step of the walk. Returning false stops the walk; End still runs.
class WalkModule {
public:
    virtual ~WalkModule() = default;
    virtual bool Begin(TextWalkContext& /*context*/) { return true; }
    virtual bool LineBegin(TextWalkContext& /*context*/, unsigned /*line*/, float /*y*/) { return true; }
    virtual bool LineReady(TextWalkContext& /*context*/, unsigned /*line*/, float /*y*/, float /*x*/,
                           float /*width*/)
    {
        return true;
    }
    virtual bool Char(TextWalkContext& /*context*/, const TextCharInfo& /*info*/) { return true; }
    virtual bool End(TextWalkContext& /*context*/) { return true; }
};

class CTextRender {
public:
    // Why a line ended.
    enum BreakReason : int { BreakNone = 0, BreakLine = 1, BreakEnd = 2 };
    struct LineInfo {
        int reason = BreakNone;
        float width = 0;
        unsigned chars = 0;
        unsigned words = 0;
    };
    static constexpr unsigned MaxModules = 8;

    CTextRender();
    ~CTextRender();
    CTextRender(const CTextRender&) = delete;
    CTextRender& operator=(const CTextRender&) = delete;

    // Draws `length` characters of the text (0: up to the terminator) in the box. The
    // selection back colour fills behind the selected characters when it is not 0, the
    // back colour behind each line when it is not 0. False for invalid flags.
    bool RenderText(CRenderer& renderer, const CFont* _font, const wchar* _string, const misc::IntRect& rect,
                    unsigned flags, unsigned length, const Color& textColor, const Color& backColor,
                    const Color& selTextColor, const Color& selBackColor, int selStart, int selEnd);
    // The box of the character at `index`: its position, advance and PixHeight.
    bool GetCharRect(const CFont* _font, const wchar* _string, const misc::IntRect& rect, unsigned flags,
                     unsigned length, unsigned index, misc::IntRect& out);
    // The character under a point given relative to the box's corner. `exact`: only a point
    // inside a character counts; otherwise the nearest character of the line under the point.
    bool HitTest(const CFont* _font, const wchar* _string, const misc::IntRect& rect, unsigned flags,
                 unsigned length, bool exact, const misc::IntVector& point, int& index, bool& leftHalf,
                 bool& topHalf);
    // The size the text takes on lines broken only at line feeds.
    bool GetTextSize(const CFont* _font, const wchar* _string, const misc::IntRect& rect, unsigned flags,
                     unsigned length, misc::IntVector& out);

private:
    struct Modules;

    // Checks and completes the flags, counts the length; fills the context.
    bool Prepare(const CFont* _font, const wchar* _string, const misc::IntRect& rect, unsigned& flags,
                 unsigned& length);
    void AddModule(WalkModule* _what);
    void Walk();
    // Measures the line from `start`: why it ends, its width, its characters (a consumed
    // line feed or blank included) and its words. `wrap` allows word wrapping.
    LineInfo GetLine(unsigned start, unsigned end, bool wrap) const;

    TextWalkContext m_Context;
    std::unique_ptr<Modules> m_Modules;
    WalkModule* m_Active[MaxModules] = {};
    unsigned m_ActiveCount = 0;
};

} // namespace ox::graphics
