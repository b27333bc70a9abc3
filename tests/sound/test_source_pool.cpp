// The source pool on the recording device: the ring of buffers through refills, the wrap
// and the end, loops, seeking, the limit of 32 sources, no device, and the real thread.
#include "misc/GamePack.h"
#include "sound/AlSourcePool.h"
#include "support/RecordingSoundDevice.h"
#include "support/SoundFiles.h"
#include "support/TestSupport.h"

#include <chrono>
#include <set>
#include <thread>

using namespace ox::sound;
using oxtest::RecordingSoundDevice;

namespace {

// 48 kHz stereo: a buffer of 8192 bytes holds 2048 frames, 42.7 ms.
constexpr double kBufferMs = 2048 * 1000.0 / 48000;

struct PoolFixture : ::testing::Test {
    oxtest::TempDir dir;
    std::unique_ptr<ox::misc::CGamePack> pack;
    RecordingSoundDevice device;
    std::unique_ptr<CAlSourcePool> pool;

    void SetUp() override
    {
        Write("long.ogg", 2 * 48000);
        Write("short.ogg", 2400);
        Write("loop.ogg", 4800);
        ox::misc::GamePackConfig config;
        config.folder = dir.Path().string();
        config.language = "";
        pack = std::make_unique<ox::misc::CGamePack>(config);
        device.Open();
        pool = std::make_unique<CAlSourcePool>(device, false, pack.get());
    }
    void Write(const std::string& name, size_t frames)
    {
        dir.Write(name, oxtest::AsString(oxtest::MakeToneOgg(2, 48000, frames)));
    }
    // Plays `ms` of device time in feed steps of 20 ms.
    void Run(CAlSource* source, double ms)
    {
        for (double t = 0; t < ms; t += 20) {
            device.Advance(20);
            pool->Update();
            source->CheckEnd();
        }
    }
    RecordingSoundDevice::Source Device(CAlSource* source) { return device.GetSource(source->GetSourceName()); }
};

} // namespace

TEST_F(PoolFixture, RingRefillsAndAStopAcrossTheWrapGivesEveryBufferBack)
{
    CAlSource* source = pool->Acquire("long.ogg");
    ASSERT_NE(source, nullptr);
    EXPECT_NEAR(source->GetLength(), 2.0, 1e-9);
    source->Play();
    EXPECT_EQ(Device(source).queue.size(), 4u);
    EXPECT_EQ(source->GetFirstBuffer(), 0);

    device.Advance(kBufferMs + 1);
    pool->Update();
    EXPECT_EQ(source->GetFirstBuffer(), 1);
    EXPECT_EQ(Device(source).queue.size(), 4u);
    EXPECT_NEAR(source->GetPlayedTime(), (kBufferMs + 1) / 1000, 1e-6);

    Run(source, 2 * kBufferMs);
    ASSERT_GE(source->GetFirstBuffer(), 2);
    source->Stop();
    EXPECT_EQ(device.errors, 0);
    EXPECT_EQ(Device(source).queue.size(), 0u);
    EXPECT_EQ(source->GetFirstBuffer(), -1);
    std::set<SoundName> names(source->GetBuffers(), source->GetBuffers() + 4);
    EXPECT_EQ(names.size(), 4u);
    for (SoundName name : names)
        EXPECT_TRUE(device.IsBuffer(name));

    // It plays again from where the stream is, and gives its place back.
    source->Play();
    EXPECT_EQ(source->GetState(), CAlSource::StatePlaying);
    pool->Release(source);
    EXPECT_EQ(pool->GetRunningSourcesCount(), 0u);
    EXPECT_EQ(Device(source).state, SourceState::Stopped);
}

TEST_F(PoolFixture, AShortFileQueuesWhatItHasAndEnds)
{
    CAlSource* source = pool->Acquire("short.ogg");
    ASSERT_NE(source, nullptr);
    source->Play();
    EXPECT_EQ(Device(source).queue.size(), 2u); // 9600 bytes
    Run(source, 20);
    EXPECT_FALSE(source->IsStopped());
    Run(source, 60);
    EXPECT_TRUE(source->IsStopped());
    EXPECT_NEAR(Device(source).playedSeconds, 0.05, 1e-6);
    EXPECT_EQ(device.errors, 0);
}

