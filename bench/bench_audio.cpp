// Audio costs: decoding a 44.1 kHz stereo Ogg Vorbis stream (reported as times real time),
// and one feed pass of the source pool over 32 playing sources on OpenAL's null output, at
// the pool thread's pace of one pass every 20 ms (the share of a core it takes). The pass
// is also measured over 32 paused sources: the pool's own cost, without decoding.
#include "misc/GamePack.h"
#include "sound/AlSourcePool.h"
#include "sound/OggVorbisStream.h"
#include "sound/VorbisWriter.h"

#include <benchmark/benchmark.h>

#include <chrono>
#include <ctime>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <thread>

using namespace ox;

namespace {

constexpr int kRate = 44100;
constexpr int kSeconds = 10;

// Ten seconds of something like music: a chord over a little noise, which the encoder
// cannot squeeze as far as a pure tone.
const std::vector<uint8_t>& Music()
{
    static const std::vector<uint8_t> file = [] {
        std::vector<int16_t> pcm(static_cast<size_t>(kRate) * kSeconds * 2);
        uint32_t noise = 12345;
        for (size_t i = 0; i < pcm.size() / 2; ++i) {
            const double t = static_cast<double>(i) / kRate;
            noise = noise * 1664525u + 1013904223u;
            const double value = 0.2 * std::sin(2 * M_PI * 220 * t) + 0.15 * std::sin(2 * M_PI * 277 * t) +
                                 0.1 * std::sin(2 * M_PI * 330 * t * (1 + 0.01 * std::sin(t))) +
                                 0.03 * (static_cast<int32_t>(noise) / 2147483648.0);
            pcm[2 * i] = pcm[2 * i + 1] = static_cast<int16_t>(value * 32767);
        }
        std::vector<uint8_t> out;
        sound::EncodeVorbis(pcm.data(), pcm.size() / 2, 2, kRate, out);
        return out;
    }();
    return file;
}

double ThreadSeconds()
{
    timespec now {};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return now.tv_sec + now.tv_nsec / 1e9;
}

void BM_VorbisDecode(benchmark::State& state)
{
    const std::vector<uint8_t>& file = Music();
    sound::COggVorbisStream stream;
    stream.OpenMemory(file.data(), static_cast<unsigned>(file.size()), "music.ogg");
    std::vector<char> block(8192);
    for (auto _ : state) {
        stream.Rewind();
        while (stream.Read(block.data(), 8192))
            benchmark::DoNotOptimize(block.data());
    }
    state.counters["x_realtime"] = benchmark::Counter(kSeconds * static_cast<double>(state.iterations()),
                                                      benchmark::Counter::kIsRate);
    state.counters["kbit_per_s"] = file.size() * 8.0 / kSeconds / 1000.0;
}
BENCHMARK(BM_VorbisDecode)->Unit(benchmark::kMillisecond);

void BM_PoolFeed(benchmark::State& state)
{
    setenv("ALSOFT_DRIVERS", "null", 0);
    const std::filesystem::path folder = std::filesystem::temp_directory_path() / "ox-bench-audio";
    std::filesystem::create_directories(folder);
    {
        std::ofstream out(folder / "music.ogg", std::ios::binary);
        out.write(reinterpret_cast<const char*>(Music().data()), static_cast<std::streamsize>(Music().size()));
    }
    misc::GamePackConfig config;
    config.folder = folder.string();
    config.language = "";
    misc::CGamePack pack(config);
    std::unique_ptr<sound::ISoundDevice> device = sound::CreateOpenAlDevice();
    if (!device->Open()) {
        state.SkipWithError("no OpenAL output");
        return;
    }
    {
        sound::CAlSourcePool pool(*device, false, &pack);
        for (int i = 0; i < sound::CAlSourcePool::SourcesCount; ++i) {
            sound::CAlSource* source = pool.Acquire("music.ogg");
            source->SetLooping(true);
            source->SetGain(0.03f);
            source->Play();
            if (state.range(0))
                source->Pause();
        }
        using Clock = std::chrono::steady_clock;
        auto next = Clock::now();
        double total = 0;
        for (auto _ : state) {
            next += std::chrono::milliseconds(sound::CAlSourcePool::FeedIntervalMs);
            std::this_thread::sleep_until(next);
            // The thread's own processor time: other work on a shared machine does not count.
            const double start = ThreadSeconds();
            pool.Update();
            const double seconds = ThreadSeconds() - start;
            state.SetIterationTime(seconds);
            total += seconds;
        }
        state.counters["core_share_pct"] =
            100.0 * total / state.iterations() / (sound::CAlSourcePool::FeedIntervalMs / 1000.0);
    }
    device->Close();
    std::filesystem::remove_all(folder);
}
BENCHMARK(BM_PoolFeed)->ArgName("paused")->Arg(0)->Arg(1)->UseManualTime()->Iterations(250)->Unit(benchmark::kMicrosecond);

} // namespace

BENCHMARK_MAIN();
