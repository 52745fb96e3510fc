// Loads the plug-ins; generates signals; reads sources and writes formats.
#pragma once

#include "peru/IInterfaceQuery.h"
#include "plugins/FormatCases.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/media/IMediaDescription.h"
#include "sonora2/plugins/PluginHandler.h"
#include "support/Files.h"
#include "support/LogLines.h"
#include "support/TempFolder.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <random>
#include <set>
#include <stdexcept>
#include <string>

namespace tests {

using peru::P;
using sonora2::audio::IAudioChunk;
using sonora2::common::IAudioFormat;
using sonora2::common::IAudioSource;

struct SShape {
    int rate = 44100;
    int channels = 2;
    int bytes = 2;
    int frameBytes() const { return channels * bytes; }
};

// The greatest difference between two 16-bit signals over their common length.
inline int getDistance16(const std::string& a, const std::string& b) {
    int distance = 0;
    for (size_t i = 0; i + 1 < std::min(a.size(), b.size()); i += 2) {
        int16_t x, y;
        std::memcpy(&x, &a[i], 2);
        std::memcpy(&y, &b[i], 2);
        distance = std::max(distance, std::abs(x - y));
    }
    return distance;
}

class CPluginTest : public ::testing::Test {
protected:
    CPluginTest() : context(peru::make<sonora2::audio::CSonoraContextAudio>()) {
        context->setLogManager(log);
        context->getBaseDirectories()->setPluginDirectory(toURI(TONEWRIGHT_PLUGIN_DIR "/"));
        std::set<std::string> names;
        for (const SFormatCase& format : kFormatCases)
            if (names.insert(format.plugin).second) context->addPluginName(format.plugin);
        context->addPluginName("sonora2_decmpa"); // reads what sonora2_l3codec writes
        context->setSwitchB(true);                // pictures of a slave are fetched ahead, as in hosts
        // All tests also hold for plug-ins in slave processes.
        handler = peru::make<sonora2::common::CPluginHandler>(context, std::getenv("TEST_BOXED") != nullptr);
    }

    P<IAudioSource> openSource(const std::filesystem::path& path, const SShape& shape = {}) {
        return handler->createAudioSource(toURI(path), shape.rate, shape.channels, shape.bytes, true);
    }
    // An open source in the file's own format.
    P<IAudioSource> openOwn(const std::filesystem::path& path, const char* plugin) {
        for (int i = 0; i < handler->getPluginCount(); ++i) {
            const P<sonora2::common::ISonoraPlugin> candidate = handler->getPlugin(i);
            if (text(candidate->getPluginName()) != plugin) continue;
            auto source = peru::interfaceCast<IAudioSource>(
                candidate->tryCreateSource(toURI(path), sonora2::common::kAudioSource, true, nullptr));
            source->open();
            return source;
        }
        throw std::runtime_error(plugin);
    }
    P<IAudioFormat> makeFormat(const std::filesystem::path& path, const SShape& shape = {}) {
        return handler->createAudioFormat(toURI(path), shape.rate, shape.channels, shape.bytes);
    }
    static std::string codecOf(const P<IAudioSource>& source) {
        return text(peru::interfaceCast<sonora2::common::IMediaDescription>(source)->getCodecName());
    }
    P<sonora2::audio::IAudioChunk> makeChunk(const std::string& pcm) {
        P<peru::IMemoryBlock> block = context->getMemoryManager()->getBlock(pcm.size());
        std::memcpy(block->getData(), pcm.data(), pcm.size());
        return peru::make<sonora2::audio::CAudioChunk>(0.0, block);
    }

    // Writes PCM in chunks of varying length.
    void writeAll(const P<IAudioFormat>& format, const std::string& pcm, const SShape& shape = {}) {
        format->open();
        size_t frames = 1;
        for (size_t at = 0; at < pcm.size(); frames = frames * 7 % 6007) {
            const size_t size = std::min(pcm.size() - at, frames * shape.frameBytes());
            format->writeAudioChunk(makeChunk(pcm.substr(at, size)));
            at += size;
        }
        format->close();
    }
    void writeFile(const std::filesystem::path& path, const std::string& pcm, const SShape& shape = {}) {
        P<IAudioFormat> format = makeFormat(path, shape);
        if (!format) throw std::runtime_error("no plug-in writes " + path.string());
        writeAll(format, pcm, shape);
    }

