#pragma once
// The drawing facade on a fixed canvas (the source resolution): maps the canvas onto the
// window with an aspect-preserving scale and offset, owns the render state and the render
// device, turns each primitive into vertices, clips them and hands them to the batch.
#include "graphics/Color.h"
#include "graphics/RenderBackend.h"
#include "graphics/RenderDevice.h"
#include "graphics/RendererState.h"
#include "misc/Matrix.h"
#include "misc/Poly.h"
#include "misc/Rect.h"
#include "misc/Vector.h"
#include "misc/WideChar.h"

#include <functional>
#include <memory>
#include <optional>
#include <vector>

namespace ox::core {
class CSystemIntegration;
}

namespace ox::graphics {

class CSurface;
class CTexture;
class CTextRender;
struct CFont;
struct UVRect;

enum Justify : int {
    JustifyLeft = -1,
    JustifyCenterH = 0,
    JustifyRight = 1,
    JustifyTop = -1,
    JustifyCenterV = 0,
    JustifyBottom = 1,
};

// Whoever holds device objects that must go before the device does (the texture
// manager, dynamic surfaces). forReset: only what a reset loses.
class IDeviceResourceOwner {
public:
    virtual ~IDeviceResourceOwner() = default;
    virtual void ReleaseDeviceResources(bool forReset) = 0;
};

// A screen mode the renderer asks the application for (after the desktop mode changed).
// Width and height 0: the desktop's size.
struct ModeRequest {
    bool fullscreen;
    bool bpp32;
    unsigned width;
    unsigned height;
};

// The backend the game runs on (OpenGL).
std::unique_ptr<IRenderBackend> CreateDefaultBackend();

class CRenderer {
public:
    // Text flags (bit values). TextMeasure clears the alignment and forces one line.
    enum TextFlags : unsigned {
        TextMeasure = 1,
        TextNoWrap = 2,
        TextWrapOther = 4,
        TextWordWrap = 8,
        TextWordEllipsis = 16,
        TextLeft = 0x20,
        TextCenterH = 0x40,
        TextRight = 0x80,
        TextTop = 0x100,
        TextCenterV = 0x200,
        TextBottom = 0x400,
        TextJustify = 0x800,
        TextUnderline = 0x1000,
        TextStrikethrough = 0x2000,
    };

    CRenderer();
    explicit CRenderer(std::unique_ptr<IRenderBackend> backend);
    ~CRenderer();
    CRenderer(const CRenderer&) = delete;
    CRenderer& operator=(const CRenderer&) = delete;

    // The window the canvas is drawn into (its real size is read from it).
    void SetSystemIntegration(core::CSystemIntegration* adapter) { m_Adapter = adapter; }
    // Replaces the backend; any device of the old one is released first.
    void SetBackend(std::unique_ptr<IRenderBackend> backend);
    IRenderBackend* GetBackend() const { return m_Backend.get(); }
    RenderDevice& GetDevice() { return *m_Device; }
    CRendererState& GetState() { return m_State; }
    CTextRender& GetTextRender() { return *m_TextRender; }

    bool InitWindow(bool fullscreen, bool bpp32, unsigned width, unsigned height);
    bool InitGraphics();
    void UpdateWindowInfo();
    // Device objects go: for a reset only what a reset loses, else everything and the device.
    void ReleaseDevice(bool forReset);
    void AddDeviceResourceOwner(IDeviceResourceOwner* owner);
    void RemoveDeviceResourceOwner(IDeviceResourceOwner* owner);
    bool IsDeviceLost() const { return m_DeviceLost; }

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
    // Told the active rectangle and the scale now and whenever they change: whoever maps
    // window pixels back to the canvas (the GUI) follows it.
    using ActiveRectListener = std::function<void(const misc::FloatRect& rect, const misc::FloatVector& scale)>;
    void SetActiveRectListener(ActiveRectListener listener);

    void GetAvailableResolutions(ResolutionsT& out) const { out = m_Resolutions; }
    void SetAvailableResolutions(ResolutionsT resolutions) { m_Resolutions = std::move(resolutions); }
    // Fills the list from the display modes the device reports.
    void EnumResolutions();

    void RequestModeRestore(bool bpp32);
    // Before a frame: a pending restore, as the mode the application is to change to. A
    // window keeps its size; full screen takes the desktop's, and the device goes first.
    std::optional<ModeRequest> CheckModeRestore();

    // The frame.
    bool BeginScene();
    bool EndScene();
    void Flush() { m_Device->Flush(); }
    void Clear(const Color& color) { m_Device->Clear(color); }

    // State.
    void SetColor(const Color& color) { m_State.SetColor(color); }
    const Color& GetColor() const { return m_State.GetColor(); }
    void SetBlendMode(BlendModes mode) { m_State.SetBlendMode(mode); }
    BlendModes GetBlendMode() const { return m_State.GetBlendMode(); }
    void ApplyMatrix(const misc::FloatMatrix& m) { m_State.ApplyMatrix(m); }
    const misc::FloatMatrix& GetMatrix() const { return m_State.GetMatrix(); }
    void SetClipPoly(const misc::Poly4& poly) { m_State.SetClipPoly(poly); }
    void PushState() { m_State.PushState(); }
    void PopState() { m_State.PopState(); }
    void PushMatrix() { m_State.PushMatrix(); }
    void PopMatrix() { m_State.PopMatrix(); }
    void PushBlendMode() { m_State.PushBlendMode(); }
    void PopBlendMode() { m_State.PopBlendMode(); }
    void PushColor() { m_State.PushColor(); }
    void PopColor() { m_State.PopColor(); }
    void SetPixelShader(const CPixelShader* shader) { m_State.SetPixelShader(shader); }
    // A render-target surface, or null for the back buffer.
    void SetRenderTarget(const CSurface* surface);

