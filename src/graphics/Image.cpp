#include "graphics/Image.h"

#include "graphics/Renderer.h"

#include <cmath>

namespace ox::graphics {

namespace {

CImage::TextureLookup g_TextureLookup;

} // namespace

void CImage::SetTextureLookup(TextureLookup lookup) { g_TextureLookup = std::move(lookup); }

void CImage::Init(const CTexture* texture)
{
    SetTexture(texture, true);
    m_Matrix = misc::FloatMatrix::Identity();
    m_Scale = 1.0f;
    m_Color = Color();
    m_SourceRect.reset();
    SetRect({0, 0, 0, 0});
    m_Flags = 0;
}

void CImage::SetTexture(const CTexture* texture, bool reset)
{
    if (texture && texture->GetData())
        m_Texture = *texture;
    else
        m_Texture = CTexture();
    if (IsAnimated())
        m_SourceRect.reset();
    ResetTimer(reset);
}

void CImage::SetTexture(const char* id, bool reset)
{
    SetTexture(id && g_TextureLookup ? g_TextureLookup(id) : nullptr, reset);
}

void CImage::ResetTimer(bool reset)
{
    if (!IsAnimated()) {
        Reset(nullptr);
        return;
    }
    if (core::CTimer* timer = Get()) {
        if (reset) {
            timer->SetTime(0);
            timer->SetK(1.0f);
        }
        return;
    }
    Reset(core::GetTimeManager().AttachTimer(nullptr));
}

misc::FloatVector CImage::GetTextureSize() const
{
    if (!HasTexture())
        return {0, 0};
    return {static_cast<float>(m_Texture.GetWidth()), static_cast<float>(m_Texture.GetHeight())};
}

void CImage::Draw(CRenderer& renderer) { DrawTransformed(renderer, m_Rect, m_Matrix); }

void CImage::Draw(CRenderer& renderer, float x, float y)
{
    const misc::FloatVector size = GetTextureSize();
    DrawTransformed(renderer, {x, y, size.X, size.Y}, m_Matrix);
}

void CImage::Draw(CRenderer& renderer, const misc::FloatRect& rect) { DrawTransformed(renderer, rect, m_Matrix); }

void CImage::DrawTransformed(CRenderer& renderer, const misc::FloatMatrix& matrix)
{
    DrawTransformed(renderer, m_Rect, matrix);
}

void CImage::DrawTransformed(CRenderer& renderer, const misc::FloatRect& rect, const misc::FloatMatrix& matrix)
{
    if (!HasTexture())
        return;
    misc::FloatRect r = rect;
    r.Width *= m_Scale;
    r.Height *= m_Scale;
    if (r.Width == 0 || r.Height == 0)
        return;
    renderer.PushMatrix();
    renderer.ApplyMatrix(matrix);
    if (m_Flags & FlagIntDest) {
        r.X = std::trunc(r.X);
        r.Y = std::trunc(r.Y);
        r.Width = std::trunc(r.Width);
        r.Height = std::trunc(r.Height);
    }
    if (m_SourceRect) {
        if (m_Flags & FlagBoxImage)
            renderer.RenderTextureBox(&m_Texture, r, *m_SourceRect, m_Color);
        else
            renderer.RenderTexture(&m_Texture, r, *m_SourceRect, m_Color);
    } else {
        // -1 (no frame) is past every part, so the first part is drawn.
        const unsigned frame = IsAnimated() ? static_cast<unsigned>(GetCurrentFrame()) : 0u;
        if (m_Flags & FlagBoxImage)
            renderer.RenderTextureBox(&m_Texture, r, frame, m_Color);
        else
            renderer.RenderTexture(&m_Texture, r, frame, m_Color);
    }
    renderer.PopMatrix();
}

void CImage::SetRect(const misc::FloatRect& rect)
{
    m_Rect = rect;
    const misc::FloatVector size = GetTextureSize();
    if (m_Rect.Width == 0)
        m_Rect.Width = size.X;
    if (m_Rect.Height == 0)
        m_Rect.Height = size.Y;
}

void CImage::SetSourceRect(const misc::IntRect& rect)
{
    if (IsAnimated())
        return;
    if (rect.Width < 0 || rect.Height < 0) {
        m_SourceRect.reset();
        return;
    }
    m_SourceRect = std::make_unique<misc::ShortRect>(static_cast<short>(rect.X), static_cast<short>(rect.Y),
                                                     static_cast<short>(rect.Width), static_cast<short>(rect.Height));
}

misc::IntRect CImage::GetSourceRect() const
{
    if (m_SourceRect)
        return {m_SourceRect->X, m_SourceRect->Y, m_SourceRect->Width, m_SourceRect->Height};
    if (!HasTexture() || !m_Texture.GetSurface())
        return {};
    const UVRect uv = m_Texture.GetSurfaceRect();
    const float w = m_Texture.GetSurface()->GetWidth(), h = m_Texture.GetSurface()->GetHeight();
    return {static_cast<int>(uv.u1 * w), static_cast<int>(uv.v1 * h), static_cast<int>((uv.u2 - uv.u1) * w),
            static_cast<int>((uv.v2 - uv.v1) * h)};
}

int CImage::GetCurrentFrame() const
{
    if (!HasTexture())
        return -1;
    if (!IsAnimated())
        return 0;
    return m_Texture.GetFrameByTime(static_cast<int>(GetTime()));
}

void CImage::PauseAnimation(bool pause)
{
    if (core::CTimer* timer = Get())
        timer->Pause(pause);
}

void CImage::SetAnimationK(float k)
{
    if (core::CTimer* timer = Get())
        timer->SetK(k);
}

float CImage::GetAnimationK() const { return Get() ? Get()->GetK() : 1.0f; }

void CImage::SetFrame(unsigned frame)
{
    if (core::CTimer* timer = Get())
        timer->SetTime(HasTexture() ? m_Texture.GetTimeByFrame(frame) : 0);
}

void CImage::SetTime(unsigned ms)
{
    if (core::CTimer* timer = Get())
        timer->SetTime(ms);
}

unsigned CImage::GetTime() const { return Get() ? Get()->GetTime() : 0; }

} // namespace ox::graphics
