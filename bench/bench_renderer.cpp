// Sprites through the renderer into the device batch, with a backend that discards what
// it is given: the cost of the renderer, the state, the clipper and the batch alone.
#include "NullBackend.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "NullBackend.h"

#include <benchmark/benchmark.h>

using namespace ox::graphics;
using ox::misc::FloatRect;
using oxbench::NullBackend;

namespace {

struct Scene {
    NullBackend* backend;
    CRenderer renderer;
    CSurface surface {64, 64};
    CTexture texture {&surface};

    Scene() : Scene(std::make_unique<NullBackend>()) {}
    explicit Scene(std::unique_ptr<NullBackend> owned) : backend(owned.get()), renderer(std::move(owned))
    {
        renderer.SetSourceResolution(1024, 768);
        renderer.InitWindow(true, true, 1920, 1080);
        renderer.BeginScene();
    }
    ~Scene() { renderer.EndScene(); }
};

} // namespace

// Unrotated, unclipped sprites from one texture: one item is one sprite.
static void BM_RenderTextureSprites(benchmark::State& state)
{
    Scene scene;
    unsigned i = 0;
    for (auto _ : state) {
        const float x = static_cast<float>(i & 511), y = static_cast<float>((i >> 9) & 511);
        scene.renderer.RenderTexture(&scene.texture, FloatRect(x, y, 32, 32));
        ++i;
    }
    scene.renderer.Flush();
    state.SetItemsProcessed(state.iterations());
    state.counters["vertices"] = static_cast<double>(scene.backend->vertices);
}
BENCHMARK(BM_RenderTextureSprites);

// The same sprites under a rectangular clip that holds them all: the clipper's fast path.
static void BM_RenderTextureInsideRectClip(benchmark::State& state)
{
    Scene scene;
    scene.renderer.SetClipPoly(ox::misc::RectToPoly4({0, 0, 1024, 768}));
    unsigned i = 0;
    for (auto _ : state) {
        const float x = static_cast<float>(i & 511), y = static_cast<float>((i >> 9) & 511);
        scene.renderer.RenderTexture(&scene.texture, FloatRect(x, y, 32, 32));
        ++i;
    }
    scene.renderer.Flush();
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_RenderTextureInsideRectClip);

// Sprites under a rotated clip polygon: every sprite goes through the polygon clipper,
// many are cut.
static void BM_RenderTextureClipped(benchmark::State& state)
{
    Scene scene;
    scene.renderer.PushMatrix();
    scene.renderer.ApplyMatrix(ox::misc::MatrixTranslation(-256, -256) * ox::misc::MatrixRotation(0.5f) *
                               ox::misc::MatrixTranslation(512, 384));
    scene.renderer.SetClipPoly(ox::misc::RectToPoly4({0, 0, 512, 512}));
    scene.renderer.PopMatrix();
    unsigned i = 0;
    for (auto _ : state) {
        const float x = static_cast<float>((i * 37) & 1023), y = static_cast<float>((i * 101) & 767);
        scene.renderer.RenderTexture(&scene.texture, FloatRect(x, y, 32, 32));
        ++i;
    }
    scene.renderer.Flush();
    state.SetItemsProcessed(state.iterations());
    state.counters["vertices/sprite"] =
        static_cast<double>(scene.backend->vertices) / static_cast<double>(state.iterations());
}
BENCHMARK(BM_RenderTextureClipped);

BENCHMARK_MAIN();