    // Primitives, in source coordinates. The colour multiplies the current colour.
    void RenderLine(const misc::FloatVector& from, const misc::FloatVector& to, const Color& color = Color());
    void RenderRect(const misc::FloatRect& rect, const Color& color = Color());
    void RenderFilledPoly4(const misc::Poly4& poly, const Color& color = Color());
    void RenderTexture(const CTexture* texture, float x, float y, unsigned frame = 0, const Color& color = Color());
    void RenderTexture(const CTexture* texture, const misc::FloatRect& dest, unsigned frame = 0,
                       const Color& color = Color());
    void RenderTexture(const CTexture* texture, const misc::Poly4& dest, unsigned frame = 0,
                       const Color& color = Color());
    void RenderTexture(const CTexture* texture, float x, float y, const misc::ShortRect& source,
                       const Color& color = Color());
    void RenderTexture(const CTexture* texture, const misc::FloatRect& dest, const misc::ShortRect& source,
                       const Color& color = Color());
    void RenderTexture(const CTexture* texture, const misc::Poly4& dest, const misc::ShortRect& source,
                       const Color& color = Color());
    // One triangle with its own texture coordinates.
    void RenderTextureTriangle(const CTexture* texture, const misc::FloatVector& p0, const misc::FloatVector& p1,
                               const misc::FloatVector& p2, const misc::FloatVector& uv0,
                               const misc::FloatVector& uv1, const misc::FloatVector& uv2,
                               const Color& color = Color());
    // A nine-part box: corners unscaled, edges and middle repeated.
    void RenderTextureBox(const CTexture* texture, const misc::FloatRect& dest, unsigned frame = 0,
                          const Color& color = Color());
    void RenderTextureBox(const CTexture* texture, const misc::FloatRect& dest, const misc::ShortRect& source,
                          const Color& color = Color());

    // One line of text at a point: a 1000 x 1000 box placed by the justifications
    // (JustifyLeft, JustifyCenterH, JustifyRight; JustifyTop, JustifyCenterV, JustifyBottom).
    // `scale` is accepted and has no effect. A null font or an empty text draws nothing.
    void RenderString(const CFont* font, const wstring& text, float x, float y, int hJustify = JustifyLeft,
                      int vJustify = JustifyTop, float scale = 1.0f, const Color& textColor = Color(),
                      const Color& backColor = Color(0u));
    // Text in a box with text flags; `length` 0 draws up to the end. The back colour fills
    // behind each line unless it is 0 (transparent black).
    void RenderText(const CFont& font, const wstring& text, const misc::IntRect& box, unsigned flags,
                    unsigned length = 0, const Color& textColor = Color(), const Color& backColor = Color(0u));
    // The same with a selection: the characters selStart to selEnd (inclusive) in their
    // own colour over the selection back colour.
    void RenderText(const CFont& font, const wstring& text, const misc::IntRect& box, unsigned flags,
                    unsigned length, const Color& textColor, const Color& backColor, const Color& selTextColor,
                    const Color& selBackColor, int selStart, int selEnd);
    void RenderText(const CFont& font, const wchar* text, const misc::IntRect& box, unsigned flags,
                    unsigned length, const Color& textColor, const Color& backColor, const Color& selTextColor,
                    const Color& selBackColor, int selStart, int selEnd);

    // A copy of an area of the back buffer (source coordinates; empty: the whole window),
    // as top-down 0xAARRGGBB words.
    bool ReadBackBuffer(std::vector<uint32_t>& pixels, unsigned& width, unsigned& height,
                        const misc::IntRect& area);

private:
    void CalculateAspect();
    bool TestDevice();
    // The vertex colour for a draw, or false when nothing is to be drawn.
    bool Preamble(const Color& color, uint32_t& diffuse) const;
    void DrawVertices(PrimitiveType type, CDeviceTexture* texture, Vertex* vertices, unsigned count);
    // Transformed and clipped vertices to the device with the current state.
    void Submit(PrimitiveType type, CDeviceTexture* texture, const Vertex* vertices, unsigned count);
    void DrawRectQuad(CDeviceTexture* texture, const misc::FloatRect& dest, const UVRect& uv, uint32_t diffuse);
    void DrawPolyQuad(CDeviceTexture* texture, const misc::Poly4& dest, const UVRect& uv, uint32_t diffuse);
    void DrawBox(const CTexture* texture, const misc::FloatRect& dest, const UVRect& uv, uint32_t diffuse);

    core::CSystemIntegration* m_Adapter = nullptr;
    std::unique_ptr<IRenderBackend> m_Backend;
    std::vector<IDeviceResourceOwner*> m_Owners;

    bool m_KeepAspect = true;
    bool m_IsFullscreen = false;
    unsigned m_Width = 0;
    unsigned m_Height = 0;
    bool m_Bpp32 = true;
    ResolutionsT m_Resolutions;
    CRendererState m_State;
    std::unique_ptr<CTextRender> m_TextRender;
    std::unique_ptr<RenderDevice> m_Device;
    bool m_DeviceLost = false;
    int m_SourceWidth = 0;
    int m_SourceHeight = 0;
    misc::FloatVector m_AspectK {1.0f, 1.0f};
    misc::FloatVector m_AspectOffset {0.0f, 0.0f};
    ActiveRectListener m_ActiveRectListener;
    bool m_RestorePending = false;
    bool m_RestoreBpp32 = true;
};

} // namespace ox::graphics
