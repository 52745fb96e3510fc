// The sound files that the program reads.
#pragma once

#include "Library.h"

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

// A file as its plug-in sees it: an open source that converts nothing.
struct SSoundFile {
    CHandle source;
    SSampleFormat samples;
    TONEWRIGHT_MediaInfo info = {};
};

// Throws std::runtime_error with the reason.
SSoundFile openSoundFile(const std::filesystem::path& file);

// Throws std::runtime_error with the reason when this is not a regular file with something in it.
void checkInput(const std::filesystem::path& file);

bool isSameFile(const std::filesystem::path& a, const std::filesystem::path& b);

// ".xyz files", as a part of a message.
std::string describeKind(const std::filesystem::path& file);

// The name of the codec of an extension.
std::string codecName(const std::filesystem::path& file);

} // namespace host
