// A scene of 2,000 image objects in 50 groups: one frame drawn into a backend that discards
// vertices, and a hit test whose point lies on no object, through all of them (half of
// them cover the point with a transparent hole, so their pixel is asked of the alpha-mask
// store). A level of 10 scenes and 2,000 objects built from the quest block; a frame of the
// demo's scheduler with 1,000 live script threads that each wait one frame. One click from
// the widget manager through a window and a scene widget to a started script: the walk
// passes every object of the scene to the area at the back.
#include "NullBackend.h"
#include "core/TexturesAlpha.h"
#include "core/TexturesAlphaWriter.h"
#include "graphics/Image.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "core/Settings.h"
#include "core/TextureManager.h"
#include "core/TimeManager.h"
#include "gui/WidgetManager.h"
#include "gui/Window.h"
#include "quest/Area.h"
#include "quest/SceneWidget.h"
#include "lua/Lua.h"
#include "lua/LuaBinding.h"
#include "lua/mluabind/StdBinding.h"
#include "quest/ImageObject.h"
#include "quest/Level.h"
#include "quest/LuaThreadManager.h"
#include "quest/QuestBinding.h"
#include "quest/QuestData.h"
#include "quest/Scene.h"
#include "quest/SceneGroup.h"

#include <benchmark/benchmark.h>

#include <cstdio>
#include <fstream>
#include <sstream>
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

namespace {

// 10 scenes of 200 objects: 180 images, then 5 groups of 4 states. Five other levels come
// first, so that the search steps over them.
std::string LevelXml()
{
    std::string xml = "<?xml version='1.0'?><Quest>";
    for (int l = 0; l < 5; ++l)
        xml += "<level id='other" + std::to_string(l) + "'><scene id='s'/></level>";
    xml += "<level id='big' s1='check()' s2='intro()'>";
    auto image = [](int n) {
        return "<object type='image' id='o" + std::to_string(n) + "' object_flags='0' hint='$10" + std::to_string(n % 10) +
               "' s1='take(self) do return end' offset='" + std::to_string(n % 1000) + " 300' angle='0' size='64 64' "
               "color='-1' image_id='" + TextureId(n % kTextures) + "'/>";
    };
    int n = 0;
    for (int sc = 0; sc < 10; ++sc) {
        xml += "<scene id='scene" + std::to_string(sc) + "' size='1024 768' flags='1'><objects>";
        for (int i = 0; i < 180; ++i)
            xml += image(n++);
        for (int g = 0; g < 5; ++g) {
            xml += "<group id='g" + std::to_string(n++) + "' s1='self.SetCurrentByNumber(2)'>";
            for (int i = 0; i < 3; ++i)
                xml += image(n++);
            xml += "</group>";
        }
        xml += "</objects><areas><area id='a" + std::to_string(sc) + "'><point offset='0 0'/><point offset='9 0'/>"
               "<point offset='9 9'/></area></areas></scene>";
    }
    return xml + "</level></Quest>";
}

} // namespace

static void BM_CreateLevel(benchmark::State& state)
{
    ox::graphics::CSurface surface {kTextureSize, kTextureSize};
    ox::graphics::CTexture texture {&surface};
    ox::graphics::CImage::SetTextureLookup([&](const char*) { return &texture; });
    const std::string xml = LevelXml();
    ox::core::CSettings settings;
    settings.LoadXmlFromMemory(xml.data(), xml.size(), "bench.xml");
    CQuestData data;
    data.SetBlock(dump::Compile(settings.GetChild("Quest"), "bench.xml"));
    size_t objects = 0;
    for (auto _ : state) {
        LevelPtrT level(data.CreateLevel("big"));
        objects = 0;
        for (const ScenePtrT& scene : level->Scenes())
            objects += scene->EnumChilds() + scene->EnumObjects() - 180;
        benchmark::DoNotOptimize(level.get());
    }
    ox::graphics::CImage::SetTextureLookup(nullptr);
    if (objects != 2000)
        state.SkipWithError("the level must hold 2,000 objects (1,950 pictures and 50 groups)");
    state.counters["block KiB"] = static_cast<double>(data.GetSize()) / 1024.0;
}
BENCHMARK(BM_CreateLevel)->Unit(benchmark::kMillisecond);

