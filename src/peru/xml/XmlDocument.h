// The XML parser's document behind reference-counted nodes.
#pragma once

#include "peru/Object.h"
#include "peru/xml/IXmlDocument.h"

#include <memory>
#include <string_view>

class TiXmlDocument;
class TiXmlNode;

namespace peru {

class CXmlNode;

class PERU_API CXmlDocument : public CObject, public IXmlDocument {
public:
    class CXmlPrinter;

    // Creates an empty document. The version must be "1.0" or "1.1", the encoding "UTF-8" or "UTF-16" in any
    // letter case; otherwise throws CInvalidArgError. Both only affect printing, not parsing.
    explicit CXmlDocument(const CStringArg& version = "1.0", const CStringArg& encoding = "UTF-8");
    ~CXmlDocument() override;

    void parse(const P<IInStream>& stream) override;
    void parseString(const P<IString>& text) override;
    void print(const P<IOutStream>& stream) const override;
    P<IString> printToString() const override;
    P<IXmlNode> getRootNode() const override;
    P<IString> getVersion() const override { return m_version; }
    P<IString> getEncodingName() const override { return m_encoding; }

    P<IString> getName() const override;
    P<IString> getText() const override;
    void setText(const CStringArg& text) override; // throws CMethodNotImplementedError
    P<IXmlNode> getChildNode(const CStringArg& name) const override;
    WEnum<IXmlNode> getChildNodes() const override;
    WEnum<IXmlNode> getChildNodesByName(const CStringArg& name) const override;
    P<IXmlNode> addChildNode(const CStringArg& name) override; // throws CInvalidArgError if there is a root
    void removeChildNode(const P<IXmlNode>& child) override;
    P<IXmlProperty> getProperty(const CStringArg& name) const override;
    WEnum<IXmlProperty> getProperties() const override;
    void setProperty(const CStringArg& name, const CStringArg& value) override; // throws like setText
    void removeProperty(const CStringArg& name) override;
    P<IXmlDocument> getDocument() const override;

private:
    friend class CXmlNode;

    // `text` must be zero-terminated UTF-8.
    void parseBytes(std::string_view text, const P<IURI>& uri);
    std::string printBytes() const;
    bool isWide() const;
    P<CXmlDocument> share() const;
    // Detaches the node objects of `parent` and of everything below it, since their elements are about to be
    // destroyed.
    void dropNodes(TiXmlNode& parent);

    P<IString> m_version;
    P<IString> m_encoding;
    std::unique_ptr<TiXmlDocument> m_tree;
    int64_t m_nodeCount = 0; // number of live node objects
};

} // namespace peru
