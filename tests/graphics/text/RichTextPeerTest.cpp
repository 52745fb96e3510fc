// Rich text compared with the toolkit's own buffers: the same text, lines and positions.
#include "graphics/text/RichTextBuffer.h"
#include "graphics/text/RichTextParser.h"
#include "graphics/text/TextLayout.h"
#include "peru/Errors.h"

#include <gtest/gtest.h>

#include <cairo.h>
#include <wx/app.h>
#include <wx/dcgraph.h>
#include <wx/graphics.h>
#include <wx/richtext/richtextbuffer.h>

using namespace graphics;

namespace {

std::string makeXml(const std::string& paragraphs) {
    return "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<richtext version=\"1.0.0.0\" "
           "xmlns=\"http://www.wxwidgets.org\"><paragraphlayout textcolor=\"#000000\" "
           "fontpointsize=\"10\" fontface=\"DejaVu Sans\">" +
           paragraphs + "</paragraphlayout></richtext>\n";
}

// The toolkit without a display; it can be started only once.
void startToolkit() {
    static const bool s_isStarted = [] {
        if (wxTheApp) return true;
        wxAppConsole::SetInstance(new wxAppConsole);
        int count = 0;
        char* arguments[] = {nullptr};
        return wxEntryStart(count, arguments);
    }();
    ASSERT_TRUE(s_isStarted);
}

// The lines of a buffer that is laid out at 960 ppi.
std::vector<STextLine> layOut(wxRichTextBuffer& buffer, double width) {
    constexpr double kUnits = 960 / 25.4;
    buffer.SetFontScale(10);
    buffer.SetDimensionScale(10);
    buffer.SetMargins(0, 0, 0, 0);
    buffer.Invalidate(wxRICHTEXT_ALL);
    cairo_surface_t* const surface = cairo_recording_surface_create(CAIRO_CONTENT_COLOR_ALPHA, nullptr);
    cairo_t* const cairo = cairo_create(surface);
    std::vector<STextLine> lines;
    {
        wxGCDC device(wxGraphicsRenderer::GetCairoRenderer()->CreateContextFromNativeContext(cairo));
        wxRichTextDrawingContext context(&buffer);
        const wxRect rect(0, 0, static_cast<int>(width * kUnits), 1000000);
        buffer.Layout(device, context, rect, rect, wxRICHTEXT_FIXED_WIDTH | wxRICHTEXT_VARIABLE_HEIGHT);
        for (auto* child = buffer.GetChildren().GetFirst(); child; child = child->GetNext())
            for (auto* line : wxDynamicCast(child->GetData(), wxRichTextParagraph)->GetLines()) {
                const wxPoint place = line->GetAbsolutePosition();
                lines.push_back({place.x / kUnits, place.y / kUnits, line->GetSize().x / kUnits,
                                 line->GetSize().y / kUnits,
                                 buffer.GetTextForRange(line->GetAbsoluteRange()).utf8_string()});
            }
    }
    cairo_destroy(cairo);
    cairo_surface_destroy(surface);
    return lines;
}

std::string toUpper(const std::string& text) {
    return wxString::FromUTF8(text).Upper().utf8_string();
}

// '@' stands for a long text, '%' for a short one.
std::string expand(const std::string& paragraphs) {
    std::string xml;
    for (const char c : paragraphs)
        if (c == '@')
            xml += "<text>The quick brown fox jumps over the lazy dog and runs into the forest.</text>";
        else if (c == '%')
            xml += "<text>The quick brown fox</text>";
        else
            xml += c;
    return makeXml(xml);
}

} // namespace