namespace {

// The level's vocabulary and the demo's scheduler in a host.
void BindLevelHost(ox::lua::CLua& lua)
{
    BindFramework(lua);
    BindMissingGeometry(lua);
    lua.BeginBinding();
    lua.Bind(BindQuestClasses());
    lua.EndBinding();
    std::ifstream file(std::string(OX_DEMO_GAME) + "/scripts/game_engine/quest.lua");
    std::stringstream scheduler;
    scheduler << file.rdbuf();
    lua.Run(scheduler.str());
}

} // namespace

static void BM_ManageThreads(benchmark::State& state)
{
    ox::core::CTimeManager time;
    ox::core::CGroupTimer* clock = time.AttachGroupTimer("bench_level", nullptr);
    ox::lua::CLua lua("bench_threads", false);
    BindLevelHost(lua);
    CLuaThreadManager& manager = g_LuaThreadManager::Instance();
    manager.SetLua(lua);
    manager.SetTimer(clock);
    lua.Run("resumes = 0 function waiter(self) while true do resumes = resumes + 1 wait(0) end end "
            "for i = 1, 1000 do CreateScript('waiter', nil) end");
    unsigned now = 0;
    for (auto _ : state) {
        clock->SetTime(now += 20);
        manager.ManageThreads();
    }
    lua_State* L = lua.GetLuaState();
    lua_getglobal(L, "resumes");
    const double resumes = lua_tonumber(L, -1);
    lua_pop(L, 1);
    manager.Clear();
    manager.SetTimer(nullptr);
    if (resumes != 1000.0 * (static_cast<double>(state.iterations()) + 1))
        state.SkipWithError("every thread must be resumed once a frame");
    state.SetItemsProcessed(state.iterations() * 1000);
}
BENCHMARK(BM_ManageThreads)->Unit(benchmark::kMicrosecond);

static void BM_ClickRoad(benchmark::State& state)
{
    SceneBench bench;
    // The scene widget asks the texture manager's masks, which keep using the bytes in place.
    static std::vector<uint8_t> masks;
    masks = bench.maskBytes;
    ox::core::CTextureManager::Instance().GetTexturesAlpha().LoadFromMemory(masks.data(), masks.size());
    bench.scene->SetSize({1024, 768});
    AreaPtrT area(new CArea());
    area->SetId("target");
    for (FloatVector p : {FloatVector(500, 370), FloatVector(530, 370), FloatVector(530, 400), FloatVector(500, 400)})
        area->InsertPoint(AreaPointPtrT(new CAreaPoint(p)), area->Points().empty() ? nullptr : area->Points().back().get());
    area->SetLuaScript("clicks = clicks + 1 quest.SetModifyFlag(true)", CBaseSceneObject::ScriptMouseClick);
    bench.scene->InsertArea(area, nullptr);

    ox::core::CTimeManager time;
    ox::lua::CLua lua("qe_level", false);
    BindLevelHost(lua);
    lua.Run("clicks = 0 function quest.SetModifyFlag(f) modified = f end function quest.GetModifyFlag() return modified end "
            "function quest.SetClickPos(p) end function wrong_click(p) end function clear_cursor() end");
    CLuaThreadManager& manager = g_LuaThreadManager::Instance();
    manager.SetLua(lua);
    manager.SetTimer(time.AttachGroupTimer("bench_clicks", nullptr));

    ox::gui::CWidgetManager widgets;
    ox::gui::WindowPtrT window(new ox::gui::CWindow("bench"));
    window->SetSize(1024, 768);
    SceneWidgetPtrT sceneWidget(new CSceneWidget());
    sceneWidget->SetScene(bench.scene.get());
    window->AddWidget(sceneWidget);
    widgets.SetMainWindow(window);
    widgets.Update();
    const ox::misc::IntVector at(static_cast<int>(kPoint.X), static_cast<int>(kPoint.Y));
    for (auto _ : state) {
        widgets.OnMouseDown(at, ox::gui::LeftButton, 0);
        manager.ManageThreads();
    }
    lua_State* L = lua.GetLuaState();
    lua_getglobal(L, "clicks");
    const double clicks = lua_tonumber(L, -1);
    lua_pop(L, 1);
    manager.Clear();
    manager.SetTimer(nullptr);
    CSceneWidget::ClearScriptCache();
    if (clicks != static_cast<double>(state.iterations()))
        state.SkipWithError("every click must start the area's script once");
    state.SetItemsProcessed(state.iterations() * kObjects);
}
BENCHMARK(BM_ClickRoad)->Unit(benchmark::kMicrosecond);

BENCHMARK_MAIN();
