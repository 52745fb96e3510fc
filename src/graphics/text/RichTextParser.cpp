#include "graphics/text/RichTextParser.h"

#include "graphics/geometry/Numbers.h"
#include "graphics/text/Bullets.h"
#include "graphics/text/RichTextXml.h"
#include "peru/Errors.h"
#include "peru/log/LogManager.h"
#include "peru/strings/String.h"

#include <glib.h>

#include <charconv>
#include <cmath>

namespace graphics {

namespace {

// Sizes of small text, as the toolkit's own rendering has them.
constexpr double kScriptScale = 1 / 1.5;
constexpr double kSmallCapitalsScale = 0.75;
constexpr double kMillimetresPerPixel = 25.4 / 96;
constexpr double kMaximalLength = 10000; // millimetres
constexpr size_t kMaximalTabs = 1000;
constexpr size_t kMaximalRuns = 5'000;        // of a paragraph
constexpr size_t kMaximalParagraphs = 10'000; // as many as lines are laid out

enum ETextEffect : int {
    kCapitals = 0x1,
    kSmallCapitals = 0x2,
    kStrikethrough = 0x4,
    kDoubleStrikethrough = 0x8,
    kSuperscript = 0x100,
    kSubscript = 0x200,
};

struct SStyle {
    STextRun run;
    SParagraph paragraph;
    int effects = 0;
    int bulletStyle = 0;
    int bulletNumber = 0;
    std::string bulletText;
    std::string bulletName;
    std::string bulletFont;
};

int readInt(const wxXmlNode& node, const char* name, int value, int low, int high) {
    const auto number = parseNumber(getAttribute(node, name));
    return number && *number >= low && *number <= high ? static_cast<int>(std::lround(*number)) : value;
}

// Tenths of a millimetre in files.
void readLength(const wxXmlNode& node, const char* name, double& millimetres) {
    const auto number = parseNumber(getAttribute(node, name));
    if (number && std::abs(*number) <= kMaximalLength * 10) millimetres = *number / 10;
}

void readString(const wxXmlNode& node, const char* name, std::string& value) {
    if (node.HasAttribute(name)) value = getAttribute(node, name);
}

// "#RRGGBB"
void readColour(const wxXmlNode& node, const char* name, SColour& colour) {
    const std::string text = getAttribute(node, name);
    if (text.size() != 7 || text[0] != '#') return;
    uint32_t value = 0;
    const auto [end, error] = std::from_chars(text.data() + 1, text.data() + 7, value, 16);
    if (error == std::errc() && end == text.data() + 7)
        colour = {static_cast<uint8_t>(value >> 16), static_cast<uint8_t>(value >> 8),
                  static_cast<uint8_t>(value), 255};
}

void readFont(const wxXmlNode& node, SStyle& style) {
    SFont& font = style.run.font;
    const int oldSize = font.pointSize;
    font.pointSize = readInt(node, "fontsize", font.pointSize, 1, 2000); // of old versions
    font.pointSize = readInt(node, "fontpointsize", font.pointSize, 1, 2000);
    if (font.pointSize != oldSize || node.HasAttribute("fontpointsize")) style.run.scale = 1;
    if (const int pixels = readInt(node, "fontpixelsize", 0, 1, 2000)) {
        font.pointSize = std::max(1, pixels * 3 / 4);
        style.run.scale = pixels * 0.75 / font.pointSize;
    }
    font.style = readInt(node, "fontstyle", font.style, 90, 94);
    font.weight = readInt(node, "fontweight", font.weight, 1, 1000);
    font.isUnderlined = readInt(node, "fontunderlined", font.isUnderlined, 0, 9) != 0;
    style.run.isStruckThrough = readInt(node, "fontstrikethrough", style.run.isStruckThrough, 0, 1) != 0;
    readString(node, "fontface", font.name);
}

void readTabs(const wxXmlNode& node, std::vector<double>& tabs) {
    if (!node.HasAttribute("tabs")) return;
    tabs.clear();
    const std::string text = getAttribute(node, "tabs");
    for (size_t begin = 0; begin < text.size() && tabs.size() < kMaximalTabs;) {
        const size_t end = std::min(text.find(',', begin), text.size());
        const auto number = parseNumber(text.substr(begin, end - begin));
        if (number && *number > 0 && *number <= kMaximalLength * 10) tabs.push_back(*number / 10);
        begin = end + 1;
    }
    std::sort(tabs.begin(), tabs.end());
}

// What the node does not state is inherited.
SStyle readStyle(const wxXmlNode& node, SStyle style) {
    readFont(node, style);
    readColour(node, "textcolor", style.run.colour);
    readColour(node, "bgcolor", style.run.background);
    const int effects = readInt(node, "texteffects", 0, 0, 0xFFFF);
    // Without flags, which old versions do not write, the effects are all that is meant.
    const int flags = readInt(node, "texteffectflags", effects, 0, 0xFFFF);
    style.effects = (style.effects & ~flags) | (effects & flags);

    SParagraph& paragraph = style.paragraph;
    paragraph.alignment =
        static_cast<ETextAlignment>(readInt(node, "alignment", static_cast<int>(paragraph.alignment), 1, 4));
    readLength(node, "leftindent", paragraph.leftIndent);
    readLength(node, "leftsubindent", paragraph.leftSubIndent);
    readLength(node, "rightindent", paragraph.rightIndent);
    readLength(node, "parspacingbefore", paragraph.spaceBefore);
    readLength(node, "parspacingafter", paragraph.spaceAfter);
    // Tenths of lines; 0 is the default.
    if (const int spacing = readInt(node, "linespacing", -1, 0, 1000); spacing >= 0)
        paragraph.lineSpacing = spacing == 0 ? 1 : spacing / 10.0;
    readTabs(node, paragraph.tabs);
    style.bulletStyle = readInt(node, "bulletstyle", style.bulletStyle, 0, 0xFFFF);
    style.bulletNumber = readInt(node, "bulletnumber", style.bulletNumber, -1000000, 1000000);
    readString(node, "bullettext", style.bulletText);
    readString(node, "bulletname", style.bulletName);
    readString(node, "bulletfont", style.bulletFont);
    return style;
}

STextRun makeRun(const SStyle& style, std::string text) {
    STextRun run = style.run;
    run.text = std::move(text);
    run.isStruckThrough |= (style.effects & (kStrikethrough | kDoubleStrikethrough)) != 0;
    run.isCapitals = (style.effects & (kCapitals | kSmallCapitals)) != 0;
    if (style.effects & kSmallCapitals) run.scale *= kSmallCapitalsScale;
    if (style.effects & (kSuperscript | kSubscript)) {
        run.script = style.effects & kSuperscript ? ETextScript::superscript : ETextScript::subscript;
        run.scale *= kScriptScale;
    }
    return run;
}

SParagraph makeParagraph(const SStyle& style) {
    SParagraph paragraph = style.paragraph;
    paragraph.font = style.run.font;
    paragraph.fontScale = style.run.scale;
    const std::string bullet =
        makeBulletText(style.bulletStyle, style.bulletNumber, style.bulletText, style.bulletName);
    if (!bullet.empty()) {
        paragraph.bullet.push_back(makeRun(style, bullet));
        if (!style.bulletFont.empty()) paragraph.bullet[0].font.name = style.bulletFont;
        paragraph.bulletAlignment = style.bulletStyle & kBulletAlignRight    ? ETextAlignment::right
                                    : style.bulletStyle & kBulletAlignCenter ? ETextAlignment::center
                                                                             : ETextAlignment::left;
    }
    return paragraph;
}

// Text with blanks at its ends is quoted.
std::string unquote(const std::string& text) {
    if (text.size() < 2 || text.front() != '"' || text.back() != '"') return text;
    return text.substr(1, text.size() - 2);
}

// One character by its number; 29 is a line break.
std::string readSymbol(const wxXmlNode& node) {
    const auto code = parseNumber(getText(node));
    if (!code || !(*code >= 1 && *code <= 0x10FFFF)) return {};
    const auto character = static_cast<gunichar>(*code);
    if (character == 29 || character == '\n') return "\n";
    if ((character < 32 && character != '\t') || !g_unichar_validate(character)) return {};
    char bytes[6];
    return std::string(bytes, static_cast<size_t>(g_unichar_to_utf8(character, bytes)));
}

// "value,flags", where the flags name the unit; 0 for units that depend on the surroundings.
double readDimension(const wxXmlNode& node, const char* name) {
    const std::string text = getAttribute(node, name);
    const size_t comma = text.find(',');
    const auto value = parseNumber(text.substr(0, comma));
    const auto flags = comma == std::string::npos ? std::nullopt : parseNumber(text.substr(comma + 1));
    if (!value || !flags || !(*value > 0 && *flags >= 0 && *flags <= 0xFFFF)) return 0;
    const double unit = [units = static_cast<int>(*flags)] {
        if (units & 0x1) return 0.1; // tenths of a millimetre
        if (units & 0x2) return kMillimetresPerPixel;
        if (units & 0x8) return 25.4 / 72;     // points
        if (units & 0x100) return 25.4 / 7200; // hundredths of a point
        return 0.0;
    }();
    return std::min(*value * unit, kMaximalLength);
}

std::string decodeHex(const std::string& text) {
    std::string bytes;
    bytes.reserve(text.size() / 2);
    int high = -1;
    for (const char c : text) {
        const int digit = g_ascii_xdigit_value(c);
        if (digit < 0) continue;
        if (high >= 0) bytes += static_cast<char>(high << 4 | digit);
        high = high >= 0 ? -1 : digit;
    }
    return bytes;
}

void readImage(const wxXmlNode& node, const SStyle& style, SParagraph& paragraph) {
    const wxXmlNode* const data = getChild(node, "data");
    if (!data) return;
    const auto format = static_cast<EBitmapFormat>(readInt(node, "imagetype", 15, 0, 10000));
    STextRun run = makeRun(style, {});
    try {
        run.image = peru::make<CBitmap>(format, decodeHex(getText(*data)));
    } catch (const peru::CException& error) {
        peru::getLogManager()->warning(peru::CString::fromUTF8("graphics"), error.getDescription());
        return;
    }
    const double pixelWidth = run.image->GetWidth(), pixelHeight = run.image->GetHeight();
    double width = readDimension(node, "width"), height = readDimension(node, "height");
    // One side alone keeps the proportions.
    if (width > 0 && !(height > 0)) height = width * pixelHeight / pixelWidth;
    if (height > 0 && !(width > 0)) width = height * pixelWidth / pixelHeight;
    run.imageSize = width > 0 ? SSize{std::min(width, kMaximalLength), std::min(height, kMaximalLength)}
                              : SSize{pixelWidth * kMillimetresPerPixel, pixelHeight * kMillimetresPerPixel};
    paragraph.runs.push_back(std::move(run));
}

void readParagraphs(const wxXmlNode& node, const SStyle& inherited, std::vector<SParagraph>& paragraphs);

void readParagraph(const wxXmlNode& node, const SStyle& style, std::vector<SParagraph>& paragraphs) {
    SParagraph paragraph = makeParagraph(style);
    bool hasObjects = false;
    for (const wxXmlNode* child = node.GetChildren(); child; child = child->GetNext()) {
        if (child->GetType() != wxXML_ELEMENT_NODE) continue;
        if (paragraph.runs.size() >= kMaximalRuns) break;
        const wxString& name = child->GetName();
        if (name == "text" || name == "symbol") {
            std::string text = name == "text" ? unquote(getText(*child)) : readSymbol(*child);
            paragraph.runs.push_back(makeRun(readStyle(*child, style), std::move(text)));
        } else if (name == "image") {
            readImage(*child, readStyle(*child, style), paragraph);
        } else if (name == "textbox" || name == "table" || name == "field") {
            // The text around the object continues below it.
            if (!paragraph.runs.empty()) paragraphs.push_back(std::move(paragraph));
            readParagraphs(*child, readStyle(*child, style), paragraphs);
            paragraph = makeParagraph(style);
            paragraph.bullet.clear();
            hasObjects = true;
        }
    }
    if (!hasObjects || !paragraph.runs.empty()) paragraphs.push_back(std::move(paragraph));
}

void readParagraphs(const wxXmlNode& node, const SStyle& inherited, std::vector<SParagraph>& paragraphs) {
    for (const wxXmlNode* child = node.GetChildren(); child; child = child->GetNext()) {
        if (paragraphs.size() >= kMaximalParagraphs) return;
        if (child->GetType() != wxXML_ELEMENT_NODE) continue;
        const wxString& name = child->GetName();
        if (name == "paragraph")
            readParagraph(*child, readStyle(*child, inherited), paragraphs);
        else if (name == "paragraphlayout" || name == "textbox" || name == "table" || name == "cell")
            readParagraphs(*child, readStyle(*child, inherited), paragraphs);
    }
}

} // namespace

std::vector<SParagraph> parseRichText(const CRichText& text) {
    std::vector<SParagraph> paragraphs;
    try {
        readParagraphs(*parseXml(text)->GetRoot(), SStyle(), paragraphs);
    } catch (const peru::CException& error) {
        peru::getLogManager()->warning(peru::CString::fromUTF8("graphics"), error.getDescription());
        paragraphs.clear();
    }
    return paragraphs;
}

bool hasText(const CRichText& text) {
    const auto paragraphs = parseRichText(text);
    return std::any_of(paragraphs.begin(), paragraphs.end(), [](const SParagraph& paragraph) {
        return std::any_of(paragraph.runs.begin(), paragraph.runs.end(),
                           [](const STextRun& run) { return run.image || !run.text.empty(); });
    });
}

} // namespace graphics
