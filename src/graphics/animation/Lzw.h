// The compression of GIF files.
#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

namespace graphics::animation {

// The first `count` values of compressed data, which stand in blocks with their lengths, the last one empty.
// `bits` is the width of the values. Throws CError if the data are damaged or too short.
std::vector<uint8_t> decodeLzw(std::string_view blocks, int bits, size_t count);

} // namespace graphics::animation
