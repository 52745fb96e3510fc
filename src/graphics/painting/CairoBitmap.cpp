#include "graphics/painting/CairoBitmap.h"

#include <cmath>
#include <memory>

namespace graphics {

using Surface = std::unique_ptr<cairo_surface_t, decltype(&cairo_surface_destroy)>;

void paintBitmap(cairo_t* cairo, const CBitmap& bitmap, const SRect& source, const SRect& target) {
    // Also false for NaN, which would put the cairo context into an error state for good.
    if (!(source.width > 0 && source.height > 0 && target.width > 0 && target.height > 0)) return;
    // A surface over the part only: interpolation must not mix in pixels beside it. cairo only reads them.
    const int left = std::clamp(static_cast<int>(std::lround(source.left)), 0, bitmap.GetWidth() - 1);
    const int top = std::clamp(static_cast<int>(std::lround(source.top)), 0, bitmap.GetHeight() - 1);
    const int width = std::clamp(static_cast<int>(std::lround(source.width)), 1, bitmap.GetWidth() - left);
    const int height = std::clamp(static_cast<int>(std::lround(source.height)), 1, bitmap.GetHeight() - top);
    const CPixels held = bitmap.GetPixels();
    auto* const pixels = const_cast<uint32_t*>(held.data()) +
                         static_cast<size_t>(top) * static_cast<size_t>(bitmap.GetWidth()) + left;
    const Surface surface(cairo_image_surface_create_for_data(reinterpret_cast<unsigned char*>(pixels),
                                                              CAIRO_FORMAT_ARGB32, width, height,
                                                              bitmap.GetWidth() * 4),
                          cairo_surface_destroy);
    cairo_save(cairo);
    cairo_rectangle(cairo, target.left, target.top, target.width, target.height);
    cairo_translate(cairo, target.left, target.top);
    cairo_scale(cairo, target.width / width, target.height / height);
    cairo_set_source_surface(cairo, surface.get(), 0, 0);
    // Without the padding, pixels at the edge of an enlarged bitmap fade into transparency.
    cairo_pattern_set_extend(cairo_get_source(cairo), CAIRO_EXTEND_PAD);
    cairo_pattern_set_filter(cairo_get_source(cairo), CAIRO_FILTER_GOOD);
    cairo_fill(cairo);
    cairo_restore(cairo);
    // A recording device must not refer to pixels that the bitmap may free before the page is written.
    cairo_surface_finish(surface.get());
}

} // namespace graphics
