// Declarations from XML and from the dump, and the audio manager on the recording device
// and a hand-moved clock: handles, limits, delays, volumes and groups, fades, pausing,
// lengths, the statistics, and a game without an output.
#include "lua/LuaTestHost.h"
#include "misc/GamePack.h"
#include "misc/animation/ClipAudio.h"
#include "misc/animation/ClipObjects.h"
#include "sound/AudioManager.h"
#include "sound/SoundBinding.h"
#include "support/RecordingSoundDevice.h"
#include "support/SoundFiles.h"
#include "support/TestSupport.h"

#include <cmath>

using namespace ox::sound;
using oxtest::RecordingSoundDevice;

namespace {

CAudioManager* g_ScriptManager = nullptr;

std::string Sound(const std::string& id, const std::string& file, const std::string& group, float volume, int repeat,
                  int max, float delay = -1)
{
    char text[512];
    snprintf(text, sizeof(text),
             "<sound id=\"%s\" file=\"%s\" group_template=\"%s\" balance=\"0\" volume=\"%g\" priority=\"1\" "
             "repeat=\"%d\" max_concurrent_sound_play=\"%d\" concurrent_sound_play_delay=\"%g\" speed=\"2\"/>\n",
             id.c_str(), file.c_str(), group.c_str(), volume, repeat, max, delay);
    return text;
}

const std::string kSoundsXml = "<?xml version=\"1.0\"?>\n<sounds>\n<sound_group flags=\"load_on_demand\">\n" +
                               Sound("music", "Sounds\\Music.OGG", "music", 70, -1, 1) +
                               "<sound_group flags=\"streamed\">\n" + Sound("click", "sounds/click.ogg", "sfx", 100, 1, 2) +
                               "</sound_group>\n" + Sound("tick", "sounds/click.ogg", "sfx", 100, 1, -1, 100) +
                               "</sound_group>\n" + Sound("gone", "sounds/nothere.ogg", "sfx", 100, 1, -1) +
                               Sound("click", "sounds/music.ogg", "music", 100, 1, -1) +
                               "<sound file=\"sounds/click.ogg\"/>\n<sound id=\"bare\" file=\"sounds/click.ogg\"/>\n"
                               "</sounds>\n";

struct AudioManagerTest : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::LogCapture log;
    oxtest::MessageCapture boxes;
    std::unique_ptr<ox::misc::CGamePack> pack;
    oxtest::FakeClock clock;
    ox::core::CTimeManager time {clock.Source()};
    RecordingSoundDevice* device = nullptr;
    std::unique_ptr<CAudioManager> manager;

    void SetUp() override
    {
        dir.Write("sounds/music.ogg", oxtest::AsString(oxtest::MakeToneOgg(2, 8000, 2400)));  // 300 ms
        dir.Write("sounds/click.ogg", oxtest::AsString(oxtest::MakeToneOgg(1, 8000, 800)));   // 100 ms
        dir.Write("properties/sounds.xml", kSoundsXml);
        ox::misc::GamePackConfig config;
        config.folder = dir.Path().string();
        config.language = "";
        pack = std::make_unique<ox::misc::CGamePack>(config);
        MakeManager(true);
    }
    void MakeManager(bool withOutput)
    {
        manager.reset();
        auto recording = std::make_unique<RecordingSoundDevice>();
        recording->openResult = withOutput;
        device = recording.get();
        AudioManagerConfig config;
        config.device = std::move(recording);
        config.time = &time;
        config.pack = pack.get();
        config.runThread = false;
        config.ticks = clock.Source();
        manager = std::make_unique<CAudioManager>(std::move(config));
        if (!withOutput)
            device = nullptr; // the manager dropped it for its silent device
        SoundDeclarationsLoader loader(pack.get());
        if (loader.Load())
            manager->LoadDeclarations(loader);
        Run(20); // the time manager's first frame
    }
    // One frame of 20 ms at a time: the clock, the output, the feed and the manager.
    void Run(double ms)
    {
        for (double t = 0; t < ms; t += 20) {
            clock.Advance(20);
            time.Update();
            if (device)
                device->Advance(20);
            manager->FeedSources();
            manager->Update();
        }
    }
    float Gain(CAudioManager::Handle handle)
    {
        return device->GetSource(manager->FindSound(handle)->GetSource()->GetSourceName()).gain;
    }
    SourceState State(CAudioManager::Handle handle)
    {
        return device->GetSource(manager->FindSound(handle)->GetSource()->GetSourceName()).state;
    }
};

} // namespace

