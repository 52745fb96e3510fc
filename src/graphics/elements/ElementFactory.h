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

// The factory that documents use for elements with a type name. Empty for none.
GRAPHICS_API void setElementFactory(const P<IGraphicElementFactory>& factory);
// Asks the factory if there is a type name; otherwise, or if the factory does not know the name, creates the
// class of the type. Empty for types without a class.
GRAPHICS_API P<CGraphicElement> CreateElement(GraphicElementType type, const std::string& typeName);
// Empty for types without a class in this module: base, custom and animation.
GRAPHICS_API P<CGraphicElement> CreateElement(GraphicElementType type);

} // namespace graphics
