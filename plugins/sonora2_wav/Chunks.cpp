#include "sonora2_wav/Chunks.h"

namespace sonora2::plugins::wav {

namespace {

constexpr int64_t kRIFFHeaderBytes = 12;
constexpr int64_t kCAFHeaderBytes = 8;

} // namespace

std::string readAt(std::FILE* file, int64_t at, size_t size) {
    std::string bytes(size, '\0');
    const bool isWhole = ::fseeko(file, at, SEEK_SET) == 0 && std::fread(bytes.data(), 1, size, file) == size;
    return isWhole ? bytes : std::string();
}

int64_t toNumber(const std::string& bytes, bool bigEndian) {
    uint64_t value = 0;
    for (size_t i = 0; i < bytes.size(); ++i)
        value = value << 8 | static_cast<uint8_t>(bytes[bigEndian ? i : bytes.size() - 1 - i]);
    return static_cast<int64_t>(value);
}

SChunk readChunk(std::FILE* file, int64_t at, bool bigEndian) {
    const std::string bytes = readAt(file, at, 8);
    if (bytes.empty()) return {};
    return {bytes.substr(0, 4), toNumber(bytes.substr(4), bigEndian), at + 8};
}

SChunk readCAFChunk(std::FILE* file, int64_t at) {
    const std::string bytes = readAt(file, at, 12);
    if (bytes.empty()) return {};
    return {bytes.substr(0, 4), toNumber(bytes.substr(4), true), at + 12};
}

SChunk findChunk(std::FILE* file, const char* id, bool bigEndian) {
    int64_t at = kRIFFHeaderBytes;
    for (int i = 0; i < kMostChunks; ++i) {
        const SChunk chunk = readChunk(file, at, bigEndian);
        if (chunk.size < 0 || chunk.id == id) return chunk;
        at = chunk.body + chunk.size + chunk.size % 2;
    }
    return {};
}

SChunk findCAFChunk(std::FILE* file, const char* id) {
    int64_t at = kCAFHeaderBytes;
    for (int i = 0; i < kMostChunks; ++i) {
        const SChunk chunk = readCAFChunk(file, at);
        if (chunk.id.empty() || chunk.id == id) return chunk;
        if (chunk.size < 0 || chunk.size > INT64_MAX - chunk.body)
            return {}; // only the sound may be open-ended
        at = chunk.body + chunk.size;
    }
    return {};
}

} // namespace sonora2::plugins::wav
