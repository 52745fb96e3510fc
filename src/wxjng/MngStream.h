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
    // The file without chunks that do not change pixels or that adapt colours to a device, and with an end
    // that repeats the animation once, so that the last frame has a duration as the others.
    std::string bytes;
};

// Throws CError if the chunks are damaged or not in a valid order, if a picture is above the limit, or if
// loops take too many steps. The library enters endless loops for some of these.
SMngStream prepareMng(std::string_view bytes);

} // namespace wxjng
