// How the work on one FLAC file is divided among eight threads, also on a machine with fewer processors: each
// thread's frames are counted. The caller cuts, feeds and writes, and one thread at a time hashes; nobody
// else can do these meanwhile, so with a processor for every thread the file takes at least as long as
// either.
#include "peru/threads/ThreadBudget.h"
#include "sonora2_flac/ParallelEncoder.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <md5.h>
#include <random>
#include <stdexcept>
#include <thread>

namespace {

using namespace sonora2::plugins;
using namespace sonora2::plugins::flac;

constexpr int kThreads = CParallelEncoder::kMostThreads;
constexpr int kRate = 44100, kBlockFrames = 4096, kChunkFrames = 4608, kSeconds = 300;
constexpr int kRepetitions = 5;
const SStreamSettings kSettings{{kRate, 2, 2}, 5};

double getSeconds(clockid_t clock) {
    timespec time{};
    clock_gettime(clock, &time);
    return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9;
}

// A chord in noise of changing volume.
std::vector<uint8_t> makeSound() {
    std::mt19937 random(1);
    std::vector<int16_t> samples(size_t{kSeconds} * kRate * 2);
    for (size_t i = 0; i < samples.size(); ++i) {
        const double time = static_cast<double>(i / 2) / kRate;
        const double noise = static_cast<double>(random() % 2001) - 1000.0;
        samples[i] = static_cast<int16_t>(6000.0 * std::sin(2764.6 * time) + 4000.0 * std::sin(691.0 * time) +
                                          noise * (1.0 + std::sin(0.3 * time)));
    }
    std::vector<uint8_t> pcm(samples.size() * 2);
    std::memcpy(pcm.data(), samples.data(), pcm.size());
    return pcm;
}

class CSink : public IFrameSink {
public:
    CSink() { MD5Init(&m_hash); }
    ~CSink() override {
        if (m_file) std::fclose(m_file);
    }
    void addToHash(const std::vector<uint8_t>& pcm) noexcept override {
        const double start = getSeconds(CLOCK_THREAD_CPUTIME_ID);
        MD5Update(&m_hash, pcm.data(), pcm.size());
        const double seconds = getSeconds(CLOCK_THREAD_CPUTIME_ID) - start;
        hashing += seconds;
        if (std::this_thread::get_id() == m_caller) callerHashing += seconds;
    }
    void addFrame(const uint8_t* bytes, size_t size, uint32_t) override {
        if (m_file) std::fwrite(bytes, 1, size, m_file);
    }
    void failEncoding(const char* reason) override { throw std::runtime_error(reason); }

    double hashing = 0; // seconds
    double callerHashing = 0;

private:
    const std::thread::id m_caller = std::this_thread::get_id();
    MD5_CTX m_hash{};
    std::FILE* m_file = std::tmpfile();
};

struct SResult {
    std::vector<size_t> frames;              // by thread
    double all = 0, caller = 0, hashing = 0; // seconds of processor time; the caller's without hashing
};

SResult encode(const std::vector<uint8_t>& pcm) {
    SResult result;
    CSink sink;
    const double all = getSeconds(CLOCK_PROCESS_CPUTIME_ID), caller = getSeconds(CLOCK_THREAD_CPUTIME_ID);
    const peru::CThreadShare share;
    CParallelEncoder encoder(kSettings, kBlockFrames, sink);
    const size_t chunk = size_t{kChunkFrames} * 4;
    for (size_t at = 0; at < pcm.size(); at += chunk)
        encoder.write(&pcm[at], static_cast<int>(std::min(chunk, pcm.size() - at) / 4));
    encoder.finish();
    result.frames = encoder.getFrameCounts();
    result.all = getSeconds(CLOCK_PROCESS_CPUTIME_ID) - all;
    result.caller = getSeconds(CLOCK_THREAD_CPUTIME_ID) - caller - sink.callerHashing;
    result.hashing = sink.hashing;
    return result;
}

} // namespace

int main() {
    peru::getThreadBudget().setLimit(kThreads);
    const std::vector<uint8_t> pcm = makeSound();
    SResult best;
    for (int i = 0; i < kRepetitions; ++i)
        if (SResult result = encode(pcm); i == 0 || result.all < best.all) best = std::move(result);

    size_t frames = 0;
    for (const size_t count : best.frames) frames += count;
    std::printf("%d seconds of sound, %zu frames, %zu threads\n", kSeconds, frames, best.frames.size());
    for (size_t i = 0; i < best.frames.size(); ++i)
        std::printf("  %-8s %6zu frames  %5.1f %%\n", i == 0 ? "caller" : "helper", best.frames[i],
                    100.0 * static_cast<double>(best.frames[i]) / static_cast<double>(frames));
    // What the caller does beside encoding.
    const double encoding = best.all - best.hashing;
    const double feeding = std::max(
        best.caller - encoding * static_cast<double>(best.frames[0]) / static_cast<double>(frames), 0.0);
    const double share = best.all / kThreads, longest = std::max({share, feeding, best.hashing});
    std::printf("processor time %.3f s, a thread's share %.3f s; feeding and writing %.3f s, hashing %.3f s\n"
                "with a processor for each thread: idle for %.0f %% of the time\n",
                best.all, share, feeding, best.hashing, 100.0 * (1.0 - share / longest));
    return 0;
}
