// One attribute: an element and a name.
#pragma once

#include "peru/collections/IEnum.h"
#include "peru/xml/XmlNode.h"

#include <vector>

namespace peru {

class PERU_API CXmlProperty : public CObject, public IXmlProperty {
public:
    CXmlProperty(const P<CXmlNode>& node, std::string name);
    ~CXmlProperty() override;

    P<IString> getName() const override;
    P<IString> getValue() const override;
    void setValue(const CStringArg& value) override;

private:
    TiXmlAttribute& getAttribute() const;

    P<CXmlNode> m_node;
    std::string m_name;
};

// Enumerates the attributes that the element had when the enumerator was created.
class PERU_API CXmlPropertyEnum : public CObject, public IEnum {
public:
    explicit CXmlPropertyEnum(const P<CXmlNode>& node);
    ~CXmlPropertyEnum() override;

    bool hasMore() const override { return m_next < m_names.size(); }
    int32_t getCount() const override { return static_cast<int32_t>(m_names.size()); }
    PC<IBase> getNextConst() override { return getNext(); }
    P<IBase> getNext() override;
    void reset() override { m_next = 0; }

private:
    P<CXmlNode> m_node;
    std::vector<std::string> m_names;
    size_t m_next = 0;
};

} // namespace peru
