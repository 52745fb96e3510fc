// Pictures of another size.
#pragma once

#include "graphics/images/Bitmap.h"

namespace graphics {

// Each pixel is a weighted mean of the pixels that it covers. Throws CError if memory is short.
peru::gui::CPremultipliedImage scaleImage(const peru::gui::CPremultipliedImage& image, SPixelSize size);

} // namespace graphics
