// Notification about changed elements.
#pragma once

#include "graphics/Api.h"
#include "peru/Object.h"

namespace graphics {

class CGraphicBase;

// Elements hold their listeners without a reference: a listener removes itself before it dies.
class GRAPHICS_API IGraphicListener : public peru::CObject {
protected:
    IGraphicListener() = default;
    ~IGraphicListener() override = default;

public:
    // After a change of center, size or rotation. May add and remove listeners.
    virtual void OnGraphicChanged(CGraphicBase& element) = 0;
};

} // namespace graphics
