// The toolkit's image handlers on memory.
#pragma once

#include "graphics/images/Bitmap.h"

#include <wx/image.h>

namespace graphics {

// Makes the handlers of all formats known to the toolkit, so that its own functions read them as well, for
// example those for pictures in rich text. Handlers that are known already remain. Costs little when called
// again.
GRAPHICS_API void registerImageHandlers();

// Both throw CError. The caller of readImage() has checked the size. Writing TIFF and GIF is not supported.
GRAPHICS_API wxImage readImage(EBitmapFormat format, const std::string& bytes);
GRAPHICS_API std::string writeImage(EBitmapFormat format, const wxImage& image);

} // namespace graphics
