// JPEG samples, of one or three channels.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace wxjng {

struct SSamples {
    int width = 0;
    int height = 0;
    int channels = 0; // 1 for grey, 3 for colours
    std::vector<uint8_t> samples;
};

// The quality is a percentage. Throws CError.
std::string encodeJpeg(const SSamples& picture, int quality);
// With the number of channels that is asked for. Throws CError if the bytes are damaged, or if the picture
// does not have the size, which the caller has checked. Picture data that end early leave the rest grey.
SSamples decodeJpeg(std::string_view bytes, int width, int height, int channels);

} // namespace wxjng
