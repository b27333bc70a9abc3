// Particle systems and paths: a frame of many full systems stepped and drawn into a backend
// that discards the vertices, and a point by coefficient on a long path.
#include "NullBackend.h"
#include "core/TimeManager.h"
#include "graphics/ParticleSystem.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "misc/animation/Path.h"

#include <benchmark/benchmark.h>

#include <cmath>
#include <memory>
#include <vector>

using ox::graphics::CParticleSystem;

namespace {

// An endless fountain that keeps 512 particles alive: they live a second, turn and grow,
// fall and feel the wind.
ox::core::ParticleDesc Fountain()
{
    ox::core::ParticleDesc d;
    d.id = "fountain";
    d.tex_id = "dot";
    d.emission = 2000;
    d.life_time_min = d.life_time_max = 1000;
    d.max_life_particles = 512;
    d.flags = ox::core::ParticleEndless | ox::core::ParticleWind | ox::core::ParticleAdditive;
    d.spread = 1;
    d.start_speed_min = 50;
    d.start_speed_max = 120;
    d.grav_min = d.grav_max = 60;
    d.wind_min = d.wind_max = 10;
    d.rad_acc_min = d.rad_acc_max = 5;
    d.emiter_size = {40, 10};
    d.spin = {0, 1, 2, 0.5f, 0.1f};
    d.size = {0.5f, 1, 1.5f, 0.5f, 0.1f};
    d.end_color = ox::graphics::Color(0x00FF8000u);
    return d;
}

} // namespace

// 100 systems of 512 live particles each, stepped by 20 ms and drawn. One item is one particle.
static void BM_ParticleStepDraw(benchmark::State& state)
{
    constexpr int kSystems = 100;
    auto now = std::make_shared<double>(0.0);
    ox::core::CTimeManager time {[now] { return *now; }};
    ox::core::CTimerWrapper timer {time.AttachTimer(time.GetRoot())};
    auto* backend = new oxbench::NullBackend();
    ox::graphics::CRenderer renderer {std::unique_ptr<oxbench::NullBackend>(backend)};
    renderer.SetSourceResolution(1024, 768);
    renderer.InitWindow(true, true, 1920, 1080);
    ox::graphics::CSurface surface {16, 16};
    ox::graphics::CTexture texture {&surface};
    CParticleSystem::SetTextureLookup([&](const char*) { return &texture; });
    std::vector<CParticleSystem> systems(kSystems);
    for (int i = 0; i < kSystems; ++i) {
        systems[i].LoadDesc(Fountain());
        systems[i].SetTimer(timer.Get());
        systems[i].SetLocation(static_cast<float>(50 + i % 10 * 90), static_cast<float>(100 + i / 10 * 60));
        systems[i].AdvanceTime(1500, 20);
    }
    long long live = 0;
    for (auto _ : state) {
        *now += 20;
        time.Update();
        renderer.BeginScene();
        for (CParticleSystem& system : systems) {
            system.Update();
            system.Render(&renderer);
            live += system.GetLifeParticlesCount();
        }
        renderer.EndScene();
    }
    CParticleSystem::SetTextureLookup(nullptr);
    state.SetItemsProcessed(live);
    state.counters["particles/frame"] = static_cast<double>(live) / static_cast<double>(state.iterations());
    state.counters["vertices/frame"] =
        static_cast<double>(backend->vertices) / static_cast<double>(state.iterations());
}
BENCHMARK(BM_ParticleStepDraw)->Unit(benchmark::kMillisecond);

// A point at a coefficient on an open path of 20 curved segments.
static void BM_PathPoint(benchmark::State& state)
{
    ox::misc::anim::CPath path;
    path.SetClosed(false);
    path.SetLocation({{0, 0}, ox::misc::RectToPoly4({0, 0, 1000, 500}), 0.3f});
    for (int i = 0; i <= 20; ++i) {
        const float x = i / 20.0f, y = 0.5f + 0.4f * std::sin(i * 1.3f);
        path.AddPoint({{std::min(x + 0.02f, 1.0f), y}, {std::max(x - 0.02f, 0.0f), y}, {x, y}});
    }
    float k = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(path.GetPosByCoef(k));
        k += 0.0137f;
        if (k > 1)
            k -= 1;
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_PathPoint);

BENCHMARK_MAIN();
