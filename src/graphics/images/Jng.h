// JNG: a JPEG picture with an alpha channel.
#pragma once

#include <string>
#include <string_view>

class wxImage;

namespace graphics {

inline constexpr std::string_view kJngSignature("\x8BJNG\r\n\x1A\n", 8);

// 8 bits for each channel; the alpha is compressed without loss. Colours under transparent pixels are
// preserved as well as JPEG preserves colours.
std::string encodeJng(const wxImage& image);
// Reads grey and colour pictures, with alpha in either compression. Throws CError for damaged files and for
// samples of 12 bits.
wxImage decodeJng(const std::string& bytes);

} // namespace graphics
