// What a resource store saves once, however many documents share it.
#pragma once

#include "graphics/Api.h"
#include "peru/xml/IXmlNode.h"

namespace graphics {

using peru::P;

class IResourceInputStore;
class IResourceOutputStore;

class GRAPHICS_API IReusableResource : public virtual peru::IBase {
protected:
    ~IReusableResource() override = default;

public:
    virtual void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const = 0;
    // Throws CError for values that make no sense; the object is then in an undefined but valid state.
    virtual void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) = 0;
    // Above 0, different for each object of the process.
    virtual int64_t GetUnique() const = 0;
};

} // namespace graphics
