// The body of most Clone() operations.
#pragma once

#include "graphics/elements/GraphicElement.h"

namespace graphics {

template <class T> P<CGraphicElement> cloneAs(const T& original) {
    P<T> copy = peru::make<T>();
    copy->Assign(original);
    return copy;
}

} // namespace graphics
