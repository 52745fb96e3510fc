#include "peru/xml/XmlNode.h"

#include "peru/Errors.h"
#include "peru/xml/XmlProperty.h"
#include "peru/xml/XmlText.h"

#include <tinyxml.h>

namespace peru {

P<CXmlNode> CXmlNode::get(const P<CXmlDocument>& document, TiXmlElement* element) {
    if (!element) return nullptr;
    if (void* known = element->GetUserData()) return P<CXmlNode>::share(static_cast<CXmlNode*>(known));
    return P<CXmlNode>(new CXmlNode(document, *element));
}

CXmlNode::CXmlNode(const P<CXmlDocument>& document, TiXmlElement& element)
    : m_document(document), m_element(&element) {
    element.SetUserData(this);
    ++m_document->m_nodeCount;
}

CXmlNode::~CXmlNode() {
    if (m_element) m_element->SetUserData(nullptr);
    --m_document->m_nodeCount;
}

TiXmlElement& CXmlNode::getElement() const {
    if (!m_element)
        throw CInvalidObjectStateError("the node was removed from its document",
                                       P<CXmlNode>::share(const_cast<CXmlNode*>(this)));
    return *m_element;
}

P<IString> CXmlNode::getName() const {
    return CString::fromUTF8(getElement().ValueStr());
}

P<IString> CXmlNode::getText() const {
    const TiXmlText* first = nullptr;
    std::string joined;
    for (const TiXmlNode* i = getElement().FirstChild(); i; i = i->NextSibling()) {
        const TiXmlText* part = i->ToText();
        if (!part) continue;
        if (!first)
            first = part;
        else
            joined += part->ValueStr();
    }
    if (!first) return CString::empty();
    return CString::fromUTF8(joined.empty() ? first->ValueStr() : first->ValueStr() + joined);
}

void CXmlNode::setText(const CStringArg& text) {
    TiXmlElement& element = getElement();
    const std::string bytes = xml::fromText(text, "IXmlNode::setText");
    for (TiXmlNode* i = element.FirstChild(); i;) {
        TiXmlNode* next = i->NextSibling();
        if (i->ToText()) element.RemoveChild(i);
        i = next;
    }
    if (bytes.empty()) return;
    if (TiXmlNode* first = element.FirstChild())
        element.InsertBeforeChild(first, TiXmlText(bytes));
    else
        element.LinkEndChild(std::make_unique<TiXmlText>(bytes).release());
}

P<IXmlNode> CXmlNode::getChildNode(const CStringArg& name) const {
    return get(m_document, getElement().FirstChildElement(CString::toStdString(name)));
}

WEnum<IXmlNode> CXmlNode::getChildNodes() const {
    return P<IEnum>(make<CXmlNodeEnum>(get(m_document, getElement().FirstChildElement()), std::nullopt));
}

WEnum<IXmlNode> CXmlNode::getChildNodesByName(const CStringArg& name) const {
    const std::string wanted = CString::toStdString(name);
    return P<IEnum>(make<CXmlNodeEnum>(get(m_document, getElement().FirstChildElement(wanted)), wanted));
}

P<IXmlNode> CXmlNode::addChildNode(const CStringArg& name) {
    int32_t depth = 0;
    for (const TiXmlNode* i = &getElement(); i->ToElement(); i = i->Parent()) ++depth;
    if (depth >= IXmlDocument::kMaxDepth)
        throw CInvalidArgError("the document cannot be nested deeper", "IXmlNode::addChildNode");
    auto child = std::make_unique<TiXmlElement>(xml::fromName(name, "IXmlNode::addChildNode"));
    return get(m_document, getElement().LinkEndChild(child.release())->ToElement());
}

void CXmlNode::removeChildNode(const P<IXmlNode>& child) {
    const P<CXmlNode> node = tryCast<CXmlNode>(child);
    TiXmlElement& element = getElement();
    if (!node || node->getElement().Parent() != &element)
        throw CInvalidArgError("child", "IXmlNode::removeChildNode");
    TiXmlElement& removed = node->getElement();
    m_document->dropNodes(removed);
    element.RemoveChild(&removed);
}

P<IXmlProperty> CXmlNode::getProperty(const CStringArg& name) const {
    std::string wanted = CString::toStdString(name);
    if (!getElement().Attribute(wanted)) return nullptr;
    return make<CXmlProperty>(P<CXmlNode>::share(const_cast<CXmlNode*>(this)), std::move(wanted));
}

WEnum<IXmlProperty> CXmlNode::getProperties() const {
    return P<IEnum>(make<CXmlPropertyEnum>(P<CXmlNode>::share(const_cast<CXmlNode*>(this))));
}

void CXmlNode::setProperty(const CStringArg& name, const CStringArg& value) {
    TiXmlElement& element = getElement();
    const std::string ownName = xml::fromName(name, "IXmlNode::setProperty");
    const std::string ownValue = xml::fromText(value, "IXmlNode::setProperty");
    int32_t count = 0;
    bool known = false;
    for (const TiXmlAttribute* i = element.FirstAttribute(); i && !known; i = i->Next()) {
        known = i->NameTStr() == ownName;
        ++count;
    }
    if (!known && count >= IXmlDocument::kMaxProperties)
        throw CInvalidArgError("the node cannot hold more properties", "IXmlNode::setProperty");
    element.SetAttribute(ownName, ownValue);
}

void CXmlNode::removeProperty(const CStringArg& name) {
    getElement().RemoveAttribute(CString::toStdString(name));
}

P<IXmlDocument> CXmlNode::getDocument() const {
    return m_document;
}

CXmlNodeEnum::CXmlNodeEnum(const P<CXmlNode>& first, std::optional<std::string> name)
    : m_first(first), m_next(first), m_name(std::move(name)) {}

CXmlNodeEnum::~CXmlNodeEnum() = default;

TiXmlElement* CXmlNodeEnum::getSibling(TiXmlElement& element) const {
    return m_name ? element.NextSiblingElement(*m_name) : element.NextSiblingElement();
}

int32_t CXmlNodeEnum::getCount() const {
    int32_t count = 0;
    for (TiXmlElement* i = m_first ? &m_first->getElement() : nullptr; i; i = getSibling(*i)) ++count;
    return count;
}

P<IBase> CXmlNodeEnum::getNext() {
    if (!m_next) throw CEndOfEnumError(P<CXmlNodeEnum>::share(this));
    TiXmlElement* following = getSibling(m_next->getElement());
    P<CXmlNode> given = m_next;
    m_next = CXmlNode::get(given->getOwner(), following);
    return given;
}

} // namespace peru
