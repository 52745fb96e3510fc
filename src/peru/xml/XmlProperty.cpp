#include "peru/xml/XmlProperty.h"

#include "peru/Errors.h"
#include "peru/xml/XmlText.h"

#include <tinyxml.h>

namespace peru {

CXmlProperty::CXmlProperty(const P<CXmlNode>& node, std::string name)
    : m_node(node), m_name(std::move(name)) {}

CXmlProperty::~CXmlProperty() = default;

P<IString> CXmlProperty::getName() const {
    return CString::fromUTF8(m_name);
}

P<IString> CXmlProperty::getValue() const {
    return CString::fromUTF8(getAttribute().ValueStr());
}

void CXmlProperty::setValue(const CStringArg& value) {
    getAttribute().SetValue(xml::fromText(value, "IXmlProperty::setValue"));
}

TiXmlAttribute& CXmlProperty::getAttribute() const {
    for (TiXmlAttribute* i = m_node->getElement().FirstAttribute(); i; i = i->Next())
        if (i->NameTStr() == m_name) return *i;
    throw CInvalidObjectStateError("the property was removed from its node", m_node);
}

CXmlPropertyEnum::CXmlPropertyEnum(const P<CXmlNode>& node) : m_node(node) {
    for (const TiXmlAttribute* i = node->getElement().FirstAttribute(); i; i = i->Next())
        m_names.push_back(i->NameTStr());
}

CXmlPropertyEnum::~CXmlPropertyEnum() = default;

P<IBase> CXmlPropertyEnum::getNext() {
    if (!hasMore()) throw CEndOfEnumError(P<CXmlPropertyEnum>::share(this));
    return make<CXmlProperty>(m_node, m_names[m_next++]);
}

} // namespace peru
