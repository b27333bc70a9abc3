// A scene of 2,000 image objects in 50 groups: one frame drawn into a backend that discards
// vertices, and a hit test whose point lies on no object, through all of them (half of
// them cover the point with a transparent hole, so their pixel is asked of the alpha-mask
// store).
#include "NullBackend.h"
#include "core/TexturesAlpha.h"
#include "core/TexturesAlphaWriter.h"
#include "graphics/Image.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "quest/ImageObject.h"
#include "quest/Scene.h"
#include "quest/SceneGroup.h"

#include <benchmark/benchmark.h>

#include <cstdio>
#include <string>

using namespace qe;
using oxbench::NullBackend;

namespace {

constexpr int kTextureSize = 64;
constexpr int kTextures = 40;
constexpr int kGroups = 50;
constexpr int kObjects = 2000;
// Where the hit test looks: the centre of every covering object's hole.
constexpr FloatVector kPoint {512, 384};

std::string TextureId(int i)
{
    char id[16];
    std::snprintf(id, sizeof id, "tex_%02d", i);
    return id;
}

// 64 x 64 pixels, solid but for a transparent 16 x 16 hole in the middle.
std::vector<uint32_t> HoledPixels()
{
    std::vector<uint32_t> pixels(kTextureSize * kTextureSize, 0xFF808080u);
    for (int y = 24; y < 40; ++y)
        for (int x = 24; x < 40; ++x)
            pixels[y * kTextureSize + x] = 0;
    return pixels;
}

struct SceneBench {
    NullBackend* backend;
    ox::graphics::CRenderer renderer;
    ox::graphics::CSurface surface {kTextureSize, kTextureSize};
    ox::graphics::CTexture texture {&surface};
    std::vector<uint8_t> maskBytes;
    ox::core::CTexturesAlpha masks;
    ScenePtrT scene {new CScene()};

    SceneBench() : SceneBench(std::make_unique<NullBackend>()) {}
    explicit SceneBench(std::unique_ptr<NullBackend> owned) : backend(owned.get()), renderer(std::move(owned))
    {
        renderer.SetSourceResolution(1024, 768);
        renderer.InitWindow(true, true, 1920, 1080);
        BuildMasks();
        ox::graphics::CImage::SetTextureLookup([this](const char*) { return &texture; });
        BuildScene();
        ox::graphics::CImage::SetTextureLookup(nullptr);
    }

    void BuildMasks()
    {
        std::vector<ox::core::AlphaMaskSource> sources;
        for (int i = 0; i < kTextures; ++i)
            sources.push_back({TextureId(i), kTextureSize, kTextureSize, HoledPixels(), 1});
        ox::core::BuildTexturesAlpha(sources, maskBytes);
        masks.LoadFromMemory(maskBytes.data(), maskBytes.size());
    }

    // Even objects cover the point at 128 x 128 (its pixel within their hole), odd ones lie
    // elsewhere at 64 x 64; every tenth is turned a little.
    void BuildScene()
    {
        for (int g = 0; g < kGroups; ++g) {
            SceneGroupPtrT group(new CSceneGroup());
            for (int i = 0; i < kObjects / kGroups; ++i) {
                const int n = g * (kObjects / kGroups) + i;
                boost::intrusive_ptr<CImageObject> image(new CImageObject());
                image->SetTextureId(TextureId(n % kTextures));
                if (n % 2 == 0) {
                    image->SetPos({kPoint.X + (n % 7) - 3, kPoint.Y + (n % 5) - 2});
                    image->SetSize({128, 128});
                } else {
                    image->SetPos({static_cast<float>(40 + (n * 37) % 300), static_cast<float>(40 + (n * 53) % 680)});
                    image->SetSize({64, 64});
                }
                if (n % 10 == 0)
                    image->SetAngle(0.05f);
                group->InsertChild(image, nullptr);
            }
            scene->InsertObject(group, nullptr);
        }
        scene->UpdateTotalChildList();
    }
};

} // namespace

static void BM_SceneDraw(benchmark::State& state)
{
    SceneBench bench;
    for (auto _ : state) {
        bench.renderer.BeginScene();
        bench.scene->DrawGame(&bench.renderer);
        bench.renderer.EndScene();
    }
    state.SetItemsProcessed(state.iterations() * kObjects);
    state.counters["vertices/frame"] =
        static_cast<double>(bench.backend->vertices) / static_cast<double>(state.iterations());
}
BENCHMARK(BM_SceneDraw)->Unit(benchmark::kMicrosecond);

static void BM_HitTestMiss(benchmark::State& state)
{
    SceneBench bench;
    if (bench.scene->GetObjectAt(kPoint, &bench.masks) || bench.scene->EnumChilds() != kObjects)
        state.SkipWithError("the point must lie on no object of the 2,000");
    for (auto _ : state)
        benchmark::DoNotOptimize(bench.scene->GetObjectAt(kPoint, &bench.masks));
    state.SetItemsProcessed(state.iterations() * kObjects);
}
BENCHMARK(BM_HitTestMiss)->Unit(benchmark::kMicrosecond);

BENCHMARK_MAIN();
