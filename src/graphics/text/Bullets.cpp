#include "graphics/text/Bullets.h"

#include <cctype>
#include <utility>

namespace graphics {

namespace {

std::string toLetter(int number, char first) {
    return number > 0 ? std::string(1, static_cast<char>(first + (number - 1) % 26)) : std::string();
}

std::string toRoman(int number, bool isLower) {
    static constexpr std::pair<int, const char*> kDigits[] = {
        {1000, "M"}, {900, "CM"}, {500, "D"}, {400, "CD"}, {100, "C"}, {90, "XC"}, {50, "L"},
        {40, "XL"},  {10, "X"},   {9, "IX"},  {5, "V"},    {4, "IV"},  {1, "I"}};
    if (number < 1 || number > 3999) return std::to_string(number);
    std::string text;
    for (const auto& [value, digits] : kDigits)
        for (; number >= value; number -= value) text += digits;
    if (isLower)
        for (char& letter : text) letter = static_cast<char>(std::tolower(letter));
    return text;
}

// Shapes as characters, so that they are in the font of the text and remain text in a PDF.
std::string toShape(const std::string& name) {
    if (name == "standard/circle-outline") return "\u25e6";
    if (name == "standard/square") return "\u25aa";
    if (name == "standard/diamond") return "\u25c6";
    if (name == "standard/triangle") return "\u25b6";
    return "\u2022";
}

} // namespace

std::string makeBulletText(int style, int number, const std::string& symbol, const std::string& name) {
    if (style & kBulletContinuation) return {};
    std::string text;
    if (style & kBulletArabic)
        text = std::to_string(number);
    else if (style & kBulletLettersUpper)
        text = toLetter(number, 'A');
    else if (style & kBulletLettersLower)
        text = toLetter(number, 'a');
    else if (style & (kBulletRomanUpper | kBulletRomanLower))
        text = toRoman(number, (style & kBulletRomanLower) != 0);
    else if (style & (kBulletSymbol | kBulletOutline))
        text = symbol;
    else if (style & (kBulletStandard | kBulletBitmap))
        return toShape(name);
    else
        return {};
    if (style & kBulletParentheses) return "(" + text + ")";
    if (style & kBulletRightParenthesis) return text + ")";
    return style & kBulletPeriod ? text + "." : text;
}

} // namespace graphics
