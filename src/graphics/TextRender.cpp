#include "graphics/TextRender.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Font.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "misc/CharClass.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <vector>

namespace ox::graphics {

namespace {

constexpr unsigned kHorizontalBits = 0x8E0;
constexpr unsigned kVerticalBits = 0x700;
constexpr unsigned kMeasureClears = 0xFE0;

inline float BoxX(const TextWalkContext& c) { return static_cast<float>(c.rect->X); }
inline float BoxY(const TextWalkContext& c) { return static_cast<float>(c.rect->Y); }

// Glyph quads: collected during the walk, drawn at its end, each clipped alone.
class WalkModuleNormalRender : public WalkModule {
public:
    bool Begin(TextWalkContext& c) override
    {
        m_Vertices.clear();
        const Color current = c.renderer->GetColor();
        m_Text = (*c.textColor * current * c.font->Color).GetARGB();
        m_SelText = (*c.selTextColor * current * c.font->Color).GetARGB();
        CSurface* surface = c.font->Texture ? c.font->Texture->GetSurface() : nullptr;
        SurfacePtr = surface ? surface->GetD3DTexture() : nullptr;
        return true;
    }

    bool LineReady(TextWalkContext& c, unsigned, float y, float x, float width) override
    {
        if (c.backColor->GetARGB() != 0)
            c.renderer->RenderFilledPoly4(
                misc::RectToPoly4({BoxX(c) + x, BoxY(c) + y, width, c.line_height}), *c.backColor);
        return true;
    }

    bool Char(TextWalkContext& c, const TextCharInfo& info) override
    {
        if (!SurfacePtr) {
            // The font's texture could not be loaded: the text is drawn with nothing, said once.
            const void* key = c.font->Texture ? static_cast<const void*>(c.font->Texture) : c.font;
            if (FirstDrawProblem(key))
                OX_LOG("graphics", diag::LogError, "Font '%s' has no glyph texture: its text draws nothing",
                       c.font->id.c_str());
            return false;
        }
        const int index = static_cast<int>(info.index);
        const uint32_t color = c.sel_start <= index && index <= c.sel_end ? m_SelText : m_Text;
        if ((color >> 24) == 0)
            return true;
        const FontChar& ch = *info.character;
        const float x0 = BoxX(c) + info.x - static_cast<float>(c.font->PaddingLeft);
        const float y0 = BoxY(c) + info.y;
        const float x1 = x0 + ch.W, y1 = y0 + c.line_height;
        auto vertex = [color](float x, float y, float u, float v) { return Vertex {x, y, 0.0f, 1.0f, color, 0u, u, v}; };
        const Vertex tl = vertex(x0, y0, ch.u1, ch.v1), tr = vertex(x1, y0, ch.u2, ch.v1);
        const Vertex bl = vertex(x0, y1, ch.u1, ch.v2), br = vertex(x1, y1, ch.u2, ch.v2);
        m_Vertices.insert(m_Vertices.end(), {tl, tr, bl, bl, tr, br});
        return true;
    }

