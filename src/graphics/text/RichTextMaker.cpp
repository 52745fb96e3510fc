// Rich text from plain text.
#include "graphics/text/RichTextParser.h"

#include "graphics/storage/XmlValues.h"
#include "graphics/text/RichTextXml.h"
#include "peru/Errors.h"
#include "peru/log/LogManager.h"
#include "peru/strings/String.h"

#include <glib.h>

namespace graphics {

namespace {

void setAttribute(wxXmlNode& node, const char* name, const std::string& value) {
    node.AddAttribute(name, wxString::FromUTF8(value));
}

std::string toHex(const SColour& colour) {
    static constexpr char kDigits[] = "0123456789ABCDEF";
    std::string text = "#";
    for (const uint8_t channel : {colour.red, colour.green, colour.blue}) {
        text += kDigits[channel >> 4];
        text += kDigits[channel & 15];
    }
    return text;
}

wxXmlNode* addElement(wxXmlNode& parent, const char* name) {
    auto* const child = new wxXmlNode(wxXML_ELEMENT_NODE, name); // owned by the parent
    parent.AddChild(child);
    return child;
}

// Replaces all paragraphs of a layout. `paragraph` and `run` have the attributes of the new ones.
void setLines(wxXmlNode& layout, const wxXmlNode& paragraph, const wxXmlNode& run, const std::string& text) {
    const auto copyAttributes = [](const wxXmlNode& from, wxXmlNode& to) {
        for (const wxXmlAttribute* a = from.GetAttributes(); a; a = a->GetNext())
            to.AddAttribute(a->GetName(), a->GetValue());
    };
    for (size_t begin = 0; begin <= text.size();) {
        const size_t end = std::min(text.find('\n', begin), text.size());
        wxXmlNode& line = *addElement(layout, "paragraph");
        copyAttributes(paragraph, line);
        // Always quoted, and so quotation marks at the ends are not taken for the outer ones.
        wxXmlNode& words = *addElement(line, "text");
        copyAttributes(run, words);
        gchar* const valid = g_utf8_make_valid(text.data() + begin, static_cast<gssize>(end - begin));
        words.AddChild(new wxXmlNode(wxXML_TEXT_NODE, wxString(),
                                     wxString::FromUTF8("\"" + removeInvalid(valid) + "\"")));
        g_free(valid);
        begin = end + 1;
    }
}

const wxXmlNode* findFirst(const wxXmlNode& node, const char* name) {
    for (const wxXmlNode* child = node.GetChildren(); child; child = child->GetNext()) {
        if (child->GetType() == wxXML_ELEMENT_NODE && child->GetName() == name) return child;
        if (const wxXmlNode* const inner = findFirst(*child, name)) return inner;
    }
    return nullptr;
}

} // namespace

P<CRichText> makeRichText(const std::string& plainText, const SFont& font, const SColour& colour,
                          ETextAlignment alignment) {
    wxXmlDocument document;
    document.SetRoot(new wxXmlNode(wxXML_ELEMENT_NODE, "richtext"));
    wxXmlNode& root = *document.GetRoot();
    setAttribute(root, "version", "1.0.0.0");
    setAttribute(root, "xmlns", "http://www.wxwidgets.org");
    wxXmlNode& layout = *addElement(root, "paragraphlayout");
    setAttribute(layout, "textcolor", toHex(colour));
    setAttribute(layout, "fontpointsize", std::to_string(font.pointSize));
    setAttribute(layout, "fontstyle", std::to_string(font.style));
    setAttribute(layout, "fontweight", std::to_string(font.weight));
    setAttribute(layout, "fontunderlined", std::to_string(font.isUnderlined));
    setAttribute(layout, "fontface", font.name);
    setAttribute(layout, "alignment", std::to_string(static_cast<int>(alignment)));
    setLines(layout, wxXmlNode(), wxXmlNode(), plainText);
    return peru::make<CRichText>(printXml(document));
}

P<CRichText> makeRichTextLike(const P<CRichText>& model, const std::string& plainText) {
    if (model) {
        try {
            const auto document = parseXml(*model);
            if (wxXmlNode* const layout = getChild(*document->GetRoot(), "paragraphlayout")) {
                const wxXmlNode* const first = getChild(*layout, "paragraph");
                const wxXmlNode paragraph = first ? *first : wxXmlNode();
                const wxXmlNode* const words = findFirst(paragraph, "text");
                const wxXmlNode run = words ? *words : wxXmlNode();
                while (wxXmlNode* const child = layout->GetChildren()) {
                    layout->RemoveChild(child);
                    delete child;
                }
                setLines(*layout, paragraph, run, plainText);
                return peru::make<CRichText>(printXml(*document));
            }
        } catch (const peru::CException& error) {
            peru::getLogManager()->warning(peru::CString::fromUTF8("graphics"), error.getDescription());
        }
    }
    return makeRichText(plainText, SFont());
}

} // namespace graphics
