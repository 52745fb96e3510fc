// Cost of the sample rate converter per decoder block.
#include "sonora2/samplerateconverter/ChannelConverters.h"

#include <benchmark/benchmark.h>

#include <random>
#include <vector>

namespace {

using peru::P;
using sonora2::samplerateconverter::CSampleRateConverter;
using CChannelConverter = CSampleRateConverter::CChannelConverter;

constexpr int kBlockFrames = 4608;

std::vector<uint8_t> makeNoise(size_t bytes) {
    std::mt19937 random(1);
    std::vector<uint8_t> noise(bytes);
    for (uint8_t& byte : noise) byte = static_cast<uint8_t>(random());
    return noise;
}

// Source rate, target rate, source channels, target channels, source bytes, target bytes.
void convertBlock(benchmark::State& state) {
    const auto value = [&](int index) { return static_cast<int>(state.range(index)); };
    const P<peru::CMemoryManager> pool = peru::make<peru::CMemoryManager>();
    const auto converter =
        peru::make<CSampleRateConverter>(value(0), value(2), value(4), value(1), value(3), value(5), pool);
    const std::vector<uint8_t> block = makeNoise(static_cast<size_t>(kBlockFrames) * value(2) * value(4));
    for (auto _ : state)
        benchmark::DoNotOptimize(converter->convert(block.data(), static_cast<int>(block.size())));
    state.SetItemsProcessed(state.iterations() * kBlockFrames);
}
BENCHMARK(convertBlock)
    ->ArgNames({"from", "to", "in", "out", "width", "outwidth"})
    ->Args({44100, 48000, 2, 2, 2, 2})
    ->Args({48000, 44100, 2, 2, 2, 2})
    ->Args({96000, 44100, 2, 2, 3, 2})
    ->Args({44100, 48000, 2, 2, 2, 1})
    ->Args({44100, 44100, 1, 2, 2, 2})
    ->Args({48000, 44100, 6, 2, 2, 2})
    ->Args({48000, 48000, 6, 6, 4, 2});

// One channel matrix by itself; all are vectorised if the source is dense.
void mixBlock(benchmark::State& state) {
    const int source = static_cast<int>(state.range(0)), target = static_cast<int>(state.range(1));
    const P<CChannelConverter> matrix = CChannelConverter::create(source, target);
    const std::vector<uint8_t> noise = makeNoise(static_cast<size_t>(kBlockFrames) * source * 2);
    std::vector<int16_t> output(static_cast<size_t>(kBlockFrames) * 6);
    CChannelConverter::SourcePointers sources{};
    CChannelConverter::PlanePointers planes{};
    for (int i = 0; i < source; ++i) sources[i] = reinterpret_cast<const int16_t*>(noise.data()) + i;
    for (int i = 0; i < target; ++i) planes[i] = output.data() + i * kBlockFrames;
    for (auto _ : state) {
        matrix->convert(kBlockFrames, sources, source * 2, planes);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * kBlockFrames);
}
BENCHMARK(mixBlock)
    ->ArgNames({"in", "out"})
    ->ArgsProduct({{1, 2, 3}, {1, 2, 3, 6}})
    ->Args({4, 2})
    ->ArgsProduct({{6}, {1, 2, 3, 6}});

} // namespace
