// Identifier comparison: equal lengths that differ should end at the hash.
#include "misc/String.h"

#include <benchmark/benchmark.h>

using ox::misc::StringA88;

static void BM_FixedStringEqualDifferentIds(benchmark::State& state)
{
    StringA88 a("textures/scene_01/background_layer");
    StringA88 b("textures/scene_01/background_layes");
    a.Hash();
    b.Hash();
    for (auto _ : state)
        benchmark::DoNotOptimize(a == b);
}
BENCHMARK(BM_FixedStringEqualDifferentIds);

static void BM_CalcHash88(benchmark::State& state)
{
    char text[88] = "textures/scene_01/background_layer_with_a_longer_name";
    for (auto _ : state)
        benchmark::DoNotOptimize(ox::misc::CalcHash(text, 53));
}
BENCHMARK(BM_CalcHash88);

BENCHMARK_MAIN();
