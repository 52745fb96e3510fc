#include "ced/Document.h"

#include "graphics/storage/XmlValues.h"
#include "peru/strings/String.h"

namespace ced {

using graphics::Node;

namespace {

constexpr const char* kItem = "item";
constexpr const char* kDesign = "graphic-document";
constexpr const char* kFormat = "format";
constexpr const char* kThemeName = "theme-name";

bool hasDesign(const Node& node) {
    return static_cast<bool>(node->getChildNode(kDesign));
}

SXmlFragment loadOthers(const Node& node, graphics::IResourceInputStore& store, const char* knownAttribute,
                        bool (*isKnownChild)(const Node&)) {
    SXmlFragment others = SXmlFragment::LoadAttributes(node);
    std::erase_if(others.attributes,
                  [&](const auto& attribute) { return attribute.first == knownAttribute; });
    others.LoadChildren(node, store, isKnownChild);
    return others;
}

} // namespace

P<CItem> CItem::Load(const Node& node, graphics::IResourceInputStore& store) {
    const auto item = LoadDesign(node->getChildNode(kDesign), store);
    graphics::readAttribute(node, kThemeName, item->m_themeName);
    item->m_others = loadOthers(node, store, kThemeName,
                                [](const Node& child) { return graphics::getName(child) == kDesign; });
    return item;
}

P<CItem> CItem::LoadDesign(const Node& node, graphics::IResourceInputStore& store) {
    const auto item = peru::make<CItem>(peru::make<graphics::CGraphicDocument>());
    item->m_document->Load(node, store);
    return item;
}

void CItem::Save(const Node& node, graphics::IResourceOutputStore& store) const {
    graphics::writeAttribute(node, kThemeName, m_themeName);
    m_others.SaveContent(node, store);
    m_document->Save(graphics::addChild(node, kDesign), store);
}

bool CDocument::IsDocument(const Node& node) {
    if (hasDesign(node)) return true;
    for (auto children = node->getChildNodes(); children.hasMore();)
        if (hasDesign(children.getNext())) return true;
    return false;
}

P<CDocument> CDocument::Load(const Node& node, graphics::IResourceInputStore& store) {
    const auto document = peru::make<CDocument>();
    graphics::readAttribute(node, kFormat, document->m_formatId);
    if (hasDesign(node)) {
        // Designs directly below the target: each is an item, and the attribute is that of all of them.
        std::string themeName;
        graphics::readAttribute(node, kThemeName, themeName);
        for (auto designs = node->getChildNodesByName(kDesign); designs.hasMore();) {
            document->m_items.push_back(CItem::LoadDesign(designs.getNext(), store));
            document->m_items.back()->SetThemeName(themeName);
        }
    }
    for (auto children = node->getChildNodes(); children.hasMore();) {
        const Node child = children.getNext();
        if (hasDesign(child)) document->m_items.push_back(CItem::Load(child, store));
    }
    document->m_others = loadOthers(node, store, kFormat, [](const Node& child) {
        return graphics::getName(child) == kDesign || hasDesign(child);
    });
    return document;
}

void CDocument::Save(const Node& node, graphics::IResourceOutputStore& store) const {
    graphics::writeAttribute(node, kFormat, m_formatId);
    m_others.SaveContent(node, store);
    for (const auto& item : m_items) {
        const std::string& name = item->GetOthers().name;
        item->Save(node->addChildNode(peru::CString::fromUTF8(name.empty() ? kItem : name)), store);
    }
}

} // namespace ced
