#include "ced/GraphicTableContent.h"
#include "graphics/Elements.h"
#include "graphics/painting/DocumentRenderer.h"
#include "graphics/text/RichTextParser.h"
#include "graphics/text/TextLayout.h"
#include "graphics/text/TextWrapper.h"
#include "peru/Errors.h"
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

// How each style changes what is painted.
TEST(RichText, PaintsItsStyles) {
    const auto area = [](const std::string& attributes, const std::string& content = "word word word") {
        const auto text = peru::make<CGraphicText>();
        text->SetText(peru::make<CRichText>(
            "<richtext><paragraphlayout fontface='DejaVu Sans' fontpointsize='12'><paragraph " + attributes +
            "><text>" + content + "</text></paragraph></paragraphlayout></richtext>"));
        text->SetSize(50, 36);
        return paint(text);
    };
    const SInk plain = area("");
    struct SCase {
        const char* attributes;
        double low, high; // the area in proportion to that of plain text
    };
    for (const SCase& c : {SCase{"fontweight='700'", 1.2, 2},
                           {"fontunderlined='1'", 1.1, 1.8},
                           {"texteffects='4' texteffectflags='4'", 1.1, 1.8},
                           {"texteffects='1' texteffectflags='1'", 1.2, 2},
                           {"texteffects='2' texteffectflags='2'", 0.7, 1.2},
                           {"texteffects='256' texteffectflags='256'", 0.35, 0.55},
                           {"texteffects='512' texteffectflags='512'", 0.35, 0.55},
                           {"fontpixelsize='32'", 3.2, 4.8},
                           {"bgcolor='#FF0000'", 3, 12}}) {
        const double share = area(c.attributes).area / plain.area;
        EXPECT_GT(share, c.low) << c.attributes;
        EXPECT_LT(share, c.high) << c.attributes;
    }
    const auto behind = [&](int effect) {
        const std::string value = "='" + std::to_string(effect) + "' ";
        return area("", "x</text><text texteffects" + value + "texteffectflags" + value + ">pp").bottom;
    };
    EXPECT_GT(behind(512), behind(256) + 0.7);
    EXPECT_NEAR(area("leftindent='75'").left - plain.left, 7.5, 0.15);
    EXPECT_NEAR(area("parspacingbefore='75'").top - plain.top, 7.5, 0.15);
    EXPECT_NEAR(area("bulletstyle='512' leftsubindent='80'").right - plain.right, 8, 0.15);
    EXPECT_NEAR(area("bulletstyle='512' leftsubindent='80'").left, plain.left, 1);
    const std::string lines = "the quick brown fox jumps over the lazy dog";
    EXPECT_NEAR(area("alignment='4'", lines).right, 55, 0.3);
    EXPECT_LT(area("", lines).right, 54);
}

TEST(RichText, TakesTheStyleOfAnother) {
    const auto model = peru::make<CRichText>("<richtext><paragraphlayout fontface='Sans'><paragraph "
                                             "alignment='3'><text fontweight='700'>old</text>"
                                             "</paragraph><paragraph/></paragraphlayout></richtext>");
    const auto paragraphs = parseRichText(*makeRichTextLike(model, "\"new\"\n  text"));
    ASSERT_EQ(paragraphs.size(), 2u);
    for (const SParagraph& paragraph : paragraphs) {
        EXPECT_EQ(paragraph.alignment, ETextAlignment::right);
        EXPECT_EQ(paragraph.runs[0].font, (SFont{"Sans", 10, 90, 700, false}));
    }
    EXPECT_EQ(paragraphs[0].runs[0].text, "\"new\"");
    EXPECT_EQ(paragraphs[1].runs[0].text, "  text");
    EXPECT_FALSE(hasText(*makeRichTextLike(model, "")));
    EXPECT_TRUE(hasText(*makeRichTextLike(nullptr, "x")));
    EXPECT_TRUE(hasText(*makeRichTextLike(peru::make<CRichText>("<damaged"), "x")));
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

TEST(GraphicTableContent, IsFilledFromContent) {
    const auto factory = peru::make<ced::CGraphicElementFactory>();
    EXPECT_FALSE(factory->CreateElement("unknown"));
    const auto table = P<ced::CGraphicTableContent>(factory->CreateElement("table-content"));
    table->InsertCols(0, 3);
    table->InsertRows(0, 2);
    EXPECT_EQ(table->GetHint(), "Double click to edit!");
    table->GetRow(0).contentId = "headings";
    table->SetCellText(0, 0, makeRichText("Title", kFont));
    EXPECT_EQ(table->GetHint(), "Double click to edit table");
    table->GetCol(0).contentId = "title";
    table->GetCol(2).contentId = "duration";
    table->SetColHiddenByTheme(2, true);
    table->SetRowHeight(1, 7);
    table->SetCellText(1, 1, makeRichText("-", kFont));
    table->SetCellText(1, 0, makeRichText("x", kFont, {9, 9, 9, 255}));
    table->GetCell(1, 0).margin = 2;
    const auto textAt = [&](int row, int col) {
        const auto paragraphs = parseRichText(*table->GetCell(row, col).text);
        return paragraphs[0].runs[0].text;
    };
    const auto fill = [&](int count) {
        table->FillFromContent(count,
                               [](const std::string& id, int item) { return id + std::to_string(item); });
    };
    for (const int count : {3, 5, 2, 0, 4}) {
        fill(count);
        ASSERT_EQ(table->GetRowCount(), 1 + std::max(1, count));
        EXPECT_EQ(textAt(0, 0), "Title");
        for (int row = 1; row < table->GetRowCount(); ++row) {
            const std::string number = std::to_string(row - 1);
            EXPECT_EQ(textAt(row, 0), count ? "title" + number : "");
            EXPECT_EQ(textAt(row, 2), count ? "duration" + number : "");
            EXPECT_EQ(textAt(row, 1), row == 1 ? "-" : "");
            EXPECT_EQ(table->GetRow(row).height, 7);
            EXPECT_EQ(table->GetCell(row, 0).margin, 2);
            EXPECT_EQ(parseRichText(*table->GetCell(row, 0).text)[0].runs[0].colour, (SColour{9, 9, 9, 255}));
        }
    }
    EXPECT_EQ(table->GetCol(2).width, 20);
    const auto clone = table->Clone();
    EXPECT_EQ(clone->GetTypeName(), "table-content");
    EXPECT_TRUE(peru::tryCast<ced::CGraphicTableContent>(clone));
    EXPECT_THROW(table->SetColWidth(0, -1), peru::CInvalidArgError);
    EXPECT_THROW(table->SetRowHeight(0, std::nan("")), peru::CInvalidArgError);
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
