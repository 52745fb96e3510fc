// The format and size of a picture file, from its header.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace tonewright::host_support {

struct SPictureFormat {
    std::string mimeType; // empty if the format is not known
    // 0 if unknown: in pixels, and in bits per pixel.
    int32_t width = 0;
    int32_t height = 0;
    int32_t colorDepth = 0;
};

// Knows JPEG, PNG, GIF, BMP and WebP. The data may be cut or damaged.
SPictureFormat detectPictureFormat(std::string_view data);

} // namespace tonewright::host_support
