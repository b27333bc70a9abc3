#include "graphics/Renderer.h"

#include "core/SystemIntegration.h"
#include "diag/Log.h"
#include "graphics/TextRender.h"
#include "graphics/Texture.h"

#include <algorithm>
#include <cmath>

namespace ox::graphics {

using misc::FloatRect;
using misc::FloatVector;
using misc::Poly4;

CRenderer::CRenderer() : CRenderer(CreateDefaultBackend()) {}

CRenderer::CRenderer(std::unique_ptr<IRenderBackend> backend)
    : m_Backend(std::move(backend)), m_TextRender(std::make_unique<CTextRender>()),
      m_Device(std::make_unique<RenderDevice>(m_Backend.get()))
{
    SetRenderBackend(m_Backend.get());
    SetRenderDevice(m_Device.get());
}

CRenderer::~CRenderer()
{
    ReleaseDevice(false);
    if (GetRenderBackend() == m_Backend.get())
        SetRenderBackend(nullptr);
    if (GetRenderDevice() == m_Device.get())
        SetRenderDevice(nullptr);
}

void CRenderer::SetBackend(std::unique_ptr<IRenderBackend> backend)
{
    ReleaseDevice(false);
    if (GetRenderBackend() == m_Backend.get())
        SetRenderBackend(nullptr);
    m_Backend = std::move(backend);
    m_Device->SetBackend(m_Backend.get());
    SetRenderBackend(m_Backend.get());
}

bool CRenderer::InitWindow(bool fullscreen, bool bpp32, unsigned width, unsigned height)
{
    if (fullscreen == m_IsFullscreen && bpp32 == m_Bpp32 && width == m_Width && height == m_Height)
        return true;
    m_IsFullscreen = fullscreen;
    m_Bpp32 = bpp32;
    m_Width = width;
    m_Height = height;
    return InitGraphics();
}

void CRenderer::UpdateWindowInfo()
{
    if (!m_Adapter)
        return;
    misc::IntRect client = m_Adapter->GetClientRect();
    if (client.Width <= 0 || client.Height <= 0)
        return; // no window yet: the size asked for stands
    m_Width = static_cast<unsigned>(client.Width);
    m_Height = static_cast<unsigned>(client.Height);
}

bool CRenderer::InitGraphics()
{
    ReleaseDevice(true);
    // Full screen covers the desktop whatever size was asked, so the window's size counts
    // in both modes: the canvas keeps its aspect and input maps to where it is drawn.
    UpdateWindowInfo();
    OX_LOG("renderer", diag::LogInfo,
           "CRenderer::InitGraphics called with m_SourceWidth=%i m_SourceHeight=%i m_Width=%i m_Height=%i "
           "m_IsFullscreen=%i",
           m_SourceWidth, m_SourceHeight, static_cast<int>(m_Width), static_cast<int>(m_Height),
           static_cast<int>(m_IsFullscreen));
    m_DeviceLost = true;
    if (m_Backend) {
        if (m_Backend->HasDevice())
            CheckResult(m_Backend->ResetDevice(m_Width, m_Height, m_IsFullscreen), "Reset D3D device",
                        diag::LogError);
        else
            CheckResult(m_Backend->CreateDevice(m_Adapter ? m_Adapter->GetWindowHandle() : nullptr, m_Width,
                                                m_Height, m_IsFullscreen),
                        "Create D3D device", diag::LogError);
    }
    CalculateAspect();
    OX_LOG("renderer", diag::LogInfo,
           "CRenderer::InitGraphics calculated aspect: m_AspectK.X=%f m_AspectK.Y=%f m_AspectOffset.Y=%f "
           "m_AspectOffset.X=%f",
           m_AspectK.X, m_AspectK.Y, m_AspectOffset.Y, m_AspectOffset.X);
    if (m_Backend && m_Backend->HasDevice()) {
        m_Device->Init();
        CPixelShader::RestoreShaders();
    }
    m_DeviceLost = false;
    return true;
}

void CRenderer::ReleaseDevice(bool forReset)
{
    if (!forReset)
        CPixelShader::ReleaseShaders();
    for (IDeviceResourceOwner* owner : std::vector<IDeviceResourceOwner*>(m_Owners))
        owner->ReleaseDeviceResources(forReset);
    if (m_Backend)
        m_Backend->ReleaseDevice(forReset);
}

void CRenderer::AddDeviceResourceOwner(IDeviceResourceOwner* owner)
{
    if (std::find(m_Owners.begin(), m_Owners.end(), owner) == m_Owners.end())
        m_Owners.push_back(owner);
}

void CRenderer::RemoveDeviceResourceOwner(IDeviceResourceOwner* owner)
{
    m_Owners.erase(std::remove(m_Owners.begin(), m_Owners.end(), owner), m_Owners.end());
}

void CRenderer::SetSourceResolution(int width, int height)
{
    m_SourceWidth = width;
    m_SourceHeight = height;
    CalculateAspect();
}

void CRenderer::SetKeepAspect(bool keep)
{
    m_KeepAspect = keep;
    CalculateAspect();
}

void CRenderer::CalculateAspect()
{
    m_AspectK = {1.0f, 1.0f};
    m_AspectOffset = {0.0f, 0.0f};
    const unsigned sw = static_cast<unsigned>(m_SourceWidth);
    const unsigned sh = static_cast<unsigned>(m_SourceHeight);
    const bool skip = (sw == 0 && sh == 0) || (sw == m_Width && sh == m_Height) || m_Width == 0 || m_Height == 0 ||
                      sw == 0 || sh == 0;
    if (!skip) {
        // In 32-bit floats, as the window sizes are chosen with.
        float dw = static_cast<float>(m_Width);
        float dh = static_cast<float>(m_Height);
        if (m_KeepAspect) {
            float rs = static_cast<float>(sw) / static_cast<float>(sh);
            float rw = static_cast<float>(m_Width) / static_cast<float>(m_Height);
            if (rw - rs > 0.001f) {
                dw = static_cast<float>(static_cast<int>(static_cast<float>(m_Height) * rs));
                m_AspectOffset.X = (static_cast<float>(m_Width) - dw) / 2.0f;
            } else if (rs - rw > 0.001f) {
                dh = static_cast<float>(static_cast<int>(static_cast<float>(m_Width) / rs));
                m_AspectOffset.Y = (static_cast<float>(m_Height) - dh) / 2.0f;
            }
        }
        m_AspectK = {dw / static_cast<float>(sw), dh / static_cast<float>(sh)};
    }
    m_State.SetAspectMatrix(m_AspectK, m_AspectOffset);
    if (m_ActiveRectListener)
        m_ActiveRectListener(GetActiveRect(), m_AspectK);
}

void CRenderer::SetActiveRectListener(ActiveRectListener listener)
{
    m_ActiveRectListener = std::move(listener);
    if (m_ActiveRectListener)
        m_ActiveRectListener(GetActiveRect(), m_AspectK);
}

misc::FloatRect CRenderer::GetActiveRect() const
{
    return {m_AspectOffset.X, m_AspectOffset.Y, static_cast<float>(m_Width) - 2 * m_AspectOffset.X,
            static_cast<float>(m_Height) - 2 * m_AspectOffset.Y};
}

void CRenderer::EnumResolutions() { m_Device->EnumResolutions(m_Resolutions); }

void CRenderer::RequestModeRestore(bool bpp32)
{
    m_RestorePending = true;
    m_RestoreBpp32 = bpp32;
}

std::optional<ModeRequest> CRenderer::CheckModeRestore()
{
    if (!m_RestorePending)
        return std::nullopt;
    m_RestorePending = false;
    if (!m_IsFullscreen)
        return ModeRequest {false, m_RestoreBpp32, m_Width, m_Height};
    // A full-screen device is rebuilt for the new desktop (this device is not lost by the
    // change, so there is no loss to wait for).
    ReleaseDevice(false);
    return ModeRequest {true, m_RestoreBpp32, 0, 0};
}

// Frame --------------------------------------------------------------------------------

bool CRenderer::TestDevice()
{
    const bool hasDevice = m_Backend && m_Backend->HasDevice();
    if (hasDevice) {
        const DeviceResult result = m_Backend->TestCooperativeLevel();
        if (CheckResult(result, "Test cooperative level", diag::LogTrace)) {
            m_DeviceLost = true;
            if (result != ResultDeviceNotReset)
                return false;
        }
    }
    if (!m_DeviceLost && hasDevice)
        return true;
    InitGraphics();
    return true;
}

bool CRenderer::BeginScene()
{
    if (!TestDevice())
        return false;
    if (!m_Backend || !m_Backend->HasDevice())
        return false;
    if (!m_Device->BeginScene()) {
        m_DeviceLost = true;
        return false;
    }
    m_State.ResetFrame();
    return true;
}

bool CRenderer::EndScene()
{
    if (m_Backend && m_Backend->HasDevice())
        m_Device->EndScene();
    return true;
}

void CRenderer::SetRenderTarget(const CSurface* surface)
{
    if (!surface) {
        m_Device->SetRenderTarget(nullptr);
        return;
    }
    const bool is_render_target = (surface->GetFlags() & CSurface::FlagRenderTarget) != 0;
    OX_ASSERT(is_render_target);
    if (!is_render_target)
        return;
    m_Device->SetRenderTarget(const_cast<CSurface*>(surface)->GetD3DTexture());
}

// Primitives -----------------------------------------------------------------------------

namespace {

inline bool IsWhite(const Color& c) { return c.Red >= 255 && c.Green >= 255 && c.Blue >= 255 && c.Alpha >= 255; }

inline Vertex MakeVertex(float x, float y, uint32_t diffuse, float u, float v)
{
    return Vertex {x, y, 0.0f, 1.0f, diffuse, 0u, u, v};
}

CDeviceTexture* DeviceTextureOf(const CTexture* texture)
{
    CSurface* surface = texture->GetSurface();
    return surface ? surface->GetD3DTexture() : nullptr;
}

// The UV rectangle of a source rectangle in surface pixels; an empty one is the first frame.
UVRect SourceUV(const CTexture* texture, const misc::ShortRect& source)
{
    if (source.Width == 0 || source.Height == 0)
        return texture->GetSurfaceRect();
    const CSurface* surface = texture->GetSurface();
    if (!surface || surface->GetWidth() == 0 || surface->GetHeight() == 0)
        return {};
    const float w = surface->GetWidth(), h = surface->GetHeight();
    return {source.X / w, source.Y / h, (source.X + source.Width) / w, (source.Y + source.Height) / h};
}

} // namespace

bool CRenderer::Preamble(const Color& color, uint32_t& diffuse) const
{
    const Color& current = m_State.GetColor();
    if (current.Alpha == 0 || color.Alpha == 0)
        return false;
    diffuse = IsWhite(color) ? current.GetARGB() : (current * color).GetARGB();
    return true;
}

void CRenderer::DrawVertices(PrimitiveType type, CDeviceTexture* texture, Vertex* v, unsigned count)
{
    m_State.TransformVertices(v, count, false);
    if (type == PrimitiveLineList) {
        if (count > 2) {
            // A line cut by a polygon comes back as a fan of points on it: keep its two ends.
            unsigned a = 0, b = 1;
            float best = -1;
            for (unsigned i = 0; i < count; ++i)
                for (unsigned j = i + 1; j < count; ++j) {
                    const float dx = v[j].x - v[i].x, dy = v[j].y - v[i].y, d = dx * dx + dy * dy;
                    if (d > best) {
                        best = d;
                        a = i;
                        b = j;
                    }
                }
            const Vertex first = v[a], second = v[b];
            v[0] = first;
            v[1] = second;
            count = 2;
        }
        if (count < 2)
            return;
    } else if (count < 3) {
        return;
    }
    Submit(type, texture, v, count);
}

void CRenderer::Submit(PrimitiveType type, CDeviceTexture* texture, const Vertex* v, unsigned count)
{
    m_Device->SetPixelShader(m_State.GetPixelShader());
    m_Device->SetBlendMode(m_State.GetBlendMode());
    m_Device->SetTexture(0, texture);
    m_Device->Draw(type, v, count);
}

void CRenderer::RenderLine(const FloatVector& from, const FloatVector& to, const Color& color)
{
    uint32_t diffuse;
    if (!Preamble(color, diffuse))
        return;
    Vertex v[MaxClipVertices];
    v[0] = MakeVertex(from.X, from.Y, diffuse, 0, 0);
    v[1] = MakeVertex(to.X, to.Y, diffuse, 0, 0);
    DrawVertices(PrimitiveLineList, nullptr, v, 2);
}

void CRenderer::RenderRect(const FloatRect& rect, const Color& color)
{
    const float r = rect.X + rect.Width, b = rect.Y + rect.Height;
    RenderLine({rect.X, rect.Y}, {r, rect.Y}, color);
    RenderLine({r, rect.Y}, {r, b}, color);
    RenderLine({r, b}, {rect.X, b}, color);
    RenderLine({rect.X, b}, {rect.X, rect.Y}, color);
}

void CRenderer::RenderFilledPoly4(const Poly4& poly, const Color& color)
{
    uint32_t diffuse;
    if (!Preamble(color, diffuse))
        return;
    Vertex v[MaxClipVertices];
    const int order[6] = {0, 1, 2, 0, 2, 3};
    for (int i = 0; i < 6; ++i)
        v[i] = MakeVertex(poly[order[i]].X, poly[order[i]].Y, diffuse, 0, 0);
    DrawVertices(PrimitiveTriangleList, nullptr, v, 6);
}

void CRenderer::DrawRectQuad(CDeviceTexture* texture, const FloatRect& d, const UVRect& uv, uint32_t diffuse)
{
    // The four corners are transformed once; without a clip the half-pixel shift goes with
    // them (the same arithmetic as shifting afterwards).
    const misc::FloatMatrix& m = m_State.GetTransform();
    const bool clip = m_State.GetClipPoly() != nullptr;
    const float shift = clip ? 0.0f : 0.5f;
    const float r = d.X + d.Width, b = d.Y + d.Height;
    auto corner = [&](float x, float y, float u, float v) {
        return MakeVertex(x * m.m[0][0] + y * m.m[1][0] + m.m[2][0] - shift,
                          x * m.m[0][1] + y * m.m[1][1] + m.m[2][1] - shift, diffuse, u, v);
    };
    Vertex v[MaxClipVertices];
    v[0] = corner(d.X, d.Y, uv.u1, uv.v1);
    v[1] = corner(r, d.Y, uv.u2, uv.v1);
    v[2] = corner(d.X, b, uv.u1, uv.v2);
    v[3] = v[2];
    v[4] = v[1];
    v[5] = corner(r, b, uv.u2, uv.v2);
    unsigned count = 6;
    if (clip) {
        m_State.ClipAndShift(v, count, false);
        if (count < 3)
            return;
    }
    Submit(PrimitiveTriangleList, texture, v, count);
}

void CRenderer::DrawPolyQuad(CDeviceTexture* texture, const Poly4& p, const UVRect& uv, uint32_t diffuse)
{
    const FloatVector c = misc::Poly4ConvertToAbsPos(p, {0.5f, 0.5f});
    const Vertex centre = MakeVertex(c.X, c.Y, diffuse, (uv.u1 + uv.u2) * 0.5f, (uv.v1 + uv.v2) * 0.5f);
    const Vertex corners[4] = {MakeVertex(p[0].X, p[0].Y, diffuse, uv.u1, uv.v1),
                               MakeVertex(p[1].X, p[1].Y, diffuse, uv.u2, uv.v1),
                               MakeVertex(p[2].X, p[2].Y, diffuse, uv.u2, uv.v2),
                               MakeVertex(p[3].X, p[3].Y, diffuse, uv.u1, uv.v2)};
    Vertex v[MaxClipVertices];
    for (int i = 0; i < 4; ++i) {
        v[i * 3] = centre;
        v[i * 3 + 1] = corners[i];
        v[i * 3 + 2] = corners[(i + 3) % 4];
    }
    DrawVertices(PrimitiveTriangleList, texture, v, 12);
}

void CRenderer::RenderTexture(const CTexture* texture, float x, float y, unsigned frame, const Color& color)
{
    if (!texture)
        return;
    RenderTexture(texture, FloatRect(x, y, texture->GetWidth(), texture->GetHeight()), frame, color);
}

void CRenderer::RenderTexture(const CTexture* texture, const FloatRect& dest, unsigned frame, const Color& color)
{
    uint32_t diffuse;
    if (!texture || !Preamble(color, diffuse))
        return;
    DrawRectQuad(DeviceTextureOf(texture), dest, texture->GetFrameSurfaceRect(frame), diffuse);
}

void CRenderer::RenderTexture(const CTexture* texture, const Poly4& dest, unsigned frame, const Color& color)
{
    uint32_t diffuse;
    if (!texture || !Preamble(color, diffuse))
        return;
    DrawPolyQuad(DeviceTextureOf(texture), dest, texture->GetFrameSurfaceRect(frame), diffuse);
}

void CRenderer::RenderTexture(const CTexture* texture, float x, float y, const misc::ShortRect& source,
                              const Color& color)
{
    if (!texture)
        return;
    FloatRect dest(x, y, source.Width, source.Height);
    if (source.Width == 0 || source.Height == 0) {
        dest.Width = texture->GetWidth();
        dest.Height = texture->GetHeight();
    }
    RenderTexture(texture, dest, source, color);
}

void CRenderer::RenderTexture(const CTexture* texture, const FloatRect& dest, const misc::ShortRect& source,
                              const Color& color)
{
    uint32_t diffuse;
    if (!texture || !Preamble(color, diffuse))
        return;
    DrawRectQuad(DeviceTextureOf(texture), dest, SourceUV(texture, source), diffuse);
}

void CRenderer::RenderTexture(const CTexture* texture, const Poly4& dest, const misc::ShortRect& source,
                              const Color& color)
{
    uint32_t diffuse;
    if (!texture || !Preamble(color, diffuse))
        return;
    DrawPolyQuad(DeviceTextureOf(texture), dest, SourceUV(texture, source), diffuse);
}

void CRenderer::RenderTextureTriangle(const CTexture* texture, const FloatVector& p0, const FloatVector& p1,
                                      const FloatVector& p2, const FloatVector& uv0, const FloatVector& uv1,
                                      const FloatVector& uv2, const Color& color)
{
    uint32_t diffuse;
    if (!texture || !Preamble(color, diffuse))
        return;
    Vertex v[MaxClipVertices];
    v[0] = MakeVertex(p0.X, p0.Y, diffuse, uv0.X, uv0.Y);
    v[1] = MakeVertex(p1.X, p1.Y, diffuse, uv1.X, uv1.Y);
    v[2] = MakeVertex(p2.X, p2.Y, diffuse, uv2.X, uv2.Y);
    DrawVertices(PrimitiveTriangleList, DeviceTextureOf(texture), v, 3);
}

void CRenderer::RenderTextureBox(const CTexture* texture, const FloatRect& dest, unsigned frame, const Color& color)
{
    uint32_t diffuse;
    if (!texture || !Preamble(color, diffuse))
        return;
    DrawBox(texture, dest, texture->GetFrameSurfaceRect(frame), diffuse);
}

void CRenderer::RenderTextureBox(const CTexture* texture, const FloatRect& dest, const misc::ShortRect& source,
                                 const Color& color)
{
    uint32_t diffuse;
    if (!texture || !Preamble(color, diffuse))
        return;
    DrawBox(texture, dest, SourceUV(texture, source), diffuse);
}

void CRenderer::DrawBox(const CTexture* texture, const FloatRect& dest, const UVRect& s, uint32_t diffuse)
{
    CDeviceTexture* device = DeviceTextureOf(texture);
    const UVRect f = texture->GetSurfaceRect();
    const float fw = f.u2 - f.u1, fh = f.v2 - f.v1;
    const float sw = fw != 0 ? texture->GetWidth() * (s.u2 - s.u1) / fw : 0.0f;
    const float sh = fh != 0 ? texture->GetHeight() * (s.v2 - s.v1) / fh : 0.0f;
    if (sw == 0 || sh == 0 || dest.Width < sw || dest.Height < sh || (dest.Width == sw && dest.Height == sh)) {
        DrawRectQuad(device, dest, s, diffuse);
        return;
    }
    const float cw = sw / 3, ch = sh / 3;
    const float k = std::floor((dest.Width - 2 * cw) / cw), m = std::floor((dest.Height - 2 * ch) / ch);
    const float r = dest.Width - (k + 2) * cw, r2 = dest.Height - (m + 2) * ch;
    const float us[4] = {s.u1, s.u1 + (s.u2 - s.u1) / 3, s.u1 + (s.u2 - s.u1) * 2 / 3, s.u2};
    const float vs[4] = {s.v1, s.v1 + (s.v2 - s.v1) / 3, s.v1 + (s.v2 - s.v1) * 2 / 3, s.v2};

    auto row = [&](float y, float height, float v1, float v2) {
        float x = dest.X;
        DrawRectQuad(device, {x, y, cw, height}, {us[0], v1, us[1], v2}, diffuse);
        x += cw;
        for (int i = 0; i < static_cast<int>(k); ++i, x += cw)
            DrawRectQuad(device, {x, y, cw, height}, {us[1], v1, us[2], v2}, diffuse);
        if (r >= 1.0f) {
            DrawRectQuad(device, {x, y, r, height}, {us[1], v1, us[1] + (us[2] - us[1]) * r / cw, v2}, diffuse);
            x += r;
        }
        DrawRectQuad(device, {x, y, cw, height}, {us[2], v1, us[3], v2}, diffuse);
    };
    float y = dest.Y;
    row(y, ch, vs[0], vs[1]);
    y += ch;
    for (int i = 0; i < static_cast<int>(m); ++i, y += ch)
        row(y, ch, vs[1], vs[2]);
    if (r2 >= 1.0f) {
        row(y, r2, vs[1], vs[1] + (vs[2] - vs[1]) * r2 / ch);
        y += r2;
    }
    row(y, ch, vs[2], vs[3]);
}

// Text ---------------------------------------------------------------------------------

void CRenderer::RenderString(const CFont* font, const wstring& text, float x, float y, int hJustify,
                             int vJustify, float /*scale*/, const Color& textColor, const Color& backColor)
{
    if (!font || text.empty())
        return;
    unsigned flags = 0;
    if (hJustify == JustifyCenterH) {
        x -= 500;
        flags |= TextCenterH;
    } else if (hJustify == JustifyRight) {
        x -= 1000;
        flags |= TextRight;
    }
    if (vJustify == JustifyCenterV) {
        y -= 500;
        flags |= TextCenterV;
    } else if (vJustify == JustifyBottom) {
        y -= 1000;
        flags |= TextBottom;
    }
    RenderText(*font, text, misc::IntRect(static_cast<int>(x), static_cast<int>(y), 1000, 1000), flags, 0,
               textColor, backColor);
}

void CRenderer::RenderText(const CFont& font, const wstring& text, const misc::IntRect& box, unsigned flags,
                           unsigned length, const Color& textColor, const Color& backColor)
{
    const Color none(0u);
    RenderText(font, text, box, flags, length, textColor, backColor, none, none, 1, 0);
}

void CRenderer::RenderText(const CFont& font, const wstring& text, const misc::IntRect& box, unsigned flags,
                           unsigned length, const Color& textColor, const Color& backColor,
                           const Color& selTextColor, const Color& selBackColor, int selStart, int selEnd)
{
    // A length past the string's end would read beyond it.
    if (length > text.size())
        length = static_cast<unsigned>(text.size());
    if (text.empty())
        return;
    m_TextRender->RenderText(*this, &font, text.c_str(), box, flags, length, textColor, backColor, selTextColor,
                             selBackColor, selStart, selEnd);
}

void CRenderer::RenderText(const CFont& font, const wchar* text, const misc::IntRect& box, unsigned flags,
                           unsigned length, const Color& textColor, const Color& backColor,
                           const Color& selTextColor, const Color& selBackColor, int selStart, int selEnd)
{
    m_TextRender->RenderText(*this, &font, text, box, flags, length, textColor, backColor, selTextColor,
                             selBackColor, selStart, selEnd);
}

bool CRenderer::ReadBackBuffer(std::vector<uint32_t>& pixels, unsigned& width, unsigned& height,
                               const misc::IntRect& area)
{
    if (m_DeviceLost || !m_Backend || !m_Backend->HasDevice())
        return false;
    misc::IntRect window {0, 0, static_cast<int>(m_Width), static_cast<int>(m_Height)};
    if (area.Width > 0 && area.Height > 0) {
        const int x0 = std::max(area.X, 0), y0 = std::max(area.Y, 0);
        const int x1 = std::min(area.X + area.Width, m_SourceWidth), y1 = std::min(area.Y + area.Height, m_SourceHeight);
        if (x1 <= x0 || y1 <= y0)
            return false;
        const misc::FloatMatrix m = misc::MatrixScale(m_AspectK.X, m_AspectK.Y) *
                                    misc::MatrixTranslation(m_AspectOffset.X, m_AspectOffset.Y);
        const FloatVector a = m.Transform({static_cast<float>(x0), static_cast<float>(y0)});
        const FloatVector b = m.Transform({static_cast<float>(x1), static_cast<float>(y1)});
        window = {static_cast<int>(a.X), static_cast<int>(a.Y), static_cast<int>(b.X) - static_cast<int>(a.X),
                  static_cast<int>(b.Y) - static_cast<int>(a.Y)};
    }
    if (window.Width <= 0 || window.Height <= 0)
        return false;
    // What is batched belongs in the picture.
    m_Device->Flush();
    std::vector<uint32_t> result(static_cast<size_t>(window.Width) * window.Height);
    if (CheckResult(m_Backend->ReadBackBuffer(window, result.data()), "GetBackBuffer", diag::LogError))
        return false;
    pixels = std::move(result);
    width = static_cast<unsigned>(window.Width);
    height = static_cast<unsigned>(window.Height);
    return true;
}

} // namespace ox::graphics
