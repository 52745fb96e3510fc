// The toolkit's image handlers on memory.
#pragma once

#include "graphics/images/Bitmap.h"

#include <wx/image.h>

namespace graphics {

// Both throw CError. JNG is not among the formats of the handlers.
wxImage readImage(EBitmapFormat format, const std::string& bytes);
std::string writeImage(EBitmapFormat format, const wxImage& image);

} // namespace graphics