    // Standard output of a command in the test's folder; throws when it fails.
    std::string run(const std::string& command) const {
        std::FILE* pipe =
            popen(("cd '" + folder.path().string() + "' && { " + command + "; } 2>/dev/null").c_str(), "r");
        std::string out;
        char buffer[65536];
        for (size_t got; (got = std::fread(buffer, 1, sizeof(buffer), pipe)) > 0;) out.append(buffer, got);
        if (pclose(pipe) != 0) throw std::runtime_error("failed: " + command);
        return out;
    }
    // The samples as decoded by another program.
    std::string decodeByPeer(const std::string& name, int bytes = 2) const {
        if (name.ends_with(".flac")) // also handles 32 bits, unlike ffmpeg
            return run("flac -sdc --force-raw-format --endian=little --sign=" +
                       std::string(bytes == 1 ? "unsigned " : "signed ") + name);
        if (name == "rifx.wav") return run("sox rifx.wav -t raw -L -");
        static const char* const kCoders[] = {"", "u8", "s16le", "s24le", "s32le"};
        const std::string coder = kCoders[bytes];
        return run("ffmpeg -v error -i " + name + " -f " + coder + " -c:a pcm_" + coder + " -");
    }

    std::string read(const std::filesystem::path& path, const SShape& shape = {}) {
        P<IAudioSource> source = openSource(path, shape);
        if (!source) throw std::runtime_error("cannot read " + path.string());
        std::string pcm = readAll(source);
        EXPECT_DOUBLE_EQ(static_cast<double>(pcm.size()) / shape.frameBytes() / shape.rate,
                         source->getDuration());
        return pcm;
    }
    // Reads the rest of a source and checks its timestamps.
    static std::string readAll(const P<IAudioSource>& source, size_t limit = SIZE_MAX) {
        std::string pcm;
        const int frameBytes = source->getChannelCount() * source->getBytesPerSample();
        double time = -1.0;
        while (pcm.size() < limit && !source->isEOF()) {
            P<sonora2::audio::IAudioChunk> chunk = source->getNextAudioChunk();
            if (!chunk) {
                EXPECT_TRUE(source->isEOF()) << "an empty chunk before the end";
                break;
            }
            if (time >= 0.0) {
                EXPECT_NEAR(time, chunk->getTimestamp(), 1e-9) << "a hole between chunks";
            }
            time = chunk->getTimestamp() +
                   static_cast<double>(chunk->getSize() / frameBytes) / source->getSampleRate();
            pcm.append(reinterpret_cast<const char*>(chunk->getData()), chunk->getSize());
        }
        return pcm;
    }

    CTempFolder folder;
    P<CLogLines> log = peru::make<CLogLines>();
    P<sonora2::audio::CSonoraContextAudio> context;
    P<sonora2::common::CPluginHandler> handler; // must outlive every source and format of a test
};

// Runs over all formats.
class CFormatTest : public CPluginTest, public ::testing::WithParamInterface<SFormatCase> {
protected:
    std::filesystem::path named(const std::string& name = "x") const {
        return folder / (name + "." + GetParam().extension);
    }
    void check(const std::string& name) const { // throws when another program finds the file invalid
        if (*GetParam().check) run(std::string(GetParam().check) + " " + name);
    }
};

// A sum of sines with some noise at full range; every channel is different.
inline std::string makeMusic(const SShape& shape, int frames) {
    std::mt19937 random(static_cast<unsigned>(shape.channels * 10 + shape.bytes));
    std::string pcm;
    pcm.reserve(static_cast<size_t>(frames) * shape.frameBytes());
    const double full = std::ldexp(1.0, 8 * shape.bytes - 1) - 1.0;
    for (int i = 0; i < frames; ++i) {
        for (int channel = 0; channel < shape.channels; ++channel) {
            const double t = static_cast<double>(i) / shape.rate;
            double value = 0.6 * std::sin(2764.6 * t * (channel + 1)) + 0.3 * std::sin(691.0 * t + channel);
            value += (static_cast<double>(random() % 2001) - 1000.0) * 1e-4;
            int64_t sample = std::llround(std::clamp(value, -1.0, 1.0) * full);
            if (i < 2) sample = i == 0 ? static_cast<int64_t>(full) : -static_cast<int64_t>(full) - 1;
            if (shape.bytes == 1) sample += 128;
            pcm.append(reinterpret_cast<const char*>(&sample), static_cast<size_t>(shape.bytes));
        }
    }
    return pcm;
}

} // namespace tests