TEST_F(AudioManagerTest, DeclarationsFromXmlKeepGroupFlagsAndPathsAndLeaveOutBadSounds)
{
    SoundDeclarationsLoader loader(pack.get());
    ASSERT_TRUE(loader.Load());
    ASSERT_EQ(loader.GetCount(), 6u); // the sound without an id is dropped
    const SoundRecord* r = loader.GetRecords();
    EXPECT_STREQ(r[0].file.c_str(), "sounds/music.ogg");
    EXPECT_EQ(r[0].flags, 1u);
    EXPECT_EQ(r[1].flags, 0u); // the inner group's flags
    EXPECT_EQ(r[2].flags, 1u);
    EXPECT_EQ(r[3].flags, 0u); // outside every group
    EXPECT_FLOAT_EQ(r[0].volume, 70.0f);
    EXPECT_EQ(r[0].repeat, -1);
    EXPECT_FLOAT_EQ(r[2].concurrent_sound_play_delay, 100.0f);
    EXPECT_NE(r[0].id.hash, 0);
    EXPECT_TRUE(log.Contains("a sound without an id is ignored"));
    EXPECT_TRUE(log.Contains("sound \"bare\" lacks some of its attributes"));

    EXPECT_TRUE(manager->IsSound("music"));
    EXPECT_TRUE(manager->IsSound("tick"));
    EXPECT_FALSE(manager->IsSound("gone"));
    EXPECT_TRUE(log.Contains("sound \"gone\": its file sounds/nothere.ogg is missing"));
    EXPECT_TRUE(log.Contains("sound \"click\" is declared twice"));
    EXPECT_FLOAT_EQ(manager->GetVolume("click"), 100.0f); // the first declaration
    EXPECT_EQ(manager->GetRepeatCount("music"), -1);
    EXPECT_EQ(manager->Play("gone"), 0u);
}

TEST_F(AudioManagerTest, TheSavedDumpIsUsedInPlaceBeforeTheXml)
{
    {
        oxtest::ScopedCwd cwd(dir.Path());
        SoundDeclarationsLoader fromXml(pack.get());
        ASSERT_TRUE(fromXml.Load());
        ASSERT_TRUE(fromXml.Save());
        // A dump read from the pack is not written back.
        SoundDeclarationsLoader fromDump(pack.get());
        ASSERT_TRUE(fromDump.Load());
        EXPECT_FALSE(fromDump.Save());
    }
    dir.Write("properties/sounds.xml", "<?xml version=\"1.0\"?><sounds/>");
    SoundDeclarationsLoader loader(pack.get());
    ASSERT_TRUE(loader.Load());
    EXPECT_EQ(loader.GetCount(), 6u);
    EXPECT_STREQ(loader.GetRecords()[5].id.c_str(), "bare");

    // A dump whose records do not fit, or hold a broken string, is refused by name.
    std::string dump = oxtest::ReadFile(dir / "properties/sounds.bindump");
    std::string shortDump = dump.substr(0, dump.size() - 1);
    dir.Write("properties/sounds.bindump", shortDump);
    EXPECT_FALSE(loader.Load());
    EXPECT_TRUE(log.Contains("sound declarations properties/sounds.bindump: 6 records do not fit"));
    dump[8 + 352 + 128] = 100; // the second id's length beyond its capacity
    dir.Write("properties/sounds.bindump", dump);
    EXPECT_FALSE(loader.Load());
    EXPECT_TRUE(log.Contains("record 1 holds a broken string"));
}

