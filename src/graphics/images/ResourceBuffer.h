// How elements own what they paint.
#pragma once

#include "graphics/images/Bitmap.h"

namespace graphics {

// Holds a resource, such as a bitmap, which other holders may share, and gives out versions of it by size.
// Versions, and the decoded form of the resource itself, are kept within a limit of memory over all holders,
// from which those that were painted least recently are released first.
template <class Resource> class TResourceBuffer {
public:
    const P<Resource>& Get() const { return m_resource; } // may be empty
    void Set(const P<Resource>& resource) { m_resource = resource; }
    // There must be a resource.
    P<Resource> Get(SPixelSize size) const { return m_resource->GetVersion(size); }
    void DropVersions() const {
        if (m_resource) m_resource->DropVersions();
    }

private:
    P<Resource> m_resource;
};

} // namespace graphics
