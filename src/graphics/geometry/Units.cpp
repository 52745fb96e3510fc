#include "graphics/geometry/Units.h"

#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

#include <algorithm>

namespace graphics {

namespace {

constexpr double kInchesPerMillimetre = 0.03937007874015748;
EUnit s_currentUnit = EUnit::millimetre;

} // namespace

EUnit getCurrentUnit() {
    return s_currentUnit;
}

void setCurrentUnit(EUnit unit) {
    s_currentUnit = unit;
}

double toUnit(double millimetres, EUnit unit) {
    switch (unit) {
    case EUnit::centimetre:
        return millimetres / 10;
    case EUnit::inch:
        return millimetres * kInchesPerMillimetre;
    default:
        return millimetres;
    }
}

double fromUnit(double value, EUnit unit) {
    switch (unit) {
    case EUnit::centimetre:
        return value * 10;
    case EUnit::inch:
        return value / kInchesPerMillimetre;
    default:
        return value;
    }
}

P<peru::IString> getUnitLabel(EUnit unit) {
    switch (unit) {
    case EUnit::centimetre:
        return peru::localize("graphics.Unit.cm", "cm");
    case EUnit::inch:
        return peru::localize("graphics.Unit.Inches", "inches");
    default:
        return peru::localize("graphics.Unit.mm", "mm");
    }
}

P<peru::IString> getShortUnitLabel(EUnit unit) {
    if (unit != EUnit::inch) return getUnitLabel(unit);
    return peru::localize("graphics.Unit.InchesShort", "\"");
}

P<peru::IString> formatLength(double millimetres, EUnit unit, int decimals) {
    const int change = unit == EUnit::centimetre ? -1 : unit == EUnit::inch ? 1 : 0;
    return peru::format("%.*f", std::max(0, decimals + change), toUnit(millimetres, unit));
}

} // namespace graphics
