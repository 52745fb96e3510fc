#include "ced/GraphicTableContent.h"
#include "graphics/Elements.h"
#include "graphics/painting/DocumentRenderer.h"
#include "graphics/text/RichTextParser.h"
#include "graphics/text/TextLayout.h"
#include "graphics/text/TextWrapper.h"
#include "peru/Errors.h"
#include "support/FontLeaks.h"

#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <iomanip>
#include <sstream>

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

// What is not a default in the paragraphs of a text: '/' begins a paragraph, '[' a run.
std::string describe(const std::vector<SParagraph>& paragraphs) {
    std::ostringstream out;
    const auto put = [&](const char* name, double value, double usual = 0) {
        if (value != usual) out << name << value << ' ';
    };
    const auto putRun = [&](const STextRun& run) {
        const SFont& font = run.font;
        if (font.name != "Arial") out << font.name << ' ';
        put("size", font.pointSize, 10), put("style", font.style, 90), put("weight", font.weight, 400);
        put("scale", run.scale, 1), put("script", static_cast<int>(run.script));
        put("underlined", font.isUnderlined), put("struck", run.isStruckThrough);
        put("capitals", run.isCapitals);
        if (run.image) out << "image " << run.imageSize.width << 'x' << run.imageSize.height;
        for (const auto& [name, colour] : {std::pair("colour", run.colour), {"back", run.background}}) {
            const uint32_t rgb = uint32_t{colour.red} << 16 | uint32_t{colour.green} << 8 | colour.blue;
            if (rgb != 0) out << name << std::hex << rgb << ' ' << std::dec;
        }
        out << run.text << ']';
    };
    for (const SParagraph& p : paragraphs) {
        out << '/';
        put("align", static_cast<int>(p.alignment), 1), put("left", p.leftIndent);
        put("sub", p.leftSubIndent), put("right", p.rightIndent), put("before", p.spaceBefore);
        put("after", p.spaceAfter), put("spacing", p.lineSpacing, 1);
        for (const double tab : p.tabs) put("tab", tab, -1);
        put("mark", static_cast<int>(p.bulletAlignment), 1), put("font", p.font.pointSize, 10);
        for (const STextRun& run : p.bullet) out << '{', putRun(run);
        for (const STextRun& run : p.runs) out << '[', putRun(run);
    }
    return out.str();
}

std::string describe(const std::string& content, const std::string& attributes = {}) {
    return describe(parseRichText(CRichText("<richtext><paragraphlayout " + attributes + ">" + content +
                                            "<!-- not text --></paragraphlayout></richtext>")));
}

// The pattern once for each line or part between '|', which stands for its '$'.
std::string repeat(const std::string& pattern, std::string parts) {
    std::replace(parts.begin(), parts.end(), '\n', '|');
    std::istringstream in(parts);
    std::string all;
    for (std::string part; std::getline(in, part, '|');) {
        all += pattern;
        all.replace(all.rfind('$'), 1, part);
    }
    return all;
}

} // namespace

TEST(RichText, ReadsEachAttribute) {
    const char* const paragraphs = R"(alignment='2' leftindent='15' leftsubindent='-20' rightindent='30'
alignment='4' parspacingbefore='5' parspacingafter='7'|alignment='0' leftindent='100000' rightindent='-100001'
alignment='5' leftindent='1e9' rightindent='x'|linespacing='15'|linespacing='1000'|linespacing='1001'|linespacing='1'
linespacing='0' tabs='300,100000,x,100001,-5,0,20,1,'|alignment='1' tabs='')";
    EXPECT_EQ(describe(repeat("<paragraph $/>", paragraphs), "linespacing='20' tabs='30' alignment='3'"),
              "/align2 left1.5 sub-2 right3 spacing2 tab3 /align4 before0.5 after0.7 spacing2 tab3 "
              "/align3 left10000 spacing2 tab3 /align3 spacing2 tab3 /align3 spacing1.5 tab3 "
              "/align3 spacing100 tab3 /align3 spacing2 tab3 /align3 spacing0.1 tab3 "
              "/align3 tab0.1 tab2 tab30 tab10000 /spacing2 ");
    const char* const texts =
        R"(fontface='Serif' fontstyle='93' fontweight='700' fontunderlined='1'|fontstyle='94'
