#include "peru/gui/ImageHeader.h"

#include <algorithm>
#include <cstdlib>

namespace peru::gui {

namespace {

uint32_t byteAt(std::string_view bytes, size_t offset) {
    return static_cast<uint8_t>(bytes[offset]);
}

uint32_t bigEndian(std::string_view bytes, size_t offset, size_t count) {
    uint32_t value = 0;
    for (size_t i = 0; i < count; ++i) value = value << 8 | byteAt(bytes, offset + i);
    return value;
}

uint32_t littleEndian(std::string_view bytes, size_t offset, size_t count) {
    uint32_t value = 0;
    for (size_t i = count; i-- > 0;) value = value << 8 | byteAt(bytes, offset + i);
    return value;
}

// Of four bytes, signed.
int64_t signedAt(std::string_view bytes, size_t offset) {
    return static_cast<int32_t>(littleEndian(bytes, offset, 4));
}

// PNG and its relatives: signature, length and type of the first chunk, then the size.
std::optional<SImageSize> readChunk(std::string_view bytes, std::string_view signature,
                                    std::string_view type) {
    if (bytes.size() < 24 || !bytes.starts_with(signature) || bytes.substr(12, 4) != type) return {};
    return SImageSize{bigEndian(bytes, 16, 4), bigEndian(bytes, 20, 4)};
}

} // namespace

std::optional<SImageSize> readPngSize(std::string_view bytes) {
    return readChunk(bytes, "\x89PNG\r\n\x1A\n", "IHDR");
}

std::optional<SImageSize> readJngSize(std::string_view bytes) {
    return readChunk(bytes, "\x8BJNG\r\n\x1A\n", "JHDR");
}

std::optional<SImageSize> readMngSize(std::string_view bytes) {
    return readChunk(bytes, "\x8AMNG\r\n\x1A\n", "MHDR");
}

// The first start-of-frame segment.
std::optional<SImageSize> readJpegSize(std::string_view bytes) {
    if (!bytes.starts_with("\xFF\xD8")) return {};
    for (size_t at = 2; at + 9 <= bytes.size();) {
        if (byteAt(bytes, at) != 0xFF) return {};
        const uint32_t marker = byteAt(bytes, at + 1);
        if (marker == 0xFF) { // padding
            ++at;
            continue;
        }
        const bool isTable = marker == 0xC4 || marker == 0xC8 || marker == 0xCC;
        if (marker >= 0xC0 && marker <= 0xCF && !isTable)
            return SImageSize{bigEndian(bytes, at + 7, 2), bigEndian(bytes, at + 5, 2)};
        at += 2 + bigEndian(bytes, at + 2, 2);
    }
    return {};
}

std::optional<SImageSize> readBmpSize(std::string_view bytes) {
    constexpr uint32_t kOldHeader = 12; // with sides of 16 bits
    if (bytes.size() < 26 || !bytes.starts_with("BM")) return {};
    if (littleEndian(bytes, 14, 4) == kOldHeader)
        return SImageSize{littleEndian(bytes, 18, 2), littleEndian(bytes, 20, 2)};
    // A negative height means top to bottom.
    return SImageSize{signedAt(bytes, 18), std::abs(signedAt(bytes, 22))};
}

std::optional<SImageSize> readGifSize(std::string_view bytes) {
    if (bytes.size() < 13 || (!bytes.starts_with("GIF87a") && !bytes.starts_with("GIF89a"))) return {};
    return SImageSize{littleEndian(bytes, 6, 2), littleEndian(bytes, 8, 2)};
}

std::optional<SImageSize> readTiffSize(std::string_view bytes) {
    constexpr uint32_t kWidth = 256, kHeight = 257, kShort = 3, kLong = 4;
    constexpr size_t kEntry = 12;
    if (bytes.size() < 8) return {};
    const bool isLittle = bytes.starts_with(std::string_view("II*\0", 4));
    if (!isLittle && !bytes.starts_with(std::string_view("MM\0*", 4))) return {};
    const auto read = [&](size_t offset, size_t count) {
        return isLittle ? littleEndian(bytes, offset, count) : bigEndian(bytes, offset, count);
    };
    const size_t directory = read(4, 4);
    if (directory + 2 > bytes.size()) return {};
    const size_t count = read(directory, 2);
    std::optional<int64_t> width, height;
    for (size_t i = 0; i < count; ++i) {
        const size_t at = directory + 2 + i * kEntry;
        if (at + kEntry > bytes.size()) return {};
        const uint32_t tag = read(at, 2), type = read(at + 2, 2);
        if ((tag != kWidth && tag != kHeight) || (type != kShort && type != kLong)) continue;
        const int64_t value = read(at + 8, type == kShort ? 2 : 4);
        (tag == kWidth ? width : height) = value;
    }
    if (!width || !height) return {};
    return SImageSize{*width, *height};
}

std::optional<SImageSize> readIconSize(std::string_view bytes) {
    constexpr size_t kHeader = 6, kEntry = 16, kMaximalCount = 64;
    if (bytes.size() < kHeader + kEntry || !bytes.starts_with(std::string_view("\0\0\1\0", 4))) return {};
    const size_t count = littleEndian(bytes, 4, 2);
    if (count < 1 || count > kMaximalCount || bytes.size() < kHeader + count * kEntry) return {};
    SImageSize size{0, 0};
    for (size_t i = 0; i < count; ++i) {
        const int64_t offset = signedAt(bytes, kHeader + i * kEntry + 12);
        if (offset < 0 || offset + 40 > static_cast<int64_t>(bytes.size())) return {};
        const std::string_view picture = bytes.substr(static_cast<size_t>(offset));
        const auto png = readPngSize(picture);
        // Otherwise a bitmap, whose height includes that of the mask.
        const int64_t width = png ? png->width : signedAt(picture, 4);
        const int64_t height = png ? png->height : signedAt(picture, 8) / 2;
        if (width < 1 || height < 1) return {};
        size = {std::max(size.width, width), std::max(size.height, height)};
    }
    return size;
}

} // namespace peru::gui
