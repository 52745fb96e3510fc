// The plug-ins over libav, and files made by another program.
#pragma once

#include "plugins/PluginFixture.h"

namespace tests {

class CAvTest : public CPluginTest {
protected:
    CAvTest() {
        context->clearPluginNames();
        for (const char* name : {"sonora2_wmf", "sonora2_dsgraph"}) context->addPluginName(name);
        handler = peru::make<sonora2::common::CPluginHandler>(context);
    }

    static constexpr int kFrames = 60007;

    // in.wav: 24 bits, so that codecs that keep them are told from others.
    void makeInput(int rate = 44100, int channels = 2) {
        const SShape shape{rate, channels, 3};
        folder.write("in.raw", makeMusic(shape, kFrames));
        run("ffmpeg -v error -y -f s24le -ar " + std::to_string(rate) + " -ac " + std::to_string(channels) +
            " -i in.raw -c:a pcm_s24le in.wav");
    }
    void encode(const std::string& options, const std::string& name) {
        run("ffmpeg -v error -y -i in.wav " + options + " " + name);
    }
    // One bit per sample and channel: the form of the signal is of no importance.
    void writeDsf(const std::string& name) {
        const auto number = [](uint64_t value, int bytes) {
            return std::string(reinterpret_cast<const char*>(&value), static_cast<size_t>(bytes));
        };
        constexpr uint64_t kBlocks = 20, kBlockBytes = 4096, kBytes = kBlocks * kBlockBytes * 2;
        std::string file = "DSD " + number(28, 8) + number(28 + 52 + 12 + kBytes, 8) + number(0, 8);
        file += "fmt " + number(52, 8) + number(1, 4) + number(0, 4) + number(2, 4) + number(2, 4) +
                number(2'822'400, 4) + number(1, 4) + number(kBlocks * kBlockBytes * 8, 8) +
                number(kBlockBytes, 4) + number(0, 4);
        file += "data" + number(12 + kBytes, 8);
        for (uint64_t i = 0; i < kBytes; ++i) file += static_cast<char>(i * i >> 7);
        folder.write(name, file);
    }
    // The plug-in's source in the file's own format; throws the plug-in's error.
    P<IAudioSource> openAv(const std::string& name) {
        const std::string extension = name.substr(name.rfind('.') + 1);
        const bool isWindows = extension == "wma" || extension == "asf" || extension == "wmv";
        return openOwn(folder / name, isWindows ? "sonora2_wmf" : "sonora2_dsgraph");
    }
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

} // namespace tests
