// Writes a document so that parsing it gives back the same texts.
#pragma once

#include "peru/xml/XmlDocument.h"

#include <string>
#include <tinyxml.h>

namespace peru {

// The layout is the base's, four blanks for a level. Escapes are the parser's own with three differences,
// without which texts would change on their way through a file: "&" is escaped also where "&#x" follows,
// blanks that the parser would drop or join are written as references, and a text of nothing but white space
// is a CDATA section. Nothing is added to the white space beside a text.
class CXmlDocument::CXmlPrinter : public TiXmlPrinter {
public:
    CXmlPrinter(std::string_view version, std::string_view encoding);

    // Hides the base's, which sees none of the text.
    const std::string& Str() const { return m_text; }

    bool VisitEnter(const TiXmlDocument& document) override;
    bool VisitExit(const TiXmlDocument& document) override;
    bool VisitEnter(const TiXmlElement& element, const TiXmlAttribute* firstAttribute) override;
    bool VisitExit(const TiXmlElement& element) override;
    bool Visit(const TiXmlDeclaration& declaration) override; // the document's own was written first
    bool Visit(const TiXmlText& text) override;
    bool Visit(const TiXmlComment& comment) override;
    bool Visit(const TiXmlUnknown& unknown) override;

private:
    void startLine();
    void endLine();
    void write(std::string_view text, bool keepBlanks);

    std::string m_text;
    int32_t m_depth = 0;
    int32_t m_inlineDepth = 0; // elements around this place that have text of their own
};

} // namespace peru
