// Video decoding: frames of a 640x480 Ogg Theora video decoded and converted to the
// surface's 32-bit pixels per second on one core, as the main-thread videos do it for each
// frame they show (target: 300 frames per second, ten times a 30 fps video).
#include "graphics/VideoTrack.h"
#include "misc/theoraplayer/TheoraWriter.h"

#include <benchmark/benchmark.h>

#include <vector>

namespace {

constexpr unsigned kWidth = 640, kHeight = 480, kFrames = 60;

// Two seconds of moving colour bands at 30 fps, keyframes every 32 frames.
const std::vector<uint8_t>& Video()
{
    static const std::vector<uint8_t> bytes = [] {
        std::vector<uint8_t> out;
        TheoraEncodeOptions options;
        options.fpsNumerator = 30;
        EncodeTheora(kWidth, kHeight, kFrames, [](unsigned i, std::vector<uint32_t>& pixels) {
            MakeVideoFrame("bars", kWidth, kHeight, i, kFrames, pixels);
        }, out, options);
        return out;
    }();
    return bytes;
}

void BM_TheoraDecode640x480(benchmark::State& state)
{
    ox::graphics::CVideoTrack track;
    if (!track.OpenMemory(Video().data(), Video().size(), "bench.ogv")) {
        state.SkipWithError("the generated video does not open");
        return;
    }
    std::vector<uint32_t> pixels(kWidth * kHeight, 0xFF000000u);
    th_ycbcr_buffer planes;
    for (auto _ : state) {
        if (track.DecodeNext() != ox::graphics::CVideoTrack::kFrame) {
            state.PauseTiming();
            track.Rewind();
            state.ResumeTiming();
            track.DecodeNext();
        }
        track.Planes(planes);
        TheoraYuvToRgb(planes, track.Picture(), pixels.data(), kWidth, kAlphaKeep);
        benchmark::DoNotOptimize(pixels.data());
    }
    state.SetItemsProcessed(state.iterations());
    state.counters["frames/s"] = benchmark::Counter(static_cast<double>(state.iterations()), benchmark::Counter::kIsRate);
}
BENCHMARK(BM_TheoraDecode640x480)->Unit(benchmark::kMillisecond);

} // namespace

BENCHMARK_MAIN();
