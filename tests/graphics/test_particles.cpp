// Particle systems: the shared generator, the cap on live particles, emission over time on a
// fake clock, the motion of one particle, drawing on the recording backend, the table's
// layout against hand-written bytes, and records or dumps a game maker can get wrong.
#include "core/ParticlesLoader.h"
#include "core/TimeManager.h"
#include "graphics/ParticleSystem.h"
#include "graphics/Texture.h"
#include "misc/GamePack.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <cmath>
#include <filesystem>
#include <cstring>

using namespace ox::graphics;
using ox::core::CParticlesLoader;
using ox::core::ParticleDesc;

namespace {

ParticleDesc Record(float emission, float lifeMax, float systemLife, uint32_t flags, int cap = 512)
{
    ParticleDesc d;
    d.id = "test";
    d.emission = emission;
    d.life_time_max = d.life_time_min = lifeMax;
    d.system_life_time = systemLife;
    d.flags = flags;
    d.max_life_particles = cap;
    d.size = {1, 1, 1, 0, 0};
    return d;
}

std::vector<ParticleDesc> Convert(const std::string& body)
{
    const std::string xml = "<?xml version=\"1.0\"?><particles>" + body + "</particles>";
    std::vector<ParticleDesc> records;
    EXPECT_TRUE(ox::core::ConvertParticlesXml(xml.data(), xml.size(), "test.xml", records));
    return records;
}

struct ParticleClock : ::testing::Test {
    oxtest::FakeClock clock;
    ox::core::CTimeManager time {clock.Source()};
    ox::core::CTimerWrapper timer {time.AttachTimer(time.GetRoot())};

    void SetUp() override
    {
        CParticleSystem::SetRandomSeed(7);
        // The first update of a clock only starts it.
        clock.Advance(20);
        time.Update();
    }
    // Frames of `ms`, the system updated after each; the live count after each frame.
    std::vector<int> Run(CParticleSystem& system, int frames, int ms)
    {
        system.SetTimer(timer.Get());
        std::vector<int> counts;
        for (int i = 0; i < frames; ++i) {
            clock.Advance(ms);
            time.Update();
            system.Update();
            counts.push_back(system.GetLifeParticlesCount());
        }
        return counts;
    }
};

} // namespace

TEST(ParticleRandom, OneGeneratorFromSeedSeven)
{
    CParticleSystem::SetRandomSeed(7);
    for (float expected : {0.0000305185f, 0.92077395f, 0.28922391f, 0.08941923f, 0.14404737f})
        EXPECT_NEAR(CParticleSystem::Random(), expected, 1e-7);
    EXPECT_NEAR(CParticleSystem::Random(10, 20), 10 + 10 * (((7u * 16807u * 16807u * 16807u * 16807u * 16807u * 16807u) >> 16) & 0x7FFF) / 32767.0f, 1e-4);
}

TEST(ParticleCap, SizedByRateAndLifeAtMost512)
{
    struct Case {
        ParticleDesc desc;
        int cap;
    } cases[] = {
        {Record(12.7f, 1000, 5000, ox::core::ParticleBurst, 600), 12},
        {Record(100, 1000, 2000, 0, 600), 150},                                // 1.5 s of life
        {Record(100, 3000, 2000, 0, 600), 300},                                // the system's life is shorter
        {Record(100, 3000, 2000, ox::core::ParticleEndless, 600), 450},         // endless: the particle's life
        {Record(100, 1000, 2000, 0, 100), 100},                                // the file's cap
        {Record(100, 1000, 2000, 0, 0), 0},                                    // 0 stays 0
        {Record(100, 1000, 2000, 0, -1), 512},                                 // outside 0..512
        {Record(1e9f, 100000, 100000, ox::core::ParticleEndless, 100000), 512},
    };
    for (const Case& c : cases) {
        CParticleSystem system;
        ASSERT_TRUE(system.LoadDesc(c.desc));
        EXPECT_EQ(system.GetCapacity(), c.cap) << c.desc.emission << " " << c.desc.max_life_particles;
    }
    CParticleSystem raised;
    raised.LoadDesc(Record(100, 1000, 2000, 0, 600));
    raised.SetEmission(200);
    EXPECT_EQ(raised.GetCapacity(), 300);
    raised.SetEmission(10);
    EXPECT_EQ(raised.GetCapacity(), 300) << "only raised";
    raised.SetEmission(1e9f);
    EXPECT_EQ(raised.GetCapacity(), 512);
    CParticleSystem fixed;
    fixed.LoadDesc(Record(100, 1000, 2000, 0, 100));
    fixed.SetEmission(1000);
    EXPECT_EQ(fixed.GetCapacity(), 100) << "a cap from the file stays";
    fixed.SetEmission(-5);
    EXPECT_EQ(fixed.GetEmission(), 0.0f);
}

