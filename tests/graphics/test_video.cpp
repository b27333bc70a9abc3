// Videos decoded on the main thread: frame timing on the injected frame delta (frame times
// are start times), looping, seeking, pausing, the translucent video's alpha, sound, and
// bad files that leave nothing drawn.
#include "VideoTestSupport.h"

#include "misc/theoraplayer/TheoraYuv.h"
#include "sound/VorbisWriter.h"

#include <algorithm>
#include <cmath>
#include <sys/wait.h>

using namespace ox;
using graphics::COpaqueVideo;
using graphics::CTranslucentVideo;
using oxtest::MakeVideo;
using oxtest::Near;

namespace {

struct MainThreadVideo : oxtest::VideoFixture {
    // 25 frames at 25 fps of 64x48, each one grey level.
    void SetUp() override
    {
        VideoFixture::SetUp();
        Write("video/levels.ogv", MakeVideo("levels", 64, 48, 25));
    }
    // Advances the clock by `ms` in steps of the frame delta, updating and drawing.
    void Play(graphics::CMainThreadVideo& video, unsigned ms)
    {
        for (unsigned done = 0; done < ms; done += static_cast<unsigned>(delta)) {
            video.Update();
            DrawOnce(video, 0, 0);
        }
    }
    size_t Draws()
    {
        const size_t n = backend->draws.size();
        backend->ClearRecord();
        return n;
    }
};

} // namespace

TEST(VideoYuv, StudioRangeTablesGiveExactWords)
{
    // Two rows by three columns (odd width: the last pixel alone), chroma per 2x2.
    uint8_t y[2 * 16] = {16, 235, 126, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 81, 145, 41};
    uint8_t u[2 * 8] = {128, 90}, v[2 * 8] = {128, 240};
    th_ycbcr_buffer planes = {{16, 2, 16, y}, {8, 1, 8, u}, {8, 1, 8, v}};
    uint32_t out[6] = {0x11000000, 0x22000000, 0x33000000, 0, 0, 0};
    TheoraYuvToRgb(planes, {0, 0, 3, 2}, out, 3, kAlphaKeep);
    EXPECT_EQ(out[0], 0x11000000u) << "black keeps its alpha";
    EXPECT_EQ(out[1], 0x22FEFEFEu) << "white: 1.164 * 219 stays below 255";
    EXPECT_EQ(out[3], 0x004B4B4Bu) << "grey of the second row shares the first chroma";
    // Y 126 with U 90, V 240: a saturated red, computed by the formula with clamping.
    const auto channel = [](double value) { return static_cast<uint32_t>(std::clamp(value, 0.0, 255.0)); };
    const double yy = 9535.0 * (126 - 16);
    const uint32_t red = channel(std::floor((yy + 13074.0 * 112) / 8192)) << 16 |
                         channel(std::floor((yy - 3203.0 * -38 - 6660.0 * 112) / 8192)) << 8 |
                         channel(std::floor((yy + 16531.0 * -38) / 8192));
    EXPECT_EQ(out[2], 0x33000000u | red);
    TheoraYuvToRgb(planes, {0, 0, 3, 2}, out, 3, kAlphaOpaque);
    EXPECT_EQ(out[0], 0xFF000000u);
    EXPECT_EQ(TheoraStudioToFull(16), 0);
    EXPECT_EQ(TheoraStudioToFull(235), 255);
    EXPECT_EQ(TheoraStudioToFull(126), 128) << "(126 - 16) * 255 / 219";
}

TEST_F(MainThreadVideo, FramesStartAtTheirTimeAndLateOnesAreNeverConverted)
{
    COpaqueVideo video;
    ASSERT_TRUE(video.LoadFromFile("video/levels.ogv"));
    EXPECT_EQ(video.GetDuration(), 1000u) << "25 frames of 40 ms";
    EXPECT_EQ(video.GetWidth(), 64u);
    EXPECT_EQ(video.GetHeight(), 48u);
    DrawOnce(video, 10, 20);
    EXPECT_EQ(video.GetShownFrame(), 0);
    EXPECT_TRUE(Near(video.GetPixels()[0], ::VideoLevel(0, 25), 255));
    EXPECT_EQ(DeviceBits(video.GetTexture()), video.GetPixels()) << "the buffer went to the surface";
    ASSERT_EQ(Draws(), 1u);

    delta = 39;
    video.Update();
    DrawOnce(video, 0, 0);
    EXPECT_EQ(video.GetShownFrame(), 0) << "frame 1 starts at 40";
    delta = 1;
    video.Update();
    DrawOnce(video, 0, 0);
    EXPECT_EQ(video.GetShownFrame(), 1);
    delta = 130;  // to 170: frames 2 and 3 are late
    video.Update();
    DrawOnce(video, 0, 0);
    EXPECT_EQ(video.GetShownFrame(), 4);
    EXPECT_TRUE(Near(DeviceBits(video.GetTexture())[100], ::VideoLevel(4, 25), 255));

    video.MoveToTime(500);
    DrawOnce(video, 0, 0);
    EXPECT_EQ(video.GetShownFrame(), 12) << "forward";
    video.MoveToTime(81);
    DrawOnce(video, 0, 0);
    EXPECT_EQ(video.GetShownFrame(), 2) << "back";
    EXPECT_TRUE(Near(video.GetPixels()[5], ::VideoLevel(2, 25), 255));
    Draws();

    video.Pause();
    video.Pause();
    delta = 500;
    video.Update();
    video.Resume();
    video.Update();
    EXPECT_EQ(video.GetTime(), 81u) << "two pauses need two resumes";
    video.Resume();
    {
        oxtest::AssertCapture asserts;
        video.Resume();
        EXPECT_EQ(asserts.Count(), 1u) << "a resume without a pause";
    }
    delta = 40;
    Play(video, 1000);
    EXPECT_TRUE(video.IsEnded());
    EXPECT_FALSE(video.IsAvailable()) << "without cycling the end closes the video";
    Draws();
    DrawOnce(video, 0, 0);
    EXPECT_EQ(Draws(), 0u) << "nothing drawn after the end";
}

