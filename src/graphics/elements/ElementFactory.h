// Creates elements.
#pragma once

#include "graphics/elements/GraphicElement.h"

namespace graphics {

// Creates elements of classes outside of this module. The interface thread calls it.
class GRAPHICS_API IGraphicElementFactory : public virtual peru::IBase {
protected:
    ~IGraphicElementFactory() override = default;

public:
    // Empty if the name is unknown.
    virtual P<CGraphicElement> CreateElement(const std::string& typeName) = 0;
};

// Empty for types without a class in this module: base, custom and animation.
GRAPHICS_API P<CGraphicElement> CreateElement(GraphicElementType type);

} // namespace graphics