    bool End(TextWalkContext& c) override
    {
        CRendererState& state = c.renderer->GetState();
        RenderDevice& device = c.renderer->GetDevice();
        device.SetBlendMode(state.GetBlendMode());
        const size_t size = m_Vertices.size();
        OX_ASSERT(size%6==0);
        Vertex quad[MaxClipVertices];
        for (size_t i = 0; i + 6 <= size; i += 6) {
            std::copy_n(m_Vertices.begin() + static_cast<std::ptrdiff_t>(i), 6, quad);
            unsigned count = 6;
            state.TransformVertices(quad, count, false);
            if (count < 3)
                continue;
            device.SetPixelShader(state.GetPixelShader());
            device.SetBlendMode(state.GetBlendMode());
            device.SetTexture(0, SurfacePtr);
            device.Draw(PrimitiveTriangleList, quad, count);
        }
        m_Vertices.clear();
        return true;
    }

private:
    std::vector<Vertex> m_Vertices;
    uint32_t m_Text = 0;
    uint32_t m_SelText = 0;
    CDeviceTexture* SurfacePtr = nullptr;
};

// One filled rectangle under each run of selected characters on a line.
class WalkModuleSelectionRender : public WalkModule {
public:
    bool Begin(TextWalkContext&) override
    {
        m_Open = false;
        return true;
    }
    bool LineReady(TextWalkContext& c, unsigned, float, float, float) override
    {
        Close(c);
        return true;
    }
    bool Char(TextWalkContext& c, const TextCharInfo& info) override
    {
        const int index = static_cast<int>(info.index);
        if (index < c.sel_start || index > c.sel_end) {
            Close(c);
            return true;
        }
        const float x = BoxX(c) + info.x;
        if (!m_Open) {
            m_Run = {x, BoxY(c) + info.y, static_cast<float>(info.character->Width), c.line_height};
            m_Open = true;
        } else {
            m_Run.Width = x + info.character->Width - m_Run.X;
        }
        return true;
    }
    bool End(TextWalkContext& c) override
    {
        Close(c);
        return true;
    }

private:
    void Close(TextWalkContext& c)
    {
        if (m_Open)
            c.renderer->RenderFilledPoly4(misc::RectToPoly4(m_Run), *c.selBackColor);
        m_Open = false;
    }

    bool m_Open = false;
    misc::FloatRect m_Run;
};

class WalkModuleCharPosCalculator : public WalkModule {
public:
    unsigned target = 0;
    misc::IntRect result;

    bool Begin(TextWalkContext&) override
    {
        result = {};
        return true;
    }
    bool Char(TextWalkContext& c, const TextCharInfo& info) override
    {
        result = {static_cast<int>(BoxX(c) + info.x), static_cast<int>(BoxY(c) + info.y), info.character->Width,
                  c.font->PixHeight};
        return info.index < target;
    }
};

class WalkModuleHitTester : public WalkModule {
public:
    bool exact = false;
    misc::IntVector point;
    int index = -1;
    bool leftHalf = false;
    bool topHalf = false;

    bool Begin(TextWalkContext&) override
    {
        m_Best = 1000000.0f;
        index = -1;
        leftHalf = topHalf = false;
        return true;
    }
    bool Char(TextWalkContext& c, const TextCharInfo& info) override
    {
        // The point and the characters' places are both relative to the box.
        const float px = static_cast<float>(point.X), py = static_cast<float>(point.Y);
        const float x = info.x, y = info.y;
        const float w = info.character->Width, h = c.line_height;
        const bool onLine = py >= y && py < y + h;
        if (onLine && px >= x && px < x + w) {
            Take(info.index, px < x + w / 2, py < y + h / 2);
            return false;
        }
        if (!exact && onLine) {
            const float distance = std::fabs(px - (x + w / 2));
            if (distance < m_Best) {
                m_Best = distance;
                Take(info.index, px < x + w / 2, py < y + h / 2);
            }
        }
        return true;
    }

private:
    void Take(unsigned at, bool left, bool top)
    {
        index = static_cast<int>(at);
        leftHalf = left;
        topHalf = top;
    }

    float m_Best = 1000000.0f;
};

class WalkModuleTextSizeCalculator : public WalkModule {
public:
    misc::IntVector size;

