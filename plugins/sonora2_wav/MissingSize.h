// Files whose writer left out what a reader needs.
#pragma once

#include <array>
#include <cstdint>
#include <cstdio>

namespace sonora2::plugins::wav {

// Bytes that a reader should see in place of those in the file; none if the size is 0.
struct SPatch {
    int64_t offset = 0;
    size_t size = 0;
    std::array<uint8_t, 8> bytes{};
};

// Replaces the size of the sound in a WAV or RF64 file that was never completed, and in a CAF file that is
// not complete, by what is there. Leaves the file at its start.
SPatch findMissingSize(std::FILE* file);

// Replaces the width of ALAC samples in the description of a CAF file by the one in the codec's own header,
// where the description states none. Leaves the file at its start.
SPatch findMissingWidth(std::FILE* file);

} // namespace sonora2::plugins::wav
