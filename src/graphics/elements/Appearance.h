// Colours, brushes, pens and fonts of elements. The numbers of styles are those of wxWidgets, which files
// hold.
#pragma once

#include <cstdint>
#include <string>

namespace graphics {

struct SColour {
    uint8_t red = 0;
    uint8_t green = 0;
    uint8_t blue = 0;
    uint8_t alpha = 255; // 0 is transparent

    bool operator==(const SColour&) const = default;
};

inline constexpr SColour kTransparent{0, 0, 0, 0};
inline constexpr int kStyleSolid = 100;
inline constexpr int kStyleDot = 101;
inline constexpr int kStyleLongDash = 102;
inline constexpr int kStyleShortDash = 103;
inline constexpr int kStyleDotDash = 104;
inline constexpr int kStyleTransparent = 106;
inline constexpr int kStyleBackwardDiagonal = 111; // rising lines; the styles up to vertical are hatches
inline constexpr int kStyleCrossDiagonal = 112;
inline constexpr int kStyleForwardDiagonal = 113; // falling lines
inline constexpr int kStyleCross = 114;
inline constexpr int kStyleHorizontal = 115;
inline constexpr int kStyleVertical = 116;

// Styles that need a bitmap, which files do not have, are painted solid.
struct SBrush {
    SColour colour{255, 255, 255, 255};
    int style = kStyleSolid;

    bool isVisible() const { return style != kStyleTransparent && colour.alpha != 0; }
    bool operator==(const SBrush&) const = default;
};

// Styles other than dots and dashes are painted solid: files have no dashes of the user's own.
struct SPen {
    SColour colour;
    int style = kStyleSolid;
    double width = 0.2; // millimetres

    bool isVisible() const { return style != kStyleTransparent && colour.alpha != 0 && width > 0; }
    bool operator==(const SPen&) const = default;
};

// From top to bottom of the element's box. It replaces the brush if one of its colours is visible.
struct SGradient {
    SColour start = kTransparent;
    SColour end = kTransparent;

    bool isVisible() const { return start.alpha != 0 || end.alpha != 0; }
    bool operator==(const SGradient&) const = default;
};

struct SFont {
    std::string name = "Arial";
    int pointSize = 10;
    int style = 90;   // 90 upright, 93 italic, 94 slanted
    int weight = 400; // 1 to 1000, 700 is bold; files from old versions have 90 to 92
    bool isUnderlined = false;

    bool operator==(const SFont&) const = default;
};

} // namespace graphics
