// Random elements for property tests.
#pragma once

#include "graphics/documents/FreeForm.h"
#include "graphics/elements/ElementFactory.h"
#include "graphics/elements/GraphicImage.h"
#include "graphics/elements/GraphicLines.h"
#include "graphics/elements/GraphicMirror.h"
#include "graphics/elements/GraphicShape.h"
#include "graphics/elements/GraphicTable.h"
#include "graphics/elements/GraphicText.h"
#include "graphics/storage/DocumentArchive.h"

#include <random>

namespace tests {

using peru::P;

inline double between(std::mt19937& random, double low, double high) {
    return low + (high - low) * static_cast<double>(random()) / 4294967295.0;
}

// Places an element anywhere on a sheet, with any rotation.
inline void place(graphics::CGraphicElement& element, std::mt19937& random) {
    element.SetSize(between(random, 0.1, 120), between(random, 0.1, 120));
    element.SetCenter(between(random, -100, 300), between(random, -100, 300));
    element.SetRotation(random() % 3 ? static_cast<double>(random() % 360) : 90.0 * (random() % 4));
    element.SetMirrored(graphics::EAxis::x, random() % 2 != 0);
    element.SetMirrored(graphics::EAxis::y, random() % 2 != 0);
}

inline graphics::SColour makeColour(std::mt19937& random) {
    const auto channel = [&] { return static_cast<uint8_t>(random()); };
    return {channel(), channel(), channel(), channel()};
}

inline std::string makeText(std::mt19937& random) {
    static const char* const kTexts[] = {"",     "a < b & \"c\"", "Füße", "  two  blanks ",
                                         "日本", "line\nbreak"};
    return kTexts[random() % 6];
}

inline P<graphics::CBitmap> makeBitmap(std::mt19937& random, bool hasAlpha) {
    const int width = 1 + static_cast<int>(random() % 9), height = 1 + static_cast<int>(random() % 9);
    std::vector<uint32_t> pixels(static_cast<size_t>(width * height));
    for (uint32_t& pixel : pixels) {
        const uint32_t alpha = hasAlpha ? random() % 255 : 255, grey = alpha ? random() % alpha : 0;
        pixel = alpha << 24 | grey * 0x10101u;
    }
    return peru::make<graphics::CBitmap>(width, height, std::move(pixels));
}

P<graphics::CGraphicDocument> makeDocument(std::mt19937& random, int depth = 0);

// Any type with any values.
inline P<graphics::CGraphicElement> makeElement(std::mt19937& random, int depth) {
    using namespace graphics;
    P<CGraphicElement> element;
    while (!element)
        element = CreateElement(static_cast<GraphicElementType>(random() % kGraphicElementTypeCount));
    place(*element, random);
    element->SetName(makeText(random));
    element->SetColoured(random() % 2 != 0);
    element->SetVisible(random() % 2 != 0);
    element->SetModified(random() % 2 != 0);
    element->SetContentId(makeText(random));
    element->SetContentIndex(static_cast<int32_t>(random() % 3));
    element->SetTextId(makeText(random));
    if (random() % 2) element->AddTag("front"), element->AddTag("tag-" + std::to_string(random() % 9));
    if (random() % 2) element->AddGroup(static_cast<int32_t>(random() % 1000));
    const auto text = [&] {
        return random() % 4 ? peru::make<CRichText>("<richtext>" + makeText(random)) : P<CRichText>();
    };
    if (const auto filled = peru::tryCast<CGraphicFilled>(element)) {
        filled->SetBrush({makeColour(random), random() % 2 ? kStyleSolid : kStyleTransparent});
        filled->SetPen({makeColour(random), 100 + static_cast<int>(random() % 7), between(random, 0, 5)});
    }
    if (const auto shape = peru::tryCast<CGraphicShape>(element)) {
        shape->SetGradient({makeColour(random), makeColour(random)});
        shape->SetShapeType(static_cast<EShapeType>(random() % 4));
        shape->SetCornerRadius(between(random, 0, 9));
        if (random() % 2) shape->SetFreeForm(getFreeFormManager()->GetForms()[random() % 4]);
    }
    if (const auto line = peru::tryCast<CGraphicLine>(element))
        line->SetPen({makeColour(random), 100, between(random, 0, 3)});
    if (const auto image = peru::tryCast<CGraphicImage>(element)) {
        if (random() % 4) image->SetBitmap(makeBitmap(random, random() % 2));
        image->SetFileName(random() % 3 ? "" : "no-folder/picture.jpg");
        image->SetNoScale(random() % 2 != 0);
        image->SetScaleMargins({between(random, 0, 9), 1, 2, 3, 0.5, between(random, 0, 9), 1, 1});
    }
    if (const auto rich = peru::tryCast<CGraphicText>(element)) {
        rich->SetText(text());
        rich->SetVerticalPlacement(static_cast<EVerticalPlacement>(random() % 3));
    }
    if (const auto circle = peru::tryCast<CGraphicTextCircle>(element))
        circle->SetCircleType(static_cast<ECircleType>(random() % 2));
    if (const auto table = peru::tryCast<CGraphicTable>(element)) {
        table->InsertRows(0, static_cast<int>(random() % 3));
        table->InsertCols(0, static_cast<int>(random() % 3));
        for (int row = 0; row < table->GetRowCount(); ++row)
            for (int col = 0; col < table->GetColCount(); ++col) {
                table->GetRow(row).height = between(random, 1, 9);
                table->GetCol(col).isHiddenByTheme = random() % 2;
                table->GetCol(col).name = makeText(random);
                table->GetCell(row, col).text = text();
                table->GetCell(row, col).verticalAlign = static_cast<EVerticalAlign>(random() % 3);
            }
    }
    if (const auto label = peru::tryCast<CGraphicLabel>(element)) {
        label->SetText(makeText(random));
        label->SetFont({"Serif", 7, 93, 700, true});
        label->SetColour(makeColour(random));
    }
    if (const auto button = peru::tryCast<CGraphicStateButton>(element)) button->SetLabel(makeText(random));
    if (const auto mirror = peru::tryCast<CGraphicMirror>(element))
        if (depth < 2) mirror->SetDocument(makeDocument(random, depth + 1));
    return element;
}

inline P<graphics::CGraphicDocument> makeDocument(std::mt19937& random, int depth) {
    using namespace graphics;
    auto document = peru::make<CGraphicDocument>();
    for (unsigned count = random() % 5; count > 0; --count) document->Add(makeElement(random, depth));
    if (random() % 2) document->SetContentBox(SRect{1, 2, between(random, 0, 9), 4});
    if (random() % 2) {
        document->SetXDatas(peru::make<CXDatas>());
        document->GetXDatas()->Set("zoom", peru::make<CRectXData>(SRect{between(random, 0, 9), 1, 2, 3}));
        document->GetXDatas()->Set("note", peru::make<CStringXData>(makeText(random)));
    }
    return document;
}

// An archive of nothing but these entries.
inline std::string makeArchive(const std::vector<graphics::SArchiveEntry>& entries) {
    return graphics::WriteArchive(
        {"unused.xml", "unused"}, [](const auto&, auto&) {}, false, entries);
}

} // namespace tests
