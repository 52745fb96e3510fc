#include "host_support/PictureFormat.h"

namespace tonewright::host_support {

namespace {

// 0 behind the end of the data
int32_t readByte(std::string_view data, size_t offset) {
    return offset < data.size() ? static_cast<unsigned char>(data[offset]) : 0;
}
int32_t readBig(std::string_view data, size_t offset) {
    return readByte(data, offset) << 8 | readByte(data, offset + 1);
}
int32_t readLittle(std::string_view data, size_t offset) {
    return readByte(data, offset + 1) << 8 | readByte(data, offset);
}

// The frame header follows other segments, such as a preview, of known size.
SPictureFormat readJpeg(std::string_view data) {
    SPictureFormat format{"image/jpeg"};
    for (size_t at = 2; at + 9 < data.size() && readByte(data, at) == 0xFF;) {
        const int32_t marker = readByte(data, at + 1);
        if (marker == 0xFF) { // a fill byte
            ++at;
            continue;
        }
        const bool isFrame =
            marker >= 0xC0 && marker <= 0xCF && marker != 0xC4 && marker != 0xC8 && marker != 0xCC;
        if (isFrame) {
            format.height = readBig(data, at + 5);
            format.width = readBig(data, at + 7);
            format.colorDepth = readByte(data, at + 4) * readByte(data, at + 9);
            break;
        }
        at += 2 + static_cast<size_t>(readBig(data, at + 2));
    }
    return format;
}

SPictureFormat readPng(std::string_view data) {
    constexpr int32_t kChannels[] = {1, 0, 3, 1, 2, 0, 4}; // by color type
    const int32_t type = readByte(data, 25);
    // A palette has colors of 8 bits per channel.
    const int32_t depth = type == 3 ? 24 : type < 7 ? kChannels[type] * readByte(data, 24) : 0;
    if (readBig(data, 16) != 0 || readBig(data, 20) != 0) return {"image/png"};
    return {"image/png", readBig(data, 18), readBig(data, 22), depth};
}

SPictureFormat readBmp(std::string_view data) {
    constexpr int32_t kOldHeader = 12; // with sizes of 16 bits
    if (readLittle(data, 14) == kOldHeader)
        return {"image/bmp", readLittle(data, 18), readLittle(data, 20), readLittle(data, 24)};
    const int32_t height = readLittle(data, 22);
    const bool isTopDown = readLittle(data, 24) == 0xFFFF; // then the height is negative
    return {"image/bmp", readLittle(data, 18), isTopDown ? 0x10000 - height : height, readLittle(data, 28)};
}

SPictureFormat readWebP(std::string_view data) {
    SPictureFormat format{"image/webp"};
    const std::string_view kind = data.substr(12, 4);
    if (kind == "VP8X") {
        format.width = (readLittle(data, 24) | readByte(data, 26) << 16) + 1;
        format.height = (readLittle(data, 27) | readByte(data, 29) << 16) + 1;
    } else if (kind == "VP8L") {
        format.width = (readLittle(data, 21) & 0x3FFF) + 1;
        format.height = ((readLittle(data, 22) >> 6 | readByte(data, 24) << 10) & 0x3FFF) + 1;
    } else if (kind == "VP8 ") {
        format.width = readLittle(data, 26) & 0x3FFF;
        format.height = readLittle(data, 28) & 0x3FFF;
    }
    return format;
}

} // namespace

SPictureFormat detectPictureFormat(std::string_view data) {
    if (data.starts_with("\xff\xd8\xff")) return readJpeg(data);
    if (data.starts_with("\x89PNG\r\n\x1a\n")) return readPng(data);
    if (data.starts_with("GIF8")) return {"image/gif", readLittle(data, 6), readLittle(data, 8), 24};
    if (data.starts_with("BM")) return readBmp(data);
    if (data.starts_with("RIFF") && data.substr(0, 12).ends_with("WEBP")) return readWebP(data);
    return {};
}

} // namespace tonewright::host_support