TEST_F(PoolFixture, ALoopRewindsWithoutAGapAndPausesHoldIt)
{
    CAlSource* source = pool->Acquire("loop.ogg");
    ASSERT_NE(source, nullptr);
    source->SetLooping(true);
    source->Play();
    Run(source, 350);
    EXPECT_EQ(source->GetState(), CAlSource::StatePlaying);
    EXPECT_EQ(Device(source).plays, 1); // the queue never ran dry
    EXPECT_NEAR(source->GetPlayedTime(), 0.35, 0.021);

    source->Pause();
    Run(source, 100);
    EXPECT_NEAR(source->GetPlayedTime(), 0.35, 0.021);
    source->Resume();
    Run(source, 100);
    EXPECT_NEAR(source->GetPlayedTime(), 0.45, 0.021);

    // Looping ends: the rest plays out and the source stops.
    source->SetLooping(false);
    Run(source, 400);
    EXPECT_TRUE(source->IsStopped());
    EXPECT_EQ(device.errors, 0);
}

TEST_F(PoolFixture, SetPositionStartsThereAndALateFeedRestartsTheQueue)
{
    CAlSource* source = pool->Acquire("long.ogg");
    ASSERT_NE(source, nullptr);
    source->Play();
    source->SetPosition(1.0);
    EXPECT_NEAR(source->GetPlayedTime(), 1.0, 1e-9);
    // A position the stream cannot seek to starts from the beginning.
    source->SetPosition(0.0);
    EXPECT_NEAR(source->GetPlayedTime(), 0.0, 1e-9);

    // The feed comes too late: the queue ran dry, and the refill plays again.
    device.Advance(5 * kBufferMs);
    EXPECT_EQ(Device(source).state, SourceState::Stopped);
    pool->Update();
    EXPECT_EQ(Device(source).state, SourceState::Playing);
    EXPECT_FALSE(source->IsStopped());
    EXPECT_EQ(device.errors, 0);
}

TEST_F(PoolFixture, The33rdSourceIsRefusedWithABox)
{
    oxtest::MessageCapture boxes;
    for (int i = 0; i < CAlSourcePool::SourcesCount; ++i)
        ASSERT_NE(pool->Acquire("short.ogg"), nullptr);
    EXPECT_EQ(pool->Acquire("short.ogg"), nullptr);
    ASSERT_EQ(boxes.Boxes().size(), 1u);
    EXPECT_EQ(boxes.Boxes()[0].text, "Total number of concurrently playing sounds exceeded allowed maximum (32).");
    EXPECT_EQ(pool->GetRunningSourcesCount(), 32u);
    // A file that does not play leaves the source free.
    pool->Release(&pool->GetSource(0));
    EXPECT_EQ(pool->Acquire("missing.ogg"), nullptr);
    EXPECT_EQ(pool->GetRunningSourcesCount(), 31u);
}

TEST(SourcePool, WithoutADeviceNothingIsMadeOrPlayed)
{
    RecordingSoundDevice device;
    device.openResult = false;
    device.Open();
    CAlSourcePool pool(device, true);
    EXPECT_FALSE(pool.HasThread());
    EXPECT_EQ(device.LiveSources(), 0u);
    EXPECT_EQ(pool.Acquire("anything.ogg"), nullptr);
    pool.Update();
}

TEST_F(PoolFixture, TheThreadFeedsThePlayingSources)
{
    pool.reset();
    pool = std::make_unique<CAlSourcePool>(device, true, pack.get());
    ASSERT_TRUE(pool->HasThread());
    CAlSource* source = pool->Acquire("long.ogg");
    ASSERT_NE(source, nullptr);
    source->Play();
    // Half a second of device time, fed by the thread alone.
    for (int i = 0; i < 25; ++i) {
        device.Advance(20);
        std::this_thread::sleep_for(std::chrono::milliseconds(25));
    }
    EXPECT_NEAR(Device(source).playedSeconds, 0.5, 1e-6);
    EXPECT_GT(source->GetFirstBuffer(), 0);
    pool.reset();
    EXPECT_EQ(device.LiveSources(), 0u);
    EXPECT_EQ(device.LiveBuffers(), 0u);
    EXPECT_EQ(device.errors, 0);
}

TEST_F(PoolFixture, OpenAlPlaysAFileToItsEndWithoutErrors)
{
    oxtest::LogCapture log;
    oxtest::MessageCapture boxes;
    std::unique_ptr<ISoundDevice> openal = CreateOpenAlDevice();
    if (!openal->Open())
        GTEST_SKIP() << "no OpenAL output here";
    {
        CAlSourcePool real(*openal, true, pack.get());
        CAlSource* source = real.Acquire("short.ogg");
        ASSERT_NE(source, nullptr);
        source->SetGain(0.5f);
        source->Play();
        for (int i = 0; i < 50 && !source->IsStopped(); ++i) {
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
            source->CheckEnd();
        }
        EXPECT_TRUE(source->IsStopped());
        EXPECT_GT(source->GetPlayedTime(), 0.04); // the last buffer may not be taken back yet
        real.Release(source);
    }
    openal->Close();
    EXPECT_TRUE(boxes.Boxes().empty());
    EXPECT_FALSE(log.Contains("OpenAL error"));
}
