#include "graphics/text/RichTextBuffer.h"

#include "graphics/text/RichTextXml.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <wx/imagpng.h>
#include <wx/log.h>
#include <wx/mstream.h>
#include <wx/richtext/richtextbuffer.h>
#include <wx/richtext/richtextxml.h>

namespace graphics {

namespace {

// What the toolkit registers when it starts, for processes that have not started it: reading a text without
// the names of its nodes would silently give an empty buffer. Images inside of texts are PNG files.
void prepareToolkit() {
    static constexpr std::pair<const char*, const char*> kClasses[] = {
        {"text", "wxRichTextPlainText"},
        {"symbol", "wxRichTextPlainText"},
        {"image", "wxRichTextImage"},
        {"paragraph", "wxRichTextParagraph"},
        {"paragraphlayout", "wxRichTextParagraphLayoutBox"},
        {"textbox", "wxRichTextBox"},
        {"cell", "wxRichTextCell"},
        {"table", "wxRichTextTable"},
        {"field", "wxRichTextField"}};
    for (const auto& [node, name] : kClasses) wxRichTextXMLHandler::RegisterNodeName(node, name);
    if (!wxImage::FindHandler(wxBITMAP_TYPE_PNG)) wxImage::AddHandler(new wxPNGHandler);
}

} // namespace

std::unique_ptr<wxRichTextBuffer> toRichTextBuffer(const CRichText& text) {
    parseXml(text); // for its limits
    prepareToolkit();
    const wxLogNull quiet;
    wxMemoryInputStream stream(text.GetXml().data(), text.GetXml().size());
    auto buffer = std::make_unique<wxRichTextBuffer>();
    // Margins of a new buffer would be added to those of the text.
    buffer->GetAttributes().GetTextBoxAttr().GetMargins().Reset();
    if (!wxRichTextXMLHandler().LoadFile(buffer.get(), stream))
        throw peru::CParseError(
            peru::localize("graphics.RichText.NotRead", "The text is not rich text of a known form."));
    return buffer;
}

P<CRichText> fromRichTextBuffer(wxRichTextBuffer& buffer) {
    prepareToolkit();
    const wxLogNull quiet;
    wxMemoryOutputStream stream;
    if (!wxRichTextXMLHandler().SaveFile(&buffer, stream)) throwNotWritten();
    std::string xml(stream.GetSize(), '\0');
    stream.CopyTo(xml.data(), xml.size());
    return peru::make<CRichText>(std::move(xml));
}

} // namespace graphics
