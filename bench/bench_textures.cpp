// The texture manager's costs: building the textures of the declarations at start (no
// pixel read), finding a texture by id, and the per-draw path to a device texture with its
// once-a-frame MRU touch and, when over budget, eviction.
#include "core/TextureDeclarations.h"
#include "core/TextureManager.h"
#include "graphics/Renderer.h"
#include "misc/GamePack.h"

#include <benchmark/benchmark.h>

#include <filesystem>
#include <memory>
#include <string>

using namespace ox;

namespace {

class NullBackend : public graphics::IRenderBackend {
public:
    using DeviceResult = graphics::DeviceResult;
    DeviceResult CreateDevice(void*, unsigned, unsigned, bool) override { return (device = true), graphics::ResultOk; }
    DeviceResult ResetDevice(unsigned, unsigned, bool) override { return graphics::ResultOk; }
    bool HasDevice() const override { return device; }
    void ReleaseDevice(bool forReset) override { device = device && forReset; }
    DeviceResult TestCooperativeLevel() override { return graphics::ResultOk; }
    void EnumModes(graphics::ResolutionsT&) override {}
    DeviceResult BeginScene() override { return graphics::ResultOk; }
    DeviceResult EndScene() override { return graphics::ResultOk; }
    DeviceResult Present() override { return graphics::ResultOk; }
    void Clear(uint32_t) override {}
    bool CreateEventQuery() override { return false; }
    bool PollEventQuery() override { return true; }
    void ReleaseEventQuery() override {}
    void SetRenderState(uint32_t, uint32_t) override {}
    void SetTextureStageState(unsigned, uint32_t, uint32_t) override {}
    void SetSamplerState(unsigned, uint32_t, uint32_t) override {}
    void SetTexture(unsigned, graphics::CDeviceTexture*) override {}
    DeviceResult SetRenderTarget(graphics::CDeviceTexture*) override { return graphics::ResultOk; }
    void SetPixelShader(graphics::CDeviceShader*) override {}
    DeviceResult DrawPrimitiveUP(graphics::PrimitiveType, unsigned, const graphics::Vertex*, unsigned) override
    {
        return graphics::ResultOk;
    }
    graphics::CDeviceTexture* CreateTexture(unsigned, unsigned, uint8_t, bool) override
    {
        return new graphics::CDeviceTexture();
    }
    void ReleaseTexture(graphics::CDeviceTexture* texture) override { delete texture; }
    DeviceResult LoadBits(graphics::CDeviceTexture*, const void*, size_t) override { return graphics::ResultOk; }
    DeviceResult ReadTexture(graphics::CDeviceTexture*, uint32_t*) override { return graphics::ResultOk; }
    DeviceResult ReadBackBuffer(const misc::IntRect&, uint32_t*) override { return graphics::ResultOk; }
    graphics::CDeviceShader* CreatePixelShader(const std::string&, std::string&) override { return nullptr; }
    void ReleasePixelShader(graphics::CDeviceShader*) override {}

private:
    bool device = false;
};

constexpr int kImages = 4000;

std::string ImageId(int i) { return "scene" + std::to_string(i % 40) + "/object_" + std::to_string(i); }

// Declarations of kImages images, each on its own 1024 x 1024 surface (4 MiB), built once.
struct World {
    graphics::CRenderer renderer {std::make_unique<NullBackend>()};
    std::unique_ptr<misc::CGamePack> pack;
    std::unique_ptr<core::CTextureDeclarationsLoader> loader;

    World()
    {
        renderer.InitWindow(false, true, 64, 64);
        misc::GamePackConfig config;
        config.folder = std::filesystem::temp_directory_path().string() + "/ox-bench-no-files";
        config.language = "";
        pack = std::make_unique<misc::CGamePack>(config);
        std::string xml = "<?xml version=\"1.0\"?><resources><surfaces>";
        for (int i = 0; i < kImages; ++i)
            xml += "<surface path=\"art/" + std::to_string(i) + ".png\" width=\"1024\" height=\"1024\"/>";
        xml += "</surfaces><group id=\"all\" flags=\"load_on_demand\">";
        for (int i = 0; i < kImages; ++i)
            xml += "<image id=\"" + ImageId(i) + "\" path=\"art/" + std::to_string(i) +
                   ".png\"><part rect_x=\"0\" rect_y=\"0\" rect_w=\"512\" rect_h=\"512\"/></image>";
        xml += "</group></resources>";
        loader = std::make_unique<core::CTextureDeclarationsLoader>(pack.get());
        loader->LoadXml(xml.data(), xml.size(), "bench");
    }
};

World& TheWorld()
{
    static World* world = new World();
    return *world;
}

} // namespace

// Start-up: one manager over the declarations, surfaces and textures made, nothing read.
static void BM_ManagerLoadDeclarations(benchmark::State& state)
{
    World& world = TheWorld();
    for (auto _ : state) {
        core::CTextureManager manager(world.pack.get());
        manager.Load(world.loader.get());
        benchmark::DoNotOptimize(manager.GetTexturesCount());
    }
    state.SetItemsProcessed(state.iterations() * kImages);
}
BENCHMARK(BM_ManagerLoadDeclarations)->Unit(benchmark::kMillisecond);

// A look-up by id: a binary search of the table in place.
static void BM_GetItem(benchmark::State& state)
{
    World& world = TheWorld();
    core::CTextureManager manager(world.pack.get());
    manager.Load(world.loader.get());
    std::vector<std::string> ids;
    for (int i = 0; i < kImages; i += 7)
        ids.push_back(ImageId(i));
    size_t i = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(manager.GetItem(ids[i].c_str()));
        i = (i + 1) % ids.size();
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_GetItem);

// What each textured draw pays: the device texture of a surface already in memory.
static void BM_DrawPathResident(benchmark::State& state)
{
    World& world = TheWorld();
    core::CTextureManager manager(world.pack.get());
    manager.Load(world.loader.get());
    graphics::CSurface* surface = manager.GetItem(ImageId(1))->GetSurface();
    uint32_t frame = 1;
    for (auto _ : state) {
        graphics::SetFrameNumber(++frame);  // a touch every time: the worst case
        benchmark::DoNotOptimize(surface->GetD3DTexture());
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_DrawPathResident);

// Frames that each draw 20 of 200 on-demand 4 MiB surfaces in turn: over 128 MiB the
// oldest go in bursts down to 96 MiB and load again when their turn comes. One item is one
// frame.
static void BM_FramesUnderTheBudget(benchmark::State& state)
{
    World& world = TheWorld();
    core::CTextureManager manager(world.pack.get());
    std::vector<graphics::CSurface*> surfaces;
    for (int i = 0; i < 200; ++i) {
        surfaces.push_back(manager.CreateSurface(1024, 1024));
        surfaces.back()->SetFlags(graphics::CSurface::FlagLoadOnDemand);
        surfaces.back()->Unload();
    }
    uint32_t frame = 1;
    size_t next = 0;
    for (auto _ : state) {
        graphics::SetFrameNumber(++frame);
        for (int i = 0; i < 20; ++i, next = (next + 1) % surfaces.size())
            benchmark::DoNotOptimize(surfaces[next]->GetD3DTexture());
    }
    state.counters["MiB"] = manager.GetVideoMemUsed() / 1048576.0;
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_FramesUnderTheBudget)->Unit(benchmark::kMicrosecond);

BENCHMARK_MAIN();
