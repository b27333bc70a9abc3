#pragma once
// A render backend that draws nothing: it records every call, keeps textures in memory,
// and can be told to fail (device creation, scene start, texture creation, the end-of-
// frame query) or to report a lost device.
#include "graphics/RenderBackend.h"
#include "graphics/Renderer.h"

#include <memory>
#include <string>
#include <vector>

namespace oxtest {

class RecordingBackend : public ox::graphics::IRenderBackend {
public:
    using Vertex = ox::graphics::Vertex;
    using DeviceResult = ox::graphics::DeviceResult;

    struct Texture : ox::graphics::CDeviceTexture {
        int id = 0;
        std::vector<unsigned char> bits;
    };
    struct Shader : ox::graphics::CDeviceShader {
        std::string source;
    };
    // One draw with the state it was made in.
    struct Draw {
        ox::graphics::PrimitiveType type;
        unsigned primitives;
        std::vector<Vertex> vertices;
        ox::graphics::CDeviceTexture* texture;
        ox::graphics::CDeviceTexture* target;
        ox::graphics::CDeviceShader* shader;
        uint32_t srcBlend, destBlend;
    };

    // Every call in order, as "Name arg arg ...".
    std::vector<std::string> calls;
    std::vector<Draw> draws;

    // What the next calls answer.
    DeviceResult createResult = ox::graphics::ResultOk;
    DeviceResult resetResult = ox::graphics::ResultOk;
    DeviceResult cooperativeLevel = ox::graphics::ResultOk;
    DeviceResult beginSceneResult = ox::graphics::ResultOk;
    DeviceResult presentResult = ox::graphics::ResultOk;
    bool queryAvailable = true;
    bool failCreateTexture = false;
    // Off: textures keep no bits until loaded (big textures on paper, for budgets).
    bool allocateBits = true;
    ox::graphics::ResolutionsT modes;

    // Counters and the device's state.
    bool hasDevice = false;
    int creates = 0, resets = 0, releases = 0, queryPolls = 0;
    unsigned width = 0, height = 0;
    uint32_t srcBlend = 0, destBlend = 0;
    ox::graphics::CDeviceTexture* stageTexture[2] = {};
    ox::graphics::CDeviceTexture* target = nullptr;
    ox::graphics::CDeviceShader* shader = nullptr;
    int liveTextures = 0;
    // The back buffer: only clears reach it.
    std::vector<uint32_t> backBuffer;

    ~RecordingBackend() override;

    // The calls whose name begins with `prefix`.
    std::vector<std::string> Calls(const std::string& prefix) const;
    void ClearRecord()
    {
        calls.clear();
        draws.clear();
    }

    DeviceResult CreateDevice(void* window, unsigned width, unsigned height, bool fullscreen) override;
    DeviceResult ResetDevice(unsigned width, unsigned height, bool fullscreen) override;
    bool HasDevice() const override { return hasDevice; }
    void ReleaseDevice(bool forReset) override;
    DeviceResult TestCooperativeLevel() override;
    void EnumModes(ox::graphics::ResolutionsT& out) override;
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
    void SetTexture(unsigned stage, ox::graphics::CDeviceTexture* texture) override;
    DeviceResult SetRenderTarget(ox::graphics::CDeviceTexture* target) override;
    void SetPixelShader(ox::graphics::CDeviceShader* shader) override;
    DeviceResult DrawPrimitiveUP(ox::graphics::PrimitiveType type, unsigned primitiveCount, const Vertex* vertices,
                                 unsigned vertexCount) override;
    ox::graphics::CDeviceTexture* CreateTexture(unsigned width, unsigned height, uint8_t format,
                                                bool renderTarget) override;
    void ReleaseTexture(ox::graphics::CDeviceTexture* texture) override;
    DeviceResult LoadBits(ox::graphics::CDeviceTexture* texture, const void* data, size_t size) override;
    DeviceResult ReadTexture(ox::graphics::CDeviceTexture* texture, uint32_t* out) override;
    DeviceResult ReadBackBuffer(const ox::misc::IntRect& area, uint32_t* out) override;
    ox::graphics::CDeviceShader* CreatePixelShader(const std::string& source, std::string& errors) override;
    void ReleasePixelShader(ox::graphics::CDeviceShader* shader) override;

private:
    void Record(std::string text) { calls.push_back(std::move(text)); }
    int m_NextTexture = 1;
    bool m_Query = false;
};

// A renderer drawing into a new recording backend (handed out through `backend`): a
// source of sourceWidth x sourceHeight in a window of windowWidth x windowHeight.
std::unique_ptr<ox::graphics::CRenderer> MakeRecordingRenderer(RecordingBackend*& backend, int sourceWidth,
                                                               int sourceHeight, unsigned windowWidth,
                                                               unsigned windowHeight);

} // namespace oxtest