TEST_F(ParticleClock, EmissionFollowsTheClock)
{
    CParticleSystem steady;
    ASSERT_TRUE(steady.LoadDesc(Record(25, 10000, 0, ox::core::ParticleEndless)));
    EXPECT_EQ(Run(steady, 6, 20), (std::vector<int> {0, 1, 1, 2, 2, 3})) << "one every 40 ms";

    CParticleSystem burst;
    ASSERT_TRUE(burst.LoadDesc(Record(12.7f, 10000, 0, ox::core::ParticleBurst)));
    EXPECT_EQ(Run(burst, 3, 20), (std::vector<int> {12, 12, 12}));
    burst.Reset();
    EXPECT_EQ(burst.GetLifeParticlesCount(), 0);
    EXPECT_EQ(Run(burst, 1, 20), (std::vector<int> {12})) << "again after Reset";

    // No rate: nothing is saved up for later.
    CParticleSystem idle;
    ASSERT_TRUE(idle.LoadDesc(Record(0, 10000, 0, ox::core::ParticleEndless, 100)));
    Run(idle, 50, 20);
    idle.SetEmission(25);
    EXPECT_EQ(Run(idle, 2, 20), (std::vector<int> {0, 1}));

    // A system of limited life stops emitting, then dies with its last particle.
    CParticleSystem brief;
    ASSERT_TRUE(brief.LoadDesc(Record(50, 100, 100, 0)));
    Run(brief, 5, 20);
    EXPECT_FALSE(brief.IsDead());
    Run(brief, 10, 20);
    EXPECT_EQ(brief.GetLifeParticlesCount(), 0);
    EXPECT_TRUE(brief.IsDead());
}

TEST_F(ParticleClock, NeverMoreLiveParticlesThanTheCap)
{
    CParticleSystem flood;
    ASSERT_TRUE(flood.LoadDesc(Record(100000, 5000, 0, ox::core::ParticleEndless, 100000)));
    ASSERT_EQ(flood.GetCapacity(), 512);
    for (int count : Run(flood, 30, 40))
        EXPECT_LE(count, 512);
    EXPECT_EQ(flood.GetLifeParticlesCount(), 512);
}

TEST(ParticleMotion, GravityWindAndSize)
{
    // One particle at rest at the origin, pulled down by 100 units/s².
    ParticleDesc d = Record(1, 60000, 0, ox::core::ParticleBurst);
    d.grav_min = d.grav_max = 100;
    d.size = {2, 2, 2, 0, 0};
    for (auto [flags, y] : {std::pair {0u, 100.0f}, {unsigned(ox::core::ParticleGravityBySize), 200.0f},
                            {unsigned(ox::core::ParticleGravityBySize | ox::core::ParticleGravityDivide), 50.0f}}) {
        ParticleDesc g = d;
        g.flags |= flags;
        CParticleSystem system;
        ASSERT_TRUE(system.LoadDesc(g));
        system.Emit(0);
        ASSERT_EQ(system.GetLifeParticlesCount(), 1);
        system.Step(1000);
        EXPECT_NEAR(system.GetParticles()[0].Pos.Y, y, 1e-3) << flags;
        EXPECT_NEAR(system.GetParticles()[0].Pos.X, 0, 1e-3);
    }
    // Wind blows along its direction; without the flag it is not drawn at all.
    ParticleDesc w = Record(1, 60000, 0, ox::core::ParticleBurst | ox::core::ParticleWind);
    w.wind_min = w.wind_max = 10;
    w.wind_direction = 0;
    CParticleSystem windy;
    ASSERT_TRUE(windy.LoadDesc(w));
    windy.Emit(0);
    windy.Step(1000);
    EXPECT_NEAR(windy.GetParticles()[0].Pos.X, 10, 1e-3);
    // Moved with the emitter only when the record says so; a jump after DropOldPos does not smear.
    w.flags |= ox::core::ParticleMoveWithEmitter;
    CParticleSystem carried;
    ASSERT_TRUE(carried.LoadDesc(w));
    carried.Emit(0);
    carried.SetLocation(50, 0);
    EXPECT_NEAR(carried.GetParticles()[0].Pos.X, 50, 1e-3);
}

