// Decoding in a slave process compared with decoding in this process: wall time, and the processor time of
// both processes. The start and the end of the slave are included. What the start takes by itself is measured
// until the slave answers its first call.
#include "peru/system/IPathes.h"
#include "sonora2/boxed/PluginClient.h"
#include "sonora2/boxed/SlaveHandler.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/plugins/PluginHandler.h"

#include <benchmark/benchmark.h>

#include <chrono>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <sys/resource.h>

using namespace sonora2::common;
using peru::CString;

namespace {

constexpr int kRate = 44100;
constexpr int kSeconds = 300;

double getProcessorTime() {
    double seconds = 0.0;
    for (const int who : {RUSAGE_SELF, RUSAGE_CHILDREN}) {
        rusage usage = {};
        ::getrusage(who, &usage);
        for (const timeval& time : {usage.ru_utime, usage.ru_stime})
            seconds += static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) / 1e6;
    }
    return seconds;
}

class CMedia {
public:
    CMedia() {
        std::string name = std::filesystem::temp_directory_path() / "boxed-bench-XXXXXX";
        m_folder = ::mkdtemp(name.data());
        for (const char* plugin :
             {"sonora2_flac", "sonora2_decmpa", "sonora2_l3codec", "sonora2_wav", "sonora2_dsgraph"})
            m_context->addPluginName(plugin);
        plain = peru::make<CPluginHandler>(m_context, false);
        boxed = peru::make<CPluginHandler>(m_context, true);
        m_context->setSwitchB(true); // pictures are fetched ahead
    }
    ~CMedia() { std::filesystem::remove_all(m_folder); }

    // Creates the file on the first call.
    P<peru::IURI> getURI(const std::string& extension) {
        const std::filesystem::path file = m_folder / ("x." + extension);
        P<peru::IURI> uri = peru::getPathes()->fromPlatformPath(CString::fromUTF8(file.string()));
        if (std::filesystem::exists(file)) return uri;
        if (extension == "m4a") {
            getURI("wav");
            runPeer("-i x.wav -c:a aac -b:a 192k x.m4a");
        } else if (extension == "mkv") {
            runPeer("-f lavfi -i testsrc2=size=1920x1080:rate=25:duration=10 -pix_fmt yuv420p -c:v libx264 "
                    "-preset veryfast x.mkv");
        } else {
            write(uri);
        }
        return uri;
    }

    const P<sonora2::audio::CSonoraContextAudio>& getContext() const { return m_context; }

    P<CPluginHandler> plain;
    P<CPluginHandler> boxed;

private:
    void runPeer(const std::string& arguments) const {
        const std::string command = "cd '" + m_folder.string() + "' && ffmpeg -nostdin -v error " + arguments;
        if (std::system(command.c_str()) != 0) throw std::runtime_error("failed: " + command);
    }
    // Tones with noise, which compress about as well as music.
    void write(const P<peru::IURI>& uri) {
        const P<IAudioFormat> format = plain->createAudioFormat(uri, kRate, 2, 2);
        format->open();
        uint32_t noise = 1;
        for (int second = 0; second < kSeconds; ++second) {
            const auto block = peru::make<peru::CMemoryBlock>(kRate * 4);
            auto* samples = reinterpret_cast<int16_t*>(block->getData());
            for (int i = 0; i < kRate; ++i) {
                noise = noise * 1664525 + 1013904223;
                const double tone = std::sin(0.05 * i + second) + std::sin(0.013 * i);
                samples[i * 2] = static_cast<int16_t>(8000 * tone + static_cast<int>(noise >> 22) - 512);
                samples[i * 2 + 1] = static_cast<int16_t>(7000 * tone + static_cast<int>(noise >> 23) - 256);
            }
            format->writeAudioChunk(peru::make<sonora2::audio::CAudioChunk>(second, block));
        }
        format->close();
    }

    std::filesystem::path m_folder;
    P<sonora2::audio::CSonoraContextAudio> m_context = peru::make<sonora2::audio::CSonoraContextAudio>();
};

CMedia& getMedia() {
    static CMedia s_media;
    return s_media;
}

void countProcessorTime(benchmark::State& state, double start) {
    state.counters["processors"] =
        benchmark::Counter((getProcessorTime() - start) * 1e3, benchmark::Counter::kAvgIterations);
}

void decode(benchmark::State& state, const char* extension, bool isBoxed) {
    CMedia& media = getMedia();
    const P<peru::IURI> uri = media.getURI(extension);
    const double start = getProcessorTime();
    int64_t bytes = 0;
    for (auto _ : state) {
        const P<IAudioSource> source =
            (isBoxed ? media.boxed : media.plain)->createAudioSource(uri, kRate, 2, 2, true);
        while (!source->isEOF())
            if (const auto chunk = source->getNextAudioChunk()) bytes += chunk->getSize();
    }
    state.SetBytesProcessed(bytes);
    countProcessorTime(state, start);
}

// 250 pictures of 1920 by 1080, as somebody watches them: the start of the slave is a small part.
void decodeVideo(benchmark::State& state, bool isBoxed) {
    CMedia& media = getMedia();
    const P<peru::IURI> uri = media.getURI("mkv");
    const double start = getProcessorTime();
    int64_t pictures = 0;
    for (auto _ : state) {
        const P<IVideoSource> source = (isBoxed ? media.boxed : media.plain)->createVideoSource(uri, nullptr);
        source->open();
        while (!source->isEOF())
            if (const P<ISonoraPicture> picture = source->getNextPicture()) {
                const auto luma = picture->getImagePlane(0, 0, 0, picture->getWidth(), picture->getHeight());
                benchmark::DoNotOptimize(luma->getData());
                ++pictures;
            }
    }
    state.SetItemsProcessed(pictures);
    countProcessorTime(state, start);
}

void startSlave(benchmark::State& state, const char* plugin) {
    const CMedia& media = getMedia();
    const double start = getProcessorTime();
    for (auto _ : state) {
        const auto begin = std::chrono::steady_clock::now();
        const auto slave =
            peru::make<CSlaveHandler>(media.getContext(), peru::newString(plugin), kSlaveNiceValue);
        slave->call("getValidTypes", [&] { return slave->getClient()->getValidTypes(); });
        state.SetIterationTime(
            std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count());
    }
    countProcessorTime(state, start);
}

BENCHMARK_CAPTURE(startSlave, flac, "sonora2_flac")->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(startSlave, libav, "sonora2_dsgraph")->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(decode, flac_plain, "flac", false)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(decode, flac_boxed, "flac", true)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(decode, mp3_plain, "mp3", false)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(decode, mp3_boxed, "mp3", true)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(decode, aac_plain, "m4a", false)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(decode, aac_boxed, "m4a", true)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(decodeVideo, plain, false)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(decodeVideo, boxed, true)->UseRealTime()->Unit(benchmark::kMillisecond);

} // namespace
