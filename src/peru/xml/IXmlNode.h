// One element of an XML document.
#pragma once

#include "peru/collections/IEnum.h"
#include "peru/xml/IXmlProperty.h"

namespace peru {

class IXmlDocument;

// Keeps its document alive. Every operation on a node that was removed from its document throws
// CInvalidObjectStateError.
//
// Names start with a letter or "_" and continue with letters, digits, "_", "-", "." and ":"; every character
// beyond ASCII counts as a letter. Text and values may contain the characters that XML allows. Anything else
// throws CInvalidArgError, so that a printed document can be read again. Text is returned in UTF-8, or in
// UTF-16 if it has characters that UTF-8 strings reject.
class PERU_API IXmlNode : public virtual IBase {
public:
    virtual P<IString> getName() const = 0;
    // The element's own text without that of its children; empty if there is none. White space around text in
    // the file is removed and each run within it becomes one blank; white space that was set or written as
    // character references is kept.
    virtual P<IString> getText() const = 0;
    virtual void setText(const CStringArg& text) = 0; // child nodes are kept

    virtual P<IXmlNode> getChildNode(const CStringArg& name) const = 0; // the first, empty if none
    // In document order. If the node that an enumerator would return next is removed, it throws
    // CInvalidObjectStateError.
    virtual WEnum<IXmlNode> getChildNodes() const = 0;
    virtual WEnum<IXmlNode> getChildNodesByName(const CStringArg& name) const = 0;
    // Appends the node after the others. Throws CInvalidArgError below the deepest level
    // (IXmlDocument::kMaxDepth).
    virtual P<IXmlNode> addChildNode(const CStringArg& name) = 0;
    // Removes the child and everything in it. Throws CInvalidArgError if it is not a child of this node.
    virtual void removeChildNode(const P<IXmlNode>& child) = 0;

    virtual P<IXmlProperty> getProperty(const CStringArg& name) const = 0; // empty if none
    virtual WEnum<IXmlProperty> getProperties() const = 0;                 // in document order
    // Adds or changes a property. Throws CInvalidArgError beyond IXmlDocument::kMaxProperties.
    virtual void setProperty(const CStringArg& name, const CStringArg& value) = 0;
    virtual void removeProperty(const CStringArg& name) = 0; // does nothing if there is none

    virtual P<IXmlDocument> getDocument() const = 0;
};

} // namespace peru