TEST(ParticleRender, QuadsOnTheDevice)
{
    oxtest::RecordingBackend* backend = nullptr;
    auto renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    CSurface surface {8, 4};
    CTexture texture {&surface};
    CParticleSystem::SetTextureLookup([&](const char* id) { return strcmp(id, "dot") == 0 ? &texture : nullptr; });
    ParticleDesc d = Record(3, 60000, 0, ox::core::ParticleBurst | ox::core::ParticleAdditive);
    d.pos = {100, 50};
    d.tex_id = "dot";
    d.start_color = d.mid_color = d.end_color = Color(0x80FF0000u);
    d.base_var_color = Color(0u);
    CParticleSystem system;
    ASSERT_TRUE(system.LoadDesc(d));
    system.Emit(0);
    ASSERT_EQ(system.GetLifeParticlesCount(), 3);
    ASSERT_TRUE(renderer->BeginScene());
    system.Render(renderer.get());
    renderer->Flush();
    ASSERT_EQ(backend->draws.size(), 1u) << "one batch";
    const auto& v = backend->draws[0].vertices;
    ASSERT_EQ(v.size(), 18u);
    EXPECT_EQ(v[0].x, 96.0f) << "no half-pixel shift";
    EXPECT_EQ(v[0].y, 48.0f);
    EXPECT_EQ(v[5].x, 104.0f);
    EXPECT_EQ(v[5].y, 52.0f);
    EXPECT_EQ(v[0].diffuse, 0x80FF0000u);
    EXPECT_EQ(backend->draws[0].destBlend, BlendFactorOne) << "additive";

    // Particles emitted past their own life within a step still draw the end colour, not beyond it.
    ParticleDesc late = Record(1000, 1000, 0, ox::core::ParticleBurst);
    late.life_time_min = 0;
    late.tex_id = "dot";
    late.start_color = late.mid_color = Color(0u);
    late.end_color = Color(0xFFFFFFFFu);
    late.base_var_color = Color(0u);
    CParticleSystem fading;
    ASSERT_TRUE(fading.LoadDesc(late));
    fading.Emit(1000);
    backend->draws.clear();
    fading.Render(renderer.get());
    renderer->Flush();
    ASSERT_FALSE(backend->draws.empty());
    for (const auto& draw : backend->draws)
        for (const auto& vertex : draw.vertices) {
            const uint32_t grey = vertex.diffuse & 0xFF;
            ASSERT_EQ(vertex.diffuse, grey * 0x01010101u) << std::hex << vertex.diffuse;
        }

    // A record naming a texture that is not there: logged, runs, draws nothing.
    oxtest::LogCapture log;
    d.tex_id = "gone";
    CParticleSystem blind;
    ASSERT_TRUE(blind.LoadDesc(d));
    EXPECT_TRUE(log.Contains("texture not found: gone"));
    blind.Emit(0);
    backend->draws.clear();
    blind.Render(renderer.get());
    renderer->Flush();
    EXPECT_TRUE(backend->draws.empty());
    CParticleSystem::SetTextureLookup(nullptr);
}

