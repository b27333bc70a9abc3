// Feeds arbitrary bytes to the particles: as a particles.bindump (checked, then every record
// it holds run for a while and drawn into a renderer whose backend draws nothing) and as
// particle XML (converted; what the converter makes must load and run the same way). The
// dump is tried once more with its magic and count set, so that the records are reached.
#include "core/ParticlesLoader.h"
#include "core/TimeManager.h"
#include "graphics/ParticleSystem.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <vector>

using ox::core::CParticlesLoader;
using ox::graphics::CParticleSystem;

namespace {

using namespace ox::graphics;

// A device that takes everything and draws nothing.
class DiscardingBackend : public IRenderBackend {
public:
    DeviceResult CreateDevice(void*, unsigned, unsigned, bool) override { return ResultOk; }
    DeviceResult ResetDevice(unsigned, unsigned, bool) override { return ResultOk; }
    bool HasDevice() const override { return true; }
    void ReleaseDevice(bool) override {}
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
    DeviceResult DrawPrimitiveUP(PrimitiveType, unsigned, const Vertex*, unsigned) override { return ResultOk; }
    CDeviceTexture* CreateTexture(unsigned, unsigned, uint8_t, bool) override { return &m_Texture; }
    void ReleaseTexture(CDeviceTexture*) override {}
    DeviceResult LoadBits(CDeviceTexture*, const void*, size_t) override { return ResultOk; }
    DeviceResult ReadTexture(CDeviceTexture*, uint32_t*) override { return ResultOk; }
    DeviceResult ReadBackBuffer(const ox::misc::IntRect&, uint32_t*) override { return ResultOk; }
    CDeviceShader* CreatePixelShader(const std::string&, std::string&) override { return nullptr; }
    void ReleasePixelShader(CDeviceShader*) override {}

private:
    CDeviceTexture m_Texture;
};

struct Stage {
    ox::core::CTimeManager time {[] { return 0.0; }};
    ox::core::CTimerWrapper timer {time.AttachTimer(time.GetRoot())};
    ox::graphics::CRenderer renderer {std::make_unique<DiscardingBackend>()};
    ox::graphics::CSurface surface {4, 4};
    ox::graphics::CTexture texture {&surface};

    Stage()
    {
        renderer.SetSourceResolution(1024, 768);
        renderer.InitWindow(false, true, 1024, 768);
        renderer.BeginScene();
        CParticleSystem::SetTextureLookup([this](const char* id) { return *id == 't' ? &texture : nullptr; });
    }
};

void Run(const CParticlesLoader& loader)
{
    static auto* stage = new Stage();
    const uint32_t count = loader.Count() < 8 ? loader.Count() : 8;
    for (uint32_t i = 0; i < count; ++i) {
        CParticleSystem system;
        if (!system.LoadDesc(loader.Records()[i]))
            continue;
        system.SetTimer(stage->timer.Get());
        system.AdvanceTime(1000, 20);
        system.SetLocation(10, 20);
        system.SetEmission(system.GetEmission() * 2);
        system.AdvanceTime(200, 50);
        if (system.GetLifeParticlesCount() > ox::graphics::kMaxLiveParticles)
            __builtin_trap();
        system.Render(&stage->renderer);
        system.IsDead();
        system.Reset();
    }
}

void TryDump(const uint8_t* data, size_t size)
{
    // An exact-size, 4-aligned copy: the sanitizer sees any read past the end.
    void* copy = aligned_alloc(4, (size + 3) / 4 * 4 + 4);
    memcpy(copy, data, size);
    {
        CParticlesLoader loader;
        if (loader.LoadFromMemory(copy, size, "fuzz.bindump"))
            Run(loader);
    }
    free(copy);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    TryDump(data, size);
    if (size >= 8) {
        std::vector<uint8_t> repaired(data, data + size);
        const uint32_t header[2] = {ox::core::kParticlesMagic,
                                    static_cast<uint32_t>((size - 8) / sizeof(ox::core::ParticleDesc))};
        memcpy(repaired.data(), header, sizeof header);
        repaired.resize(8 + header[1] * sizeof(ox::core::ParticleDesc));
        TryDump(repaired.data(), repaired.size());
    }
    std::vector<ox::core::ParticleDesc> records;
    if (ox::core::ConvertParticlesXml(reinterpret_cast<const char*>(data), size, "fuzz.xml", records)) {
        CParticlesLoader converted;
        converted.LoadRecords(records);
        if (converted.Count() != records.size())
            __builtin_trap();
        Run(converted);
    }
    return 0;
}
