// Real output through OpenAL Soft, each run in a child process of this test binary, since
// OpenAL reads its configuration once per process: the wave driver writes what the game
// plays to a file, where a tone must appear at the level its volumes give; and without any
// driver the game must go on silently.
#include "misc/GamePack.h"
#include "sound/AudioManager.h"
#include "support/SoundFiles.h"
#include "support/TestSupport.h"

#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cmath>
#include <cstring>
#include <thread>

extern char** environ;

using namespace ox::sound;

namespace {

constexpr const char* kChildDir = "OX_AUDIO_CHILD_DIR";

// Runs one test of this binary in a child process with extra environment; its exit status.
int RunChild(const std::string& test, const std::vector<std::string>& env)
{
    char self[4096] = {};
    if (readlink("/proc/self/exe", self, sizeof(self) - 1) <= 0)
        return -1;
    std::vector<std::string> values = env;
    for (char** e = environ; *e; ++e) {
        const std::string entry = *e;
        const std::string name = entry.substr(0, entry.find('='));
        if (name != "ALSOFT_DRIVERS" && name != "ALSOFT_CONF" && name != kChildDir)
            values.push_back(entry);
    }
    std::vector<char*> envp;
    for (std::string& value : values)
        envp.push_back(value.data());
    envp.push_back(nullptr);
    std::string filter = "--gtest_filter=" + test;
    char* argv[] = {self, filter.data(), nullptr};
    pid_t pid = 0;
    if (posix_spawn(&pid, self, nullptr, nullptr, argv, envp.data()) != 0)
        return -1;
    int status = 0;
    waitpid(pid, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

// A 16-bit wave file's samples of one channel; empty when it is no such file.
std::vector<int16_t> ReadWaveChannel(const std::string& bytes, int& rate)
{
    std::vector<int16_t> samples;
    if (bytes.size() < 12 || bytes.compare(0, 4, "RIFF") != 0 || bytes.compare(8, 4, "WAVE") != 0)
        return samples;
    int channels = 0, bits = 0;
    for (size_t at = 12; at + 8 <= bytes.size();) {
        uint32_t size;
        memcpy(&size, bytes.data() + at + 4, 4);
        const std::string id = bytes.substr(at, 4);
        const char* body = bytes.data() + at + 8;
        if (id == "fmt " && size >= 16) {
            uint16_t c, b;
            memcpy(&c, body + 2, 2);
            memcpy(&rate, body + 4, 4);
            memcpy(&b, body + 14, 2);
            channels = c;
            bits = b;
        } else if (id == "data" && bits == 16 && channels > 0) {
            const size_t frames = std::min<size_t>(size, bytes.size() - at - 8) / (2 * channels);
            samples.resize(frames);
            for (size_t i = 0; i < frames; ++i)
                memcpy(&samples[i], body + i * 2 * channels, 2);
            return samples;
        }
        at += 8 + size + (size & 1);
    }
    return samples;
}

// The mean level of each stretch of sound, windows of 10 ms apart, the edges left out.
std::vector<double> Levels(const std::vector<int16_t>& samples, int rate)
{
    const size_t window = rate / 100;
    std::vector<double> rms;
    for (size_t at = 0; at + window <= samples.size(); at += window) {
        double sum = 0;
        for (size_t i = at; i < at + window; ++i)
            sum += double(samples[i]) * samples[i];
        rms.push_back(std::sqrt(sum / window));
    }
    std::vector<double> levels;
    for (size_t i = 0; i < rms.size();) {
        if (rms[i] < 30) {
            ++i;
            continue;
        }
        size_t end = i;
        while (end < rms.size() && rms[end] >= 30)
            ++end;
        double sum = 0;
        const size_t from = i + (end - i) / 4, to = end - (end - i) / 4;
        for (size_t k = from; k < to; ++k)
            sum += rms[k];
        if (to > from)
            levels.push_back(sum / (to - from));
        i = end;
    }
    return levels;
}

} // namespace

TEST(AudioOutput, AToneReachesTheWaveFileAtTheLevelOfItsVolumes)
{
    oxtest::TempDir dir;
    const std::string wave = (dir / "out.wav").string();
    dir.Write("alsoft.conf", "[general]\ndrivers = wave\nchannels = stereo\nsample-type = int16\n"
                             "frequency = 44100\n[wave]\nfile = " + wave + "\n");
    ASSERT_EQ(RunChild("AudioOutputChild.PlaysTwoTones",
                       {"ALSOFT_CONF=" + (dir / "alsoft.conf").string(), "ALSOFT_DRIVERS=wave",
                        std::string(kChildDir) + "=" + dir.Path().string()}),
              0);
    int rate = 0;
    const std::vector<int16_t> samples = ReadWaveChannel(oxtest::ReadFile(wave), rate);
    ASSERT_EQ(rate, 44100);
    const std::vector<double> levels = Levels(samples, rate);
    ASSERT_EQ(levels.size(), 2u);
    // The tone (0.5 of full scale) at volume 100, then at 20 (80 in a group at 50, all at 50).
    const double tone = 0.5 * 32767 / std::sqrt(2.0);
    EXPECT_NEAR(levels[0] / tone, 1.0, 0.1);
    EXPECT_NEAR(levels[1] / levels[0], 0.2, 0.01);
}

TEST(AudioOutput, WithoutAnyDriverTheGameGoesOnSilently)
{
    oxtest::TempDir dir;
    EXPECT_EQ(RunChild("AudioOutputChild.HasNoOutput",
                       {"ALSOFT_DRIVERS=nosuch", std::string(kChildDir) + "=" + dir.Path().string()}),
              0);
}

namespace {

void PlayToTheEnd(CAudioManager& manager, ox::core::CTimeManager& time, const char* id)
{
    const auto handle = manager.Play(id);
    ASSERT_NE(handle, 0u);
    for (int i = 0; i < 200 && manager.IsSound(handle); ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
        time.Update();
        manager.Update();
    }
    EXPECT_FALSE(manager.IsSound(handle));
}

} // namespace

TEST(AudioOutputChild, PlaysTwoTones)
{
    const char* folder = getenv(kChildDir);
    if (!folder)
        GTEST_SKIP() << "run by AudioOutput in a process of its own";
    oxtest::TempDir dir;
    dir.Write("tone.ogg", oxtest::AsString(oxtest::MakeToneOgg(2, 44100, 44100 * 4 / 10, 440.0, 0.5)));
    dir.Write("properties/sounds.xml",
              "<?xml version=\"1.0\"?>\n<sounds>\n"
              "<sound id=\"loud\" file=\"tone.ogg\" group_template=\"sfx\" volume=\"100\" balance=\"0\" priority=\"0\" "
              "repeat=\"1\" max_concurrent_sound_play=\"-1\" concurrent_sound_play_delay=\"-1\" speed=\"1\"/>\n"
              "<sound id=\"soft\" file=\"tone.ogg\" group_template=\"music\" volume=\"80\" balance=\"0\" priority=\"0\" "
              "repeat=\"1\" max_concurrent_sound_play=\"-1\" concurrent_sound_play_delay=\"-1\" speed=\"1\"/>\n"
              "</sounds>\n");
    ox::misc::GamePackConfig config;
    config.folder = dir.Path().string();
    config.language = "";
    ox::misc::CGamePack pack(config);
    ox::core::CTimeManager time;
    AudioManagerConfig audio;
    audio.time = &time;
    audio.pack = &pack;
    CAudioManager manager(std::move(audio));
    ASSERT_TRUE(manager.IsAudioAvailable());
    SoundDeclarationsLoader loader(&pack);
    ASSERT_TRUE(loader.Load());
    manager.LoadDeclarations(loader);

    PlayToTheEnd(manager, time, "loud");
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    manager.SetGroupVolume("music", 50);
    manager.SetGlobalVolume(50);
    PlayToTheEnd(manager, time, "soft");
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
}

TEST(AudioOutputChild, HasNoOutput)
{
    if (!getenv(kChildDir))
        GTEST_SKIP() << "run by AudioOutput in a process of its own";
    oxtest::MessageCapture boxes;
    ox::core::CTimeManager time;
    AudioManagerConfig audio;
    audio.time = &time;
    CAudioManager manager(std::move(audio));
    EXPECT_FALSE(manager.IsAudioAvailable());
    EXPECT_EQ(manager.Play("anything"), 0u);
    EXPECT_TRUE(manager.Update());
    ASSERT_EQ(boxes.Boxes().size(), 1u);
    EXPECT_EQ(boxes.Boxes()[0].text, "Cannot initialize audio subsystem.");
}
