#include "graphics/painting/DocumentRenderer.h"

#include "graphics/painting/OffScreen.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <cairo-pdf.h>
#include <cairo-svg.h>
#include <cmath>

namespace graphics {

namespace {

constexpr double kMillimetresPerInch = 25.4;
constexpr double kPointsPerInch = 72;
// Of reflections and other pictures of pixels inside vector files.
constexpr double kVectorDpi = 300;

SRect getSourceBox(CGraphicDocument& document) {
    const SRect box = document.GetSourceBox();
    // The comparison also rejects NaN.
    if (box.width > 0 && box.height > 0 && std::isfinite(box.width) && std::isfinite(box.height)) return box;
    throw peru::CError(
        peru::localize("graphics.DocumentRenderer.Empty", "The document has no area to paint."));
}

void paint(CGraphicDocument& document, IGraphicsContext& graphics, const SRect& target,
           const SRenderOptions& options) {
    CPaintContext context(graphics, CMatrix(), options.colourMode, options.outputKind);
    document.Paint(context, target, options.filter);
}

std::unique_ptr<COffScreen> render(CGraphicDocument& document, const SRenderOptions& options) {
    const SRect box = getSourceBox(document);
    const double scale = options.dpi / kMillimetresPerInch;
    const double width = box.width * scale, height = box.height * scale;
    if (!(width < 1e9 && height < 1e9)) throw peru::CInvalidArgError("dpi", "Render");
    auto offScreen =
        std::make_unique<COffScreen>(std::max(1L, std::lround(width)), std::max(1L, std::lround(height)));
    // The exact scale instead of whole pixels: shapes have the same proportions at every resolution.
    paint(document, offScreen->GetGraphics(), {0, 0, width, height}, options);
    return offScreen;
}

cairo_status_t append(void* target, const unsigned char* data, unsigned length) {
    static_cast<std::string*>(target)->append(reinterpret_cast<const char*>(data), length);
    return CAIRO_STATUS_SUCCESS;
}

// `create` makes the surface for a size in points.
template <class Create>
std::string renderVector(CGraphicDocument& document, const SRenderOptions& options, const Create& create) {
    const SRect box = getSourceBox(document);
    const double scale = kPointsPerInch / kMillimetresPerInch;
    const SRect target{0, 0, box.width * scale, box.height * scale};
    std::string bytes;
    cairo_surface_t* const surface = create(&bytes, target.width, target.height);
    cairo_t* const cairo = cairo_create(surface);
    try {
        const auto graphics =
            peru::make<TEffectGraphicsContext<CCairoContext>>(cairo, kVectorDpi / kPointsPerInch);
        paint(document, *graphics, target, options);
    } catch (...) {
        cairo_destroy(cairo);
        cairo_surface_destroy(surface);
        throw;
    }
    cairo_status_t status = cairo_status(cairo);
    cairo_destroy(cairo);
    cairo_surface_finish(surface);
    if (status == CAIRO_STATUS_SUCCESS) status = cairo_surface_status(surface);
    cairo_surface_destroy(surface);
    if (status != CAIRO_STATUS_SUCCESS) throw peru::CError(cairo_status_to_string(status));
    return bytes;
}

} // namespace

P<CBitmap> RenderBitmap(CGraphicDocument& document, const SRenderOptions& options) {
    return render(document, options)->GetBitmap();
}

std::string RenderPng(CGraphicDocument& document, const SRenderOptions& options) {
    return render(document, options)->GetPng();
}

std::string RenderPdf(CGraphicDocument& document, const SRenderOptions& options) {
    return renderVector(document, options, [](std::string* bytes, double width, double height) {
        cairo_surface_t* const surface = cairo_pdf_surface_create_for_stream(append, bytes, width, height);
        cairo_pdf_surface_set_metadata(surface, CAIRO_PDF_METADATA_CREATE_DATE, "2000-01-01T00:00:00Z");
        return surface;
    });
}

std::string RenderSvg(CGraphicDocument& document, const SRenderOptions& options) {
    return renderVector(document, options, [](std::string* bytes, double width, double height) {
        cairo_surface_t* const surface = cairo_svg_surface_create_for_stream(append, bytes, width, height);
        cairo_svg_surface_set_document_unit(surface, CAIRO_SVG_UNIT_PT);
        return surface;
    });
}

} // namespace graphics
