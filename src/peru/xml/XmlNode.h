// The node object of an element, and the enumerators over elements and their attributes.
#pragma once

#include "peru/Object.h"
#include "peru/xml/XmlDocument.h"

#include <optional>
#include <string>

class TiXmlAttribute;
class TiXmlElement;

namespace peru {

// An element has at most one node object at a time and points to it, so that the object can be detached when
// the element is destroyed.
class PERU_API CXmlNode : public CObject, public IXmlNode {
public:
    // Returns the node object of an element of the document; empty for a null pointer.
    static P<CXmlNode> get(const P<CXmlDocument>& document, TiXmlElement* element);
    ~CXmlNode() override;

    P<IString> getName() const override;
    P<IString> getText() const override;
    void setText(const CStringArg& text) override;
    P<IXmlNode> getChildNode(const CStringArg& name) const override;
    WEnum<IXmlNode> getChildNodes() const override;
    WEnum<IXmlNode> getChildNodesByName(const CStringArg& name) const override;
    P<IXmlNode> addChildNode(const CStringArg& name) override;
    void removeChildNode(const P<IXmlNode>& child) override;
    P<IXmlProperty> getProperty(const CStringArg& name) const override;
    WEnum<IXmlProperty> getProperties() const override;
    void setProperty(const CStringArg& name, const CStringArg& value) override;
    void removeProperty(const CStringArg& name) override;
    P<IXmlDocument> getDocument() const override;

    // Throws CInvalidObjectStateError if the element has been destroyed.
    TiXmlElement& getElement() const;
    const P<CXmlDocument>& getOwner() const { return m_document; }
    void drop() { m_element = nullptr; }

private:
    CXmlNode(const P<CXmlDocument>& document, TiXmlElement& element);

    P<CXmlDocument> m_document;
    TiXmlElement* m_element; // null once it is destroyed
};

// Enumerates sibling elements, all of them or those with a given name.
class PERU_API CXmlNodeEnum : public CObject, public IEnum {
public:
    // `first` is the first element to return; empty for none.
    CXmlNodeEnum(const P<CXmlNode>& first, std::optional<std::string> name);
    ~CXmlNodeEnum() override;

    bool hasMore() const override { return static_cast<bool>(m_next); }
    int32_t getCount() const override; // counts by walking over them
    PC<IBase> getNextConst() override { return getNext(); }
    P<IBase> getNext() override;
    void reset() override { m_next = m_first; }

private:
    TiXmlElement* getSibling(TiXmlElement& element) const;

    P<CXmlNode> m_first;
    P<CXmlNode> m_next;
    std::optional<std::string> m_name;
};

} // namespace peru
