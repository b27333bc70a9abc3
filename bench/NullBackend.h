#pragma once
// A render backend that discards what it is given (it counts the vertices), so that a
// benchmark measures the renderer, the state, the clipper and the batch alone.
#include "graphics/RenderBackend.h"

#include <benchmark/benchmark.h>

namespace oxbench {

using ox::graphics::CDeviceShader;
using ox::graphics::CDeviceTexture;
using ox::graphics::DeviceResult;
using ox::graphics::IRenderBackend;
using ox::graphics::PrimitiveType;
using ox::graphics::ResolutionsT;
using ox::graphics::ResultOk;
using ox::graphics::Vertex;

class NullBackend : public IRenderBackend {
public:
    CDeviceTexture texture;
    unsigned long long vertices = 0;

    DeviceResult CreateDevice(void*, unsigned, unsigned, bool) override { return (device = true), ResultOk; }
    DeviceResult ResetDevice(unsigned, unsigned, bool) override { return ResultOk; }
    bool HasDevice() const override { return device; }
    void ReleaseDevice(bool forReset) override { device = device && forReset; }
    DeviceResult TestCooperativeLevel() override { return ResultOk; }
    void EnumModes(ResolutionsT&) override {}
    DeviceResult BeginScene() override { return ResultOk; }
    DeviceResult EndScene() override { return ResultOk; }
    DeviceResult Present() override { return ResultOk; }
    void Clear(uint32_t) override {}
    bool CreateEventQuery() override { return false; }
    bool PollEventQuery() override { return true; }
    void ReleaseEventQuery() override {}
    void SetRenderState(uint32_t, uint32_t) override {}
    void SetTextureStageState(unsigned, uint32_t, uint32_t) override {}
    void SetSamplerState(unsigned, uint32_t, uint32_t) override {}
    void SetTexture(unsigned, CDeviceTexture*) override {}
    DeviceResult SetRenderTarget(CDeviceTexture*) override { return ResultOk; }
    void SetPixelShader(CDeviceShader*) override {}
    DeviceResult DrawPrimitiveUP(PrimitiveType, unsigned, const Vertex* v, unsigned count) override
    {
        benchmark::DoNotOptimize(v);
        vertices += count;
        return ResultOk;
    }
    CDeviceTexture* CreateTexture(unsigned, unsigned, uint8_t, bool) override { return &texture; }
    void ReleaseTexture(CDeviceTexture*) override {}
    DeviceResult LoadBits(CDeviceTexture*, const void*, size_t) override { return ResultOk; }
    DeviceResult ReadTexture(CDeviceTexture*, uint32_t*) override { return ResultOk; }
    DeviceResult ReadBackBuffer(const ox::misc::IntRect&, uint32_t*) override { return ResultOk; }
    CDeviceShader* CreatePixelShader(const std::string&, std::string&) override { return nullptr; }
    void ReleasePixelShader(CDeviceShader*) override {}

private:
    bool device = false;
};

} // namespace oxbench
