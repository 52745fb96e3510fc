#include "graphics/elements/GraphicElementType.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

namespace graphics {

namespace {

struct SType {
    const char* tag;
    const char* key; // null for types that users do not see
    const char* text;
};

constexpr SType kTypes[kGraphicElementTypeCount] = {
    {"base", nullptr, nullptr},
    {"paper", "graphics.GraphicElementType.Paper", "Paper"},
    {"image", "graphics.GraphicElementType.Image", "Image"},
    {"text", "graphics.GraphicElementType.Text", "Text"},
    {"text-circle", "graphics.GraphicElementType.TextCircle", "Circular Text"},
    {"table", "graphics.GraphicElementType.Table", "Table"},
    {"line", "graphics.GraphicElementType.Line", "Line"},
    {"point", "graphics.GraphicElementType.Point", "Point"},
    {"circle", "graphics.GraphicElementType.Circle", "Circle"},
    {"rectangle", nullptr, nullptr},
    {"shape", "graphics.GraphicElementType.Shape", "Shape"},
    {"arrow", nullptr, nullptr},
    {"dimension", "graphics.GraphicElementType.Dimension", "Dimension"},
    {"custom", nullptr, nullptr},
    {"dummy", nullptr, nullptr},
    {"state-button", "graphics.GraphicElementType.StateButton", "Button"},
    {"animation", nullptr, nullptr},
    {"mirror", "graphics.GraphicElementType.Mirror", "Mirror"},
    {"label", nullptr, nullptr},
};

const SType* findType(GraphicElementType type) {
    const int value = static_cast<int>(type);
    return value >= 0 && value < kGraphicElementTypeCount ? &kTypes[value] : nullptr;
}

} // namespace

std::string GraphicTypeToXml(GraphicElementType type) {
    const SType* const found = findType(type);
    if (!found) throw peru::CError("GraphicTypeToXml. Unknwown type");
    return found->tag;
}

bool IsGraphicTypeTag(std::string_view tag) {
    for (const SType& type : kTypes)
        if (tag == type.tag) return true;
    return false;
}

GraphicElementType GraphicTypeFromXml(std::string_view tag) {
    for (int value = 0; value < kGraphicElementTypeCount; ++value)
        if (tag == kTypes[value].tag) return static_cast<GraphicElementType>(value);
    throw peru::CError(peru::CString::fromUTF8("GraphicTypeFromXml. Unknwown type:" + std::string(tag)));
}

std::string GetGraphicTypeName(GraphicElementType type) {
    const SType* const found = findType(type);
    if (!found || !found->key) return "Unknown";
    return peru::CString::toStdString(peru::localize(found->key, found->text));
}

} // namespace graphics