TEST_F(MainThreadVideo, CyclingWrapsWithTheLeftOverOfTheFrameDelta)
{
    COpaqueVideo video;
    ASSERT_TRUE(video.LoadFromFile("video/levels.ogv"));
    video.CycleAfterEnd(true);
    video.MoveToTime(990);
    DrawOnce(video, 0, 0);
    EXPECT_EQ(video.GetShownFrame(), 24);
    delta = 55;  // 1045: 45 into the next pass
    video.Update();
    DrawOnce(video, 0, 0);
    EXPECT_TRUE(video.IsAvailable());
    EXPECT_EQ(video.GetTime(), 45u);
    EXPECT_EQ(video.GetShownFrame(), 1);
    EXPECT_TRUE(Near(video.GetPixels()[0], ::VideoLevel(1, 25), 255));
    const unsigned now = video.GetTime();
    video.MoveToTime(now);
    EXPECT_EQ(video.GetShownFrame(), 1) << "moving to the current time changes nothing";
}

TEST_F(MainThreadVideo, TranslucentAlphaComesFromTheAlphaTrack)
{
    TheoraEncodeOptions alpha;
    alpha.layout = TheoraEncodeOptions::Alpha;
    Write("video/disc.ogv", MakeVideo("disc", 64, 48, 10));
    Write("video/disc_alpha.ogv", MakeVideo("disc", 64, 48, 10, alpha));
    Write("video/levels_alpha.ogv", MakeVideo("levels", 64, 48, 25, alpha));
    Write("video/small.ogv", MakeVideo("levels", 32, 48, 25, alpha));

    CTranslucentVideo video;
    ASSERT_TRUE(video.LoadFromFile("video/levels.ogv", "video/levels_alpha.ogv"));
    delta = 200;
    video.Update();
    DrawOnce(video, 0, 0);
    ASSERT_EQ(video.GetShownFrame(), 5);
    const int level = ::VideoLevel(5, 25);
    for (uint32_t pixel : {video.GetPixels()[0], video.GetPixels()[64 * 48 - 1]})
        EXPECT_TRUE(Near(pixel, level, level)) << std::hex << pixel;

    ASSERT_TRUE(video.LoadFromFile("video/disc.ogv", "video/disc_alpha.ogv"));
    DrawOnce(video, 0, 0);
    std::vector<uint32_t> frame;
    MakeVideoFrame("disc", 64, 48, 0, 10, frame);
    for (size_t i : {size_t(0), size_t(24 * 64 + 32), size_t(47 * 64 + 63)})
        EXPECT_NEAR(static_cast<int>(video.GetPixels()[i] >> 24), static_cast<int>(frame[i] >> 24), 6) << i;

    ASSERT_TRUE(video.LoadFromFile("video/levels.ogv"));
    DrawOnce(video, 0, 0);
    EXPECT_EQ(video.GetPixels()[0] >> 24, 0xFFu) << "without an alpha track the picture is opaque";

    oxtest::LogCapture log;
    EXPECT_FALSE(video.LoadFromFile("video/levels.ogv", "video/small.ogv"));
    EXPECT_TRUE(log.Contains("video/small.ogv is 32x48")) << "sizes that do not match: no picture";
    EXPECT_EQ(video.GetTexture(), nullptr);
}