    bool Begin(TextWalkContext&) override
    {
        size = {};
        return true;
    }
    bool LineReady(TextWalkContext& c, unsigned, float y, float, float width) override
    {
        size.X = std::max(size.X, static_cast<int>(width));
        size.Y = std::max(size.Y, static_cast<int>(y + c.line_height));
        return true;
    }
};

class WalkModuleUnderlineRender : public WalkModule {
public:
    bool LineReady(TextWalkContext& c, unsigned, float y, float x, float width) override
    {
        const float y0 = BoxY(c) + y + static_cast<float>(c.font->Baseline + 8);
        c.renderer->RenderLine({BoxX(c) + x, y0}, {BoxX(c) + x + width, y0}, *c.textColor);
        return true;
    }
};

class WalkModuleStrikethroughRender : public WalkModule {
public:
    bool LineReady(TextWalkContext& c, unsigned, float y, float x, float width) override
    {
        const int baseline = c.font->Baseline;
        const float y0 = BoxY(c) + y + static_cast<float>(baseline + baseline / 3);
        c.renderer->RenderLine({BoxX(c) + x, y0}, {BoxX(c) + x + width + 30, y0}, *c.textColor);
        return true;
    }
};

} // namespace

struct CTextRender::Modules {
    WalkModuleNormalRender normal;
    WalkModuleSelectionRender selection;
    WalkModuleCharPosCalculator charPos;
    WalkModuleHitTester hitTester;
    WalkModuleTextSizeCalculator textSize;
    WalkModuleUnderlineRender underline;
    WalkModuleStrikethroughRender strikethrough;
};

CTextRender::CTextRender() : m_Modules(std::make_unique<Modules>()) {}
CTextRender::~CTextRender() = default;

void CTextRender::AddModule(WalkModule* _what)
{
    OX_ASSERT(_what != 0);
    OX_ASSERT(m_ActiveCount < MaxModules);
    if (_what && m_ActiveCount < MaxModules)
        m_Active[m_ActiveCount++] = _what;
}

bool CTextRender::Prepare(const CFont* _font, const wchar* _string, const misc::IntRect& rect, unsigned& flags,
                          unsigned& length)
{
    m_Context = TextWalkContext();
    m_ActiveCount = 0;
    if (!_string) {
        OX_LOG("graphics", diag::LogError, "CTextRender::RenderText - invalid string pointer");
        OX_ASSERT(_string != 0);
        return false;
    }
    if (!_font) {
        diag::AssertFailed(u"&_font != 0", OX_WIDEN_LITERAL(__FILE__), __LINE__);
        return false;
    }
    unsigned _draw_flags = flags;
    if (_draw_flags & CRenderer::TextMeasure)
        _draw_flags &= ~kMeasureClears;
    const int horizontal = std::popcount(_draw_flags & kHorizontalBits);
    if (horizontal > 1) {
        OX_LOG("graphics", diag::LogWarning, "Invalid horizontal text alignment");
        return false;
    }
    if (horizontal == 0)
        _draw_flags |= CRenderer::TextLeft;
    const int vertical = std::popcount(_draw_flags & kVerticalBits);
    if (vertical > 1) {
        OX_LOG("graphics", diag::LogWarning, "Invalid vertical text alignment");
        return false;
    }
    if (vertical == 0)
        _draw_flags |= CRenderer::TextTop;
    if ((_draw_flags & CRenderer::TextWordWrap) &&
        (_draw_flags & (CRenderer::TextWrapOther | CRenderer::TextNoWrap))) {
        OX_LOG("graphics", diag::LogWarning, "Invalid text wrapping flags");
        return false;
    }
    if (_draw_flags & CRenderer::TextMeasure)
        _draw_flags = (_draw_flags | CRenderer::TextNoWrap) & ~static_cast<unsigned>(CRenderer::TextWordWrap);
    OX_ASSERT(!(_draw_flags & CRenderer::TextWordEllipsis));
    if (_draw_flags & CRenderer::TextWordEllipsis)
        return false;
    if (length == 0)
        while (_string[length] != 0)
            ++length;
    flags = _draw_flags;

    m_Context.font = _font;
    m_Context.text = _string;
    m_Context.length = length;
    m_Context.rect = &rect;
    m_Context.flags = flags;
    m_Context.line_height = static_cast<float>(_font->PixHeight + _font->PaddingTop + _font->PaddingBottom);
    return true;
}

CTextRender::LineInfo CTextRender::GetLine(unsigned start, unsigned end, bool wrap) const
{
    const CFont& font = *m_Context.font;
    const wchar* text = m_Context.text;
    const bool wordWrap = wrap && (m_Context.flags & CRenderer::TextWordWrap);
    const float boxWidth = static_cast<float>(m_Context.rect->Width);
    LineInfo line;
    wchar previous = 0;
    for (unsigned i = start;; ++i) {
        if (i >= end) {
            line.reason = BreakEnd;
            line.chars = i - start;
            ++line.words;
            return line;
        }
        const wchar* currentcharptr = text + i;
        if (*currentcharptr == 0) {
            // The length given runs past the terminator: the text ends here.
            OX_ASSERT(*currentcharptr != 0);
            line.reason = BreakEnd;
            line.chars = i - start;
            ++line.words;
            return line;
        }
        const wchar code = *currentcharptr;
        if (code == 10) {
            line.reason = BreakLine;
            line.chars = i + 1 - start;
            ++line.words;
            return line;
        }
        if (const FontChar* ch = font.GetChar(code))
            line.width += static_cast<float>(font.GetKern(*ch, previous) + ch->Width + font.SymbolGap);
        if (misc::IsBreakSpace(code))
            ++line.words;
        previous = code;
        if (wordWrap && line.width >= boxWidth) {
            // Back to the last blank of the line; a word longer than the line breaks after
            // the character that overflowed.
            unsigned at = i;
            bool blank = false;
            for (unsigned j = i + 1; j-- > start;)
                if (misc::IsBreakSpace(text[j])) {
                    at = j;
                    blank = true;
                    break;
                }
            LineInfo broken = GetLine(start, blank ? at : at + 1, false);
            if (blank)
                ++broken.chars; // the blank is consumed, not measured
            broken.reason = BreakLine;
            return broken;
        }
    }
}

void CTextRender::Walk()
{
    TextWalkContext& c = m_Context;
    const CFont& font = *c.font;
    const misc::IntRect& rect = *c.rect;
    bool going = true;
    auto all = [&](auto&& call) {
        for (unsigned m = 0; going && m < m_ActiveCount; ++m)
            going = call(*m_Active[m]);
    };

    all([&](WalkModule& m) { return m.Begin(c); });
    const int pitch = font.PixHeight + font.LineGap;
    float y = 0;
    if (c.flags & (CRenderer::TextCenterV | CRenderer::TextBottom)) {
        int lines = 0;
        for (unsigned position = 0;;) {
            const LineInfo line = GetLine(position, c.length, true);
            ++lines;
            position += line.chars;
            if (line.reason == BreakEnd || line.chars == 0)
                break;
        }
        const int total = pitch * lines;
        const int offset = (c.flags & CRenderer::TextCenterV) ? (rect.Height - total) / 2 : rect.Height - total;
        if (offset >= 1)
            y += static_cast<float>(offset);
    }

    const bool justify = (c.flags & CRenderer::TextJustify) != 0;
    unsigned position = 0;
    for (unsigned lineNumber = 0; going && position < c.length; ++lineNumber) {
        all([&](WalkModule& m) { return m.LineBegin(c, lineNumber, y); });
        if (!going)
            break;
        const LineInfo line = GetLine(position, c.length, true);
        const int breakreason = line.reason;
        OX_ASSERT(breakreason);
        if (line.chars == 0)
            break;
        float extra = 0;
        if (justify && line.words > 2)
            extra = std::max(0.0f, (static_cast<float>(rect.Width) - line.width) / static_cast<float>(line.words - 1));
        float x = 0;
        if (c.flags & CRenderer::TextCenterH) {
            const float offset = std::trunc((static_cast<float>(rect.Width) - line.width) / 2);
            if (offset >= 1)
                x = offset;
        } else if (c.flags & CRenderer::TextRight) {
            const float offset = static_cast<float>(rect.Width) - line.width;
            if (offset >= 1)
                x = offset;
        }
        all([&](WalkModule& m) { return m.LineReady(c, lineNumber, y, x, line.width); });

        wchar previous = 0;
        for (unsigned i = position; going && i < position + line.chars; ++i) {
            const wchar code = c.text[i];
            if (code == 10) {
                const TextCharInfo info {code, i, x, y, &font.GetCharOrEmpty(10)};
                all([&](WalkModule& m) { return m.Char(c, info); });
            } else if (const FontChar* ch = font.GetChar(code)) {
                x += static_cast<float>(font.GetKern(*ch, previous));
                const TextCharInfo info {code, i, x, y, ch};
                all([&](WalkModule& m) { return m.Char(c, info); });
                x += static_cast<float>(ch->Width + font.SymbolGap);
            }
            if (justify && misc::IsBreakSpace(code))
                x += extra;
            previous = code;
        }
        position += line.chars;
        y += static_cast<float>(pitch);
    }
    // End runs whatever stopped the walk.
    for (unsigned m = 0; m < m_ActiveCount; ++m)
        m_Active[m]->End(c);
}

bool CTextRender::RenderText(CRenderer& renderer, const CFont* _font, const wchar* _string,
                             const misc::IntRect& rect, unsigned flags, unsigned length, const Color& textColor,
                             const Color& backColor, const Color& selTextColor, const Color& selBackColor,
                             int selStart, int selEnd)
{
    if (!Prepare(_font, _string, rect, flags, length))
        return false;
    m_Context.renderer = &renderer;
    m_Context.textColor = &textColor;
    m_Context.backColor = &backColor;
    m_Context.selTextColor = &selTextColor;
    m_Context.selBackColor = &selBackColor;
    m_Context.sel_start = selStart;
    m_Context.sel_end = selEnd;
    if (selBackColor.GetARGB() != 0)
        AddModule(&m_Modules->selection);
    AddModule(&m_Modules->normal);
    if (flags & CRenderer::TextUnderline)
        AddModule(&m_Modules->underline);
    if (flags & CRenderer::TextStrikethrough)
        AddModule(&m_Modules->strikethrough);
    Walk();
    return true;
}

bool CTextRender::GetCharRect(const CFont* _font, const wchar* _string, const misc::IntRect& rect, unsigned flags,
                              unsigned length, unsigned index, misc::IntRect& out)
{
    if (!Prepare(_font, _string, rect, flags, length))
        return false;
    if (length == 0) {
        out = {rect.X, rect.Y, 0, 0};
        return true;
    }
    if (index >= length)
        return false;
    m_Modules->charPos.target = index;
    AddModule(&m_Modules->charPos);
    Walk();
    out = m_Modules->charPos.result;
    return !(out == misc::IntRect());
}

bool CTextRender::HitTest(const CFont* _font, const wchar* _string, const misc::IntRect& rect, unsigned flags,
                          unsigned length, bool exact, const misc::IntVector& point, int& index, bool& leftHalf,
                          bool& topHalf)
{
    index = -1;
    if (!Prepare(_font, _string, rect, flags, length))
        return false;
    WalkModuleHitTester& tester = m_Modules->hitTester;
    tester.exact = exact;
    tester.point = point;
    AddModule(&tester);
    Walk();
    index = tester.index;
    leftHalf = tester.leftHalf;
    topHalf = tester.topHalf;
    return index >= 0;
}

bool CTextRender::GetTextSize(const CFont* _font, const wchar* _string, const misc::IntRect& rect, unsigned flags,
                              unsigned length, misc::IntVector& out)
{
    out = {};
    flags |= CRenderer::TextMeasure;
    if (!Prepare(_font, _string, rect, flags, length))
        return false;
    AddModule(&m_Modules->textSize);
    Walk();
    out = m_Modules->textSize.size;
    return true;
}

} // namespace ox::graphics
