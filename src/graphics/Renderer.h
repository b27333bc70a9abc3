#pragma once
// The drawing facade on a fixed canvas (the source resolution). This part holds the window
// mode and the aspect mapping of the canvas onto the window; the device and the primitives
// join it with the graphics device.
#include "misc/Rect.h"
#include "misc/Vector.h"

#include <vector>

namespace ox::core {
class CSystemIntegration;
}

namespace ox::graphics {

struct Resolution {
    unsigned Width = 0;
    unsigned Height = 0;
    bool Bpp32 = true;
    bool operator==(const Resolution& o) const { return Width == o.Width && Height == o.Height && Bpp32 == o.Bpp32; }
};
using ResolutionsT = std::vector<Resolution>;

class CRenderer {
public:
    CRenderer() = default;

    // The window the canvas is drawn into (client size read from it when windowed).
    void SetSystemIntegration(core::CSystemIntegration* adapter) { m_Adapter = adapter; }

    bool InitWindow(bool fullscreen, bool bpp32, unsigned width, unsigned height);
    bool InitGraphics();
    void UpdateWindowInfo();

    void SetSourceResolution(int width, int height);
    misc::IntVector GetSourceResolution() const { return {m_SourceWidth, m_SourceHeight}; }
    void SetKeepAspect(bool keep);
    unsigned GetWidth() const { return m_Width; }
    unsigned GetHeight() const { return m_Height; }
    bool IsFullscreen() const { return m_IsFullscreen; }
    bool Is32BPP() const { return m_Bpp32; }
    misc::FloatVector GetScale() const { return m_AspectK; }
    misc::FloatVector GetAspectOffset() const { return m_AspectOffset; }
    misc::FloatRect GetActiveRect() const;

    void GetAvailableResolutions(ResolutionsT& out) const { out = m_Resolutions; }
    void SetAvailableResolutions(ResolutionsT resolutions) { m_Resolutions = std::move(resolutions); }
    // Fills the list from the display modes SDL reports.
    void EnumResolutions();

    void RequestModeRestore(bool bpp32);
    // Before a frame: a pending restore of a windowed mode asks the application for it.
    void CheckModeRestore();

    // The frame. Without a render device there is nothing to draw into: false.
    bool BeginScene() { return false; }
    bool EndScene() { return true; }
    void ReleaseDevice(bool /*forReset*/) {}

private:
    void CalculateAspect();

    core::CSystemIntegration* m_Adapter = nullptr;
    bool m_KeepAspect = true;
    bool m_IsFullscreen = false;
    unsigned m_Width = 0;
    unsigned m_Height = 0;
    bool m_Bpp32 = true;
    ResolutionsT m_Resolutions;
    bool m_DeviceLost = false;
    int m_SourceWidth = 0;
    int m_SourceHeight = 0;
    misc::FloatVector m_AspectK {1.0f, 1.0f};
    misc::FloatVector m_AspectOffset {0.0f, 0.0f};
    bool m_RestorePending = false;
    bool m_RestoreBpp32 = true;
};

} // namespace ox::graphics
