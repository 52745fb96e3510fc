#include "Cancel.h"
#include "Commands.h"
#include "ExitCodes.h"
#include "Failure.h"
#include "SoundFile.h"
#include "Text.h"

#include <algorithm>
#include <cstdio>
#include <set>
#include <stdexcept>
#include <utility>

namespace host {

namespace fs = std::filesystem;

namespace {

std::string codecOf(const SSoundFile& sound, const fs::path& file) {
    return *sound.info.codec ? sound.info.codec : codecName(file);
}

std::string formatBitRate(int64_t bitsPerSecond) { // 320 kbit/s
    return bitsPerSecond > 0 ? std::to_string((bitsPerSecond + 500) / 1000) + " kbit/s" : "-";
}

} // namespace

void printFailure(const fs::path& file, const std::string& reason) {
    std::fprintf(stderr, "tonewright: %s: %s\n", toPrintable(file.native()).c_str(),
                 toPrintable(reason).c_str());
}

int forEachFile(const std::vector<fs::path>& files, bool json, EReader reader,
                const std::function<void(const fs::path&)>& job) {
    bool failed = false;
    for (const fs::path& file : files) {
        if (isCancelled()) return kExitCancelled;
        try {
            job(file);
        } catch (const std::exception& error) {
            failed = true;
            if (json)
                std::printf("%s\n", toLine({{"file", file.native()}, {"error", error.what()}}).c_str());
            else
                printFailure(file, error.what());
        }
        if (!flushOutput() && reader == EReader::needed) break;
    }
    return failed ? kExitFailure : kExitSuccess;
}

int showInfo(CLibrary& library, const std::vector<fs::path>& files, bool json) {
    bool hasHeading = json;
    return forEachFile(files, json, EReader::needed, [&](const fs::path& file) {
        const SSoundFile sound = openSoundFile(file);
        const TONEWRIGHT_MediaInfo& info = sound.info;
        const uint64_t bytes = fs::file_size(file);
        if (!std::exchange(hasHeading, true))
            std::printf("%11s %7s %8s %5s %10s %10s  %-12s  %s\n", "duration", "rate", "channels", "bits",
                        "bit rate", "size", "codec", "file");
        if (json)
            std::printf("%s\n", toLine({{"file", file.native()},
                                        {"codec", codecOf(sound, file)},
                                        {"duration", info.duration},
                                        {"rate", info.sampleRate},
                                        {"channels", info.channelCount},
                                        {"bits", info.bytesPerSample * 8},
                                        {"bit_rate", info.bitRate},
                                        {"bytes", bytes},
                                        {"plugin", info.plugin}})
                                    .c_str());
        else
            std::printf("%11s %7d %8d %5d %10s %10s  %-12s  %s\n", formatDuration(info.duration).c_str(),
                        info.sampleRate, info.channelCount, info.bytesPerSample * 8,
                        formatBitRate(info.bitRate).c_str(), formatSize(bytes).c_str(),
                        codecOf(sound, file).c_str(), toPrintable(file.native()).c_str());
    });
}

int listFormats(CLibrary& library, bool json) {
    CHandle extensions(library.getValidCodecExtensions(TONEWRIGHT_AUDIO_SOURCE));
    std::set<std::string> names;
    for (int32_t i = 0; i < library.getExtensionCount(extensions.get()); ++i) {
        CHandle text(library.getExtension(extensions.get(), i));
        if (text) names.insert(toUTF8(TONEWRIGHT_GetText(text.get())));
    }
    if (json) {
        std::printf("%s\n", toLine({{"read", names}}).c_str());
    } else {
        for (const std::string& name : names) std::printf("%s\n", name.c_str());
    }
    flushOutput();
    return names.empty() ? kExitFailure : kExitSuccess;
}

} // namespace host