TEST(ParticleTable, LayoutOfTheDump)
{
    const auto records = Convert(R"(<particle id="spark" pos="1.5 2" direction="0.25" flags="4096"
        emission="12" max_life_particles="40" size="1 2 3 4 5" start_color="4278255360" tex_id="star"/>
        <group><particle id="ash" grav_max="9"/></group>)");
    ASSERT_EQ(records.size(), 2u);
    const std::vector<uint32_t> words = ox::core::BuildParticlesDump(records);
    const auto* bytes = reinterpret_cast<const uint8_t*>(words.data());
    ASSERT_EQ(words.size() * 4, 8 + 2 * 384u);
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(bytes), 3), "PAR");
    EXPECT_EQ(bytes[3], 1);
    EXPECT_EQ(words[1], 2u);
    auto f32 = [&](size_t at) { float f; memcpy(&f, bytes + at, 4); return f; };
    auto u32 = [&](size_t at) { uint32_t u; memcpy(&u, bytes + at, 4); return u; };
    auto i16 = [&](size_t at) { int16_t i; memcpy(&i, bytes + at, 2); return i; };
    const size_t ash = 8, spark = 8 + 384;  // sorted by id
    EXPECT_STREQ(reinterpret_cast<const char*>(bytes + ash + 8), "ash");
    EXPECT_EQ(f32(ash + 136), 9.0f);
    EXPECT_STREQ(reinterpret_cast<const char*>(bytes + spark + 8), "spark");
    EXPECT_EQ(f32(spark + 96), 1.5f);
    EXPECT_EQ(f32(spark + 100), 2.0f);
    EXPECT_EQ(f32(spark + 104), 0.25f);
    EXPECT_EQ(u32(spark + 160), 40u);
    EXPECT_EQ(f32(spark + 164), 12.0f);
    EXPECT_EQ(f32(spark + 168), 0.0001f);
    EXPECT_EQ(u32(spark + 176), 4096u);
    EXPECT_EQ(f32(spark + 220), 1.0f);
    EXPECT_EQ(f32(spark + 236), 5.0f);
    EXPECT_EQ(i16(spark + 240), 0) << "red of 0xFF00FF00";
    EXPECT_EQ(i16(spark + 242), 255);
    EXPECT_EQ(i16(spark + 246), 255) << "alpha";
    EXPECT_EQ(i16(spark + 248), 255) << "white by default";
    EXPECT_STREQ(reinterpret_cast<const char*>(bytes + spark + 288 + 8), "star");

    CParticlesLoader loader;
    ASSERT_TRUE(loader.LoadFromMemory(words.data(), words.size() * 4, "hand"));
    ASSERT_NE(loader.Find("spark"), nullptr);
    EXPECT_EQ(loader.Find("spark")->emission, 12.0f);
    EXPECT_EQ(loader.Find("none"), nullptr);
}

