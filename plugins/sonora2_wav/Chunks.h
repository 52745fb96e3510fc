// The chunks of RIFF and CAF files.
#pragma once

#include <cstdint>
#include <cstdio>
#include <string>

namespace sonora2::plugins::wav {

// Files with more chunks than this are damaged; following them would take very long.
constexpr int kMostChunks = 4096;

// Empty unless all of these bytes are in the file.
std::string readAt(std::FILE* file, int64_t at, size_t size);
int64_t toNumber(const std::string& bytes, bool bigEndian);

struct SChunk {
    std::string id;
    int64_t size = -1; // of the body; -1 when there is no whole header left
    int64_t body = 0;  // its offset
};

SChunk readChunk(std::FILE* file, int64_t at, bool bigEndian); // of RIFF
SChunk readCAFChunk(std::FILE* file, int64_t at);

// The first chunk of that id; its size is -1 if there is none.
SChunk findChunk(std::FILE* file, const char* id, bool bigEndian);
SChunk findCAFChunk(std::FILE* file, const char* id);

} // namespace sonora2::plugins::wav