TEST_F(AudioManagerTest, HandlesLimitsAndDelays)
{
    EXPECT_EQ(manager->Play(""), 0u);
    EXPECT_EQ(manager->Play("nosuch"), 0u);
    EXPECT_EQ(manager->GetPlayingCount(), 0u);
    EXPECT_TRUE(log.Contains("Play: no sound \"nosuch\" is declared"));

    const auto first = manager->Play("music");
    EXPECT_EQ(first, 1u);
    EXPECT_EQ(manager->Play("music"), 0u); // at most one
    EXPECT_TRUE(manager->Stop(first, 0));
    EXPECT_TRUE(manager->IsSound(first)); // until the next update
    EXPECT_EQ(manager->Play("music"), 2u); // the refused play used no handle
    Run(20);
    EXPECT_FALSE(manager->IsSound(first));
    EXPECT_FALSE(manager->Stop(77u, 0));
    EXPECT_FALSE(manager->Stop("nosuch", 0));

    // 100 ms between starts of "tick".
    EXPECT_NE(manager->Play("tick"), 0u);
    Run(60);
    EXPECT_EQ(manager->Play("tick"), 0u);
    Run(60);
    EXPECT_NE(manager->Play("tick"), 0u);

    // A paused sound does not count under the maximum.
    manager->Stop("music", 0);
    Run(20);
    const auto paused = manager->Play("music");
    manager->Pause(paused, true);
    const auto second = manager->Play("music");
    EXPECT_NE(second, 0u);
    manager->Pause(paused, false); // it lost its place and ends
    Run(20);
    EXPECT_FALSE(manager->IsSound(paused));
    EXPECT_TRUE(manager->IsSound(second));
}

TEST_F(AudioManagerTest, VolumesOfGroupsAndTheWholeReachTheSources)
{
    CVolumeTable table;
    table.SetGroup("g", 70);
    EXPECT_EQ(table.Effective(70, "g"), 49);
    EXPECT_EQ(table.Effective(70, "unknown"), 70);
    table.SetGlobal(50);
    EXPECT_EQ(table.Effective(99, "g"), 34); // 0.5 * 0.7 * 99 = 34.65
    table.SetGlobal(250);
    EXPECT_EQ(table.GetGlobal(), 100.0f);

    const auto music = manager->Play("music");
    EXPECT_FLOAT_EQ(Gain(music), 0.70f);
    manager->SetGroupVolume("music", 70);
    EXPECT_FLOAT_EQ(Gain(music), 0.49f);
    manager->SetGlobalVolume(50);
    EXPECT_FLOAT_EQ(Gain(music), 0.24f);
    manager->SetGlobalVolume(100);

    // A group no declaration names is made, clamped, and reported once.
    manager->SetGroupVolume("voices", 140);
    EXPECT_FLOAT_EQ(manager->GetGroupVolume("voices"), 100.0f);
    EXPECT_FLOAT_EQ(manager->GetGroupVolume("nothing"), 100.0f);
    EXPECT_TRUE(log.Contains("SetGroupVolume: no sound declaration names the volume group \"voices\""));

    // Volumes of one sound and of a declaration; the declared one is the sound's maximum.
    EXPECT_TRUE(manager->SetVolume(music, 30, 0, 0));
    EXPECT_FLOAT_EQ(manager->GetVolume(music), 30.0f);
    EXPECT_FLOAT_EQ(manager->GetMaxVolume(music), 70.0f);
    EXPECT_FLOAT_EQ(Gain(music), 0.21f);
    EXPECT_TRUE(manager->SetVolume("click", 40, 0, 0));
    EXPECT_FLOAT_EQ(manager->GetVolume(manager->Play("click")), 40.0f);
    EXPECT_FALSE(manager->SetVolume("nosuch", 40, 0, 0));
    EXPECT_FLOAT_EQ(manager->GetVolume(999u), 0.0f);
}

