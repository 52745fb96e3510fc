#include "graphics/text/RichTextXml.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/xml/XmlDocument.h"

#include <wx/log.h>
#include <wx/mstream.h>

namespace graphics {

void throwNotWritten() {
    throw peru::CError(peru::localize("graphics.RichText.NotWritten", "The rich text could not be written."));
}

std::unique_ptr<wxXmlDocument> parseXml(const CRichText& text) {
    const std::string& xml = text.GetXml();
    // Checks the depth, which the toolkit does not limit although it releases trees recursively.
    peru::make<peru::CXmlDocument>()->parseString(peru::CString::fromUTF8(xml));
    const wxLogNull quiet;
    wxMemoryInputStream stream(xml.data(), xml.size());
    auto document = std::make_unique<wxXmlDocument>();
    if (!document->Load(stream) || !document->GetRoot())
        throw peru::CParseError(peru::localize("graphics.RichText.Damaged", "The rich text is damaged."));
    return document;
}

std::string printXml(const wxXmlDocument& document) {
    const wxLogNull quiet;
    wxMemoryOutputStream stream;
    if (!document.Save(stream)) throwNotWritten();
    std::string xml(stream.GetSize(), '\0');
    stream.CopyTo(xml.data(), xml.size());
    return xml;
}

std::string getAttribute(const wxXmlNode& node, const char* name) {
    return node.GetAttribute(name).utf8_string();
}

std::string getText(const wxXmlNode& node) {
    wxString text;
    for (const wxXmlNode* child = node.GetChildren(); child; child = child->GetNext())
        if (child->GetType() == wxXML_TEXT_NODE || child->GetType() == wxXML_CDATA_SECTION_NODE)
            text += child->GetContent();
    return text.utf8_string();
}

wxXmlNode* getChild(const wxXmlNode& node, const char* name) {
    for (wxXmlNode* child = node.GetChildren(); child; child = child->GetNext())
        if (child->GetType() == wxXML_ELEMENT_NODE && child->GetName() == name) return child;
    return nullptr;
}

} // namespace graphics
