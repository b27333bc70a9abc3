#include "graphics/Renderer.h"

#include "core/Application.h"
#include "core/SystemIntegration.h"
#include "diag/Log.h"

#include <SDL.h>

#include <algorithm>

namespace ox::graphics {

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
    m_Width = static_cast<unsigned>(client.Width);
    m_Height = static_cast<unsigned>(client.Height);
}

bool CRenderer::InitGraphics()
{
    if (!m_IsFullscreen)
        UpdateWindowInfo();
    OX_LOG("renderer", diag::LogInfo,
           "CRenderer::InitGraphics called with m_SourceWidth=%i m_SourceHeight=%i m_Width=%i m_Height=%i "
           "m_IsFullscreen=%i",
           m_SourceWidth, m_SourceHeight, static_cast<int>(m_Width), static_cast<int>(m_Height),
           static_cast<int>(m_IsFullscreen));
    m_DeviceLost = true;
    CalculateAspect();
    OX_LOG("renderer", diag::LogInfo,
           "CRenderer::InitGraphics calculated aspect: m_AspectK.X=%f m_AspectK.Y=%f m_AspectOffset.Y=%f "
           "m_AspectOffset.X=%f",
           m_AspectK.X, m_AspectK.Y, m_AspectOffset.Y, m_AspectOffset.X);
    m_DeviceLost = false;
    return true;
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
    if ((sw == 0 && sh == 0) || (sw == m_Width && sh == m_Height) || m_Width == 0 || m_Height == 0 || sw == 0 ||
        sh == 0)
        return;
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

misc::FloatRect CRenderer::GetActiveRect() const
{
    return {m_AspectOffset.X, m_AspectOffset.Y, static_cast<float>(m_Width) - 2 * m_AspectOffset.X,
            static_cast<float>(m_Height) - 2 * m_AspectOffset.Y};
}

void CRenderer::EnumResolutions()
{
    m_Resolutions.clear();
    if (!SDL_WasInit(SDL_INIT_VIDEO))
        return;
    int count = SDL_GetNumDisplayModes(0);
    for (int i = 0; i < count; ++i) {
        SDL_DisplayMode mode;
        if (SDL_GetDisplayMode(0, i, &mode) != 0)
            continue;
        Resolution r {static_cast<unsigned>(mode.w), static_cast<unsigned>(mode.h),
                      SDL_BITSPERPIXEL(mode.format) >= 24};
        if (std::find(m_Resolutions.begin(), m_Resolutions.end(), r) == m_Resolutions.end())
            m_Resolutions.push_back(r);
    }
}

void CRenderer::RequestModeRestore(bool bpp32)
{
    m_RestorePending = true;
    m_RestoreBpp32 = bpp32;
}

void CRenderer::CheckModeRestore()
{
    if (!m_RestorePending || m_IsFullscreen)
        return;
    m_RestorePending = false;
    if (core::g_Application)
        core::g_Application->ChangeScreenMode(false, m_RestoreBpp32, m_Width, m_Height);
}

} // namespace ox::graphics