TEST(RichTextPeer, HasTheSameLines) {
    startToolkit();
    for (const std::string paragraphs : {
             "<paragraph>@</paragraph><paragraph/><paragraph>@</paragraph>",
             "<paragraph parspacingbefore='30' parspacingafter='15' linespacing='15'>@</paragraph>"
             "<paragraph linespacing='20'>@</paragraph>",
             "<paragraph leftindent='50' leftsubindent='60' rightindent='70'>@</paragraph>",
             "<paragraph leftindent='110' leftsubindent='-60'>@</paragraph>",
             "<paragraph leftindent='50' leftsubindent='60' bulletstyle='257' bulletnumber='3'>@</paragraph>",
             "<paragraph alignment='2' leftindent='50' leftsubindent='60'>@</paragraph>",
             "<paragraph alignment='3' rightindent='40'>@</paragraph>",
             "<paragraph fontpointsize='17' fontweight='700'>@</paragraph>",
             "<paragraph fontface='DejaVu Serif'>@</paragraph>",
             "<paragraph><text fontpointsize='20'>Big </text>@</paragraph><paragraph>%</paragraph>",
             "<paragraph><text>x</text><text texteffects='256' texteffectflags='256'>up</text>"
             "<text texteffects='512' texteffectflags='512'>down</text></paragraph><paragraph>%</paragraph>",
             "<paragraph texteffects='1' texteffectflags='1'>@</paragraph>",
             "<paragraph texteffects='2' texteffectflags='2'>@</paragraph>",
             "<paragraph tabs='150,320'><text>a</text><symbol>9</symbol><text>b</text><symbol>9</symbol>"
             "<text>c</text></paragraph>",
             "<paragraph leftindent='30'><text>a</text><symbol>9</symbol><text>b</text></paragraph>",
             "<paragraph><text>WWWWWWWWWWWWWWWWWWWWWWWWWWWWWWWWW</text></paragraph>",
             "<paragraph><text>a  b   c</text><symbol>34</symbol><text>\"  d \"</text></paragraph>",
         }) {
        const CRichText text(expand(paragraphs));
        const auto expected = layOut(*toRichTextBuffer(text), 60);
        const auto actual = CTextLayout(parseRichText(text), 60).GetLines();
        ASSERT_EQ(actual.size(), expected.size()) << paragraphs;
        for (size_t i = 0; i < actual.size(); ++i) {
            const std::string what = paragraphs + " " + std::to_string(i);
            // Capitals are in the layout only.
            EXPECT_EQ(toUpper(actual[i].text), toUpper(expected[i].text)) << what;
            EXPECT_NEAR(actual[i].left, expected[i].left, 0.15) << what;
            EXPECT_NEAR(actual[i].top, expected[i].top, 0.05 + 0.05 * static_cast<double>(i)) << what;
            EXPECT_NEAR(actual[i].width, expected[i].width, 1.3) << what; // a blank at its end
            EXPECT_NEAR(actual[i].height, expected[i].height, 0.1) << what;
        }
    }
}

// What an editor stores after it has changed nothing is the same text for us.
TEST(RichTextPeer, ConvertsBuffersWithoutLoss) {
    wxRichTextBuffer buffer;
    buffer.SetBasicStyle(wxRichTextAttr(wxColour(1, 2, 3)));
    buffer.AddParagraph(wxString::FromUTF8("  \"quoted\"  Füße\x1d 日本\t"));
    wxRichTextAttr list;
    list.SetBulletStyle(wxTEXT_ATTR_BULLET_STYLE_ROMAN_LOWER | wxTEXT_ATTR_BULLET_STYLE_PARENTHESES);
    list.SetBulletNumber(14);
    list.SetLeftIndent(10, 70);
    auto* const item = new wxRichTextParagraph(wxString("item"), &buffer, &list);
    buffer.AppendChild(item);
    wxImage image(4, 3);
    image.SetRGB(wxRect(0, 0, 4, 3), 255, 0, 0);
    wxRichTextAttr size;
    size.GetTextBoxAttr().GetWidth().SetValue(80, wxTEXT_ATTR_UNITS_TENTHS_MM);
    const auto first = fromRichTextBuffer(buffer); // adds the handler that images need
    item->AppendChild(new wxRichTextImage(image, item, &size));
    auto* const box = new wxRichTextBox(item);
    box->AddParagraph("boxed");
    item->AppendChild(box);
    const auto text = fromRichTextBuffer(buffer);
    EXPECT_EQ(fromRichTextBuffer(*toRichTextBuffer(*text))->GetXml(), text->GetXml());
    EXPECT_THROW(toRichTextBuffer(CRichText("<richtext><paragraph>")), peru::CException);

    const auto paragraphs = parseRichText(*text);
    ASSERT_EQ(paragraphs.size(), 3u);
    std::string words;
    for (const STextRun& run : paragraphs[0].runs) words += run.text;
    EXPECT_EQ(words, "  \"quoted\"  Füße\n 日本\t");
    ASSERT_EQ(paragraphs[1].runs.size(), 2u);
    EXPECT_EQ(paragraphs[1].runs[1].imageSize, (SSize{8, 6}));
    EXPECT_EQ(paragraphs[1].runs[1].image->GetPixels()[0], 0xffff0000u);
    EXPECT_EQ(paragraphs[2].runs[0].text, "boxed");
}
