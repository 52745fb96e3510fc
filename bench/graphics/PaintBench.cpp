// A sheet painted by the module, and the same pictures drawn with cairo directly.
#include "Designs.h"
#include "graphics/painting/DocumentRenderer.h"
#include "graphics/painting/OffScreen.h"

#include <benchmark/benchmark.h>
#include <cairo.h>
#include <cstdlib>

using namespace graphics;

namespace {

constexpr double kScale = 300 / 25.4; // pixels per millimetre

void setSource(cairo_t* cairo, const SColour& colour) {
    cairo_set_source_rgba(cairo, colour.red / 255.0, colour.green / 255.0, colour.blue / 255.0,
                          colour.alpha / 255.0);
}

// The outline of a shape around the origin, as a program would draw it that knows cairo only.
void addOutline(cairo_t* cairo, const CGraphicShape& shape) {
    const SSize size = shape.GetSize();
    const double x = size.width / 2, y = size.height / 2;
    if (shape.GetShapeType() == EShapeType::rectangle)
        return cairo_rectangle(cairo, -x, -y, size.width, size.height);
    if (shape.GetShapeType() == EShapeType::ellipse) {
        cairo_save(cairo);
        cairo_scale(cairo, x, y);
        cairo_new_path(cairo);
        cairo_arc(cairo, 0, 0, 1, 0, 2 * M_PI);
        cairo_close_path(cairo);
        return cairo_restore(cairo);
    }
    const double r = std::min(shape.GetCornerRadius(), std::min(x, y));
    cairo_new_path(cairo);
    cairo_arc(cairo, x - r, -y + r, r, -M_PI / 2, 0);
    cairo_arc(cairo, x - r, y - r, r, 0, M_PI / 2);
    cairo_arc(cairo, -x + r, y - r, r, M_PI / 2, M_PI);
    cairo_arc(cairo, -x + r, -y + r, r, M_PI, 3 * M_PI / 2);
    cairo_close_path(cairo);
}

void drawShape(cairo_t* cairo, const CGraphicShape& shape) {
    addOutline(cairo, shape);
    if (shape.GetGradient().isVisible()) {
        const double y = shape.GetSize().height / 2;
        cairo_pattern_t* const pattern = cairo_pattern_create_linear(0, -y, 0, y);
        const auto addStop = [&](double offset, const SColour& colour) {
            cairo_pattern_add_color_stop_rgba(pattern, offset, colour.red / 255.0, colour.green / 255.0,
                                              colour.blue / 255.0, colour.alpha / 255.0);
        };
        addStop(0, shape.GetGradient().start);
        addStop(1, shape.GetGradient().end);
        cairo_set_source(cairo, pattern);
        cairo_pattern_destroy(pattern);
    } else {
        setSource(cairo, shape.GetBrush().colour);
    }
    cairo_fill_preserve(cairo);
    setSource(cairo, shape.GetPen().colour);
    cairo_set_line_width(cairo, shape.GetPen().width);
    cairo_stroke(cairo);
}

void drawImage(cairo_t* cairo, const CGraphicImage& image) {
    const CBitmap& bitmap = *image.GetBitmap();
    const CPixels pixels = bitmap.GetPixels();
    const SSize size = image.GetSize();
    cairo_surface_t* const surface = cairo_image_surface_create_for_data(
        reinterpret_cast<unsigned char*>(const_cast<uint32_t*>(pixels.data())), CAIRO_FORMAT_ARGB32,
        bitmap.GetWidth(), bitmap.GetHeight(), bitmap.GetWidth() * 4);
    cairo_rectangle(cairo, -size.width / 2, -size.height / 2, size.width, size.height);
    cairo_translate(cairo, -size.width / 2, -size.height / 2);
    cairo_scale(cairo, size.width / bitmap.GetWidth(), size.height / bitmap.GetHeight());
    cairo_set_source_surface(cairo, surface, 0, 0);
    cairo_pattern_set_extend(cairo_get_source(cairo), CAIRO_EXTEND_PAD);
    cairo_fill(cairo);
    cairo_surface_destroy(surface);
}

// The caller destroys the result.
cairo_surface_t* drawWithCairo(CGraphicDocument& document) {
    cairo_surface_t* const surface = cairo_image_surface_create(
        CAIRO_FORMAT_ARGB32, static_cast<int>(std::lround(bench::kSheetWidth * kScale)),
        static_cast<int>(std::lround(bench::kSheetHeight * kScale)));
    cairo_t* const cairo = cairo_create(surface);
    cairo_scale(cairo, kScale, kScale);
    for (const auto& element : document.GetElements()) {
        cairo_save(cairo);
        cairo_translate(cairo, element->GetCenter().x, element->GetCenter().y);
        cairo_rotate(cairo, element->GetRotation() * M_PI / 180);
        if (const auto* shape = dynamic_cast<const CGraphicShape*>(element.get()))
            drawShape(cairo, *shape);
        else
            drawImage(cairo, dynamic_cast<const CGraphicImage&>(*element));
        cairo_restore(cairo);
    }
    cairo_destroy(cairo);
    return surface;
}

void paint(CGraphicDocument& document, COffScreen& target) {
    CPaintContext context(target.GetGraphics(), CMatrix());
    document.Paint(context, {0, 0, bench::kSheetWidth * kScale, bench::kSheetHeight * kScale});
}

// A comparison of speed is worth nothing if the pictures differ.
void requireSamePicture(CGraphicDocument& document) {
    const CPixels painted = RenderBitmap(document)->GetPixels();
    cairo_surface_t* const drawn = drawWithCairo(document);
    const unsigned char* const bytes = cairo_image_surface_get_data(drawn);
    double difference = 0;
    for (size_t i = 0; i < painted.size() * 4; ++i)
        difference += std::abs(reinterpret_cast<const unsigned char*>(painted.data())[i] - bytes[i]);
    cairo_surface_destroy(drawn);
    if (difference / static_cast<double>(painted.size() * 4) > 0.05) std::abort();
}

const P<CGraphicDocument>& getSheet() {
    static const P<CGraphicDocument> sheet = [] {
        P<CGraphicDocument> made = bench::makeSheet();
        requireSamePicture(*made);
        return made;
    }();
    return sheet;
}

void BM_Sheet(benchmark::State& state) {
    CGraphicDocument& sheet = *getSheet();
    for (auto _ : state) {
        COffScreen target(std::lround(bench::kSheetWidth * kScale),
                          std::lround(bench::kSheetHeight * kScale));
        paint(sheet, target);
        benchmark::DoNotOptimize(target.GetRow(0));
    }
}
BENCHMARK(BM_Sheet)->Unit(benchmark::kMillisecond);

void BM_SheetWithCairo(benchmark::State& state) {
    CGraphicDocument& sheet = *getSheet();
    for (auto _ : state) cairo_surface_destroy(drawWithCairo(sheet));
}
BENCHMARK(BM_SheetWithCairo)->Unit(benchmark::kMillisecond);

} // namespace
