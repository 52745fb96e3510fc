// One element of an XML document.
#pragma once

#include "peru/collections/IEnum.h"
#include "peru/xml/IXmlProperty.h"

namespace peru {

class IXmlDocument;

// Keeps its document alive. Every operation on a node that was removed from its document throws
// CInvalidObjectStateError.
//
// Names begin with a letter or "_" and go on with letters, digits, "_", "-", "." and ":"; whatever is beyond
// ASCII counts as a letter. Text and values hold the characters that XML can hold. What breaks these rules
// throws CInvalidArgError, so that what is printed can be read again. Text comes back in UTF-8, or in UTF-16
// where it has characters that UTF-8 strings refuse.
class PERU_API IXmlNode : public virtual IBase {
public:
    virtual P<IString> getName() const = 0;
    // The element's own text, that of its children left out; empty without any. White space that stood around
    // it in the file is gone and each run within it is one blank; what was set or written as character
    // references is kept as it is.
    virtual P<IString> getText() const = 0;
    virtual void setText(const CStringArg& text) = 0; // child nodes stay

    virtual P<IXmlNode> getChildNode(const CStringArg& name) const = 0; // the first, empty if none
    // In document order. An enumerator goes on from the node that comes next; if that one is removed
    // meanwhile it throws CInvalidObjectStateError.
    virtual WEnum<IXmlNode> getChildNodes() const = 0;
    virtual WEnum<IXmlNode> getChildNodesByName(const CStringArg& name) const = 0;
    // Behind the others. Throws CInvalidArgError below the deepest level (IXmlDocument::kMaxDepth).
    virtual P<IXmlNode> addChildNode(const CStringArg& name) = 0;
    // With everything in it. Throws CInvalidArgError when it is no child of this node.
    virtual void removeChildNode(const P<IXmlNode>& child) = 0;

    virtual P<IXmlProperty> getProperty(const CStringArg& name) const = 0; // empty if none
    virtual WEnum<IXmlProperty> getProperties() const = 0;                 // in document order
    // Adds or changes. Throws CInvalidArgError beyond IXmlDocument::kMaxProperties.
    virtual void setProperty(const CStringArg& name, const CStringArg& value) = 0;
    virtual void removeProperty(const CStringArg& name) = 0; // nothing happens if there is none

    virtual P<IXmlDocument> getDocument() const = 0;
};

} // namespace peru
