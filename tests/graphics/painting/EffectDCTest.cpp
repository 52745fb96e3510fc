#include "graphics/painting/TEffectDC.h"

#include <gtest/gtest.h>

#include <cairo.h>
#include <wx/brush.h>
#include <wx/dcgraph.h>
#include <wx/graphics.h>
#include <wx/pen.h>

using namespace graphics;

TEST(EffectDC, ReplacesColours) {
    for (const auto& [effect, expected] : {std::pair(EEffect::none, 0x80643200u),
                                           {EEffect::grey, 0x803b3b3bu},
                                           {EEffect::mask, 0xff808080u}}) {
        cairo_surface_t* const surface = cairo_image_surface_create(CAIRO_FORMAT_ARGB32, 20, 10);
        cairo_t* const cairo = cairo_create(surface);
        {
            TEffectDC<wxGCDC> dc(
                wxGraphicsRenderer::GetCairoRenderer()->CreateContextFromNativeContext(cairo));
            dc.SetEffect(effect);
            dc.SetPen(*wxTRANSPARENT_PEN);
            dc.SetBrush(wxBrush(wxColour(200, 100, 0, 128)));
            dc.DrawRectangle(0, 0, 10, 10);
            dc.SetBrush(*wxTRANSPARENT_BRUSH);
            dc.DrawRectangle(10, 0, 10, 10);
            dc.SetPen(wxPen(wxColour(200, 100, 0, 128), 4));
            dc.DrawLine(15, 0, 15, 10);
        }
        cairo_surface_flush(surface);
        const auto* const row = reinterpret_cast<const uint32_t*>(
            cairo_image_surface_get_data(surface) + 5 * cairo_image_surface_get_stride(surface));
        EXPECT_EQ(row[5], expected);
        EXPECT_EQ(row[15], expected);
        EXPECT_EQ(row[11], 0u);
        cairo_destroy(cairo);
        cairo_surface_destroy(surface);
    }
}
