// Images of the toolkit and of cairo.
#pragma once

#include "peru/gui/RGBAImage.h"

#include <cairo.h>
#include <memory>

class wxImage;

namespace peru::gui {

// A mask becomes transparency. Throws CInvalidArgError for an invalid image.
GRAPHICS_API CRGBAImage fromWxImage(const wxImage& image);
GRAPHICS_API CPremultipliedImage premultipliedFromWxImage(const wxImage& image);
// With an alpha channel only if a pixel is not opaque. Throws CError if memory is short.
GRAPHICS_API wxImage toWxImage(const CRGBAImage& image);

using Surface = std::unique_ptr<cairo_surface_t, decltype(&cairo_surface_destroy)>;

// A surface over the image's pixels, without a copy. The image must outlive it, and the surface is only for
// painting from.
GRAPHICS_API Surface toSurface(const CPremultipliedImage& image);
// A copy of a surface of 32 bits per pixel. Throws CInvalidArgError for another one.
GRAPHICS_API CPremultipliedImage fromSurface(cairo_surface_t* surface);

} // namespace peru::gui
