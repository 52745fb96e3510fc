#include "sonora2_wav/MissingSize.h"

#include "sonora2_wav/Chunks.h"

#include <algorithm>
#include <string>

namespace sonora2::plugins::wav {

namespace {

std::array<uint8_t, 8> toBytes(uint64_t value, bool bigEndian) {
    std::array<uint8_t, 8> bytes{};
    for (size_t i = 0; i < 8; ++i) bytes[i] = static_cast<uint8_t>(value >> (bigEndian ? 56 - 8 * i : 8 * i));
    return bytes;
}

// Whether the rest of the file consists of whole chunks.
bool isChunkList(std::FILE* file, int64_t at, int64_t end, bool bigEndian) {
    for (int i = 0; at < end; ++i) {
        const SChunk chunk = readChunk(file, at, bigEndian);
        const auto isPrintable = [](char c) { return c >= ' ' && c <= '~'; };
        if (i == kMostChunks || chunk.size < 0 || !std::ranges::all_of(chunk.id, isPrintable)) return false;
        at = chunk.body + chunk.size + chunk.size % 2;
    }
    return at <= end + 1; // the last padding byte may be missing
}

// A size of 0 is correct if the data chunk is followed by nothing or by other chunks.
SPatch findInRIFF(std::FILE* file, int64_t end, bool bigEndian, bool hasLargeSizes) {
    const SChunk data = findChunk(file, "data", bigEndian);
    if (data.size < 0 || data.body >= end) return {};
    int64_t largeSize = 0; // offset of the size that RF64 uses in place of the data chunk's own
    if (const SChunk sizes = findChunk(file, "ds64", bigEndian); sizes.size >= 0 && sizes.body < data.body)
        largeSize = sizes.body + 8;
    const bool isMissing =
        hasLargeSizes ? largeSize > 0 && readAt(file, largeSize, 8) == std::string(8, '\0') : data.size == 0;
    if (!isMissing || isChunkList(file, data.body, end, bigEndian)) return {};
    if (hasLargeSizes) return {largeSize, 8, toBytes(static_cast<uint64_t>(end - data.body), false)};
    return {data.body - 4, 4, toBytes(UINT64_MAX, false)}; // the library reduces it to the rest of the file
}

// The library refuses a data chunk that is longer than the file or of unknown length.
SPatch findInCAF(std::FILE* file, int64_t end) {
    const SChunk data = findCAFChunk(file, "data");
    const int64_t rest = end - data.body;
    if (data.id.empty() || rest < 0 || (data.size >= 0 && data.size <= rest)) return {};
    return {data.body - 8, 8, toBytes(static_cast<uint64_t>(rest), true)};
}

SPatch findWidth(std::FILE* file) {
    constexpr int kFormat = 8, kFlags = 12; // offsets in the description
    const SChunk description = findCAFChunk(file, "desc");
    const SChunk cookie = findCAFChunk(file, "kuki");
    if (description.id.empty() || cookie.id.empty() ||
        readAt(file, description.body + kFormat, 8) != std::string("alac\0\0\0\0", 8))
        return {};
    // The header may be wrapped in two atoms.
    int64_t header = cookie.body;
    if (readAt(file, header + 4, 4) == "frma") header += 12;
    if (readAt(file, header + 4, 4) == "alac") header += 12;
    constexpr int64_t kWidths[] = {16, 20, 24, 32}; // stated as 1 to 4
    const auto* const width = std::ranges::find(kWidths, toNumber(readAt(file, header + 5, 1), true));
    if (width == std::end(kWidths)) return {};
    return {description.body + kFlags + 3, 1, {static_cast<uint8_t>(width - kWidths + 1)}};
}

} // namespace

SPatch findMissingSize(std::FILE* file) {
    const int64_t end = ::fseeko(file, 0, SEEK_END) == 0 ? ::ftello(file) : 0;
    const std::string start = readAt(file, 0, 12);
    const std::string form = start.substr(0, 4);
    SPatch patch;
    if (form == "caff")
        patch = findInCAF(file, end);
    else if ((form == "RIFF" || form == "RIFX" || form == "RF64") && start.ends_with("WAVE"))
        patch = findInRIFF(file, end, form == "RIFX", form == "RF64");
    std::rewind(file);
    return patch;
}

SPatch findMissingWidth(std::FILE* file) {
    const SPatch patch = readAt(file, 0, 4) == "caff" ? findWidth(file) : SPatch();
    std::rewind(file);
    return patch;
}

} // namespace sonora2::plugins::wav