TEST(ParticleTable, BadDumpsAndRecordsAreRefused)
{
    oxtest::TempDir dir;
    oxtest::MessageCapture boxes;
    oxtest::LogCapture log;
    std::vector<uint32_t> words = ox::core::BuildParticlesDump(Convert(R"(<particle id="a"/>)"));
    std::string bytes(reinterpret_cast<const char*>(words.data()), words.size() * 4);
    // Truncated: the count no longer matches the size.
    dir.Write("properties/particles.bindump", bytes.substr(0, bytes.size() - 10));
    dir.Write("properties/particle.xml", R"(<?xml version="1.0"?><p><particle id="x"/></p>)");
    ox::misc::GamePackConfig config;
    config.folder = dir.Path().string();
    config.language = "";
    ox::misc::CGamePack pack(config);
    CParticlesLoader loader(&pack);
    EXPECT_FALSE(loader.Load());
    ASSERT_EQ(boxes.Boxes().size(), 1u);
    EXPECT_NE(boxes.Boxes()[0].text.find("has wrong format version or is corrupted"), std::string::npos);
    EXPECT_EQ(loader.Find("x"), nullptr) << "the XML is not tried";
    CParticleSystem system;
    EXPECT_FALSE(system.LoadById("x"));

    // A broken string inside a dump of the right size.
    words[2] = 0xFFFF;
    EXPECT_FALSE(loader.LoadFromMemory(words.data(), words.size() * 4, "broken"));
    EXPECT_TRUE(log.Contains("'broken' is refused: record 0 holds a broken id"));

    // Unreadable and absurd numbers: logged with the record's id, never run.
    const auto records = Convert(R"(<particle id="mad" emission="lots" life_time_max="nan" emiter_size="3"/>)");
    ASSERT_EQ(records.size(), 1u);
    EXPECT_TRUE(log.Contains("particle 'mad': cannot read 'emission' from \"lots\""));
    EXPECT_TRUE(log.Contains("particle 'mad': cannot read 'emiter_size' from \"3\""));
    EXPECT_FALSE(system.LoadDesc(records[0]));
    EXPECT_TRUE(log.Contains("particle 'mad' holds a number that is not finite"));

    // An id longer than a record holds is refused, not cut.
    oxtest::AssertCapture asserts;
    const auto longId = Convert("<particle id=\"" + std::string(100, 'x') + "\" emission=\"3\"/>");
    ASSERT_EQ(longId.size(), 1u);
    EXPECT_EQ(asserts.Count(), 0u);
    EXPECT_TRUE(longId[0].id.empty());
    EXPECT_TRUE(log.Contains("particle '': cannot read 'id'"));

    // Without a dump the XML stands, and a table built from it is saved.
    std::filesystem::remove(dir / "properties/particles.bindump");
    ASSERT_TRUE(loader.Load());
    ASSERT_NE(loader.Find("x"), nullptr);
    oxtest::ScopedCwd cwd(dir.Path());
    ASSERT_TRUE(loader.Save());
    CParticlesLoader again(&pack);
    ASSERT_TRUE(again.Load());
    EXPECT_FALSE(again.IsBuiltFromXml());
    EXPECT_NE(again.Find("x"), nullptr);
}

// The fuzzer's findings kept as seeds: records of finite but extreme numbers whose particles or
// emission counts reach NaN on the way. Nothing converts a NaN to an integer (undefined; the
// sanitizer build of the tests stops there), and the systems still run and draw.
void RunDumpFinding(const std::filesystem::path& file)
{
    std::string bytes = oxtest::ReadFile(file);
    ASSERT_GE(bytes.size(), 8u + sizeof(ox::core::ParticleDesc)) << file;
    const uint32_t header[2] = {ox::core::kParticlesMagic,
                                static_cast<uint32_t>((bytes.size() - 8) / sizeof(ox::core::ParticleDesc))};
    memcpy(bytes.data(), header, sizeof header);
    bytes.resize(8 + header[1] * sizeof(ox::core::ParticleDesc));
    std::vector<uint32_t> aligned((bytes.size() + 3) / 4);
    memcpy(aligned.data(), bytes.data(), bytes.size());
    ox::core::CParticlesLoader loader;
    ASSERT_TRUE(loader.LoadFromMemory(aligned.data(), bytes.size(), "finding")) << file;

    oxtest::RecordingBackend* backend = nullptr;
    auto renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    CSurface surface {4, 4};
    CTexture texture {&surface};
    CParticleSystem::SetTextureLookup([&](const char*) { return &texture; });
    ASSERT_TRUE(renderer->BeginScene());
    ox::core::CTimeManager time {[] { return 0.0; }};
    ox::core::CTimerWrapper timer {time.AttachTimer(time.GetRoot())};
    for (uint32_t i = 0; i < loader.Count(); ++i) {
        CParticleSystem system;
        if (!system.LoadDesc(loader.Records()[i]))
            continue;
        system.SetTimer(timer.Get());
        system.AdvanceTime(1000, 20);
        system.SetLocation(10, 20);
        system.SetEmission(system.GetEmission() * 2);
        system.AdvanceTime(200, 50);
        system.Render(renderer.get());
    }
    renderer->Flush();
    CParticleSystem::SetTextureLookup(nullptr);
}

TEST(ParticleRender, ExtremeRecordsDrawOnlyNumbers)
{
    for (const char* finding : {"nan-coordinate", "nan-emission"})
        RunDumpFinding(std::filesystem::path(OX_FUZZ_CORPUS) / "fuzz_particles" / finding);
}
