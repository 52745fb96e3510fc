// The structure of GIF files.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace graphics::animation {

// What happens to a frame's rectangle before the next frame.
enum class EDisposal { keep, clear, restore };

struct SGifFrame {
    int left = 0;
    int top = 0;
    int width = 0;
    int height = 0;
    int milliseconds = 0;
    EDisposal disposal = EDisposal::keep;
    int transparent = -1; // the index of a colour that is not painted
    bool isInterlaced = false;
    std::string_view palette; // red, green and blue of each colour
    int bits = 0;             // of a pixel
    std::string_view blocks;  // the compressed pixels
};

struct SGifFile {
    int width = 0;
    int height = 0;
    int loops = 1; // 0 for ever
    std::vector<SGifFrame> frames;
};

// Refers to `bytes`. Throws CError if a block is damaged or cut off, if there is no frame, or if frames are
// above the limit of pixels; a missing end behind a whole frame is accepted.
SGifFile parseGif(std::string_view bytes);

} // namespace graphics::animation
