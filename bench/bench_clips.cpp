// Running clips: a frame of many clips advanced and drawn into a backend that discards the
// vertices, and the lookup of a clip by id among many.
#include "NullBackend.h"
#include "core/TimeManager.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "misc/animation/Clip.h"
#include "misc/animation/ClipServices.h"
#include "misc/animation/ClipsLoader.h"

#include <benchmark/benchmark.h>

#include <memory>
#include <string>
#include <vector>

using namespace ox::misc::anim;

namespace {

// A clip of `objects` looping images that move, turn and fade over three keys, inside the
// clip's rectangle whatever their turn.
std::string ClipXml(const std::string& id, int objects)
{
    std::string xml = "<Clip id=\"" + id + "\" w=\"100\" h=\"100\">";
    for (int i = 0; i < objects; ++i) {
        const std::string x = std::to_string(15 + 8 * i);
        xml += "<image id=\"o" + std::to_string(i) + "\" i_id=\"tex\" vis=\"true\" at=\"1\">"
               "<kp t=\"0\" itpl=\"true\" p=\"" + x + ",20\" py=\"-8 -8 8 -8 8 8 -8 8\" c=\"0xFFFFFFFF\"/>"
               "<kp t=\"" + std::to_string(400 + 10 * i) + "\" itpl=\"true\" p=\"" + x + ",80\" a=\"1.5\" "
               "py=\"-8 -8 8 -8 8 8 -8 8\" c=\"0x80FF8040\"/>"
               "<kp t=\"" + std::to_string(900 + 20 * i) + "\" itpl=\"true\" p=\"" + x + ",20\" a=\"3\" "
               "py=\"-8 -8 8 -8 8 8 -8 8\" c=\"0xFFFFFFFF\"/></image>";
    }
    return xml + "</Clip>";
}

bool Declare(CClipsLoader& loader, const std::vector<std::string>& ids, int objects)
{
    std::string xml = "<?xml version=\"1.0\"?><clips>";
    for (const std::string& id : ids)
        xml += ClipXml(id, objects);
    xml += "</clips>";
    ClipRecords records;
    return ConvertClipsXml(xml.data(), xml.size(), "bench", records) && loader.LoadRecords(records);
}

std::string IdOf(int i) { return "clip_" + std::to_string(i * 7919 % 100003); }

} // namespace

// 1,000 running clips of 10 image objects each, every object between two keys, on a clock
// of 20 ms frames, and a renderer into a backend that discards the vertices.
struct Frames {
    static constexpr int kClips = 1000, kObjects = 10;
    std::shared_ptr<double> now = std::make_shared<double>(0.0);
    ox::core::CTimeManager time {[now = now] { return *now; }};
    oxbench::NullBackend* backend = new oxbench::NullBackend();
    ox::graphics::CRenderer renderer {std::unique_ptr<oxbench::NullBackend>(backend)};
    ox::graphics::CSurface surface {64, 64};
    ox::graphics::CTexture texture {&surface};
    CClipsLoader loader;
    std::vector<CClip> clips;

    bool Start()
    {
        renderer.SetSourceResolution(1024, 768);
        renderer.InitWindow(true, true, 1920, 1080);
        ClipServices& services = GetClipServices();
        services.time = &time;
        services.textures = [this](const char*) { return &texture; };
        if (!Declare(loader, {"walker"}, kObjects))
            return false;
        clips.resize(kClips);
        for (int i = 0; i < kClips; ++i) {
            clips[i].Load(loader, "walker");
            clips[i].SetPos({static_cast<float>(50 + i % 32 * 30), static_cast<float>(50 + i / 32 * 20)});
            clips[i].SetTime(i * 13 % 900);
        }
        return true;
    }
    void Tick()
    {
        *now += 20;
        time.Update();
    }
    ~Frames()
    {
        clips.clear();
        GetClipServices() = ClipServices();
    }
};

// One frame advanced and drawn. One item is one object.
static void BM_ClipUpdateDraw(benchmark::State& state)
{
    Frames frames;
    if (!frames.Start()) {
        state.SkipWithError("the clip does not load");
        return;
    }
    for (auto _ : state) {
        frames.Tick();
        frames.renderer.BeginScene();
        for (CClip& clip : frames.clips) {
            clip.Update();
            clip.Draw(&frames.renderer);
        }
        frames.renderer.EndScene();
    }
    state.SetItemsProcessed(state.iterations() * Frames::kClips * Frames::kObjects);
    state.counters["vertices/frame"] =
        static_cast<double>(frames.backend->vertices) / static_cast<double>(state.iterations());
}
BENCHMARK(BM_ClipUpdateDraw)->Unit(benchmark::kMillisecond);

// The same frame advanced only: the time lines' share.
static void BM_ClipUpdate(benchmark::State& state)
{
    Frames frames;
    if (!frames.Start()) {
        state.SkipWithError("the clip does not load");
        return;
    }
    for (auto _ : state) {
        frames.Tick();
        for (CClip& clip : frames.clips)
            clip.Update();
    }
    state.SetItemsProcessed(state.iterations() * Frames::kClips * Frames::kObjects);
}
BENCHMARK(BM_ClipUpdate)->Unit(benchmark::kMillisecond);

// The lookup of a clip by id among 5,000 (a binary search of the table).
static void BM_ClipLookup(benchmark::State& state)
{
    constexpr int kClips = 5000;
    std::vector<std::string> ids;
    for (int i = 0; i < kClips; ++i)
        ids.push_back(IdOf(i));
    CClipsLoader loader;
    if (!Declare(loader, ids, 1)) {
        state.SkipWithError("the clips do not load");
        return;
    }
    size_t i = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(loader.FindClip(ids[i].c_str()));
        i = (i + 2477) % ids.size();
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_ClipLookup);

BENCHMARK_MAIN();
