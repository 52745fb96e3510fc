// What a text layout consists of, for contexts that paint it.
#pragma once

#include "graphics/text/TextLayout.h"

#include <pango/pangocairo.h>

namespace graphics {

// Layouts are computed at this many units per millimetre, since glyph positions are rounded to fractions of a
// unit.
inline constexpr double kUnitsPerMillimetre = 100;

struct CTextLayout::SImpl {
    struct SUnref {
        void operator()(void* object) const { g_object_unref(object); }
    };
    struct SBlock {
        std::unique_ptr<PangoLayout, SUnref> layout;
        double top; // units
    };

    std::vector<SBlock> blocks; // one for each paragraph
    double width = 0;           // units, as the height
    double height = 0;
};

} // namespace graphics
