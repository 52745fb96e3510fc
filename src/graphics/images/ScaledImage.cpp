#include "graphics/images/ScaledImage.h"

#include "peru/Errors.h"
#include "peru/gui/ImageConversion.h"

namespace graphics {

peru::gui::CPremultipliedImage scaleImage(const peru::gui::CPremultipliedImage& image, SPixelSize size) {
    const peru::gui::Surface source = peru::gui::toSurface(image);
    const peru::gui::Surface target(cairo_image_surface_create(CAIRO_FORMAT_ARGB32, size.width, size.height),
                                    cairo_surface_destroy);
    cairo_t* const cairo = cairo_create(target.get());
    cairo_scale(cairo, static_cast<double>(size.width) / image.getWidth(),
                static_cast<double>(size.height) / image.getHeight());
    cairo_set_source_surface(cairo, source.get(), 0, 0);
    // Without the padding, pixels at the edges fade into transparency.
    cairo_pattern_set_extend(cairo_get_source(cairo), CAIRO_EXTEND_PAD);
    cairo_pattern_set_filter(cairo_get_source(cairo), CAIRO_FILTER_GOOD);
    cairo_set_operator(cairo, CAIRO_OPERATOR_SOURCE);
    cairo_paint(cairo);
    const cairo_status_t status = cairo_status(cairo);
    cairo_destroy(cairo);
    if (status != CAIRO_STATUS_SUCCESS) throw peru::CError(cairo_status_to_string(status));
    return peru::gui::fromSurface(target.get());
}

} // namespace graphics
