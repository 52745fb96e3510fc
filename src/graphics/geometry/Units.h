// Lengths as users see them.
#pragma once

#include "graphics/Api.h"
#include "peru/strings/String.h"

namespace graphics {

using peru::P;

enum class EUnit { millimetre = 0, centimetre = 1, inch = 2 };

// The setting of the process, for the interface thread.
GRAPHICS_API EUnit getCurrentUnit();
GRAPHICS_API void setCurrentUnit(EUnit unit);

// Between millimetres and the unit.
GRAPHICS_API double toUnit(double millimetres, EUnit unit);
GRAPHICS_API double fromUnit(double value, EUnit unit);
// "mm", "cm" or "inches", localised; the short form of inches is the inch sign.
GRAPHICS_API P<peru::IString> getUnitLabel(EUnit unit);
GRAPHICS_API P<peru::IString> getShortUnitLabel(EUnit unit);
// The number without its label. `decimals` is the precision wanted in millimetres: centimetres have one
// decimal fewer, inches one more.
GRAPHICS_API P<peru::IString> formatLength(double millimetres, EUnit unit, int decimals = 2);

} // namespace graphics
