// What a text layout consists of, for contexts that paint it.
#pragma once

#include "graphics/text/TextLayout.h"

#include <pango/pangocairo.h>

#include <map>

namespace graphics {

// Layouts are computed at this many units per millimetre, since glyph positions are rounded to fractions of a
// unit.
inline constexpr double kUnitsPerMillimetre = 100;

// Bounds on what a damaged file can ask for; the rest of a longer text is left out.
inline constexpr size_t kMaximalText = 1'000'000; // bytes
inline constexpr size_t kMaximalLines = 10'000;

struct SUnref {
    void operator()(void* object) const { g_object_unref(object); }
};
using Context = std::unique_ptr<PangoContext, SUnref>;
using Layout = std::unique_ptr<PangoLayout, SUnref>;

// An image that stands in the text as one character. Layouts refer to it.
struct SInlineImage {
    P<CBitmap> bitmap;
    double width; // units
    double height;
};

struct CTextLayout::SImpl {
    struct SBlock {
        Layout layout;
        double left; // units
        double top;
        bool isBullet = false;
    };

    std::vector<std::unique_ptr<SInlineImage>> images;
    std::map<const CBitmap*, P<CBitmap>> changedBitmaps; // with the effect, by the bitmaps of the paragraphs
    std::vector<SBlock> blocks;                          // lines and bullets
    double width = 0;                                    // units, as the height
    double height = 0;
    size_t textLeft = kMaximalText; // bytes that may still be laid out
};

// For layouts without hinting, so that extents do not vary with the scale.
Context makePangoContext();
// A font's ascent and descent, in units.
struct SFontHeight {
    double ascent;
    double descent;
};
SFontHeight getFontHeight(PangoContext* context, const SFont& font, double scale);
// Replaces the text by what is laid out: capitals, and the character that stands for an image. Invalid bytes
// are replaced as well, since a layout would drop the whole text.
void prepareText(STextRun& run);
// One line of text that was prepared. The images are added to the target.
Layout makePangoLayout(PangoContext* context, const SParagraph& paragraph, const std::vector<STextRun>& runs,
                       EEffect effect, CTextLayout::SImpl& target);

} // namespace graphics
