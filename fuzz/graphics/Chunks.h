// Files of chunks with valid checksums, which mutations alone would hardly find.
#pragma once

#include <cstdint>
#include <string>
#include <zlib.h>

inline std::string repairChecksums(const uint8_t* data, size_t size) {
    std::string bytes(reinterpret_cast<const char*>(data), size);
    for (size_t at = 8; at + 12 <= size;) {
        const size_t length =
            size_t{data[at]} << 24 | size_t{data[at + 1]} << 16 | size_t{data[at + 2]} << 8 | data[at + 3];
        if (length > size - at - 12) break;
        const auto sum = static_cast<uint32_t>(crc32(0, data + at + 4, static_cast<uInt>(length + 4)));
        for (size_t i = 0; i < 4; ++i) bytes[at + 8 + length + i] = static_cast<char>(sum >> (24 - 8 * i));
        at += 12 + length;
    }
    return bytes;
}
