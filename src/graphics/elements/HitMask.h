// Pixels that an element covers.
#pragma once

#include "graphics/geometry/Geometry.h"

#include <cstdint>
#include <vector>

namespace graphics {

// One byte of alpha for each device pixel of the box, row by row.
struct SHitMask {
    SRect box;      // the element's box in device pixels, for which the mask was painted
    int left = 0;   // device pixel of the first column
    int top = 0;    // and of the first row
    int width = 0;  // pixels
    int height = 0; // pixels
    std::vector<uint8_t> alpha;

    // 0 outside of the mask.
    uint8_t getAlpha(int x, int y) const {
        if (x < left || y < top || x - left >= width || y - top >= height) return 0;
        return alpha[static_cast<size_t>(y - top) * static_cast<size_t>(width) +
                     static_cast<size_t>(x - left)];
    }
};

} // namespace graphics
