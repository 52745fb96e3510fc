// Cost of mixing: the loop by itself, and a list of tracks that play at the same time.
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/media/SilentAudioSource.h"
#include "sonora2/tracks/AudioTrack.h"
#include "sonora2/tracks/AudioTracklist.h"
#include "sonora2/tracks/MixSamples.h"

#include <benchmark/benchmark.h>

#include <random>
#include <vector>

namespace {

using peru::P;
using namespace sonora2;

constexpr int kStepFrames = 4000;

std::vector<int16_t> makeNoise(size_t count, unsigned seed) {
    std::mt19937 random(seed);
    std::vector<int16_t> noise(count);
    for (int16_t& sample : noise) sample = static_cast<int16_t>(random());
    return noise;
}

// One step of a stereo list; the bytes counted are those of the samples mixed in.
void mixStep(benchmark::State& state) {
    const std::vector<int16_t> samples = makeNoise(kStepFrames * 2, 1);
    std::vector<int16_t> sum = makeNoise(kStepFrames * 2, 2);
    for (auto _ : state) {
        audio::mixSamples(samples.data(), sum.data(), sum.size());
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(sum.size() * sizeof(int16_t)));
}
BENCHMARK(mixStep);

// Tracks without cost of their own, each in its own lane, with or without the worker.
void playList(benchmark::State& state) {
    const P<common::ISonoraContext> context = peru::make<audio::CSonoraContextAudio>();
    auto list =
        peru::make<audio::CAudioTracklist>(state.range(1) != 0, context, 44100, 2, 2, kStepFrames, 0.0, 0);
    constexpr double kLength = 36000.0;
    for (int i = 0; i < state.range(0); ++i)
        list->addTrack(peru::make<audio::CAudioTrack>(
                           context,
                           peru::make<CSilentAudioSource>(context->getMemoryManager(), kLength, 44100, 2, 2),
                           false, 0.0, kLength, i),
                       0.0, kLength);
    list->open();
    for (auto _ : state) {
        benchmark::DoNotOptimize(list->getNextAudioChunk());
        if (!list->hasMore()) list->skipToFrame(0);
    }
    state.SetItemsProcessed(state.iterations() * kStepFrames);
}
BENCHMARK(playList)->ArgNames({"tracks", "thread"})->ArgsProduct({{1, 2, 8, 40}, {0, 1}});

// Thousands of consecutive tracks, each in its own lane: the cost of a step and of a skip to find the few
// that play.
void skipInLongList(benchmark::State& state) {
    const P<common::ISonoraContext> context = peru::make<audio::CSonoraContextAudio>();
    auto list = peru::make<audio::CAudioTracklist>(false, context, 44100, 2, 2, kStepFrames, 0.0, 0);
    constexpr int kTracks = 2000;
    constexpr double kLength = 18.0;
    for (int i = 0; i < kTracks; ++i)
        list->addTrack(peru::make<audio::CAudioTrack>(
                           context,
                           peru::make<CSilentAudioSource>(context->getMemoryManager(), kLength, 44100, 2, 2),
                           false, i * kLength, kLength, state.range(0) != 0 ? i : 0),
                       i * kLength, (i + 1) * kLength);
    list->open();
    std::mt19937 random(1);
    for (auto _ : state) {
        list->skipToFrame(static_cast<uint32_t>(random() % 36000000));
        benchmark::DoNotOptimize(list->getNextAudioChunk());
    }
}
BENCHMARK(skipInLongList)->ArgName("lanes")->Arg(0)->Arg(1);

} // namespace
