#include "graphics/elements/ShapeType.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

namespace graphics {

namespace {

struct SShapeType {
    const char* xml;
    const char* key;
    const char* text;
};

constexpr SShapeType kShapeTypes[kShapeTypeCount] = {
    {"rectangle", "CGraphicShape.ShapeType.Rectangle", "Rectangle"},
    {"ellipse", "CGraphicShape.ShapeType.Ellipse", "Ellipse"},
    {"rounded-rectangle", "CGraphicShape.ShapeType.RoundedRectangle", "Rounded Rectangle"},
    {"free-form", "CGraphicShape.ShapeType.FreeForm", "Free form"},
};

const SShapeType& findShapeType(EShapeType type) {
    const int value = static_cast<int>(type);
    if (value < 0 || value >= kShapeTypeCount) throw peru::CError("ShapeTypeToXml. Unknwown type");
    return kShapeTypes[value];
}

} // namespace

std::string ShapeTypeToXml(EShapeType type) {
    return findShapeType(type).xml;
}

EShapeType ShapeTypeFromXml(std::string_view text) {
    for (int value = 0; value < kShapeTypeCount; ++value)
        if (text == kShapeTypes[value].xml) return static_cast<EShapeType>(value);
    throw peru::CError(peru::CString::fromUTF8("ShapeTypeFromXml. Unknwown type:" + std::string(text)));
}

std::string GetShapeTypeName(EShapeType type) {
    const SShapeType& found = findShapeType(type);
    return peru::CString::toStdString(peru::localize(found.key, found.text));
}

} // namespace graphics
