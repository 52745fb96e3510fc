// Limits on the memory that pictures take.
#pragma once

#include "graphics/Api.h"

#include <cstdint>

namespace peru::gui {

// The default limit on the pixels of one picture.
inline constexpr int64_t kDefaultMaximalPixels = 100'000'000;

// The limit on the pixels of one picture, checked before memory is allocated: TONEWRIGHT_IMAGE_MEGAPIXELS or
// the default, until it is set. Values below 1 restore that.
GRAPHICS_API int64_t getMaximalPixels();
GRAPHICS_API void setMaximalPixels(int64_t count);

// Throws CError if a side is below 1 or above 32767, or if the picture has more pixels than the limit.
GRAPHICS_API void checkImageSize(int64_t width, int64_t height);

// The limit on the bytes of all decoded and scaled pictures that are kept to be painted again:
// TONEWRIGHT_IMAGE_MEMORY in MiB or 256 MiB, until it is set. Values below 1 restore that.
GRAPHICS_API int64_t getImageMemory();
GRAPHICS_API void setImageMemory(int64_t bytes);

} // namespace peru::gui