fontweight='1000' fontstrikethrough='1'|fontstyle='89' fontweight='0' fontstrikethrough='2' fontunderlined='10'
fontstyle='95' fontweight='1001'|fontweight='1' fontunderlined='9'|fontsize='12'|fontsize='1'|fontsize='12' fontpointsize='2000'
fontpointsize='2001'|fontpointsize='0'|fontpointsize='1'|fontpixelsize='16'|fontpixelsize='17'|fontpixelsize='1'
fontpixelsize='2000'|fontpixelsize='2001'|textcolor='#102030' bgcolor='#FFfe01'|textcolor='0102030' bgcolor='#12345'
textcolor='#10203G' bgcolor='#-10203'|textcolor='#1020301'|texteffects='1'|texteffects='2'|texteffects='4' texteffectflags='4'
texteffects='8' texteffectflags='65535'|texteffects='768' texteffectflags='256'|texteffects='512'|texteffects='65536'
texteffects='1' texteffectflags='0')";
    EXPECT_EQ(
        describe("<paragraph>" + repeat("<text $>t</text>", texts) + "</paragraph>"),
        "/[Serif style93 weight700 underlined1 t][style94 t][weight1000 struck1 t][t][t][weight1 underlined1 "
        "t]"
        "[size12 t][size1 t][size2000 t][t][t][size1 t][size12 t][size12 scale1.0625 t][size1 scale0.75 t]"
        "[size1500 t][t][colour102030 backfffe01 t][t][t][t][capitals1 t][scale0.75 capitals1 t][struck1 t]"
        "[struck1 t][scale0.666667 script1 t][scale0.666667 script2 t][t][t]");
    // What a part of the text does not state is inherited.
    EXPECT_EQ(describe("<paragraph fontpixelsize='17' texteffects='5'><text fontunderlined='0'>a</text>"
                       "<text texteffects='0' texteffectflags='4' fontpointsize='12'>b</text>"
                       "<text fontsize='12' fontstrikethrough='0'>c</text></paragraph>",
                       "fontstrikethrough='1' fontunderlined='1'"),
              "/font12 [size12 scale1.0625 struck1 capitals1 a][size12 underlined1 struck1 capitals1 b]"
              "[size12 scale1.0625 underlined1 struck1 capitals1 c]");
}

TEST(RichText, MarksLists) {
    const char* const styles =
        R"(1' bulletnumber='12|257' bulletnumber='12|385' bulletnumber='12|1025' bulletnumber='12
2' bulletnumber='1|2' bulletnumber='26|4' bulletnumber='27|4' bulletnumber='0|8' bulletnumber='3999
8' bulletnumber='444|16' bulletnumber='88|16' bulletnumber='4000|8' bulletnumber='0|8' bulletnumber='1666
288|2048|576|768|256|16385|4097|8193|65537|512' bulletname='standard/circle-outline
512' bulletname='standard/square|512' bulletname='standard/diamond|512' bulletname='standard/triangle
1' bulletfont='Symbol)";
    EXPECT_EQ(
        describe(repeat("<paragraph bullettext='*' bulletstyle='$'/>", styles)),
        "/{12]/{12.]/{(12)]/{12)]/{A]/{Z]/{a]//{MMMCMXCIX]/{CDXLIV]/{lxxxviii]/{4000]/{0]/{MDCLXVI]"
        "/{*.]/{*]/{\u2022]/{\u2022]///mark3 {0]/mark2 {0]//{\u25e6]/{\u25aa]/{\u25c6]/{\u25b6]/{Symbol 0]");
}

