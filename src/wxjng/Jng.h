// JNG: a JPEG picture with an alpha channel.
#pragma once

#include "graphics/Api.h"

#include <string>
#include <string_view>

class wxImage;

namespace wxjng {

enum class EAlphaCompression {
    deflate = 0, // without loss, as in a PNG file
    jpeg = 8,
};

// 8 bits for each channel. A picture whose pixels are all grey is written with one channel, and an alpha
// channel only if the image has one. Colours under transparent pixels are preserved as well as JPEG preserves
// colours. Throws CError.
GRAPHICS_API std::string encodeJng(const wxImage& image, EAlphaCompression compression, int quality);
// Reads grey and colour pictures, with alpha in either compression. Throws CError for damaged files, for
// samples of 12 bits and for pictures above the limit.
GRAPHICS_API wxImage decodeJng(std::string_view bytes);

} // namespace wxjng
