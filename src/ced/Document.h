// The designs of one target.
#pragma once

#include "ced/XmlFragment.h"
#include "graphics/documents/GraphicDocument.h"

namespace ced {

// The design of one printed item.
class GRAPHICS_API CItem : public peru::CObject {
public:
    explicit CItem(const P<graphics::CGraphicDocument>& document) : m_document(document) {}
    ~CItem() override = default;

    // `node` is the element of the item, which has a design.
    static P<CItem> Load(const P<peru::IXmlNode>& node, graphics::IResourceInputStore& store);
    // `node` is the element of the design alone.
    static P<CItem> LoadDesign(const P<peru::IXmlNode>& node, graphics::IResourceInputStore& store);
    void Save(const P<peru::IXmlNode>& node, graphics::IResourceOutputStore& store) const;

    const P<graphics::CGraphicDocument>& GetDocument() const { return m_document; } // never empty
    const std::string& GetThemeName() const { return m_themeName; }
    void SetThemeName(const std::string& name) { m_themeName = name; }
    // What else the element holds: in templates and themes the measures and a thumbnail.
    const SXmlFragment& GetOthers() const { return m_others; }

private:
    const P<graphics::CGraphicDocument> m_document;
    std::string m_themeName;
    SXmlFragment m_others; // its name is that of the element
};

class GRAPHICS_API CDocument : public peru::CObject {
public:
    CDocument() = default;
    ~CDocument() override = default;

    // Whether an element looks like that of a target, whatever its name is: designs lie in it or in its
    // children.
    static bool IsDocument(const P<peru::IXmlNode>& node);
    static P<CDocument> Load(const P<peru::IXmlNode>& node, graphics::IResourceInputStore& store);
    void Save(const P<peru::IXmlNode>& node, graphics::IResourceOutputStore& store) const;

    // The id of one of the project's formats; empty if there is none.
    const std::string& GetFormatId() const { return m_formatId; }
    void SetFormatId(const std::string& id) { m_formatId = id; }
    const std::vector<P<CItem>>& GetItems() const { return m_items; }
    void AddItem(const P<CItem>& item) { m_items.push_back(item); }

private:
    std::string m_formatId;
    std::vector<P<CItem>> m_items;
    SXmlFragment m_others;
};

} // namespace ced