TEST(RichText, ReadsEachKindOfContent) {
    const char* const contents = R"(<text>plain</text><text>" b "</text>
<text>"</text><text>""</text><text>"a</text><text>a"</text>|<text><![CDATA[a<b]]><!-- no -->c</text><!-- no --><unknown/>
<symbol>9</symbol><symbol>10</symbol><symbol>29</symbol><symbol>65</symbol><symbol>32</symbol><symbol>1114109</symbol>
<symbol>0</symbol><symbol>31</symbol><symbol>55296</symbol><symbol>x</symbol><symbol>1114112</symbol><symbol>-1</symbol>
<text>a</text><textbox><paragraph><text>b</text></paragraph></textbox><text>c</text>|<field><paragraph/></field><text>d</text>
<table fontpointsize='8'><cell><paragraph><text>e</text></paragraph></cell></table>|<text>f</text><field/>
<image/><image><data>zz</data></image>)";
    EXPECT_EQ(
        describe(repeat("<paragraph>$</paragraph>", contents) +
                 "<textbox><paragraph/></textbox><cell><paragraph/></cell><text>no</text>"
                 "<paragraph bulletstyle='1'><text>a</text><field/><text>b</text></paragraph>"),
        "/[plain][ b ]/[\"][][\"a][a\"]/[a<bc]/[\t][\n][\n][A][ ][\U0010fffd]/[][][][][][]/[a]/[b]/[c]//[d]"
        "/font8 [size8 e]/[f]////{0][a]/[b]");
    std::ostringstream data;
    for (const char c : peru::make<CBitmap>(4, 2, std::vector<uint32_t>(8))->Encode(EBitmapFormat::png))
        data << std::hex << std::setw(2) << std::setfill('0') << int{static_cast<uint8_t>(c)} << "\n ";
    const char* const sizes =
        R"(|width='80,1'|height='80,1'|width='80,1' height='10,1'|width='96,2'|width='72,8'
width='7200,256'|width='80,1' height='80,4'|width='80' height='x,1'|width='-8,1' height='0,1'
width='80,65537' height='80,-1'|height='90000,1'|width='1e9,1' height='1e9,1')";
    EXPECT_EQ(describe("<paragraph>" +
                       repeat("<image imagetype='15' $><data>" + data.str() + "</data></image>", sizes) +
                       "</paragraph>"),
              "/[image 1.05833x0.529167][image 8x4][image 16x8][image 8x1][image 25.4x12.7][image 25.4x12.7]"
              "[image 25.4x12.7][image 8x4][image 1.05833x0.529167][image 1.05833x0.529167]"
              "[image 1.05833x0.529167][image 10000x9000][image 10000x10000]");
    EXPECT_TRUE(parseRichText(CRichText("<richtext>")).empty());
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
    EXPECT_EQ(describe(parseRichText(*makeRichTextLike(model, "\"new\"\x1f\n\n  b & <c>"))),
              "/align3 [Sans weight700 \"new\"]/align3 [Sans weight700 ]/align3 [Sans weight700   b & <c>]");
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
}

TEST(Text, HasASizeThatCanBePainted) {
    const auto text = peru::make<CGraphicTextCircle>();
    text->SetText(makeRichText("too large", {"DejaVu Sans", 300, 90, 400, false}));
    text->SetSize(10, 10);
    EXPECT_EQ(paint(text).area, 0);
    // In files of labels, any number.
    for (const auto& [size, low, high] : {std::tuple(INT_MAX, 500.0, 1500.0), {-5, 0.1, 1.0}}) {
        const SFont font{"DejaVu Sans", size, 90, 400, false};
        const double height = CTextLayout({{{{"x", font, {}}}, ETextAlignment::left, font}}, 0).GetHeight();
        EXPECT_GT(height, low) << size;
        EXPECT_LT(height, high) << size;
    }
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
