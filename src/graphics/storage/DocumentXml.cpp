// The XML of documents and what belongs to them.
#include "graphics/documents/FreeForm.h"
#include "graphics/elements/ElementFactory.h"
#include "graphics/storage/IResourceStores.h"
#include "graphics/storage/XmlNames.h"
#include "graphics/storage/XmlValues.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

namespace graphics {

namespace {

constexpr int kDocumentVersion = 1;

void saveXDatas(const Node& node, const CXDatas& datas) {
    const Node children = addChild(node, "xdata");
    for (const auto& [name, data] : datas.GetAll()) {
        const Node child = children->addChildNode(peru::CString::fromUTF8(encodeName(name)));
        writeAttribute(child, "type", data->GetTypeName());
        writeAttribute(child, "value", data->Save());
    }
}

P<CXDatas> loadXDatas(const Node& node, IResourceInputStore& store) {
    auto datas = peru::make<CXDatas>();
    for (auto children = node->getChildNodes(); children.hasMore();) {
        const Node child = children.getNext();
        std::string type, value;
        readAttribute(child, "type", type);
        const auto data = CXDatas::Create(type);
        if (!data) {
            store.Report(
                peru::localize("graphics.CXDatas.UnknownType",
                               "The value \"%NAME%\" of the unknown type \"%TYPE%\" is left out.",
                               {{"%NAME%", child->getName()}, {"%TYPE%", peru::CString::fromUTF8(type)}}));
            continue;
        }
        if (readAttribute(child, "value", value)) data->Load(value);
        datas->Set(decodeName(getName(child)), data);
    }
    return datas;
}

// The children of a document that are not elements.
bool isPartOfDocument(std::string_view tag) {
    return tag == "bounding-box" || tag == "content-box" || tag == "xdata";
}

// The element of a node, not yet loaded; empty if the node is not one, or of a class that this program lacks.
P<CGraphicElement> createElement(const Node& node, IResourceInputStore& store) {
    // A tag of old files.
    static constexpr const char* kTableContent = "table-content";
    const std::string tag = getName(node);
    const bool isTableContent = tag == kTableContent;
    if (!isTableContent && !IsGraphicTypeTag(tag)) {
        if (!isPartOfDocument(tag))
            store.Report(peru::localize("graphics.CGraphicDocument.UnknownTag",
                                        "An unknown element \"%TAG%\" is left out.",
                                        {{"%TAG%", peru::CString::fromUTF8(tag)}}));
        return {};
    }
    std::string typeName = isTableContent ? kTableContent : "";
    readAttribute(node, "type-name", typeName);
    const auto element =
        CreateElement(isTableContent ? GraphicElementType::table : GraphicTypeFromXml(tag), typeName);
    if (!element)
        store.Report(peru::localize(
            "graphics.CGraphicDocument.UnknownElement",
            "An element \"%TAG%\" of the unknown class \"%CLASS%\" is left out.",
            {{"%TAG%", peru::CString::fromUTF8(tag)}, {"%CLASS%", peru::CString::fromUTF8(typeName)}}));
    return element;
}

// Ends the update also when an element cannot be read.
class CUpdate {
public:
    explicit CUpdate(CGraphicContainer& container) : m_container(container) { container.BeginUpdate(); }
    ~CUpdate() { m_container.EndUpdate(); }
    CUpdate(const CUpdate&) = delete;
    CUpdate& operator=(const CUpdate&) = delete;

private:
    CGraphicContainer& m_container;
};

} // namespace

void CGraphicDocument::Save(const Node& node, IResourceOutputStore& store) {
    writeInteger(node, "version", kDocumentVersion);
    write(node, "bounding-box", GetBoundingBox());
    if (GetContentBox()) write(node, "content-box", *GetContentBox());
    for (const auto& element : GetElements()) {
        const Node child = addChild(node, GraphicTypeToXml(element->GetType()).c_str());
        writeAttribute(child, "type-name", element->GetTypeName());
        store.SaveReusable(child, element->GetTypeName(), element);
    }
    if (GetXDatas() && !GetXDatas()->IsEmpty()) saveXDatas(node, *GetXDatas());
}

void CGraphicDocument::Load(const Node& node, IResourceInputStore& store) {
    const CUpdate update(*this);
    Clear();
    int64_t version = kDocumentVersion;
    if (readInteger(node, "version", version) && version > kDocumentVersion)
        store.Report(peru::localize(
            "graphics.CGraphicDocument.LaterVersion",
            "A design is of version %VERSION%, which is later than %KNOWN%. What is "
            "unknown of it is lost when it is saved.",
            {{"%VERSION%", peru::format("%d", version)}, {"%KNOWN%", peru::format("%d", kDocumentVersion)}}));
    if (SRect box; read(node, "content-box", box)) SetContentBox(box);
    for (auto children = node->getChildNodes(); children.hasMore();) {
        const Node child = children.getNext();
        const auto created = createElement(child, store);
        if (!created) continue;
        const auto element = P<CGraphicElement>(store.LoadReusable(child, created->GetTypeName(), created));
        // A document that names an element twice shows it once.
        if (!element->HasListener(this)) Add(element);
    }
    const Node datas = node->getChildNode("xdata");
    SetXDatas(datas ? loadXDatas(datas, store) : nullptr);
}

void CFreeForm::Save(const Node& node, IResourceOutputStore& store) const {
    writeAttribute(node, "name", m_id);
    m_document->Save(addChild(node, "graphic-document"), store);
}

P<CFreeForm> CFreeForm::Load(const Node& node, IResourceInputStore& store) {
    std::string id;
    readAttribute(node, "name", id);
    if (const auto known = getFreeFormManager()->Find(id)) return known;
    auto freeForm = peru::make<CFreeForm>(id);
    if (const Node document = node->getChildNode("graphic-document"))
        freeForm->m_document->Load(document, store);
    return freeForm;
}

} // namespace graphics
