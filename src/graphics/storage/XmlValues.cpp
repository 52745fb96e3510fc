#include "graphics/storage/XmlValues.h"

#include "graphics/geometry/Numbers.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/String.h"
#include "peru/xml/XmlText.h"

#include <limits>

namespace graphics {

namespace {

// A part of a record and its attribute.
template <class T> struct SPart {
    const char* name;
    double T::*member;
};

constexpr SPart<SPoint> kPoint[] = {{"x", &SPoint::x}, {"y", &SPoint::y}};
constexpr SPart<SSize> kSize[] = {{"width", &SSize::width}, {"height", &SSize::height}};
constexpr SPart<SRect> kRect[] = {
    {"left", &SRect::left}, {"top", &SRect::top}, {"width", &SRect::width}, {"height", &SRect::height}};
constexpr SPart<SScaleMargins> kMargins[] = {
    {"left", &SScaleMargins::left},
    {"top", &SScaleMargins::top},
    {"right", &SScaleMargins::right},
    {"bottom", &SScaleMargins::bottom},
    {"left-factor", &SScaleMargins::leftFactor},
    {"top-factor", &SScaleMargins::topFactor},
    {"right-factor", &SScaleMargins::rightFactor},
    {"bottom-factor", &SScaleMargins::bottomFactor},
};

template <class T, size_t N>
void writeParts(const Node& node, const char* key, const T& value, const SPart<T> (&parts)[N]) {
    const Node child = addChild(node, key);
    for (const auto& part : parts) writeNumber(child, part.name, value.*part.member);
}

template <class T, size_t N>
bool readParts(const Node& node, const char* key, T& value, const SPart<T> (&parts)[N]) {
    const Node child = node->getChildNode(key);
    if (!child) return false;
    for (const auto& part : parts) readNumber(child, part.name, value.*part.member);
    return true;
}

} // namespace

std::string removeInvalid(std::string_view text) {
    std::string valid;
    valid.reserve(text.size());
    while (!text.empty()) {
        const size_t size = peru::measureXmlCharacter(text.substr(0, 4));
        valid.append(text.substr(0, size));
        text.remove_prefix(std::max<size_t>(1, size));
    }
    return valid;
}

void throwInvalid(const Node& node, const char* attribute, const std::string& value) {
    throw peru::CParseError(peru::localize(
        "graphics.XmlValues.Invalid", "The value \"%VALUE%\" of \"%ATTRIBUTE%\" in \"%NODE%\" is invalid.",
        {{"%VALUE%", peru::CString::fromUTF8(value)},
         {"%ATTRIBUTE%", attribute},
         {"%NODE%", node->getName()}}));
}

void writeAttribute(const Node& node, const char* name, const std::string& value) {
    const std::string text = removeInvalid(value);
    if (text.empty())
        node->removeProperty(name);
    else
        node->setProperty(name, peru::CString::fromUTF8(text));
}

void writeNumber(const Node& node, const char* name, double value) {
    // Files with values that cannot be read again would be lost.
    const std::string text = formatNumber(value);
    if (!parseNumber(text)) throwInvalid(node, name, text);
    writeAttribute(node, name, text);
}

void writeInteger(const Node& node, const char* name, int64_t value) {
    writeAttribute(node, name, std::to_string(value));
}

void writeBool(const Node& node, const char* name, bool value) {
    writeAttribute(node, name, value ? "true" : "false");
}

bool readAttribute(const Node& node, const char* name, std::string& value) {
    const auto property = node->getProperty(name);
    if (!property) return false;
    value = peru::CString::toStdString(property->getValue());
    return true;
}

bool readNumber(const Node& node, const char* name, double& value) {
    std::string text;
    if (!readAttribute(node, name, text)) return false;
    const auto number = parseNumber(text);
    if (!number) throwInvalid(node, name, text);
    value = *number;
    return true;
}

bool readInteger(const Node& node, const char* name, int64_t& value) {
    std::string text;
    if (!readAttribute(node, name, text)) return false;
    const auto number = parseInteger(text);
    if (!number) throwInvalid(node, name, text);
    value = *number;
    return true;
}

bool readInteger(const Node& node, const char* name, int32_t& value) {
    int64_t number = value;
    if (!readInteger(node, name, number)) return false;
    if (number < std::numeric_limits<int32_t>::min() || number > std::numeric_limits<int32_t>::max())
        throwInvalid(node, name, std::to_string(number));
    value = static_cast<int32_t>(number);
    return true;
}

bool readBool(const Node& node, const char* name, bool& value) {
    std::string text;
    if (!readAttribute(node, name, text)) return false;
    if (text != "true" && text != "false") throwInvalid(node, name, text);
    value = text == "true";
    return true;
}

Node addChild(const Node& node, const char* name) {
    return node->addChildNode(name);
}

std::string getName(const Node& node) {
    return peru::CString::toStdString(node->getName());
}

void write(const Node& node, const char* key, const SColour& colour) {
    const Node child = addChild(node, key);
    writeInteger(child, "red", colour.red);
    writeInteger(child, "green", colour.green);
    writeInteger(child, "blue", colour.blue);
    writeInteger(child, "alpha", colour.alpha);
}

bool read(const Node& node, const char* key, SColour& colour) {
    const Node child = node->getChildNode(key);
    if (!child) return false;
    const auto readChannel = [&](const char* name, uint8_t& channel) {
        int32_t value = channel;
        readInteger(child, name, value);
        if (value < 0 || value > 255) throwInvalid(child, name, std::to_string(value));
        channel = static_cast<uint8_t>(value);
    };
    readChannel("red", colour.red);
    readChannel("green", colour.green);
    readChannel("blue", colour.blue);
    readChannel("alpha", colour.alpha);
    return true;
}

void write(const Node& node, const char* key, const SBrush& brush) {
    const Node child = addChild(node, key);
    write(child, "color", brush.colour);
    writeInteger(child, "style", brush.style);
}

bool read(const Node& node, const char* key, SBrush& brush) {
    const Node child = node->getChildNode(key);
    if (!child) return false;
    read(child, "color", brush.colour);
    readInteger(child, "style", brush.style);
    return true;
}

void write(const Node& node, const char* key, const SPen& pen) {
    const Node child = addChild(node, key);
    write(child, "color", pen.colour);
    writeInteger(child, "style", pen.style);
    writeNumber(child, "width", pen.width);
}

bool read(const Node& node, const char* key, SPen& pen) {
    const Node child = node->getChildNode(key);
    if (!child) return false;
    read(child, "color", pen.colour);
    readInteger(child, "style", pen.style);
    readNumber(child, "width", pen.width);
    return true;
}

void write(const Node& node, const char* key, const SGradient& gradient) {
    const Node child = addChild(node, key);
    write(child, "start", gradient.start);
    write(child, "end", gradient.end);
}

bool read(const Node& node, const char* key, SGradient& gradient) {
    const Node child = node->getChildNode(key);
    if (!child) return false;
    read(child, "start", gradient.start);
    read(child, "end", gradient.end);
    return true;
}

void write(const Node& node, const char* key, const SFont& font) {
    const Node child = addChild(node, key);
    writeAttribute(child, "name", font.name);
    writeInteger(child, "pointsize", font.pointSize);
    writeInteger(child, "style", font.style);
    writeInteger(child, "weight", font.weight);
    writeBool(child, "underlined", font.isUnderlined);
}

bool read(const Node& node, const char* key, SFont& font) {
    const Node child = node->getChildNode(key);
    if (!child) return false;
    readAttribute(child, "name", font.name);
    readInteger(child, "pointsize", font.pointSize);
    readInteger(child, "style", font.style);
    readInteger(child, "weight", font.weight);
    readBool(child, "underlined", font.isUnderlined);
    return true;
}

void write(const Node& node, const char* key, const SPoint& point) {
    writeParts(node, key, point, kPoint);
}

bool read(const Node& node, const char* key, SPoint& point) {
    return readParts(node, key, point, kPoint);
}

void write(const Node& node, const char* key, const SSize& size) {
    writeParts(node, key, size, kSize);
}

bool read(const Node& node, const char* key, SSize& size) {
    return readParts(node, key, size, kSize);
}

void write(const Node& node, const char* key, const SRect& rect) {
    writeParts(node, key, rect, kRect);
}

bool read(const Node& node, const char* key, SRect& rect) {
    return readParts(node, key, rect, kRect);
}

void write(const Node& node, const char* key, const SScaleMargins& margins) {
    writeParts(node, key, margins, kMargins);
}

bool read(const Node& node, const char* key, SScaleMargins& margins) {
    return readParts(node, key, margins, kMargins);
}

} // namespace graphics
