// Random elements for property tests.
#pragma once

#include "graphics/elements/ElementFactory.h"

#include <random>

namespace tests {

using peru::P;

inline double between(std::mt19937& random, double low, double high) {
    return low + (high - low) * static_cast<double>(random()) / 4294967295.0;
}

// Places an element anywhere on a sheet, with any rotation.
inline void place(graphics::CGraphicElement& element, std::mt19937& random) {
    element.SetSize(between(random, 0.1, 120), between(random, 0.1, 120));
    element.SetCenter(between(random, -100, 300), between(random, -100, 300));
    element.SetRotation(random() % 3 ? static_cast<double>(random() % 360) : 90.0 * (random() % 4));
    element.SetMirrored(graphics::EAxis::x, random() % 2 != 0);
    element.SetMirrored(graphics::EAxis::y, random() % 2 != 0);
}

} // namespace tests
