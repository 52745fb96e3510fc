#include "AudioFile.h"
#include "Cancel.h"
#include "Commands.h"
#include "HostLog.h"
#include "Text.h"

#include <algorithm>
#include <cstdio>
#include <set>
#include <stdexcept>
#include <utility>

namespace host {

namespace fs = std::filesystem;

namespace {

struct SInfo {
    SSampleFormat samples;
    double duration = 0;
    uint64_t bytes = 0;
};

SInfo readInfo(CLibrary& library, const fs::path& file) {
    checkInput(file);
    CHostLog::takeReason();
    SInfo info{readSampleFormat(file), 0, fs::file_size(file)};
    const SSampleFormat& samples = info.samples;
    CHandle source(library.CreateAudioSourceFromURI(toURI(file).c_str(), samples.rate, samples.channels,
                                                    samples.bytesPerSample, 1));
    if (source) info.duration = library.AudioSource_GetDuration(source.get());
    if (!source || info.duration < 0) throw std::runtime_error(CHostLog::takeReadReason(file));
    return info;
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
        const SInfo info = readInfo(library, file);
        if (!std::exchange(hasHeading, true))
            std::printf("%11s %7s %8s %5s %10s  %s\n", "duration", "rate", "channels", "bits", "size",
                        "file");
        if (json)
            std::printf("%s\n", toLine({{"file", file.native()},
                                        {"codec", codecName(file)},
                                        {"duration", info.duration},
                                        {"rate", info.samples.rate},
                                        {"channels", info.samples.channels},
                                        {"bits", info.samples.bytesPerSample * 8},
                                        {"bytes", info.bytes}})
                                    .c_str());
        else
            std::printf("%11s %7d %8d %5d %10s  %s\n", formatDuration(info.duration).c_str(),
                        info.samples.rate, info.samples.channels, info.samples.bytesPerSample * 8,
                        formatSize(info.bytes).c_str(), toPrintable(file.native()).c_str());
    });
}

int listFormats(CLibrary& library, bool json) {
    CHandle extensions(library.getValidCodecExtensions(TONEWRIGHT_AUDIO_SOURCE));
    std::set<std::string> names;
    for (int32_t i = 0; i < library.getExtensionCount(extensions.get()); ++i) {
        CHandle text(library.getExtension(extensions.get(), i));
        if (text)
            names.insert(toUTF8({TONEWRIGHT_GetText(text.get()), TONEWRIGHT_GetTextLength(text.get())}));
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
