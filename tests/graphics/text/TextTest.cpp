#include "graphics/Elements.h"
#include "graphics/painting/DocumentRenderer.h"
#include "graphics/text/TextLayout.h"
#include "graphics/text/TextWrapper.h"
#include "support/FontLeaks.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <cmath>

using namespace graphics;
using tests::P;

namespace {

const SFont kFont{"DejaVu Sans", 14, 90, 400, false};

// The box of what is painted, in millimetres of a sheet of 60 x 40.
struct SInk {
    double left = 1e9, top = 1e9, right = -1e9, bottom = -1e9, area = 0;
};

SInk paint(const P<CGraphicElement>& element, double dpi = 254) {
    auto document = peru::make<CGraphicDocument>();
    document->SetContentBox(SRect{0, 0, 60, 40});
    element->SetCenter(30, 20);
    document->Add(element);
    SRenderOptions options;
    options.dpi = dpi;
    const auto bitmap = RenderBitmap(*document, options);
    SInk ink;
    for (int y = 0; y < bitmap->GetHeight(); ++y)
        for (int x = 0; x < bitmap->GetWidth(); ++x) {
            const double alpha = bitmap->GetPixels()[static_cast<size_t>(y * bitmap->GetWidth() + x)] >> 24,
                         pixel = 25.4 / dpi;
            ink.area += alpha / 255 * pixel * pixel;
            if (alpha < 128) continue;
            ink.left = std::min(ink.left, x * pixel), ink.right = std::max(ink.right, (x + 1) * pixel);
            ink.top = std::min(ink.top, y * pixel), ink.bottom = std::max(ink.bottom, (y + 1) * pixel);
        }
    return ink;
}

} // namespace

TEST(RichText, ReadsStylesAndText) {
    const auto paragraphs =
        parseRichText(CRichText("<?xml version=\"1.0\" encoding=\"UTF-8\"?><richtext version=\"1.0.0.0\" "
                                "xmlns=\"http://www.wxwidgets.org\">"
                                "<paragraphlayout textcolor=\"#102030\" fontpointsize=\"9\" "
                                "fontface=\"Sans\"><paragraph alignment=\"2\">"
                                "<text>plain</text><text fontweight=\"700\" textcolor=\"#FF0000\">\" bold "
                                "\"</text><symbol>29</symbol></paragraph>"
                                "<paragraph/></paragraphlayout></richtext>"));
    ASSERT_EQ(paragraphs.size(), 2u);
    ASSERT_EQ(paragraphs[0].runs.size(), 3u);
    EXPECT_EQ(paragraphs[0].alignment, ETextAlignment::center);
    EXPECT_EQ(paragraphs[0].runs[0].colour, (SColour{16, 32, 48, 255}));
    EXPECT_EQ(paragraphs[0].runs[0].font, (SFont{"Sans", 9, 90, 400, false}));
    EXPECT_EQ(paragraphs[0].runs[1].text, " bold ");
    EXPECT_EQ(paragraphs[0].runs[1].font.weight, 700);
    EXPECT_EQ(paragraphs[0].runs[2].text, "\n");
    EXPECT_TRUE(parseRichText(CRichText("<richtext>")).empty());
    const auto lines =
        parseRichText(*makeRichText("a \n\nb & <c>", kFont, {1, 2, 3, 255}, ETextAlignment::right));
    ASSERT_EQ(lines.size(), 3u);
    EXPECT_EQ(lines[0].runs[0].text, "a ");
    EXPECT_EQ(lines[2].runs[0].text, "b & <c>");
    EXPECT_EQ(lines[2].runs[0].font, kFont);
    EXPECT_EQ(lines[2].alignment, ETextAlignment::right);
}

TEST(RichText, IsPaintedInItsBox) {
    const auto text = peru::make<CGraphicText>();
    text->SetText(makeRichText("one two three four five", kFont));
    text->SetSize(30, 34);
    const CTextLayout layout(parseRichText(*text->GetText()), 30);
    EXPECT_GE(layout.GetLineCount(), 2);
    const SInk top = paint(text);
    EXPECT_GE(top.left, 14.9);
    EXPECT_LE(top.right, 45.1);
    EXPECT_LT(top.bottom, 3 + layout.GetHeight() + 0.1);
    text->SetVerticalPlacement(EVerticalPlacement::bottom);
    EXPECT_NEAR(paint(text).top - top.top, 34 - layout.GetHeight(), 0.2);
    for (const double dpi : {96.0, 600.0}) {
        const SInk other = paint(text, dpi);
        EXPECT_NEAR(other.area, top.area, 0.05 * top.area) << dpi;
        EXPECT_NEAR(other.left, top.left, 0.3) << dpi;
        EXPECT_NEAR(other.right, top.right, 0.5) << dpi;
    }
    // The text of a PDF page remains text.
    const auto document = peru::make<CGraphicDocument>();
    document->Add(text);
    const tests::CTempFolder folder;
    folder.write("a.pdf", RenderPdf(*document));
    const auto words = tests::CProcess({"pdftotext", "a.pdf", "-"}, folder.path().string()).wait();
    EXPECT_NE(words.out.find("one two"), std::string::npos) << words.out << words.err;
}

TEST(CircularText, StaysInsideItsCircle) {
    for (const ECircleType type : {ECircleType::convex, ECircleType::concav}) {
        const auto text = peru::make<CGraphicTextCircle>();
        text->SetText(makeRichText("MMMMMMM", kFont));
        text->SetCircleType(type);
        text->SetSize(36, 36);
        const SInk ink = paint(text);
        EXPECT_NEAR(ink.left - 12, 48 - ink.right, 0.3) << CircleTypeToXml(type);
        EXPECT_GE(ink.top, 2);
        EXPECT_LT(ink.bottom, 20);
        EXPECT_GT(ink.right - ink.left, 15);
    }
    const auto text = peru::make<CGraphicTextCircle>();
    text->SetText(makeRichText("too large", {"DejaVu Sans", 300, 90, 400, false}));
    text->SetSize(10, 10);
    EXPECT_EQ(paint(text).area, 0);
}

TEST(GraphicTable, IsPaintedWithoutHiddenColumns) {
    const auto table = peru::make<CGraphicTable>();
    table->InsertRows(0, 1);
    table->InsertCols(0, 2);
    table->SetRowHeight(0, 10);
    table->SetCellText(0, 1, makeRichText("H", kFont));
    table->SetSize(50, 20);
    const SInk both = paint(table);
    EXPECT_GT(both.left, 30);
    table->GetCol(0).isHiddenByTheme = true;
    const SInk one = paint(table);
    EXPECT_NEAR(both.left - one.left, 25, 0.2);
    table->GetCol(1).isVisible = false;
    EXPECT_EQ(paint(table).area, 0);
    const auto label = peru::make<CGraphicLabel>();
    label->SetText("Label \xff");
    label->SetFont(kFont);
    label->SetSize(50, 20);
    EXPECT_GT(paint(label).area, 5);
}

TEST(TextWrapper, BreaksBehindDelimiters) {
    const CTextWrapper wrapper(
        [](const std::string& piece) { return 10.0 * static_cast<double>(piece.size()); });
    for (const auto& [text, width, expected] : {std::tuple("one two three", 80.0, "one two \nthree"),
                                                {"a,b:c", 20.0, "a,\nb:\nc"},
                                                {"word", 5.0, "\nword"},
                                                {"ab\ncd ef", 40.0, "ab\ncd \nef"},
                                                {"", 5.0, ""},
                                                {"a\n\nb", 50.0, "a\n\nb"}})
        EXPECT_EQ(wrapper.Wrap(text, width), expected) << text;
}
