// The formats that all plug-in tests cover. A new plug-in adds its rows here.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace tests {

struct SFormatCase {
    const char* plugin;
    const char* extension;
    bool lossless;             // what is written comes back bit for bit
    std::vector<int> widths;   // bytes per sample that can be written
    std::vector<int> channels; // that can be written
    bool exactEstimate;        // the estimated size is exact
    const char* magic;         // first bytes of a file; empty if they vary
    const char* check;         // command that validates a file given as last argument; empty: ffmpeg reads it
};

inline const std::vector<SFormatCase> kFormatCases{
    {"sonora2_wav", "wav", true, {1, 2, 3, 4}, {1, 2, 6}, true, "RIFF", ""},
    {"sonora2_wav", "rf64", true, {1, 2, 3, 4}, {1, 2, 6}, true, "RF64", ""},
    {"sonora2_wav", "w64", true, {1, 2, 3, 4}, {1, 2, 6}, true, "riff", ""},
    {"sonora2_wav", "aiff", true, {1, 2, 3, 4}, {1, 2, 6}, true, "FORM", ""},
    {"sonora2_wav", "aifc", true, {1, 2, 3, 4}, {1, 2, 6}, true, "FORM", ""},
    {"sonora2_wav", "au", true, {1, 2, 3, 4}, {1, 2, 6}, true, ".snd", ""},
    {"sonora2_wav", "caf", true, {1, 2, 3, 4}, {1, 2, 6}, true, "caff", ""},
    {"sonora2_flac", "flac", true, {1, 2, 3, 4}, {1, 2, 6}, false, "fLaC", "flac -st"},
    {"sonora2_vorbis", "ogg", false, {1, 2, 3, 4}, {1, 2, 6}, false, "OggS", "oggdec -Q -o /dev/null"},
    {"sonora2_l3codec", "mp3", false, {1, 2, 3, 4}, {1, 2}, false, "\xff", ""},
};

// Names test instances by extension.
inline std::string printName(const testing::TestParamInfo<SFormatCase>& row) {
    return row.param.extension;
}

} // namespace tests