TEST_F(AudioManagerTest, AStopFadesOutWhileAGroupStopPlaysOnAtFullVolume)
{
    const auto music = manager->Play("music");
    const auto click = manager->Play("click", -2, -2, -2, -1, -2); // looping
    ASSERT_NE(click, 0u);
    manager->Stop(music, 100);
    manager->StopGroup("sfx", 100);
    Run(40);
    EXPECT_FLOAT_EQ(Gain(music), 0.42f); // 70 less 40 % of it
    EXPECT_FLOAT_EQ(Gain(click), 1.0f);
    Run(40);
    EXPECT_FLOAT_EQ(Gain(music), 0.14f);
    EXPECT_TRUE(manager->IsSound(click));
    Run(40);
    EXPECT_FALSE(manager->IsSound(music));
    EXPECT_FALSE(manager->IsSound(click));
    EXPECT_EQ(manager->GetPool().GetRunningSourcesCount(), 0u);

    // A volume fade with a delay holds the old volume until the delay is over.
    const auto again = manager->Play("music");
    manager->SetVolume(again, 0, 100, 60);
    Run(40);
    EXPECT_FLOAT_EQ(Gain(again), 0.70f);
    Run(60);
    EXPECT_NEAR(Gain(again), 0.42f, 0.011f);
}

TEST_F(AudioManagerTest, PausingCountsAndSoundsStartedUnderItStartPaused)
{
    const auto music = manager->Play("music");
    manager->PauseAll(true);
    manager->PauseAll(true);
    EXPECT_EQ(State(music), SourceState::Paused);
    const auto click = manager->Play("click");
    ASSERT_NE(click, 0u);
    EXPECT_TRUE(manager->FindSound(click)->IsPaused());
    EXPECT_EQ(State(click), SourceState::Paused);
    manager->PauseAll(false);
    EXPECT_TRUE(manager->FindSound(click)->IsPaused());
    manager->PauseAll(false);
    EXPECT_FALSE(manager->FindSound(click)->IsPaused());
    EXPECT_EQ(State(click), SourceState::Playing);
    EXPECT_EQ(State(music), SourceState::Playing);

    // A paused game clock counts too.
    time.Pause(true);
    const auto late = manager->Play("click");
    EXPECT_TRUE(manager->FindSound(late)->IsPaused());
    time.Pause(false);
    manager->PauseAll(false);
    EXPECT_FALSE(manager->FindSound(late)->IsPaused());
}

TEST_F(AudioManagerTest, LengthsPositionsAndTheValuesOfASound)
{
    EXPECT_DOUBLE_EQ(manager->GetLength("music"), -1.0);
    const auto music = manager->Play("music", 0.5f, 60, 3, -2, 4);
    EXPECT_DOUBLE_EQ(manager->GetLength("music"), 300.0);
    EXPECT_DOUBLE_EQ(manager->GetLength(music), 300.0);
    EXPECT_FLOAT_EQ(manager->GetSpeed(music), 1.0f);
    EXPECT_FLOAT_EQ(manager->GetBalance(music), 0.5f);
    EXPECT_EQ(manager->GetPriority(music), 3);
    EXPECT_EQ(manager->GetRepeatCount(music), -1);
    // A loop reports its place in the file.
    Run(400);
    const double position = manager->GetPosition(music);
    EXPECT_GE(position, 0.0);
    EXPECT_LE(position, 300.0);
    EXPECT_NEAR(position, 100.0, 45.0);
    EXPECT_TRUE(manager->SetPosition(music, 0.2f));
    EXPECT_NEAR(manager->GetPosition(music), 200.0, 1.0);
    // Once the repeats end, what is queued plays out to the end of the file, and it stops.
    EXPECT_TRUE(manager->SetRepeatCount(music, 1));
    Run(800);
    EXPECT_FALSE(manager->IsSound(music));
}

TEST_F(AudioManagerTest, StatisticsCountPlayingSoundsEveryFiveSeconds)
{
    oxtest::ScopedCwd cwd(dir.Path());
    manager->SetStatistics(true);
    manager->Play("music");
    manager->Play("click", -2, -2, -2, -1, -2);
    manager->Play("click", -2, -2, -2, -1, -2);
    manager->Update();
    clock.Advance(5000);
    manager->Update();
    EXPECT_FALSE(oxtest::fs::exists(dir / "sound_stat_0"));
    clock.Advance(1);
    manager->Update();
    EXPECT_EQ(oxtest::ReadFile(dir / "sound_stat_0"),
              "    sounds/click.ogg 2\n    sounds/music.ogg 1\n");
}

