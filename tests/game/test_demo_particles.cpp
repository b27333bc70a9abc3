// The demo's clip as the game runs it: the spark follows its oval path and leaves sparkles,
// the embers rise, and both are drawn.
#include "core/ParticlesLoader.h"
#include "core/TimeManager.h"
#include "graphics/Texture.h"
#include "misc/GamePack.h"
#include "misc/animation/Clip.h"
#include "misc/animation/ClipObjects.h"
#include "misc/animation/ClipServices.h"
#include "misc/animation/ClipsLoader.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <cmath>
#include <cstring>

using namespace ox::misc::anim;

TEST(DemoParticles, TheSparkRidesItsPathAndBothSystemsDraw)
{
    oxtest::RecordingBackend* backend = nullptr;
    auto renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    ox::graphics::CSurface surface {96, 96};
    ox::graphics::CTexture texture {&surface};
    oxtest::FakeClock clock;
    ox::core::CTimeManager time {clock.Source()};
    GetClipServices().time = &time;
    ox::graphics::CParticleSystem::SetTextureLookup([&](const char* id) {
        return strcmp(id, "demo_disc") == 0 ? &texture : nullptr;
    });
    const std::string dump = oxtest::ReadFile(std::string(OX_DEMO_GAME) + "/properties/particles.bindump");
    std::vector<uint32_t> words(dump.size() / 4);
    memcpy(words.data(), dump.data(), dump.size());
    ox::core::CParticlesLoader& particles = ox::core::CParticlesLoader::Instance();
    ASSERT_TRUE(particles.LoadFromMemory(words.data(), dump.size(), "demo"));

    ox::misc::GamePackConfig config;
    config.folder = OX_DEMO_GAME;
    config.language = "";
    ox::misc::CGamePack pack(config);
    CClipsLoader clips(&pack);
    ASSERT_TRUE(clips.Load());
    CClip show;
    ASSERT_TRUE(show.Load(clips, "demo_show"));
    auto* spark = dynamic_cast<CParticleObject*>(show.FindObject("spark"));
    auto* embers = dynamic_cast<CParticleObject*>(show.FindObject("embers"));
    ASSERT_NE(spark, nullptr);
    ASSERT_NE(embers, nullptr);
    ASSERT_NE(spark->GetPath(), nullptr);
    for (int i = 0; i < 75; ++i) {
        clock.Advance(20);
        time.Update();
        show.Update();
    }
    // 1.5 s of 6: a quarter of the way round, at the right end of the oval.
    EXPECT_NEAR(spark->GetPos().X, 320, 4.0);
    EXPECT_NEAR(spark->GetPos().Y, 100, 4.0);
    EXPECT_GT(spark->GetSystem().GetLifeParticlesCount(), 20);
    EXPECT_GT(embers->GetSystem().GetLifeParticlesCount(), 5);
    ASSERT_TRUE(renderer->BeginScene());
    show.Draw(renderer.get());
    renderer->Flush();
    size_t vertices = 0;
    for (const auto& draw : backend->draws)
        vertices += draw.vertices.size();
    EXPECT_GT(vertices, 6u * 25);

    show.Clear();
    particles.LoadRecords({});
    ox::graphics::CParticleSystem::SetTextureLookup(nullptr);
    GetClipServices() = ClipServices();
}
