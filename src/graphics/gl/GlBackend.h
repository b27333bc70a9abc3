#pragma once
// The render backend on OpenGL 3.3 core, through a GL context that SDL makes on the game's
// window. Vertices come pre-transformed in window pixels with pixel centres on whole
// numbers (the vertex shader adds the half pixel back); colours and textures are BGRA.
#include "graphics/RenderBackend.h"

#include <memory>
#include <unordered_set>

struct SDL_Window;

namespace ox::graphics {

struct GlFunctions;

class CGlBackend : public IRenderBackend {
public:
    CGlBackend();
    ~CGlBackend() override;

    DeviceResult CreateDevice(void* window, unsigned width, unsigned height, bool fullscreen) override;
    DeviceResult ResetDevice(unsigned width, unsigned height, bool fullscreen) override;
    bool HasDevice() const override { return m_Context != nullptr; }
    void ReleaseDevice(bool forReset) override;
    DeviceResult TestCooperativeLevel() override { return m_Context ? ResultOk : ResultDeviceLost; }
    void EnumModes(ResolutionsT& out) override;

    DeviceResult BeginScene() override;
    DeviceResult EndScene() override;
    DeviceResult Present() override;
    void Clear(uint32_t argb) override;
    bool CreateEventQuery() override;
    bool PollEventQuery() override;
    void ReleaseEventQuery() override;

    void SetRenderState(uint32_t state, uint32_t value) override;
    void SetTextureStageState(unsigned stage, uint32_t state, uint32_t value) override;
    void SetSamplerState(unsigned stage, uint32_t state, uint32_t value) override;
    void SetTexture(unsigned stage, CDeviceTexture* texture) override;
    DeviceResult SetRenderTarget(CDeviceTexture* target) override;
    void SetPixelShader(CDeviceShader* shader) override;
    DeviceResult DrawPrimitiveUP(PrimitiveType type, unsigned primitiveCount, const Vertex* vertices,
                                 unsigned vertexCount) override;

    CDeviceTexture* CreateTexture(unsigned width, unsigned height, uint8_t format, bool renderTarget) override;
    void ReleaseTexture(CDeviceTexture* texture) override;
    DeviceResult LoadBits(CDeviceTexture* texture, const void* data, size_t size) override;
    DeviceResult ReadTexture(CDeviceTexture* texture, uint32_t* out) override;
    DeviceResult ReadBackBuffer(const misc::IntRect& area, uint32_t* out) override;

    CDeviceShader* CreatePixelShader(const std::string& source, std::string& errors) override;
    void ReleasePixelShader(CDeviceShader* shader) override;

    // The GL_RENDERER and GL_VERSION strings of the context.
    const std::string& GetRendererName() const { return m_RendererName; }

private:
    struct Texture;
    struct Program;

    bool Setup();
    void Teardown();
    unsigned CompileProgram(const std::string& fragment, std::string& errors);
    void BindTarget();
    void PrepareDraw();
    void BindStageTexture();
    bool Check(const char* what);

    SDL_Window* m_Window = nullptr;
    void* m_Context = nullptr;
    std::unique_ptr<GlFunctions> m_Gl;
    std::string m_RendererName;
    unsigned m_Width = 0;
    unsigned m_Height = 0;

    Program* m_DefaultProgram = nullptr;
    Program* m_Program = nullptr;
    unsigned m_Vao = 0;
    unsigned m_Vbo = 0;
    unsigned m_Sampler = 0;
    unsigned m_White = 0;
    Texture* m_Target = nullptr;
    Texture* m_Bound = nullptr;
    uint32_t m_SrcBlend = 5;
    uint32_t m_DestBlend = 6;
    uint32_t m_Stage[7] = {};
    bool m_UniformsDirty = true;
    void* m_Fence = nullptr;
    std::unordered_set<Texture*> m_Textures;
    std::unordered_set<Program*> m_Programs;
};

} // namespace ox::graphics
