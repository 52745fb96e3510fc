// Brushes that paint lines instead of an area.
#pragma once

#include <cairo.h>

namespace graphics {

bool isHatch(int brushStyle);
// Fills the clip with the lines of a hatch in the current colour. The lines are millimetres apart in the
// context's coordinates, so they look the same at every resolution; those of neighbouring shapes meet.
void paintHatch(cairo_t* cairo, int brushStyle);

} // namespace graphics
