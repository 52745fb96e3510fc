// Bitmaps on cairo contexts.
#pragma once

#include "graphics/geometry/Geometry.h"
#include "graphics/images/Bitmap.h"

#include <cairo.h>

namespace graphics {

// Stretches a part of the bitmap, in whole pixels, to the target in the context's coordinates. Nothing is
// painted if one of the two is empty.
void paintBitmap(cairo_t* cairo, const CBitmap& bitmap, const SRect& source, const SRect& target);

} // namespace graphics
