// A tree of XML elements.
#pragma once

#include "peru/streams/IStreams.h"
#include "peru/xml/IXmlNode.h"

namespace peru {

// As a node the document has no name, text or properties; its only child is the root, which addChildNode
// creates if there is none. A document and all of its nodes belong to one thread at a time.
class PERU_API IXmlDocument : public virtual IXmlNode {
public:
    // Limits against hostile documents: parsing and printing use stack in proportion to the depth, and the
    // cost of a property grows with the number of its siblings.
    static constexpr int32_t kMaxDepth = 256;
    static constexpr int32_t kMaxProperties = 1000;

    // Both replace the content; nodes of the old content count as removed. On CParseError the old content is
    // kept. The bytes may be UTF-8, UTF-16 with a byte order mark, or declared Latin-1; a mark takes
    // precedence over the declaration. Document type declarations with a body are rejected, since their
    // definitions would be lost.
    virtual void parse(const P<IInStream>& stream) = 0; // the rest of the stream
    virtual void parseString(const P<IString>& text) = 0;

    // Writes a declaration and the tree, each level indented by four blanks, as UTF-8, or as little-endian
    // UTF-16 with a mark if that is the document's encoding. A string has no mark.
    virtual void print(const P<IOutStream>& stream) const = 0;
    virtual P<IString> printToString() const = 0;

    virtual P<IXmlNode> getRootNode() const = 0; // empty if there are no elements
    virtual P<IString> getVersion() const = 0;
    virtual P<IString> getEncodingName() const = 0;
};

} // namespace peru
