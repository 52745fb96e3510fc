// Rich text as it is laid out.
#pragma once

#include "graphics/elements/Appearance.h"
#include "graphics/geometry/Geometry.h"
#include "graphics/images/Bitmap.h"

#include <vector>

namespace graphics {

enum class ETextAlignment { left = 1, center = 2, right = 3, justified = 4 };

enum class ETextScript { normal, superscript, subscript };

// Text in one style, which may contain line breaks and tabs, or an image that stands in a line like a
// character.
struct STextRun {
    std::string text;
    SFont font;
    SColour colour;
    SColour background = kTransparent;
    double scale = 1;                         // of the font's size
    ETextScript script = ETextScript::normal; // the scale already includes the smaller size
    bool isStruckThrough = false;
    bool isCapitals = false;
    P<CBitmap> image = {};
    SSize imageSize = {}; // millimetres
};

// Lengths are millimetres.
struct SParagraph {
    std::vector<STextRun> runs;
    ETextAlignment alignment = ETextAlignment::left;
    SFont font; // of a paragraph without text, and of the line spacing
    double fontScale = 1;
    double leftIndent = 0;
    double leftSubIndent = 0; // of the lines behind the first, in addition
    double rightIndent = 0;
    double spaceBefore = 0;
    double spaceAfter = 0;
    double lineSpacing = 1;        // distance of the baselines in line heights
    std::vector<double> tabs = {}; // from the start of the line; empty for the default ones
    // Stands at the left indent and moves the first line's text to the indent of the other lines.
    std::vector<STextRun> bullet = {};
    ETextAlignment bulletAlignment = ETextAlignment::left; // within the additional indent
};

} // namespace graphics
