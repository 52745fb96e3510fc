#include "sonora2_wav/MissingSize.h"

#include <algorithm>
#include <string>

namespace sonora2::plugins::wav {

namespace {

constexpr int64_t kRIFFHeaderBytes = 12;
constexpr int64_t kCAFHeaderBytes = 8;

std::array<uint8_t, 8> toBytes(uint64_t value, bool bigEndian) {
    std::array<uint8_t, 8> bytes{};
    for (size_t i = 0; i < 8; ++i) bytes[i] = static_cast<uint8_t>(value >> (bigEndian ? 56 - 8 * i : 8 * i));
    return bytes;
}

// Empty beyond the end.
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

struct SChunk {
    std::string id;
    int64_t size = -1; // -1 when there are no 8 bytes left
};

SChunk readChunk(std::FILE* file, int64_t at, bool bigEndian) {
    const std::string bytes = readAt(file, at, 8);
    if (bytes.empty()) return {};
    return {bytes.substr(0, 4), toNumber(bytes.substr(4), bigEndian)};
}

// Whether the rest of the file consists of whole chunks.
bool isChunkList(std::FILE* file, int64_t at, int64_t end, bool bigEndian) {
    while (at < end) {
        const SChunk chunk = readChunk(file, at, bigEndian);
        const auto isPrintable = [](char c) { return c >= ' ' && c <= '~'; };
        if (chunk.size < 0 || !std::ranges::all_of(chunk.id, isPrintable)) return false;
        at += 8 + chunk.size + chunk.size % 2;
    }
    return at <= end + 1; // the last padding byte may be missing
}

// A size of 0 is correct if the data chunk is followed by nothing or by other chunks.
SPatch findInRIFF(std::FILE* file, int64_t end, bool bigEndian, bool hasLargeSizes) {
    int64_t largeSize = 0; // offset of the size that RF64 uses in place of the data chunk's own
    int64_t at = kRIFFHeaderBytes;
    SChunk chunk = readChunk(file, at, bigEndian);
    for (; chunk.size >= 0 && chunk.id != "data"; chunk = readChunk(file, at, bigEndian)) {
        if (chunk.id == "ds64") largeSize = at + 16;
        at += 8 + chunk.size + chunk.size % 2;
    }
    at += 8;
    const bool isMissing =
        hasLargeSizes ? largeSize > 0 && readAt(file, largeSize, 8) == std::string(8, '\0') : chunk.size == 0;
    if (!isMissing || at >= end || isChunkList(file, at, end, bigEndian)) return {};
    if (hasLargeSizes) return {largeSize, 8, toBytes(static_cast<uint64_t>(end - at), false)};
    return {at - 4, 4, toBytes(UINT64_MAX, false)}; // the library reduces it to the rest of the file
}

// The library refuses a data chunk that is longer than the file or of unknown length.
SPatch findInCAF(std::FILE* file, int64_t end) {
    for (int64_t at = kCAFHeaderBytes;;) {
        const std::string head = readAt(file, at, 12);
        if (head.empty()) return {};
        const int64_t size = toNumber(head.substr(4), true);
        const int64_t rest = end - at - 12;
        if (head.starts_with("data") && (size < 0 || size > rest))
            return {at + 4, 8, toBytes(static_cast<uint64_t>(rest), true)};
        if (size < 0 || size > rest) return {};
        at += 12 + size;
    }
}

} // namespace

SPatch findMissingSize(std::FILE* file) {
    const int64_t end = ::fseeko(file, 0, SEEK_END) == 0 ? ::ftello(file) : 0;
    const std::string start = readAt(file, 0, kRIFFHeaderBytes);
    const std::string form = start.substr(0, 4);
    SPatch patch;
    if (form == "caff")
        patch = findInCAF(file, end);
    else if ((form == "RIFF" || form == "RIFX" || form == "RF64") && start.ends_with("WAVE"))
        patch = findInRIFF(file, end, form == "RIFX", form == "RF64");
    std::rewind(file);
    return patch;
}

} // namespace sonora2::plugins::wav
