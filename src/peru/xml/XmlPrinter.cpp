#include "peru/xml/XmlPrinter.h"

#include "peru/xml/XmlText.h"

#include <algorithm>

namespace peru {

namespace {

bool hasText(const TiXmlElement& element) {
    for (const TiXmlNode* i = element.FirstChild(); i; i = i->NextSibling())
        if (i->ToText()) return true;
    return false;
}

} // namespace

CXmlDocument::CXmlPrinter::CXmlPrinter(std::string_view version, std::string_view encoding) {
    SetIndent("    ");
    m_text.append("<?xml version=\"")
        .append(version)
        .append("\" encoding=\"")
        .append(encoding)
        .append("\" ?>");
    m_text += LineBreak();
}

void CXmlDocument::CXmlPrinter::startLine() {
    if (m_inlineDepth == 0)
        for (int32_t i = 0; i < m_depth; ++i) m_text += Indent();
}

void CXmlDocument::CXmlPrinter::endLine() {
    if (m_inlineDepth == 0) m_text += LineBreak();
}

bool CXmlDocument::CXmlPrinter::VisitEnter(const TiXmlDocument&) {
    return true;
}

bool CXmlDocument::CXmlPrinter::VisitExit(const TiXmlDocument&) {
    return true;
}

bool CXmlDocument::CXmlPrinter::VisitEnter(const TiXmlElement& element, const TiXmlAttribute* attribute) {
    startLine();
    m_text.append("<").append(element.ValueStr());
    for (; attribute; attribute = attribute->Next()) {
        m_text.append(" ").append(attribute->NameTStr()).append("=\"");
        write(attribute->ValueStr(), false);
        m_text += '"';
    }
    if (element.NoChildren()) {
        m_text += " />";
        endLine();
        return true;
    }
    m_text += '>';
    if (m_inlineDepth > 0 || hasText(element)) ++m_inlineDepth;
    ++m_depth;
    endLine();
    return true;
}

bool CXmlDocument::CXmlPrinter::VisitExit(const TiXmlElement& element) {
    if (element.NoChildren()) return true;
    --m_depth;
    startLine();
    if (m_inlineDepth > 0) --m_inlineDepth;
    m_text.append("</").append(element.ValueStr()).append(">");
    endLine();
    return true;
}

bool CXmlDocument::CXmlPrinter::Visit(const TiXmlDeclaration&) {
    return true;
}

bool CXmlDocument::CXmlPrinter::Visit(const TiXmlText& text) {
    const std::string& value = text.ValueStr();
    // The parser drops text that is only white space unless it is in a CDATA section.
    const bool blank = std::all_of(value.begin(), value.end(), xml::isBlank);
    if (text.CDATA() || blank)
        m_text.append("<![CDATA[").append(value).append("]]>");
    else
        write(value, true);
    return true;
}

bool CXmlDocument::CXmlPrinter::Visit(const TiXmlComment& comment) {
    startLine();
    m_text.append("<!--").append(comment.ValueStr()).append("-->");
    endLine();
    return true;
}

bool CXmlDocument::CXmlPrinter::Visit(const TiXmlUnknown& unknown) {
    startLine();
    m_text.append("<").append(unknown.ValueStr()).append(">");
    endLine();
    return true;
}

void CXmlDocument::CXmlPrinter::write(std::string_view text, bool keepBlanks) {
    constexpr const char* kDigits = "0123456789ABCDEF";
    for (size_t i = 0; i < text.size(); ++i) {
        const char ch = text[i];
        switch (ch) {
        case '&':
            m_text += "&amp;";
            break;
        case '<':
            m_text += "&lt;";
            break;
        case '>':
            m_text += "&gt;";
            break;
        case '"':
            m_text += "&quot;";
            break;
        case '\'':
            m_text += "&apos;";
            break;
        case '\xEF':
            // The parser treats the byte order mark as white space.
            if (text.substr(i).starts_with(xml::kMark)) {
                m_text += "&#xFEFF;";
                i += 2;
            } else {
                m_text += ch;
            }
            break;
        case ' ':
            if (keepBlanks && (i == 0 || i + 1 == text.size() || text[i - 1] == ' '))
                m_text += "&#x20;";
            else
                m_text += ch;
            break;
        default:
            if (static_cast<uint8_t>(ch) < 0x20)
                m_text.append("&#x0").append(1, kDigits[static_cast<uint8_t>(ch)]).append(";");
            else
                m_text += ch;
        }
    }
}

} // namespace peru
