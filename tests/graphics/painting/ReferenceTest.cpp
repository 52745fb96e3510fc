// Each type of element against a reference picture: plain, rotated, mirrored, grey and stretched. Run with
// TONEWRIGHT_UPDATE_REFERENCES=1 to write the picture anew, and look at it.
#include "graphics/documents/FreeForm.h"
#include "graphics/elements/BasicElements.h"
#include "graphics/elements/GraphicImage.h"
#include "graphics/elements/GraphicLines.h"
#include "graphics/elements/GraphicMirror.h"
#include "graphics/elements/GraphicShape.h"
#include "graphics/elements/GraphicTable.h"
#include "graphics/elements/GraphicText.h"
#include "graphics/painting/OffScreen.h"
#include "graphics/painting/PaintContext.h"
#include "graphics/text/RichTextParser.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <fstream>

using namespace graphics;
using peru::P;

namespace {

constexpr int kCell = 60;    // pixels
constexpr double kScale = 2; // pixels per millimetre
constexpr int kVariants = 5;

const SFont kFont{"DejaVu Sans", 11, 90, 400, false};
const SPen kPen{{0, 0, 160, 255}, kStyleSolid, 1};

struct SSubject {
    std::string name;
    P<CGraphicElement> element;
};

P<CGraphicShape> makeShape(EShapeType type, const SBrush& brush) {
    auto shape = peru::make<CGraphicShape>();
    shape->SetShapeType(type);
    shape->SetBrush(brush);
    shape->SetPen(kPen);
    return shape;
}

template <class Line> P<CGraphicElement> makeLine(int style) {
    auto line = peru::make<Line>();
    line->SetLine({-10, -6}, {8, 5});
    line->SetPen({{160, 0, 0, 255}, style, 0.8});
    return line;
}

template <class Text> P<CGraphicElement> makeText(const std::string& words) {
    auto text = peru::make<Text>();
    text->SetText(makeRichText(words, kFont, {0, 90, 0, 255}));
    return text;
}

P<CGraphicImage> makeImage() {
    std::vector<uint32_t> pixels;
    for (uint32_t y = 0; y < 24; ++y)
        for (uint32_t x = 0; x < 24; ++x)
            pixels.push_back(
                x + y < 8 ? 0 : 0xff000000u | x * 10 << 16 | y * 10 << 8 | (x / 6 + y / 6) % 2 * 255);
    auto image = peru::make<CGraphicImage>();
    image->SetBitmap(peru::make<CBitmap>(24, 24, std::move(pixels)));
    return image;
}

std::vector<SSubject> makeSubjects() {
    const SBrush brush{{250, 200, 60, 255}};
    std::vector<SSubject> subjects;
    const auto add = [&](const std::string& name, const P<CGraphicElement>& element, double height = 14) {
        if (!element->IsDefinedByPoints()) element->SetSize(22, height);
        element->SetCenter(0, 0);
        subjects.push_back({name, element});
    };
    for (const auto& filled :
         std::vector<P<CGraphicFilled>>{peru::make<CGraphicRectangle>(), peru::make<CGraphicCircle>()}) {
        filled->SetBrush(brush);
        filled->SetPen(kPen);
        add(GraphicTypeToXml(filled->GetType()), filled);
    }
    add("ellipse", makeShape(EShapeType::ellipse, {brush.colour, kStyleBackwardDiagonal}));
    const auto rounded = makeShape(EShapeType::roundedRectangle, brush);
    rounded->SetGradient({{255, 255, 255, 255}, {200, 0, 0, 255}});
    add("rounded rectangle", rounded);
    for (const auto& form : getFreeFormManager()->GetForms()) {
        const auto shape = makeShape(EShapeType::freeForm, brush);
        shape->SetFreeForm(form);
        add(form->GetId(), shape, 20);
    }
    const P<CGraphicElement> mirrored = subjects[4].element; // the star
    add("line", makeLine<CGraphicLine>(kStyleDotDash));
    add("line of dots", makeLine<CGraphicLine>(kStyleDot));
    add("arrow", makeLine<CGraphicArrow>(kStyleLongDash));
    add("dimension", makeLine<CGraphicDimension>(kStyleShortDash));
    add("image", makeImage());
    const auto frame = makeImage();
    frame->SetScaleMargins({1.5, 1, 2, 1.5, 2, 2.5, 0.5, 1.5});
    add("image with margins", frame);
    const auto small = makeImage();
    small->SetNoScale(true);
    add("image at its size", small);
    add("text", makeText<CGraphicText>("Rich text, two lines"));
    add("circular text", makeText<CGraphicTextCircle>("Around"), 22);
    const auto inside = makeText<CGraphicTextCircle>("Around");
    static_cast<CGraphicTextCircle&>(*inside).SetCircleType(ECircleType::concav);
    add("circular text inside", inside, 22);
    const auto table = peru::make<CGraphicTable>();
    table->InsertRows(0, 2);
    table->InsertCols(0, 2);
    table->SetCellText(0, 0, makeRichText("A", kFont));
    table->SetCellText(1, 1, makeRichText("B", kFont, {160, 0, 0, 255}, ETextAlignment::right));
    add("table", table);
    const auto mirror = peru::make<CGraphicMirror>();
    mirror->SetDocument(peru::make<CGraphicDocument>());
    mirror->GetDocument()->Add(mirrored->Clone());
    add("mirror", mirror, 20);
    const auto label = peru::make<CGraphicLabel>();
    label->SetText("Label");
    label->SetFont({"DejaVu Sans", 14, 93, 700, true});
    label->SetColour({0, 0, 160, 255});
    add("label", label);
    const auto button = peru::make<CGraphicStateButton>();
    button->SetLabel("On");
    add("button", button);
    add("paper", peru::make<CGraphicPaper>());
    return subjects;
}

// One row of a sheet on white; `shift` moves the element, in millimetres.
void paint(COffScreen& sheet, int row, const CGraphicElement& original, double shift = 0) {
    const SFill white{{}, {}, {}};
    for (int variant = 0; variant < kVariants; ++variant) {
        const auto element = original.Clone();
        element->SetRotation(variant == 1 ? 30 : 0);
        element->SetMirrored(EAxis::x, variant == 2);
        const CMatrix cell = CMatrix::translation((variant + 0.5) * kCell, (row + 0.5) * kCell);
        CPaintContext background(sheet.GetGraphics(), cell);
        const SRect box = SRect::fromCenter({}, {kCell, kCell});
        background.GetGraphics().SetEffect(EEffect::none);
        background.GetGraphics().DrawPath(CPath::rectangle(box), &white, nullptr);
        background.GetGraphics().PushClip(box);
        {
            const SSize scale = variant == 4 ? SSize{0.7 * kScale, 1.3 * kScale} : SSize{kScale, kScale};
            CPaintContext context(
                sheet.GetGraphics(),
                cell * CMatrix::scaling(scale.width, scale.height) * CMatrix::translation(shift, shift),
                variant == 3 ? EColourMode::grey : EColourMode::coloured, EOutputKind::screen);
            element->Paint(context);
        }
        sheet.GetGraphics().SetEffect(EEffect::none);
        CPaintContext(sheet.GetGraphics(), cell).GetGraphics().PopClip();
    }
}

// The channels of a pixel, averaged with its neighbours: glyphs differ a little between versions of the
// rasteriser.
std::array<double, 3> blur(const CBitmap& bitmap, int x, int y) {
    std::array<double, 3> sum{};
    for (int dy = -1; dy <= 1; ++dy)
        for (int dx = -1; dx <= 1; ++dx) {
            const int px = std::clamp(x + dx, 0, bitmap.GetWidth() - 1);
            const int py = std::clamp(y + dy, 0, bitmap.GetHeight() - 1);
            const uint32_t pixel = bitmap.GetPixels()[static_cast<size_t>(py * bitmap.GetWidth() + px)];
            for (size_t channel = 0; channel < 3; ++channel)
                sum[channel] += (pixel >> 8 * channel & 255) / 9.0;
        }
    return sum;
}

// Empty if two cells are the same, otherwise what differs.
std::string compare(const CBitmap& actual, const CBitmap& expected, int left, int row) {
    for (int top = row * kCell; top < (row + 1) * kCell; top += 10)
        for (int x0 = left; x0 < left + kCell; x0 += 10) {
            std::array<double, 3> mean{};
            for (int y = top; y < top + 10; ++y)
                for (int x = x0; x < x0 + 10; ++x) {
                    const auto a = blur(actual, x, y), e = blur(expected, x, y);
                    for (size_t channel = 0; channel < 3; ++channel) {
                        mean[channel] += (a[channel] - e[channel]) / 100;
                        if (std::abs(a[channel] - e[channel]) > 45)
                            return "pixel " + std::to_string(x) + "," + std::to_string(y);
                    }
                }
            for (const double difference : mean)
                if (std::abs(difference) > 6)
                    return "block " + std::to_string(x0) + "," + std::to_string(top);
        }
    return {};
}

} // namespace

