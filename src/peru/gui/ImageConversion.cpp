#include "peru/gui/ImageConversion.h"

#include "peru/Errors.h"

#include <wx/image.h>

namespace peru::gui {

CRGBAImage fromWxImage(const wxImage& image) {
    if (!image.IsOk()) throw CInvalidArgError("image", "fromWxImage");
    wxImage source = image; // shares the pixels unless the mask is converted
    if (source.HasMask() && !source.HasAlpha()) source.InitAlpha();
    const size_t count = static_cast<size_t>(source.GetWidth()) * static_cast<size_t>(source.GetHeight());
    std::vector<uint32_t> pixels(count);
    const uint8_t* const colours = source.GetData();
    const auto getColour = [&](size_t i) {
        return uint32_t{colours[3 * i]} << 16 | uint32_t{colours[3 * i + 1]} << 8 | colours[3 * i + 2];
    };
    if (const uint8_t* const alphas = source.HasAlpha() ? source.GetAlpha() : nullptr)
        for (size_t i = 0; i < count; ++i) pixels[i] = uint32_t{alphas[i]} << 24 | getColour(i);
    else
        for (size_t i = 0; i < count; ++i) pixels[i] = 0xFF000000u | getColour(i);
    return {source.GetWidth(), source.GetHeight(), std::move(pixels)};
}

CPremultipliedImage premultipliedFromWxImage(const wxImage& image) {
    CRGBAImage straight = fromWxImage(image);
    if (image.HasAlpha() || image.HasMask()) return premultiply(std::move(straight));
    const int width = straight.getWidth(), height = straight.getHeight();
    return {width, height, std::move(straight).takePixels()}; // opaque: both kinds are the same
}

wxImage toWxImage(const CRGBAImage& image) {
    if (image.isEmpty()) throw CInvalidArgError("image", "toWxImage");
    wxImage result(image.getWidth(), image.getHeight(), false);
    if (!result.IsOk()) throw CError("Out of memory");
    const uint32_t* const pixels = image.getRow(0);
    const size_t count = image.getPixels().size();
    uint8_t* const colours = result.GetData();
    for (size_t i = 0; i < count; ++i) {
        colours[3 * i] = static_cast<uint8_t>(pixels[i] >> 16);
        colours[3 * i + 1] = static_cast<uint8_t>(pixels[i] >> 8);
        colours[3 * i + 2] = static_cast<uint8_t>(pixels[i]);
    }
    if (image.isOpaque()) return result;
    result.SetAlpha();
    uint8_t* const alphas = result.GetAlpha();
    if (!alphas) throw CError("Out of memory");
    for (size_t i = 0; i < count; ++i) alphas[i] = static_cast<uint8_t>(pixels[i] >> 24);
    return result;
}

Surface toSurface(const CPremultipliedImage& image) {
    if (image.isEmpty()) throw CInvalidArgError("image", "toSurface");
    auto* const pixels = reinterpret_cast<unsigned char*>(const_cast<uint32_t*>(image.getRow(0)));
    return {cairo_image_surface_create_for_data(pixels, CAIRO_FORMAT_ARGB32, image.getWidth(),
                                                image.getHeight(), image.getWidth() * 4),
            cairo_surface_destroy};
}

CPremultipliedImage fromSurface(cairo_surface_t* surface) {
    const cairo_format_t format = cairo_image_surface_get_format(surface);
    if (format != CAIRO_FORMAT_ARGB32 && format != CAIRO_FORMAT_RGB24)
        throw CInvalidArgError("surface", "fromSurface");
    cairo_surface_flush(surface);
    CPremultipliedImage image(cairo_image_surface_get_width(surface),
                              cairo_image_surface_get_height(surface));
    const unsigned char* const data = cairo_image_surface_get_data(surface);
    const ptrdiff_t stride = cairo_image_surface_get_stride(surface);
    const uint32_t opaque = format == CAIRO_FORMAT_RGB24 ? 0xFF000000u : 0;
    for (int y = 0; y < image.getHeight(); ++y) {
        const auto* const from = reinterpret_cast<const uint32_t*>(data + y * stride);
        uint32_t* const to = image.getRow(y);
        for (int x = 0; x < image.getWidth(); ++x) to[x] = from[x] | opaque;
    }
    return image;
}

} // namespace peru::gui