TEST_F(MainThreadVideo, BadFilesAreLoggedByNameAndDrawNothing)
{
    const std::string good = MakeVideo("levels", 64, 48, 25);
    Write("video/cut.ogv", good.substr(0, 200));
    std::string corrupt = good;
    for (size_t i = 100; i < corrupt.size(); i += 7)
        corrupt[i] = static_cast<char>(corrupt[i] * 31 + 5);
    Write("video/corrupt.ogv", corrupt);
    std::vector<uint8_t> sound;
    const std::vector<int16_t> pcm = sound::SynthesiseTone(440, 4000, 1, 8000, 0.5);
    ASSERT_TRUE(sound::EncodeVorbis(pcm.data(), 4000, 1, 8000, sound));
    Write("video/sound.ogv", std::string(sound.begin(), sound.end()));
    Write("video/empty.ogv", "");
    Write("video/tail.ogv", good.substr(0, good.size() * 2 / 3));

    for (const char* name : {"video/cut.ogv", "video/sound.ogv", "video/empty.ogv", "video/missing.ogv"}) {
        oxtest::LogCapture log;
        COpaqueVideo video;
        EXPECT_FALSE(video.LoadFromFile(name)) << name;
        EXPECT_TRUE(log.Contains(name)) << name;
        video.Update();
        DrawOnce(video, 0, 0);
    }
    // A corrupt body or a cut tail: whatever decodes plays, the rest ends the video.
    for (const char* name : {"video/corrupt.ogv", "video/tail.ogv"}) {
        COpaqueVideo video;
        if (!video.LoadFromFile(name))
            continue;
        delta = 40;
        Play(video, 1200);
        EXPECT_TRUE(video.IsEnded()) << name;
    }

    backend->failCreateTexture = true;
    oxtest::LogCapture log;
    COpaqueVideo video;
    EXPECT_FALSE(video.LoadFromFile("video/levels.ogv"));
    EXPECT_TRUE(log.Contains("video/levels.ogv: no surface of 64x48"));
    Draws();
    DrawOnce(video, 0, 0);
    EXPECT_EQ(Draws(), 0u);
}

TEST_F(MainThreadVideo, AttachedSoundFollowsPauseSeekAndCycling)
{
    Write("video/talk.ogv", MakeVideo("levels", 64, 48, 25, {}, 1.0));
    std::vector<std::string> calls;
    graphics::VideoServices& s = graphics::GetVideoServices();
    s.playSound = [&](const char* id, int repeat) {
        calls.push_back(std::string("play ") + id + " " + std::to_string(repeat));
        return std::string(id) == "voice" ? 7u : 0u;
    };
    s.stopSound = [&](uint32_t h, float) { calls.push_back("stop " + std::to_string(h)); };
    s.pauseSound = [&](uint32_t h, bool p) { calls.push_back((p ? "pause " : "resume ") + std::to_string(h)); };
    s.seekSound = [&](uint32_t h, float t) { calls.push_back("seek " + std::to_string(h) + " " + std::to_string(t)); };
    s.repeatSound = [&](uint32_t h, int r) { calls.push_back("repeat " + std::to_string(h) + " " + std::to_string(r)); };

    COpaqueVideo video;
    EXPECT_FALSE(video.AttachSound("voice")) << "nothing loaded";
    ASSERT_TRUE(video.LoadFromFile("video/talk.ogv")) << "a Vorbis track beside the picture";
    EXPECT_FALSE(video.AttachSound("unknown"));
    EXPECT_TRUE(video.AttachSound("voice"));
    video.CycleAfterEnd(true);
    video.Pause();
    video.Pause();
    video.Resume();
    video.Resume();
    video.MoveToTime(250);
    video.Release();
    EXPECT_EQ(calls, (std::vector<std::string>{"play unknown 1", "play voice 1", "repeat 7 -1", "pause 7",
                                               "resume 7", "seek 7 0.250000", "stop 7"}));
    EXPECT_EQ(video.GetTexture(), nullptr);
}

TEST(OxMediaOgv, WritesWhatTheWriterMakesAndDescribesIt)
{
    oxtest::TempDir dir;
    const auto run = [&](const std::string& arguments) {
        const std::string command = std::string(OX_OXMEDIA_PATH) + " " + arguments + " >'" +
                                    (dir / "out.txt").string() + "' 2>&1";
        return WEXITSTATUS(system(command.c_str()));
    };
    const std::string stacked = (dir / "stacked.ogv").string(), talk = (dir / "talk.ogv").string();
    ASSERT_EQ(run("ogv '" + stacked + "' --size 40x30 --frames 7 --pattern disc --layout stacked"), 0);
    TheoraEncodeOptions options;
    options.layout = TheoraEncodeOptions::Stacked;
    EXPECT_EQ(oxtest::ReadFile(stacked), MakeVideo("disc", 40, 30, 7, options)) << "one encoder for tool and tests";
    ASSERT_EQ(run("ogv '" + talk + "' --frames 10 --fps 20 --tone 440 --rate 11025"), 0);
    ASSERT_EQ(run("info '" + stacked + "' '" + talk + "'"), 0);
    const std::string info = oxtest::ReadFile(dir / "out.txt");
    EXPECT_NE(info.find("stacked.ogv: Ogg Theora, 40x60, 280 ms"), std::string::npos) << info;
    EXPECT_NE(info.find("talk.ogv: Ogg Theora, 64x48, 500 ms"), std::string::npos) << info;
    EXPECT_EQ(run("ogv '" + talk + "' --pattern nothing"), 2);
    EXPECT_EQ(run("ogv '" + talk + "' --layout sideways"), 2);
}
