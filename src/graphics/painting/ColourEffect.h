// Colours and bitmaps under an effect.
#pragma once

#include "graphics/painting/IGraphicsContext.h"

namespace graphics {

GRAPHICS_API SColour applyEffect(const SColour& colour, EEffect effect);
// Costs a copy of the pixels.
GRAPHICS_API P<CBitmap> applyEffect(const CBitmap& bitmap, EEffect effect);

} // namespace graphics
