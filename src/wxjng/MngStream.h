// Checks MNG files before the library reads them.
#pragma once

#include <string>
#include <string_view>

namespace wxjng {

struct SMngStream {
    int width = 0;
    int height = 0;
    // How often the animation is played: 0 for ever.
    int loops = 1;
    // The file without chunks that do not change pixels or that adapt colours to a device, and with loops
    // written out: when the library repeats chunks, it frees memory twice for some files.
    std::string bytes;
    // Where the last frame ends. Behind it follows an invisible picture, so that the library waits for the
    // duration of the last frame.
    size_t end = 0;
};

// Throws CError if the chunks are damaged or not in a valid order, if a picture is above the limit, or if
// loops take too much memory. The library enters endless loops for some of these.
SMngStream prepareMng(std::string_view bytes);

} // namespace wxjng
