// Designs that are measured.
#pragma once

#include "graphics/documents/GraphicDocument.h"
#include "graphics/elements/GraphicImage.h"
#include "graphics/elements/GraphicShape.h"

#include <cmath>
#include <random>

namespace bench {

using peru::P;

inline constexpr double kSheetWidth = 210, kSheetHeight = 297; // millimetres

inline double between(std::mt19937& random, double low, double high) {
    return low + (high - low) * static_cast<double>(random()) / 4294967295.0;
}

inline graphics::SColour makeColour(std::mt19937& random) {
    const auto channel = [&] { return static_cast<uint8_t>(random()); };
    return {channel(), channel(), channel(), static_cast<uint8_t>(random() % 2 ? 255 : 160)};
}

// Ellipses, rectangles with round corners and plain ones, turned, with fill and outline.
inline P<graphics::CGraphicShape> makeShape(std::mt19937& random, double smallest, double largest) {
    using namespace graphics;
    auto shape = peru::make<CGraphicShape>();
    shape->SetShapeType(static_cast<EShapeType>(random() % 3));
    shape->SetSize(between(random, smallest, largest), between(random, smallest, largest));
    shape->SetRotation(static_cast<double>(random() % 360));
    shape->SetBrush({makeColour(random)});
    shape->SetPen({makeColour(random), kStyleSolid, 0.3});
    if (random() % 4 == 0) shape->SetGradient({makeColour(random), makeColour(random)});
    return shape;
}

inline P<graphics::CBitmap> makeBitmap(std::mt19937& random, int side) {
    std::vector<uint32_t> pixels(static_cast<size_t>(side) * static_cast<size_t>(side));
    const uint32_t seed = static_cast<uint32_t>(random());
    for (size_t i = 0; i < pixels.size(); ++i)
        pixels[i] = 0xFF000000u | (static_cast<uint32_t>(i) * 2654435761u ^ seed) >> 8;
    return peru::make<graphics::CBitmap>(side, side, std::move(pixels));
}

// 200 shapes and 20 turned bitmaps of 1000 by 1000 pixels on an A4 sheet.
inline P<graphics::CGraphicDocument> makeSheet() {
    using namespace graphics;
    std::mt19937 random(1);
    auto document = peru::make<CGraphicDocument>();
    document->SetContentBox(SRect{0, 0, kSheetWidth, kSheetHeight});
    for (int i = 0; i < 220; ++i) {
        P<CGraphicElement> element;
        if (i % 11 == 0) {
            const auto image = peru::make<CGraphicImage>();
            image->SetBitmap(makeBitmap(random, 1000));
            image->SetSize(85, 85);
            image->SetRotation(static_cast<double>(random() % 360));
            element = image;
        } else {
            element = makeShape(random, 10, 60);
        }
        element->SetCenter(between(random, 30, kSheetWidth - 30), between(random, 30, kSheetHeight - 30));
        document->Add(element);
    }
    return document;
}

// Small shapes on a square grid, 2 mm apart.
inline P<graphics::CGraphicDocument> makeGrid(int count) {
    std::mt19937 random(1);
    auto document = peru::make<graphics::CGraphicDocument>();
    const int columns = static_cast<int>(std::ceil(std::sqrt(count)));
    document->BeginUpdate();
    for (int i = 0; i < count; ++i) {
        const auto shape = makeShape(random, 1, 2);
        shape->SetCenter(2.0 * (i % columns) + 1, 2.0 * (i / columns) + 1);
        document->Add(shape);
    }
    document->EndUpdate();
    return document;
}

} // namespace bench