TEST_F(AudioManagerTest, WithoutAnOutputTheGameGoesOnSilently)
{
    MakeManager(false);
    EXPECT_FALSE(manager->IsAudioAvailable());
    EXPECT_TRUE(manager->IsSound("music"));
    EXPECT_EQ(manager->Play("music"), 0u);
    manager->StopAll(0);
    manager->PauseAll(true);
    EXPECT_TRUE(manager->Update());
    ASSERT_EQ(boxes.Boxes().size(), 1u);
    EXPECT_EQ(boxes.Boxes()[0].text, "Cannot initialize audio subsystem.");
    EXPECT_TRUE(log.Contains("no audio output (recording): the game runs silently"));
}

TEST_F(AudioManagerTest, ScriptsReachSoundsByIdAndByHandle)
{
    g_ScriptManager = manager.get();
    oxtest::LuaTestHost host;
    host.Declare([] {
        return mluabind::Namespace("ox").Merge(BindAudioManager()).AddFunction(
            mluabind::Function("TestAudio", [] { return g_ScriptManager; }));
    });
    EXPECT_EQ(host.Run("local a = ox.TestAudio()\n"
                       "local h = a.Play('music', -2, 50, -2, -2, -2)\n"
                       "a.SetGroupVolume('music', 40)\n"
                       "return table.concat({h, tostring(a.IsSound(h)), tostring(a.IsSound('music')),\n"
                       "    a.GetVolume(h), a.GetVolume('music'), a.GetGroupVolume('music'), a.GetRepeatCount(h),\n"
                       "    tostring(a.Stop(h, 0)), tostring(a.Stop('nosuch', 0)), a.Play('', -2, -2, -2, -2, -2)}, ' ')"),
              "1 true true 50 70 40 -1 true false 0");
    EXPECT_EQ(host.Run("return type(ox.core.CAudioManager.Instance)"), "function");
    EXPECT_TRUE(host.Reports.empty()) << host.LastReport();
    g_ScriptManager = nullptr;
}

TEST(SoundPlayer, PlaysByIdAndCanBeReplaced)
{
    std::vector<std::string> played;
    SoundPlayer previous = SetSoundPlayer([&](const char* id) {
        played.push_back(id);
        return CAudioManager::Handle(7);
    });
    EXPECT_EQ(PlaySound("door_open"), 7u);
    EXPECT_EQ(PlaySound(""), 0u);
    EXPECT_EQ(PlaySound(nullptr), 0u);
    EXPECT_EQ(played, std::vector<std::string> {"door_open"});
    SetSoundPlayer(previous);
}

TEST_F(AudioManagerTest, ClipSoundPointsPlayThroughTheManagerAndStopByOwner)
{
    dir.Write("properties/sounds.xml", "<?xml version=\"1.0\"?>\n<sounds>\n" +
                                           Sound("blip", "sounds/click.ogg", "sfx", 100, 1, -1) + "</sounds>\n");
    MakeManager(true);
    ox::misc::anim::CClipAudio audio(*manager);
    ox::misc::anim::CImageObject first, second;

    audio.Play(first, "blip", 0);
    audio.Play(second, "blip", 50); // starts 50 ms in
    ASSERT_EQ(audio.Count(), 2u);
    audio.Play(second, "blip", 150); // its 100 ms are over before it could start
    audio.Play(second, "nothing", 0);
    EXPECT_EQ(audio.Count(), 2u);
    EXPECT_EQ(manager->IsSound("blip"), true);

    audio.StopAll(first);
    EXPECT_EQ(audio.Count(), 1u) << "only the first object's sound ends";
    Run(200);
    audio.Pause(second, true);
    EXPECT_EQ(audio.Count(), 0u) << "finished sounds leave the list";
}
