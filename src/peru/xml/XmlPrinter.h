// Prints a document so that parsing it restores the same texts.
#pragma once

#include "peru/xml/XmlDocument.h"

#include <string>
#include <tinyxml.h>

namespace peru {

// The layout is that of the base class with four blanks per level. Escaping follows the parser's own with
// three differences, without which texts would change on their way through a file: "&" is also escaped in
// "&#x", blanks that the parser would drop or merge are written as references, and a text of only white space
// becomes a CDATA section. No white space is added next to a text.
class CXmlDocument::CXmlPrinter : public TiXmlPrinter {
public:
    CXmlPrinter(std::string_view version, std::string_view encoding);

    // Hides the function of the base, whose buffer stays empty.
    const std::string& Str() const { return m_text; }

    bool VisitEnter(const TiXmlDocument& document) override;
    bool VisitExit(const TiXmlDocument& document) override;
    bool VisitEnter(const TiXmlElement& element, const TiXmlAttribute* firstAttribute) override;
    bool VisitExit(const TiXmlElement& element) override;
    bool
    Visit(const TiXmlDeclaration& declaration) override; // ignored: the constructor writes the document's own
    bool Visit(const TiXmlText& text) override;
    bool Visit(const TiXmlComment& comment) override;
    bool Visit(const TiXmlUnknown& unknown) override;

private:
    void startLine();
    void endLine();
    void write(std::string_view text, bool keepBlanks);

    std::string m_text;
    int32_t m_depth = 0;
    int32_t m_inlineDepth = 0; // enclosing elements printed without line breaks because of their text
};

} // namespace peru
