// The threaded video library and CVideoPlayer: frames decoded ahead by the worker and taken
// when due on a game timer, the alpha layouts, the worker letting go of a clip destroyed
// mid-stream, focus pausing, and bad files.
#include "VideoTestSupport.h"

#include "core/TimeManager.h"
#include "graphics/VideoPlayer.h"
#include "sound/VorbisWriter.h"

#include <chrono>
#include <thread>

using namespace ox;
using graphics::CVideoPlayer;
using oxtest::MakeVideo;

namespace {

struct VideoPlayer : oxtest::VideoFixture {
    oxtest::FakeClock clock;
    std::unique_ptr<core::CTimeManager> time;

    void SetUp() override
    {
        VideoFixture::SetUp();
        time = std::make_unique<core::CTimeManager>(clock.Source());
        time->AttachGroupTimer("video", time->GetRoot());
        time->Update();
        time->Update();  // the first frame's step is below 0; the second is 0
        graphics::GetVideoServices().findTimer = [this](const char* id) { return time->GetTimer(id); };
        Write("video/levels.ogv", MakeVideo("levels", 64, 48, 25));
    }
    // Waits until the worker has filled the clip's queue (or the clip has no more frames).
    static void WaitForQueue(TheoraVideoClip& clip, unsigned frames = TheoraVideoManager::kDefaultPrecachedFrames)
    {
        for (int i = 0; i < 2000 && clip.getFrameQueue().getReadyCount() < frames && !clip.isDone(); ++i)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    void Step(CVideoPlayer& player, int ms)
    {
        clock.Advance(ms);
        time->Update();
        player.Update();
    }
    // The grey level of the first pixel on the surface.
    static int Shown(CVideoPlayer& player) { return player.GetTexture()->GetSurface()->GetBuffer()[0] & 0xFF; }
};

int RedOf(const std::vector<uint32_t>& bits, size_t i) { return static_cast<int>(bits[i] >> 16 & 0xFF); }

} // namespace

TEST_F(VideoPlayer, TheDueFrameIsTakenOnTheGameTimer)
{
    CVideoPlayer player("video");
    EXPECT_EQ(player.GetTime(), 0.0f) << "no clip";
    EXPECT_EQ(player.GetDuration(), 0.0f);
    ASSERT_TRUE(player.LoadFromFile("video/levels.ogv"));
    EXPECT_EQ(player.GetWidth(), 64u);
    EXPECT_EQ(player.GetHeight(), 48u);
    EXPECT_NEAR(player.GetDuration(), 1000.0f, 0.01f);
    EXPECT_EQ(CVideoPlayer::GetCurrent(), &player);
    WaitForQueue(*player.GetClip());

    player.Update();

    auto bits = DeviceBits(player.GetTexture());
    EXPECT_NEAR(RedOf(bits, 0), ::VideoLevel(0, 25), 3) << "frame 0 at time 0";
    EXPECT_EQ(bits[0] >> 24, 0xFFu) << "opaque";
    Step(player, 20);
    EXPECT_NEAR(RedOf(DeviceBits(player.GetTexture()), 0), ::VideoLevel(0, 25), 3) << "frame 1 not due";
    Step(player, 20);
    EXPECT_NEAR(RedOf(DeviceBits(player.GetTexture()), 0), ::VideoLevel(1, 25), 3) << "frame 1 at 40 ms";
    EXPECT_NEAR(player.GetTime(), 40.0f, 0.01f);

    graphics::PauseCurrentVideo();
    Step(player, 80);
    EXPECT_NEAR(player.GetTime(), 40.0f, 0.01f) << "the application's focus pauses the clock";
    graphics::ResumeCurrentVideo();
    WaitForQueue(*player.GetClip(), 10);
    Step(player, 80);  // 120: frames 2 and 3 are due, the older one is taken first
    EXPECT_NEAR(player.GetTime(), 120.0f, 0.01f);
    EXPECT_NEAR(RedOf(DeviceBits(player.GetTexture()), 0), ::VideoLevel(2, 25), 3);

    backend->ClearRecord();
    DrawOnce(player, 5, 6);
    ASSERT_EQ(backend->draws.size(), 1u);
    EXPECT_EQ(backend->draws[0].texture, player.GetTexture()->GetSurface()->PeekD3DTexture());
}

TEST_F(VideoPlayer, AlphaComesFromAStackedHalfOrASecondClip)
{
    TheoraEncodeOptions stacked, alpha;
    stacked.layout = TheoraEncodeOptions::Stacked;
    alpha.layout = TheoraEncodeOptions::Alpha;
    Write("video/stacked.ogv", MakeVideo("disc", 64, 48, 5, stacked));
    Write("video/disc.ogv", MakeVideo("disc", 64, 48, 5));
    Write("video/disc_alpha.ogv", MakeVideo("disc", 64, 48, 5, alpha));
    Write("video/odd.ogv", MakeVideo("disc", 64, 49, 5));
    std::vector<uint32_t> frame;
    MakeVideoFrame("disc", 64, 48, 0, 5, frame);

    CVideoPlayer player("video");
    ASSERT_TRUE(player.LoadFromFileAlpha("video/stacked.ogv"));
    EXPECT_EQ(player.GetWidth(), 64u);
    EXPECT_EQ(player.GetHeight(), 48u) << "half of the 96 rows";
    EXPECT_FALSE(player.IsTransparent(0, 0)) << "no pixels yet";
    WaitForQueue(*player.GetClip(), 5);
    player.Update();
    const uint32_t* pixels = player.GetTexture()->GetSurface()->GetBuffer();
    for (size_t i : {size_t(0), size_t(24 * 64 + 32), size_t(47 * 64 + 63)})
        EXPECT_NEAR(static_cast<int>(pixels[i] >> 24), static_cast<int>(frame[i] >> 24), 6) << i;
    EXPECT_TRUE(player.IsTransparent(0, 0));
    EXPECT_FALSE(player.IsTransparent(32, 24));

    ASSERT_TRUE(player.LoadFromFile("video/disc.ogv", "video/disc_alpha.ogv"));
    WaitForQueue(*player.GetClip(), 5);
    player.Update();
    EXPECT_TRUE(player.IsTransparent(1, 1));
    EXPECT_FALSE(player.IsTransparent(32, 24));

    oxtest::LogCapture log;
    EXPECT_FALSE(player.LoadFromFileAlpha("video/odd.ogv"));
    EXPECT_TRUE(log.Contains("video/odd.ogv: a stacked video needs an even height"));
    EXPECT_FALSE(player.LoadFromFile("video/disc.ogv", "video/odd.ogv"));
    EXPECT_TRUE(log.Contains("the alpha video video/odd.ogv is 64x49"));
    EXPECT_EQ(player.GetTexture(), nullptr);
}

TEST_F(VideoPlayer, BadFilesAreLoggedByNameAndDrawNothing)
{
    const std::string good = MakeVideo("levels", 64, 48, 25);
    Write("video/cut.ogv", good.substr(0, 150));
    Write("video/noise.ogv", std::string(5000, '\x5A'));
    std::vector<uint8_t> sound;
    const std::vector<int16_t> pcm = sound::SynthesiseTone(440, 4000, 1, 8000, 0.5);
    ASSERT_TRUE(sound::EncodeVorbis(pcm.data(), 4000, 1, 8000, sound));
    Write("video/sound.ogv", std::string(sound.begin(), sound.end()));
    CVideoPlayer player("video");
    for (const char* name : {"video/cut.ogv", "video/noise.ogv", "video/sound.ogv", "video/missing.ogv"}) {
        oxtest::LogCapture log;
        EXPECT_FALSE(player.LoadFromFile(name)) << name;
        EXPECT_TRUE(log.Contains(name)) << name;
        backend->ClearRecord();
        player.Update();
        DrawOnce(player, 0, 0);
        EXPECT_TRUE(backend->draws.empty());
    }
    {
        oxtest::LogCapture log;
        EXPECT_FALSE(player.LoadFromFile("video/noise.ogv"));
        EXPECT_TRUE(log.Contains("invalid theora stream"));
    }
    // A clip with a Vorbis track plays; its sound goes nowhere.
    Write("video/talk.ogv", MakeVideo("levels", 64, 48, 25, {}, 1.0));
    ASSERT_TRUE(player.LoadFromFile("video/talk.ogv"));
    EXPECT_TRUE(player.GetClip()->hasAudio());
    WaitForQueue(*player.GetClip());
    for (int i = 0; i < 5; ++i)
        Step(player, 40);
    // One frame a step from frame 0: the oldest frame less than 0.1 s late is taken first.
    EXPECT_NEAR(RedOf(DeviceBits(player.GetTexture()), 0), ::VideoLevel(4, 25), 3);
}

TEST(TheoraVideoManager, AClipDestroyedMidStreamIsLetGoAndTheWorkerEnds)
{
    const std::string bytes = MakeVideo("bars", 320, 240, 60);
    auto manager = std::make_unique<TheoraVideoManager>(1);
    std::vector<TheoraVideoClip*> clips;
    for (int i = 0; i < 3; ++i)
        clips.push_back(manager->createVideoClip(
            new TheoraMemoryFileDataSource(bytes.data(), bytes.size(), "bars" + std::to_string(i)), 2, 4));
    // Each clip gets frames: the emptiest queue is served first.
    for (int i = 0; i < 2000 && clips[2]->getFrameQueue().getReadyCount() < 2; ++i)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    EXPECT_GE(clips[0]->getFrameQueue().getReadyCount(), 1u);
    EXPECT_GE(clips[1]->getFrameQueue().getReadyCount(), 1u);
    // Taken away while the worker decodes: running the clock keeps the queues draining.
    for (int round = 0; round < 20; ++round) {
        manager->update(0.05f);
        for (TheoraVideoClip* clip : clips)
            while (clip && clip->getNextFrame())
                clip->popFrame();
        if (round == 10) {
            manager->destroyVideoClip(clips[1]);
            clips[1] = nullptr;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    EXPECT_EQ(manager->getClipCount(), 2u);
    const auto start = std::chrono::steady_clock::now();
    manager.reset();  // stops the worker (idle or busy) and destroys the clips left
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(200)) << "not a full idle wait";
}
