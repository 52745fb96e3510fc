#include "sonora2_decmpa/SoundEnd.h"

#include <algorithm>
#include <string>
#include <string_view>

namespace sonora2::plugins {

namespace {

constexpr size_t kID3v1Bytes = 128;
constexpr size_t kEnhancedBytes = 227;       // "TAG+", before ID3v1
constexpr size_t kAPEBytes = 32;             // of a header or footer
constexpr size_t kID3v2Bytes = 10;           // of a header or footer
constexpr size_t kLyricsBytes = 5120;        // the longest Lyrics3v1
constexpr size_t kSearchedBytes = 64 * 1024; // for the first frame

std::string readAt(std::FILE* file, int64_t offset, size_t size) {
    std::string bytes(size, '\0');
    if (offset < 0 || ::fseeko(file, offset, SEEK_SET) != 0) return {};
    bytes.resize(std::fread(bytes.data(), 1, size, file));
    return bytes;
}

uint32_t toNumber(std::string_view bytes, int bits, bool bigEndian) {
    uint32_t number = 0;
    for (size_t i = 0; i < 4; ++i)
        number = number << bits | static_cast<uint8_t>(bytes[bigEndian ? i : 3 - i]);
    return number;
}

// Bytes of the tag that ends there; 0 if there is none.
int64_t getTagBefore(std::FILE* file, int64_t end) {
    const std::string tail = readAt(file, std::max<int64_t>(end - kLyricsBytes, 0),
                                    static_cast<size_t>(std::min<int64_t>(end, kLyricsBytes)));
    const auto getLast = [&](size_t size) {
        return tail.size() >= size ? std::string_view(tail).substr(tail.size() - size) : std::string_view();
    };
    if (getLast(kID3v1Bytes).starts_with("TAG")) {
        const bool isEnhanced = getLast(kID3v1Bytes + kEnhancedBytes).starts_with("TAG+");
        return static_cast<int64_t>(kID3v1Bytes + (isEnhanced ? kEnhancedBytes : 0));
    }
    if (const auto footer = getLast(kAPEBytes); footer.starts_with("APETAGEX")) {
        const bool hasHeader = toNumber(footer.substr(20), 8, false) >> 31;
        return int64_t{toNumber(footer.substr(12), 8, false)} + (hasHeader ? kAPEBytes : 0);
    }
    if (const auto footer = getLast(kID3v2Bytes); footer.starts_with("3DI"))
        return int64_t{toNumber(footer.substr(6), 7, true)} + 2 * kID3v2Bytes;
    if (const auto footer = getLast(15); footer.ends_with("LYRICS200")) {
        const std::string size(footer.substr(0, 6));
        const bool isNumber = std::ranges::all_of(size, [](char c) { return c >= '0' && c <= '9'; });
        return isNumber ? std::stol(size) + 15 : 0;
    }
    if (getLast(9) == "LYRICSEND") {
        const size_t begin = tail.rfind("LYRICSBEGIN");
        return begin == tail.npos ? 0 : static_cast<int64_t>(tail.size() - begin);
    }
    return 0;
}

// Bytes of the tag that starts there; 0 if there is none.
int64_t getTagAfter(std::FILE* file, int64_t start) {
    const std::string head = readAt(file, start, kAPEBytes);
    if (head.size() < kAPEBytes) return 0;
    if (head.starts_with("ID3"))
        return int64_t{toNumber(std::string_view(head).substr(6), 7, true)} + (head[5] & 0x10 ? 20 : 10);
    if (head.starts_with("APETAGEX"))
        return int64_t{toNumber(std::string_view(head).substr(12), 8, false)} + kAPEBytes;
    return head.starts_with("TAG") ? kID3v1Bytes : 0;
}

// The bits of a frame header that stay the same within a stream: version, layer and rate.
uint32_t getConstantBits(std::string_view header) {
    return toNumber(header, 8, true) & 0xFFFE0C00;
}

bool isHeader(std::string_view header) {
    const uint32_t bits = toNumber(header, 8, true);
    const bool hasSync = bits >> 21 == 0x7FF;
    return hasSync && (bits >> 19 & 3) != 1 && (bits >> 17 & 3) != 0 && (bits >> 12 & 15) != 15 &&
           (bits >> 10 & 3) != 3;
}

} // namespace

int64_t skipTags(std::FILE* file, int64_t offset) {
    for (int64_t size = getTagAfter(file, offset); size > 0; size = getTagAfter(file, offset)) offset += size;
    return offset;
}

int64_t findSoundEnd(std::FILE* file) {
    int64_t end = ::fseeko(file, 0, SEEK_END) == 0 ? ::ftello(file) : 0;
    for (int64_t size = getTagBefore(file, end); size > 0 && size <= end; size = getTagBefore(file, end))
        end -= size;

    int64_t start = skipTags(file, 0);
    const std::string head = readAt(file, start, kSearchedBytes);
    size_t at = 0;
    while (at + 4 <= head.size() && !isHeader(std::string_view(head).substr(at))) ++at;
    start += static_cast<int64_t>(at);
    // The side information that precedes the Xing header is up to 32 bytes long.
    const std::string_view first = std::string_view(head).substr(std::min(at, head.size()), 4 + 2 + 32 + 16);
    const size_t xing = std::min(first.find("Xing"), first.find("Info"));
    constexpr uint32_t kHasFrames = 1, kHasBytes = 2;
    if (xing != first.npos && xing + 16 <= first.size()) {
        const uint32_t flags = toNumber(first.substr(xing + 4), 8, true);
        const uint32_t size = toNumber(first.substr(xing + (flags & kHasFrames ? 12 : 8)), 8, true);
        const int64_t stated = start + size;
        if ((flags & kHasBytes) && size > 0 && stated < end) {
            const std::string next = readAt(file, skipTags(file, stated), 4);
            const bool continues = next.size() == 4 && getConstantBits(next) == getConstantBits(first);
            if (!continues) end = stated;
        }
    }
    std::rewind(file);
    return end;
}

} // namespace sonora2::plugins
