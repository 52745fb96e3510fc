#include "graphics/text/RichTextParser.h"

#include "graphics/geometry/Numbers.h"
#include "graphics/storage/XmlValues.h"
#include "peru/Errors.h"
#include "peru/log/LogManager.h"
#include "peru/strings/String.h"
#include "peru/xml/XmlDocument.h"

#include <charconv>
#include <cmath>

namespace graphics {

namespace {

struct SStyle {
    SFont font;
    SColour colour;
    ETextAlignment alignment = ETextAlignment::left;
};

int32_t readSmall(const Node& node, const char* name, int32_t value, int32_t low, int32_t high) {
    std::string text;
    if (!readAttribute(node, name, text)) return value;
    const auto number = parseNumber(text);
    return number && *number >= low && *number <= high ? static_cast<int32_t>(std::lround(*number)) : value;
}

// "#RRGGBB"
void readColour(const Node& node, const char* name, SColour& colour) {
    std::string text;
    if (!readAttribute(node, name, text) || text.size() != 7 || text[0] != '#') return;
    uint32_t value = 0;
    const auto [end, error] = std::from_chars(text.data() + 1, text.data() + 7, value, 16);
    if (error == std::errc() && end == text.data() + 7)
        colour = {static_cast<uint8_t>(value >> 16), static_cast<uint8_t>(value >> 8),
                  static_cast<uint8_t>(value), 255};
}

// What the node does not state is inherited.
SStyle readStyle(const Node& node, SStyle style) {
    // Old versions write "fontsize".
    style.font.pointSize = readSmall(node, "fontsize", style.font.pointSize, 1, 2000);
    style.font.pointSize = readSmall(node, "fontpointsize", style.font.pointSize, 1, 2000);
    style.font.style = readSmall(node, "fontstyle", style.font.style, 90, 94);
    style.font.weight = readSmall(node, "fontweight", style.font.weight, 1, 1000);
    style.font.isUnderlined = readSmall(node, "fontunderlined", style.font.isUnderlined, 0, 9) != 0;
    readAttribute(node, "fontface", style.font.name);
    readColour(node, "textcolor", style.colour);
    style.alignment =
        static_cast<ETextAlignment>(readSmall(node, "alignment", static_cast<int>(style.alignment), 1, 4));
    return style;
}

std::string readRun(const Node& node) {
    const std::string text = peru::CString::toStdString(node->getText());
    if (getName(node) == "symbol") { // one character by its number
        const auto code = parseInteger(text);
        if (code == 9) return "\t";
        return code == 29 || code == 10 ? "\n" : "";
    }
    // Text with blanks at its ends is quoted.
    if (text.size() >= 2 && text.front() == '"' && text.back() == '"') return text.substr(1, text.size() - 2);
    return text;
}

void readParagraphs(const Node& node, const SStyle& inherited, std::vector<SParagraph>& paragraphs) {
    for (auto children = node->getChildNodes(); children.hasMore();) {
        const Node child = children.getNext();
        const SStyle style = readStyle(child, inherited);
        if (getName(child) == "paragraphlayout") {
            readParagraphs(child, style, paragraphs);
        } else if (getName(child) == "paragraph") {
            SParagraph& paragraph = paragraphs.emplace_back();
            paragraph.alignment = style.alignment;
            paragraph.font = style.font;
            for (auto runs = child->getChildNodes(); runs.hasMore();) {
                const Node run = runs.getNext();
                if (getName(run) != "text" && getName(run) != "symbol") continue;
                const SStyle runStyle = readStyle(run, style);
                paragraph.runs.push_back({readRun(run), runStyle.font, runStyle.colour});
            }
        }
    }
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

} // namespace

std::vector<SParagraph> parseRichText(const CRichText& text) {
    std::vector<SParagraph> paragraphs;
    try {
        const auto document = peru::make<peru::CXmlDocument>();
        document->parseString(peru::CString::fromUTF8(text.GetXml()));
        if (const Node root = document->getRootNode()) readParagraphs(root, SStyle(), paragraphs);
    } catch (const peru::CException& error) {
        peru::getLogManager()->warning(peru::CString::fromUTF8("graphics"), error.getDescription());
        paragraphs.clear();
    }
    return paragraphs;
}

P<CRichText> makeRichText(const std::string& plainText, const SFont& font, const SColour& colour,
                          ETextAlignment alignment) {
    const auto document = peru::make<peru::CXmlDocument>();
    const Node root = document->addChildNode("richtext");
    writeAttribute(root, "version", "1.0.0.0");
    writeAttribute(root, "xmlns", "http://www.wxwidgets.org");
    const Node layout = addChild(root, "paragraphlayout");
    writeInteger(layout, "fontpointsize", font.pointSize);
    writeInteger(layout, "fontstyle", font.style);
    writeInteger(layout, "fontweight", font.weight);
    writeInteger(layout, "fontunderlined", font.isUnderlined);
    writeAttribute(layout, "fontface", font.name);
    writeAttribute(layout, "textcolor", toHex(colour));
    writeInteger(layout, "alignment", static_cast<int>(alignment));
    for (size_t begin = 0; begin <= plainText.size();) {
        const size_t end = std::min(plainText.find('\n', begin), plainText.size());
        const Node run = addChild(addChild(layout, "paragraph"), "text");
        run->setText(peru::CString::fromUTF8("\"" + plainText.substr(begin, end - begin) + "\""));
        begin = end + 1;
    }
    return peru::make<CRichText>(peru::CString::toStdString(document->printToString()));
}

} // namespace graphics
