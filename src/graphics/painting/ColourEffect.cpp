#include "graphics/painting/ColourEffect.h"

namespace graphics {

namespace {

// The luminance of ITU-R BT.601, rounded.
uint32_t getLuminance(uint32_t red, uint32_t green, uint32_t blue) {
    return (299 * red + 587 * green + 114 * blue + 500) / 1000;
}

} // namespace

SColour applyEffect(const SColour& colour, EEffect effect) {
    switch (effect) {
    case EEffect::grey: {
        const auto grey = static_cast<uint8_t>(getLuminance(colour.red, colour.green, colour.blue));
        return {grey, grey, grey, colour.alpha};
    }
    case EEffect::mask:
        return {colour.alpha, colour.alpha, colour.alpha, 255};
    default:
        return colour;
    }
}

P<CBitmap> applyEffect(const CBitmap& bitmap, EEffect effect) {
    std::vector<uint32_t> pixels = bitmap.GetPixels();
    for (uint32_t& pixel : pixels) {
        const uint32_t alpha = pixel >> 24;
        // The luminance of premultiplied channels is the premultiplied luminance.
        if (effect == EEffect::grey)
            pixel = alpha << 24 | getLuminance(pixel >> 16 & 255, pixel >> 8 & 255, pixel & 255) * 0x10101u;
        else if (effect == EEffect::mask && alpha != 0) // nothing is painted where a bitmap is transparent
            pixel = 0xFF000000u | alpha * 0x10101u;
    }
    return peru::make<CBitmap>(bitmap.GetWidth(), bitmap.GetHeight(), std::move(pixels));
}

} // namespace graphics
