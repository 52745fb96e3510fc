// The paragraphs of a rich text.
#pragma once

#include "graphics/elements/Appearance.h"
#include "graphics/elements/RichText.h"

#include <vector>

namespace graphics {

// Text in one style. It may contain line breaks.
struct STextRun {
    std::string text;
    SFont font;
    SColour colour;
};

enum class ETextAlignment { left = 1, center = 2, right = 3, justified = 4 };

struct SParagraph {
    std::vector<STextRun> runs;
    ETextAlignment alignment = ETextAlignment::left;
    SFont font; // of a paragraph without text: its height is that of a line
};

// Reads text, fonts, colours and alignment; images and other objects are left out. Text that cannot be read
// has no paragraphs.
GRAPHICS_API std::vector<SParagraph> parseRichText(const CRichText& text);
// The other way, for texts that a program fills in. Each line becomes a paragraph.
GRAPHICS_API P<CRichText> makeRichText(const std::string& plainText, const SFont& font,
                                       const SColour& colour = {},
                                       ETextAlignment alignment = ETextAlignment::left);

} // namespace graphics
