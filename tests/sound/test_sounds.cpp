// Fades on the audio clock and one playing sound on the recording device: delays, the sum
// of the steps, repeats under one sound, the end of a sound, pausing under a maximum.
#include "misc/GamePack.h"
#include "sound/AlSourcePool.h"
#include "sound/Sound.h"
#include "support/RecordingSoundDevice.h"
#include "support/SoundFiles.h"
#include "support/TestSupport.h"

using namespace ox::sound;
using oxtest::RecordingSoundDevice;

namespace {

struct SoundFixture : ::testing::Test {
    oxtest::TempDir dir;
    std::unique_ptr<ox::misc::CGamePack> pack;
    RecordingSoundDevice device;
    std::unique_ptr<CAlSourcePool> pool;
    oxtest::FakeClock clock;
    ox::core::CTimeManager time {clock.Source()};
    CVolumeTable volumes;
    SoundContext context;

    void SetUp() override
    {
        dir.Write("beep.ogg", oxtest::AsString(oxtest::MakeToneOgg(1, 8000, 800))); // 100 ms
        ox::misc::GamePackConfig config;
        config.folder = dir.Path().string();
        config.language = "";
        pack = std::make_unique<ox::misc::CGamePack>(config);
        device.Open();
        pool = std::make_unique<CAlSourcePool>(device, false, pack.get());
        context = {pool.get(), time.AttachGroupTimer("AudioManager", nullptr), pack.get(), &volumes};
        Run(20); // the time manager's first frame
    }
    // Game time and device time go on together, a frame of 20 ms at a time.
    void Run(double ms, CSound* sound = nullptr)
    {
        for (double t = 0; t < ms; t += 20) {
            clock.Advance(20);
            time.Update();
            device.Advance(20);
            pool->Update();
            if (sound)
                sound->Update();
        }
    }
};

} // namespace

TEST_F(SoundFixture, AFadeWaitsForItsDelayAndItsStepsAddUpToItsDelta)
{
    CFade fade(context.clock, 50.0f, 100.0f, 40.0f);
    EXPECT_FALSE(fade.IsNull());
    float sum = 0;
    Run(40);
    sum += fade.Step();
    EXPECT_EQ(sum, 0.0f);
    Run(20);
    sum += fade.Step();
    EXPECT_FLOAT_EQ(sum, 10.0f);
    // A copy goes on with its own clock from the same point.
    CFade copy = fade;
    Run(60);
    EXPECT_FALSE(fade.Ended());
    sum += fade.Step();
    EXPECT_FLOAT_EQ(sum, 40.0f);
    Run(100);
    sum += fade.Step();
    EXPECT_EQ(sum, 50.0f);
    EXPECT_TRUE(fade.Ended());
    EXPECT_FLOAT_EQ(copy.Step(), 40.0f);

    // A paused fade holds; one of no length gives its whole delta once its delay is over.
    CFade held(context.clock, 10.0f, 100.0f, 0.0f);
    held.Pause(true);
    Run(200);
    EXPECT_EQ(held.Step(), 0.0f);
    CFade jump(context.clock, -30.0f, 0.0f, 50.0f);
    Run(40);
    EXPECT_EQ(jump.Step(), 0.0f);
    Run(20);
    EXPECT_EQ(jump.Step(), -30.0f);
    EXPECT_EQ(jump.Step(), 0.0f);
    EXPECT_TRUE(CFade().IsNull());
}

TEST_F(SoundFixture, RepeatsPlayUnderOneSoundAndThenItEnds)
{
    CSoundType type(&context);
    ASSERT_TRUE(type.Init("beep.ogg", -1));
    for (int repeat : {0, 1, 2}) {
        SCOPED_TRACE(repeat);
        CSound sound(type);
        ASSERT_TRUE(sound.Play(-2, -2, -2, repeat, -2));
        EXPECT_EQ(type.GetPlayingCount(), 1u);
        EXPECT_DOUBLE_EQ(type.GetLength(), 100.0);
        const SoundName first = sound.GetSource()->GetSourceName();
        const int plays = device.GetSource(first).plays;
        Run(140, &sound);
        EXPECT_EQ(sound.IsStopped(), repeat < 2);
        if (repeat == 2) {
            // The second run has a source again (the same one, the first free).
            EXPECT_EQ(sound.GetSource()->GetSourceName(), first);
            EXPECT_EQ(device.GetSource(first).plays, plays + 1);
            EXPECT_EQ(type.GetPlayingCount(), 1u);
            Run(120, &sound);
            EXPECT_TRUE(sound.IsStopped());
        }
        EXPECT_EQ(type.GetPlayingCount(), 0u);
    }
    EXPECT_EQ(pool->GetRunningSourcesCount(), 0u);
}

TEST_F(SoundFixture, AStopFadeEndsTheSoundAndVolumesReachTheSource)
{
    CSoundType type(&context);
    ASSERT_TRUE(type.Init("beep.ogg", -1));
    type.SetVolume(80, 0, 0);
    volumes.SetGroup("sfx", 50);
    type.SetGroup("sfx");
    CSound sound(type);
    ASSERT_TRUE(sound.Play(-2, -2, -2, -1, -2));
    const SoundName name = sound.GetSource()->GetSourceName();
    EXPECT_FLOAT_EQ(device.GetSource(name).gain, 0.40f);
    sound.SetVolume(20, 100, 0);
    Run(60, &sound);
    EXPECT_FLOAT_EQ(device.GetSource(name).gain, 0.22f); // 80 - 60 * 60 / 100, halved
    sound.Stop(100);
    Run(80, &sound);
    EXPECT_FALSE(sound.IsStopped());
    Run(40, &sound);
    EXPECT_TRUE(sound.IsStopped());
    EXPECT_EQ(type.GetPlayingCount(), 0u);
}

TEST_F(SoundFixture, APausedSoundFreesItsPlaceAndEndsIfItLostIt)
{
    CSoundType type(&context);
    ASSERT_TRUE(type.Init("beep.ogg", 1));
    CSound first(type);
    ASSERT_TRUE(first.Play(-2, -2, -2, -1, -2));
    EXPECT_FALSE(type.CanPlay());
    first.Pause();
    first.Pause();
    EXPECT_TRUE(first.IsPaused());
    EXPECT_TRUE(type.CanPlay());
    first.Resume();
    EXPECT_TRUE(first.IsPaused());
    first.Resume();
    EXPECT_FALSE(first.IsPaused());
    EXPECT_EQ(type.GetPlayingCount(), 1u);

    first.Pause();
    CSound second(type);
    ASSERT_TRUE(second.Play(-2, -2, -2, -1, -2));
    first.Resume();
    EXPECT_TRUE(first.IsStopped());
    EXPECT_EQ(type.GetPlayingCount(), 1u);
}