TEST(Painting, AgreesWithTheReferencePictures) {
    const auto subjects = makeSubjects();
    const int rows = static_cast<int>(subjects.size());
    COffScreen sheet(kVariants * kCell, rows * kCell), shifted(kVariants * kCell, rows * kCell);
    for (int row = 0; row < rows; ++row) {
        paint(sheet, row, *subjects[static_cast<size_t>(row)].element);
        paint(shifted, row, *subjects[static_cast<size_t>(row)].element, 0.5);
    }
    const std::string file = TONEWRIGHT_TEST_DATA "/graphics/elements.png";
    if (getenv("TONEWRIGHT_UPDATE_REFERENCES")) std::ofstream(file, std::ios::binary) << sheet.GetPng();
    const CBitmap reference(EBitmapFormat::png, tests::readFile(file));
    const auto actual = sheet.GetBitmap(), moved = shifted.GetBitmap();
    ASSERT_EQ(reference.GetWidth(), actual->GetWidth());
    ASSERT_EQ(reference.GetHeight(), actual->GetHeight());
    for (int row = 0; row < rows; ++row)
        for (int variant = 0; variant < kVariants; ++variant) {
            const std::string what = subjects[static_cast<size_t>(row)].name + " " + std::to_string(variant);
            EXPECT_EQ(compare(*actual, reference, variant * kCell, row), "") << what;
            // The comparison notices a move by one pixel.
            EXPECT_NE(compare(*moved, reference, variant * kCell, row), "") << what;
        }
}
