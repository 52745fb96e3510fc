// The sizes of pictures, from the headers of their files.
#pragma once

#include "graphics/Api.h"

#include <cstdint>
#include <optional>
#include <string_view>

namespace peru::gui {

struct SImageSize {
    int64_t width;
    int64_t height;

    bool operator==(const SImageSize&) const = default;
};

// Empty if the bytes are not the header of such a file. The sizes are as announced, so they may be 0,
// negative or too large.
GRAPHICS_API std::optional<SImageSize> readPngSize(std::string_view bytes);
GRAPHICS_API std::optional<SImageSize> readJngSize(std::string_view bytes);
GRAPHICS_API std::optional<SImageSize> readMngSize(std::string_view bytes);
GRAPHICS_API std::optional<SImageSize> readJpegSize(std::string_view bytes);
GRAPHICS_API std::optional<SImageSize> readBmpSize(std::string_view bytes);
GRAPHICS_API std::optional<SImageSize> readGifSize(std::string_view bytes);
GRAPHICS_API std::optional<SImageSize> readTiffSize(std::string_view bytes); // of the first page
// The largest width and the largest height of the pictures in an icon.
GRAPHICS_API std::optional<SImageSize> readIconSize(std::string_view bytes);

} // namespace peru::gui
