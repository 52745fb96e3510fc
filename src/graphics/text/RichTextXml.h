// The XML of rich text as a tree.
#pragma once

#include "graphics/elements/RichText.h"

#include <wx/xml/xml.h>

#include <memory>

namespace graphics {

// Unlike our own documents, the tree keeps all white space inside of texts. Throws CParseError if the text is
// not well-formed or exceeds the limits of IXmlDocument.
std::unique_ptr<wxXmlDocument> parseXml(const CRichText& text);
// Throws CError.
std::string printXml(const wxXmlDocument& document);
[[noreturn]] void throwNotWritten();

// UTF-8; empty if the node lacks the attribute.
std::string getAttribute(const wxXmlNode& node, const char* name);
// The text directly inside of the node.
std::string getText(const wxXmlNode& node);
// The first child element with the name; null if there is none.
wxXmlNode* getChild(const wxXmlNode& node, const char* name);

} // namespace graphics
