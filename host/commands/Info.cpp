#include "commands/Info.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "commands/ForEachFile.h"
#include "library/Failure.h"
#include "media/Download.h"
#include "media/InputContent.h"
#include "media/SoundFile.h"
#include "media/WholeTag.h"
#include "terminal/Progress.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <optional>
#include <set>
#include <stdexcept>
#include <utility>

namespace host {

namespace fs = std::filesystem;

namespace {

std::string codecOf(const SSoundFile& sound, const fs::path& file) {
    return *sound.info.codec ? sound.info.codec : codecName(file);
}

// Plug-ins count the whole file, in which pictures can take more space than the sound.
int64_t getBitRate(const TONEWRIGHT_MediaInfo& info, const fs::path& file) {
    if (info.bitRate <= 0 || info.duration <= 0 || !canHaveTag(file)) return info.bitRate;
    double pictures = 0;
    try {
        for (const STagPicture& picture : readWholeTag(file).pictures)
            pictures += static_cast<double>(picture.data.size());
    } catch (const std::exception&) {
        return info.bitRate; // a file without a readable tag can still be played
    }
    if (hasVorbisComment(file) && !hasExtension(file, {".flac"})) pictures *= 4.0 / 3; // in Base64
    return std::max<int64_t>(info.bitRate - std::llround(pictures * 8 / info.duration), 0);
}

std::string formatBitRate(int64_t bitsPerSecond) { // 320 kbit/s
    return bitsPerSecond > 0 ? std::to_string((bitsPerSecond + 500) / 1000) + " kbit/s" : "-";
}

} // namespace

int showInfo(CLibrary& library, const std::vector<fs::path>& files, bool json) {
    bool hasHeading = json;
    return forEachFile(files, json, EReader::needed, [&](const fs::path& file) {
        std::optional<CInputContent> content;
        if (isWebAddress(file)) content.emplace(file);
        if (isCancelled()) return;
        const fs::path& opened = content ? content->getPath() : file;
        const SSoundFile sound = openSoundFile(opened);
        const TONEWRIGHT_MediaInfo& info = sound.info;
        const uint64_t bytes = fs::file_size(opened);
        const int64_t bitRate = getBitRate(info, opened);
        if (!std::exchange(hasHeading, true))
            std::printf(
                "%s\n",
                tr("host.Info.header",
                   "   duration    rate channels  bits   bit rate       size  codec                 file")
                    .c_str());
        if (json)
            std::printf("%s\n", toLine({{"file", file.native()},
                                        {"codec", codecOf(sound, opened)},
                                        {"duration", info.duration},
                                        {"rate", info.sampleRate},
                                        {"channels", info.channelCount},
                                        {"bits", info.bytesPerSample * 8},
                                        {"bit_rate", bitRate},
                                        {"bytes", bytes},
                                        {"plugin", info.plugin}})
                                    .c_str());
        else
            std::printf("%11s %7d %8d %5d %10s %10s  %-20s  %s\n", formatDuration(info.duration).c_str(),
                        info.sampleRate, info.channelCount, info.bytesPerSample * 8,
                        formatBitRate(bitRate).c_str(), formatSize(bytes).c_str(),
                        codecOf(sound, opened).c_str(), toPrintable(file.native()).c_str());
    });
}

} // namespace host
