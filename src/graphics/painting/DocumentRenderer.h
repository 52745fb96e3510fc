// Pictures of documents.
#pragma once

#include "graphics/documents/GraphicDocument.h"
#include "graphics/painting/PaintContext.h"

#include <string>

namespace graphics {

struct SRenderOptions {
    double dpi = 300; // of bitmaps
    EColourMode colourMode = EColourMode::coloured;
    EOutputKind outputKind = EOutputKind::picture;
    // Paints the elements for which it returns true; empty for all.
    GraphicFilter filter = {};
};

// The content box of the document, otherwise its bounding box, at its size in millimetres. No display is
// needed. They throw CError if the document has no area, or if its bitmap would be too large.
GRAPHICS_API P<CBitmap> RenderBitmap(CGraphicDocument& document, const SRenderOptions& options = {});
// Transparent where nothing is painted.
GRAPHICS_API std::string RenderPng(CGraphicDocument& document, const SRenderOptions& options = {});
// One page; the same document gives the same bytes.
GRAPHICS_API std::string RenderPdf(CGraphicDocument& document, const SRenderOptions& options = {});
GRAPHICS_API std::string RenderSvg(CGraphicDocument& document, const SRenderOptions& options = {});

} // namespace graphics
