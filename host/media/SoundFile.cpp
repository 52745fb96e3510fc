#include "media/SoundFile.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"

#include <algorithm>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

SSoundFile openSoundFile(const fs::path& file) {
    checkInput(file);
    return openSoundPipe(file);
}

SSoundFile openSoundPipe(const fs::path& file) {
    SSoundFile sound;
    sound.info.size = sizeof sound.info;
    clearFailure();
    sound.source = CHandle(TONEWRIGHT_Host_OpenMedia(toURI(file).c_str(), &sound.info));
    if (!sound.source)
        throw std::runtime_error(takeFailure(tr("host.unreadable", "The file cannot be read"), file));
    sound.samples = {sound.info.sampleRate, sound.info.channelCount, sound.info.bytesPerSample};
    return sound;
}

std::string describe(const SSampleFormat& samples) {
    const std::initializer_list<STextValue> values{{"%RATE%", std::to_string(samples.rate)},
                                                   {"%CHANNELS%", std::to_string(samples.channels)},
                                                   {"%BITS%", std::to_string(samples.bytesPerSample * 8)}};
    return samples.channels == 1
               ? tr("host.formatOfOneChannel", "%RATE% Hz, %CHANNELS% channel and %BITS% bits", values)
               : tr("host.format", "%RATE% Hz, %CHANNELS% channels and %BITS% bits", values);
}

std::string describeKind(const fs::path& file) {
    if (!file.has_extension()) return tr("host.filesWithoutExtension", "files without an extension");
    return tr("host.filesOfKind", "%EXTENSION% files", {{"%EXTENSION%", file.extension().string()}});
}

std::string codecName(const fs::path& file) {
    std::string extension = file.extension();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char c) { return std::tolower(c); });
    static constexpr struct {
        const char* extension;
        const char* codec;
    } kCodecs[] = {{".flac", "FLAC"}, {".mp3", "MP3"},  {".ogg", "Ogg Vorbis"}, {".oga", "Ogg Vorbis"},
                   {".wav", "WAV"},   {".wave", "WAV"}, {".aif", "AIFF"},       {".aiff", "AIFF"},
                   {".au", "AU"},     {".snd", "AU"},   {".caf", "CAF"},        {".w64", "Wave64"},
                   {".rf64", "RF64"}};
    for (const auto& known : kCodecs)
        if (extension == known.extension) return known.codec;
    return extension.empty() ? tr("host.unknown", "unknown") : extension.substr(1);
}

} // namespace host
