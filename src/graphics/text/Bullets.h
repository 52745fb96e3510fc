// The marks in front of list paragraphs.
#pragma once

#include <string>

namespace graphics {

// Bits of the attribute "bulletstyle" of rich text.
enum EBulletStyle : int {
    kBulletArabic = 0x1,
    kBulletLettersUpper = 0x2,
    kBulletLettersLower = 0x4,
    kBulletRomanUpper = 0x8,
    kBulletRomanLower = 0x10,
    kBulletSymbol = 0x20,
    kBulletBitmap = 0x40,
    kBulletParentheses = 0x80,
    kBulletPeriod = 0x100,
    kBulletStandard = 0x200,
    kBulletRightParenthesis = 0x400,
    kBulletOutline = 0x800,
    kBulletAlignRight = 0x1000,
    kBulletAlignCenter = 0x2000,
    kBulletContinuation = 0x4000, // the paragraph continues the one before it and has no mark
};

// The mark as text. `symbol` is the text of symbols and outlines, `name` that of a standard bullet. Empty for
// a style without a mark.
std::string makeBulletText(int style, int number, const std::string& symbol, const std::string& name);

} // namespace graphics
