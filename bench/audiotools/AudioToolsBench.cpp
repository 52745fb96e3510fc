// The audio tools, measuring beside the library that they use.
#include <tonewright/audiotools.h>

#include <benchmark/benchmark.h>
#include <ebur128.h>

#include <random>
#include <vector>

namespace {

constexpr int kRate = 44100;
constexpr int kChunkFrames = 8192;
constexpr int kChunks = 160; // about 30 seconds of stereo sound

std::vector<short> makeChunk() {
    std::mt19937 random(1);
    std::vector<short> samples(kChunkFrames * 2);
    for (short& sample : samples) sample = static_cast<short>(static_cast<int>(random() % 32768) - 16384);
    return samples;
}

void reportSpeed(benchmark::State& state) {
    state.counters["times_real_time"] = benchmark::Counter(
        static_cast<double>(kChunkFrames) * kChunks / kRate, benchmark::Counter::kIsIterationInvariantRate);
}

void measureDirectly(benchmark::State& state, int mode) {
    const std::vector<short> chunk = makeChunk();
    for (auto _ : state) {
        ebur128_state* meter = ebur128_init(2, kRate, mode);
        for (int i = 0; i < kChunks; ++i) ebur128_add_frames_short(meter, chunk.data(), kChunkFrames);
        double loudness = 0;
        ebur128_loudness_global(meter, &loudness);
        double peak = 0, range = 0;
        ebur128_true_peak(meter, 0, &peak);
        ebur128_loudness_range(meter, &range);
        benchmark::DoNotOptimize(loudness + peak + range);
        ebur128_destroy(&meter);
    }
    reportSpeed(state);
}

void measureWith(benchmark::State& state, TONEWRIGHT_Analysator* (*create)()) {
    const std::vector<short> chunk = makeChunk();
    for (auto _ : state) {
        TONEWRIGHT_Analysator* analysator = create();
        analysator->operations->initialise(analysator, 2, 2, kRate);
        for (int i = 0; i < kChunks; ++i)
            analysator->operations->analyse(analysator, chunk.data(),
                                            static_cast<int64_t>(chunk.size() * sizeof(short)));
        benchmark::DoNotOptimize(analysator->operations->result(analysator));
        analysator->operations->destroy(analysator);
    }
    reportSpeed(state);
}

void equalize(benchmark::State& state) {
    std::vector<short> chunk = makeChunk();
    TONEWRIGHT_Equalizer* equalizer = createEqualizer();
    equalizer->operations->configure(equalizer, kRate, 2, 2);
    equalizer->operations->select(equalizer, 1); // all ten bands
    for (auto _ : state)
        for (int i = 0; i < kChunks; ++i)
            equalizer->operations->process(equalizer, chunk.data(),
                                           static_cast<int64_t>(chunk.size() * sizeof(short)));
    equalizer->operations->destroy(equalizer);
    reportSpeed(state);
}

BENCHMARK_CAPTURE(measureDirectly, loudness, EBUR128_MODE_I)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(measureWith, loudness, createNormalizeAnalysator)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(measureDirectly, all,
                  EBUR128_MODE_I | EBUR128_MODE_LRA | EBUR128_MODE_SAMPLE_PEAK | EBUR128_MODE_TRUE_PEAK)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(measureWith, all, [] {
    return createLoudnessAnalysator(TONEWRIGHT_ANALYSATOR_PEAKS | TONEWRIGHT_ANALYSATOR_RANGE);
})->Unit(benchmark::kMillisecond);
BENCHMARK(equalize)->Unit(benchmark::kMillisecond);

} // namespace
