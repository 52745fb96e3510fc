// Input files.
#pragma once

#include "base/InputFile.h"
#include "library/Library.h"

#include <filesystem>
#include <string>
#include <tonewright/host.h>

namespace host {

struct SSampleFormat {
    int rate = 44100;
    int channels = 2;
    int bytesPerSample = 2;

    bool operator==(const SSampleFormat&) const = default;
};

// "44100 Hz, 2 channels and 16 bits"
std::string describe(const SSampleFormat& samples);

// A file opened in its own format: the source is open and converts nothing.
struct SSoundFile {
    CHandle source;
    SSampleFormat samples;
    TONEWRIGHT_MediaInfo info = {};
};

// Throws std::runtime_error with the reason.
SSoundFile openSoundFile(const std::filesystem::path& file);

// The same for a named pipe. Its source has no known duration and cannot seek.
SSoundFile openSoundPipe(const std::filesystem::path& pipe);

// ".xyz files", for messages.
std::string describeKind(const std::filesystem::path& file);

// Names the codec by the file's extension.
std::string codecName(const std::filesystem::path& file);

} // namespace host
