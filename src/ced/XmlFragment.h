// XML that is carried along.
#pragma once

#include "graphics/storage/IResourceStores.h"

#include <functional>
#include <variant>
#include <vector>

namespace ced {

using peru::P;

// A node with everything below it, and with the attachments of known kinds that it refers to, so that it can
// be written to another file, also one of another container. Used for parts of projects that this module does
// not interpret, and for those of later versions.
struct GRAPHICS_API SXmlFragment {
    std::string name;
    std::string text;
    std::vector<std::pair<std::string, std::string>> attributes;
    std::vector<SXmlFragment> children;
    std::variant<std::monostate, P<graphics::CBitmap>, P<graphics::CRichText>, P<peru::IMemoryBlock>>
        attachment;

    static SXmlFragment Load(const P<peru::IXmlNode>& node, graphics::IResourceInputStore& store);
    // In two steps, for nodes of which only a part is carried along: name and attributes, then text and those
    // children that are unknown.
    static SXmlFragment LoadAttributes(const P<peru::IXmlNode>& node);
    void LoadChildren(const P<peru::IXmlNode>& node, graphics::IResourceInputStore& store,
                      const std::function<bool(const P<peru::IXmlNode>&)>& isKnown = {});
    // Below the node.
    void Save(const P<peru::IXmlNode>& parent, graphics::IResourceOutputStore& store) const;
    // The attributes, text and children alone, into a node of the same meaning.
    void SaveContent(const P<peru::IXmlNode>& node, graphics::IResourceOutputStore& store) const;

    bool IsEmpty() const { return text.empty() && attributes.empty() && children.empty(); }
    // Empty if there is none.
    std::string GetAttribute(std::string_view attribute) const;
    const SXmlFragment* FindChild(std::string_view child) const;

private:
    // Takes the attachment over from the store if its kind is known and it can be read.
    void LoadAttachment(const P<peru::IXmlNode>& parent, graphics::IResourceInputStore& store);
};

} // namespace ced
