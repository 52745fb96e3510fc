#include "graphics/storage/Reusables.h"

#include "graphics/storage/XmlValues.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

namespace graphics {

void CSavedResources::Save(const P<peru::IXmlNode>& node, const std::string& type,
                           const P<IReusableResource>& resource, IResourceOutputStore& store) {
    if (!resource) return;
    const auto [entry, isNew] = m_entries.try_emplace(
        resource->GetUnique(), SEntry{static_cast<int64_t>(m_entries.size()) + 1, type});
    if (entry->second.type != type) throw peru::CError("Error adding unique resource. Type not equal");
    writeAttribute(node, "unique", std::to_string(entry->second.number));
    writeAttribute(node, "type", type);
    if (isNew) resource->Save(node, store);
}

P<IReusableResource> CLoadedResources::Load(const P<peru::IXmlNode>& node, const std::string& type,
                                            const P<IReusableResource>& instance,
                                            IResourceInputStore& store) {
    int64_t number = -1;
    readInteger(node, "unique", number);
    if (number <= 0) {
        instance->Load(node, store);
        return instance;
    }
    const auto [entry, isNew] = m_entries.try_emplace(number, SEntry{type, instance});
    if (entry->second.type != type) throw peru::CError("Error get reuseable resource. Type different");
    if (!isNew) {
        // A resource that contains itself would never be released, and every copy of it endless.
        if (entry->second.isLoading)
            throw peru::CParseError(
                peru::localize("graphics.CLoadedResources.Cycle", "The element %UNIQUE% contains itself.",
                               {{"%UNIQUE%", peru::CString::fromUTF8(std::to_string(number))}}));
        return entry->second.resource;
    }
    instance->Load(node, store);
    m_entries.at(number).isLoading = false;
    return instance;
}

} // namespace graphics
