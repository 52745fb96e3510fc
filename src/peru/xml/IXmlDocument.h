// A tree of XML elements.
#pragma once

#include "peru/streams/IStreams.h"
#include "peru/xml/IXmlNode.h"

namespace peru {

// As a node the document has no name, text or properties; its only child is the root, which addChildNode
// makes in a document without one. It belongs to one thread at a time, with all of its nodes.
class PERU_API IXmlDocument : public virtual IXmlNode {
public:
    // What parsing and printing take on the stack grows with the depth, and what a property costs grows with
    // the number of its siblings: hostile documents end here.
    static constexpr int32_t kMaxDepth = 256;
    static constexpr int32_t kMaxProperties = 1000;

    // Both replace the content; nodes of the old one count as removed. On CParseError the old content stays.
    // The bytes may be UTF-8, UTF-16 that begins with its mark, or Latin-1 that is declared so; a mark counts
    // for more than what is declared. Document type declarations with a body are refused: what they define
    // would be lost.
    virtual void parse(const P<IInStream>& stream) = 0; // all that is left in it
    virtual void parseString(const P<IString>& text) = 0;

    // A declaration, then the tree, each level indented by four blanks. As UTF-8, or little-endian UTF-16
    // with its mark if that is the document's encoding; a string needs no mark.
    virtual void print(const P<IOutStream>& stream) const = 0;
    virtual P<IString> printToString() const = 0;

    virtual P<IXmlNode> getRootNode() const = 0; // empty in a document without elements
    virtual P<IString> getVersion() const = 0;
    virtual P<IString> getEncodingName() const = 0;
};

} // namespace peru
