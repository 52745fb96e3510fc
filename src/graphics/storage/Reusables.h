// Which resources a store has seen.
#pragma once

#include "graphics/elements/IdGenerator.h"
#include "graphics/storage/IResourceStores.h"

#include <map>

namespace graphics {

// Files number resources from 1 in the order in which they are saved, so that a document that is loaded and
// saved again has the same content.
class GRAPHICS_API CSavedResources {
public:
    // Writes the number and, for the first node of the resource, its content.
    void Save(const P<peru::IXmlNode>& node, const std::string& type, const P<IReusableResource>& resource,
              IResourceOutputStore& store);

private:
    struct SEntry {
        int64_t number;
        std::string type;
    };
    std::map<int64_t, SEntry> m_entries; // by unique value
};

class GRAPHICS_API CLoadedResources {
public:
    P<IReusableResource> Load(const P<peru::IXmlNode>& node, const std::string& type,
                              const P<IReusableResource>& instance, IResourceInputStore& store);

private:
    struct SEntry {
        std::string type;
        P<IReusableResource> resource;
        bool isLoading = true;
    };
    std::map<int64_t, SEntry> m_entries; // by number in the file
};

} // namespace graphics
