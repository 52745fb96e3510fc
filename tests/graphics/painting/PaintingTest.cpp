#include "graphics/Elements.h"
#include "graphics/documents/FreeForm.h"
#include "graphics/elements/GraphicImage.h"
#include "graphics/elements/GraphicLines.h"
#include "graphics/elements/GraphicMirror.h"
#include "graphics/elements/GraphicShape.h"
#include "graphics/elements/GraphicTable.h"
#include "graphics/elements/GraphicText.h"
#include "graphics/painting/DocumentRenderer.h"
#include "graphics/painting/OffScreen.h"
#include "graphics/text/RichTextParser.h"
#include "peru/Errors.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <cmath>

using namespace graphics;
using tests::P;

namespace {

constexpr double kSheetWidth = 60, kSheetHeight = 40; // millimetres

P<CGraphicDocument> makeSheet() {
    auto document = peru::make<CGraphicDocument>();
    document->SetContentBox(SRect{0, 0, kSheetWidth, kSheetHeight});
    return document;
}

// One element of each class that paints shapes, black, rotated and partly mirrored.
std::vector<P<CGraphicElement>> makeShapes() {
    std::vector<P<CGraphicElement>> shapes;
    const SPen pen{{0, 0, 0, 255}, kStyleSolid, 1.5};
    const auto addFilled = [&](const P<CGraphicFilled>& element) {
        element->SetPen(pen);
        element->SetBrush({{0, 0, 0, 255}});
        element->SetSize(30, 18);
        element->SetCenter(29, 21);
        element->SetRotation(24);
        shapes.push_back(element);
    };
    addFilled(peru::make<CGraphicCircle>());
    addFilled(peru::make<CGraphicRectangle>());
    for (const auto type : {EShapeType::rectangle, EShapeType::ellipse, EShapeType::roundedRectangle}) {
        const auto shape = peru::make<CGraphicShape>();
        shape->SetShapeType(type);
        addFilled(shape);
    }
    for (const auto& form : getFreeFormManager()->GetForms()) {
        const auto shape = peru::make<CGraphicShape>();
        shape->SetShapeType(EShapeType::freeForm);
        shape->SetFreeForm(form);
        shape->SetMirrored(EAxis::y, true);
        addFilled(shape);
    }
    const std::vector<P<CGraphicLine>> lines{peru::make<CGraphicLine>(), peru::make<CGraphicArrow>(),
                                             peru::make<CGraphicDimension>()};
    for (const auto& line : lines) {
        line->SetPen(pen);
        line->SetLine({12, 28}, {40, 10});
        line->SetMirrored(EAxis::x, true);
        line->SetRotation(10);
        shapes.push_back(line);
    }
    return shapes;
}

// What is not a shape: tables and texts, bitmaps, and reflections.
std::vector<P<CGraphicElement>> makeContents() {
    const SFont font{"DejaVu Sans", 16, 90, 700, false};
    const auto text = peru::make<CGraphicText>(), circle = P<CGraphicText>(peru::make<CGraphicTextCircle>());
    text->SetText(makeRichText("rich text in lines", font));
    circle->SetText(makeRichText("circular text", font));
    const auto table = peru::make<CGraphicTable>();
    table->InsertCols(0, 2);
    table->InsertRows(0, 1);
    table->SetCellText(0, 0, makeRichText("cell", font));
    table->SetCellText(0, 1, makeRichText("other", font));
    const auto image = peru::make<CGraphicImage>();
    image->SetBitmap(
        peru::make<CBitmap>(2, 2, std::vector<uint32_t>{0xff000000u, 0, 0x80000000u, 0xff000000u}));
    const auto mirror = peru::make<CGraphicMirror>();
    mirror->SetDocument(peru::make<CGraphicDocument>());
    mirror->GetDocument()->Add(makeShapes()[0]);
    std::vector<P<CGraphicElement>> contents{text, circle, table, image, mirror};
    for (const auto& element : contents) {
        element->SetSize(36, 26);
        element->SetCenter(29, 21);
        element->SetRotation(17);
    }
    return contents;
}

// Area, center and spread of what is painted, in millimetres.
struct SMoments {
    double area = 0, x = 0, y = 0, spreadX = 0, spreadY = 0;
};

// `coverage` returns 0 to 255 for a pixel.
template <class Coverage> SMoments measure(int width, int height, double pixel, const Coverage& coverage) {
    SMoments m;
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) {
            const double weight = coverage(x, y) / 255.0, px = (x + 0.5) * pixel, py = (y + 0.5) * pixel;
            m.area += weight, m.x += weight * px, m.y += weight * py;
            m.spreadX += weight * px * px, m.spreadY += weight * py * py;
        }
    m.x /= m.area, m.y /= m.area;
    m.spreadX = std::sqrt(m.spreadX / m.area - m.x * m.x);
    m.spreadY = std::sqrt(m.spreadY / m.area - m.y * m.y);
    m.area *= pixel * pixel;
    return m;
}

SMoments measure(CGraphicDocument& document, double dpi) {
    const auto bitmap = RenderBitmap(document, {dpi});
    return measure(bitmap->GetWidth(), bitmap->GetHeight(), 25.4 / dpi, [&](int x, int y) {
        return bitmap->GetPixels()[static_cast<size_t>(y * bitmap->GetWidth() + x)] >> 24;
    });
}

void expectSame(const SMoments& actual, const SMoments& expected, double tolerance, const std::string& what) {
    EXPECT_NEAR(actual.area, expected.area, expected.area * 0.02) << what;
    EXPECT_NEAR(actual.x, expected.x, tolerance) << what;
    EXPECT_NEAR(actual.y, expected.y, tolerance) << what;
    EXPECT_NEAR(actual.spreadX, expected.spreadX, tolerance) << what;
    EXPECT_NEAR(actual.spreadY, expected.spreadY, tolerance) << what;
}

uint32_t getPixel(const P<CBitmap>& bitmap, int x, int y) {
    return bitmap->GetPixels()[static_cast<size_t>(y * bitmap->GetWidth() + x)];
}

} // namespace

TEST(Painting, GivesTheSameShapesAtEveryResolution) {
    for (const auto& shape : makeShapes()) {
        const auto document = makeSheet();
        document->Add(shape);
        const SMoments reference = measure(*document, 600);
        const std::string what = GraphicTypeToXml(shape->GetType());
        ASSERT_GT(reference.area, 20) << what;
        for (const double dpi : {96.0, 300.0})
            expectSame(measure(*document, dpi), reference, 0.25 * 25.4 / dpi, what);
    }
    for (const auto& element : makeContents()) {
        const auto document = makeSheet();
        document->Add(element);
        const SMoments reference = measure(*document, 600);
        ASSERT_GT(reference.area, 20);
        for (const double dpi : {96.0, 300.0})
            expectSame(measure(*document, dpi), reference, 0.5 * 25.4 / dpi,
                       GraphicTypeToXml(element->GetType()));
    }
}

TEST(Painting, GivesTheSameShapesOnPdfPages) {
    const tests::CTempFolder folder;
    const auto document = makeSheet();
    for (const auto& shape : makeShapes()) document->Add(shape->Clone());
    EXPECT_EQ(RenderPdf(*document), RenderPdf(*document));
    EXPECT_NE(RenderSvg(*document).find("<svg"), std::string::npos);
    double x = 0;
    for (const auto& element : document->GetElements())
        element->SetBoundingSize(15, 15), element->SetCenter(10 + 3.5 * x++, 20);
    folder.write("page.pdf", RenderPdf(*document));
    const auto result = tests::CProcess({"pdftoppm", "-r", "150", "-singlefile", "-gray", "page.pdf", "page"},
                                        folder.path().string())
                            .wait();
    ASSERT_EQ(result.exitCode, 0) << result.err;
    const std::string image = tests::readFile(folder / "page.pgm");
    int width = 0, height = 0, offset = 0;
    ASSERT_EQ(sscanf(image.c_str(), "P5 %d %d 255%n", &width, &height, &offset), 2);
    const SMoments page = measure(width, height, 25.4 / 150, [&](int px, int py) {
        return 255 - static_cast<uint8_t>(image[static_cast<size_t>(offset + 1 + py * width + px)]);
    });
    expectSame(page, measure(*document, 150), 0.5 * 25.4 / 150, "pdf");
}

TEST(HitMask, AgreesWithThePaintedAlpha) {
    std::mt19937 random(3);
    for (const auto& shape : makeShapes())
        for (int i = 0; i < 4; ++i) {
            if (!shape->IsDefinedByPoints())
                shape->SetSize(tests::between(random, 2, 30), tests::between(random, 2, 30));
            shape->SetCenter(tests::between(random, 20, 40), tests::between(random, 15, 25));
            shape->SetRotation(random() % 360);
            const CMatrix matrix =
                CMatrix::translation(3.3, 4.7) *
                CMatrix::scaling(tests::between(random, 1, 4), tests::between(random, 1, 4));
            shape->UpdateHitMask(matrix);
            COffScreen picture(300, 240);
            CPaintContext context(picture.GetGraphics(), matrix);
            shape->Paint(context);
            int painted = 0;
            for (int y = 0; y < picture.GetHeight(); ++y)
                for (int x = 0; x < picture.GetWidth(); ++x) {
                    const auto alpha = static_cast<uint8_t>(picture.GetRow(y)[x] >> 24);
                    ASSERT_EQ(shape->GetHitMask()->getAlpha(x, y), alpha)
                        << GraphicTypeToXml(shape->GetType()) << " " << x << "," << y;
                    painted += alpha != 0;
                }
            ASSERT_GT(painted, 0);
        }
}

TEST(HitMask, IsPaintedAgainAfterAChange) {
    const auto shape = peru::make<CGraphicShape>();
    shape->SetSize(20, 20);
    shape->UpdateHitMask(CMatrix());
    const SHitMask* const mask = shape->GetHitMask();
    shape->UpdateHitMask(CMatrix::translation(0.0005, 0));
    EXPECT_EQ(shape->GetHitMask(), mask);
    shape->SetMirrored(EAxis::x, true);
    EXPECT_EQ(shape->GetHitMask(), nullptr);
    EXPECT_THROW(shape->UpdateHitMask(CMatrix::scaling(1000, 1000)), peru::CError);
    EXPECT_THROW(shape->UpdateHitMask(CMatrix::scaling(1e300, 1)), peru::CError);
}

TEST(Painting, AppliesEffects) {
    const auto document = makeSheet();
    const auto shape = peru::make<CGraphicShape>();
    shape->SetSize(60, 40);
    shape->SetCenter(30, 20);
    shape->SetPen({kTransparent});
    shape->SetBrush({{200, 100, 0, 128}});
    document->Add(shape);
    const auto at = [&](const SRenderOptions& options) {
        return getPixel(RenderBitmap(*document, options), 60, 40);
    };
    SRenderOptions options{50.8};
    EXPECT_EQ(at(options), 0x80643200u);
    options.colourMode = EColourMode::grey;
    EXPECT_EQ(at(options), 0x803b3b3bu);
    options.colourMode = EColourMode::coloured;
    shape->SetColoured(false);
    EXPECT_EQ(at(options), 0x803b3b3bu);
    options.filter = [](const CGraphicElement& element) { return element.HasTag("front"); };
    EXPECT_EQ(at(options), 0u);
    shape->SetColoured(true);
    COffScreen mask(120, 80);
    mask.GetGraphics().SetEffect(EEffect::mask);
    CPaintContext context(mask.GetGraphics(), CMatrix());
    document->Paint(context, {0, 0, 120, 80});
    EXPECT_EQ(mask.GetRow(40)[60], 0xff808080u);
    // Bitmaps and texts as well; nothing is painted where a bitmap is transparent.
    const auto image = peru::make<CGraphicImage>();
    image->SetBitmap(peru::make<CBitmap>(2, 1, std::vector<uint32_t>{0, 0x80400000u}));
    image->SetSize(60, 40);
    image->SetCenter(30, 20);
    const auto text = peru::make<CGraphicText>();
    text->SetText(makeRichText("\u2588", {"DejaVu Sans", 100, 90, 400, false}, {255, 0, 0, 255}));
    text->SetSize(60, 40);
    text->SetCenter(30, 20);
    for (const auto& [effect, left, right, glyph] : {std::tuple(EEffect::mask, 0u, 0xff808080u, 0xffffffffu),
                                                     {EEffect::grey, 0u, 0x80131313u, 0xff4c4c4cu},
                                                     {EEffect::none, 0u, 0x80400000u, 0xffff0000u}}) {
        COffScreen picture(120, 80);
        picture.GetGraphics().SetEffect(effect);
        CPaintContext other(picture.GetGraphics(), CMatrix::scaling(2, 2));
        image->Paint(other);
        EXPECT_EQ(picture.GetRow(40)[10], left);
        EXPECT_EQ(picture.GetRow(40)[110], right);
        text->Paint(other);
        EXPECT_EQ(picture.GetRow(40)[10], glyph);
    }
    shape->SetGradient({{255, 0, 0, 255}, {0, 0, 255, 255}});
    const auto picture = RenderBitmap(*document, {50.8});
    EXPECT_GT(getPixel(picture, 60, 2) >> 16 & 255, 240u);
    EXPECT_GT(getPixel(picture, 60, 77) & 255, 240u);
}

// A hatch is the same along its lines, and covers its share of the area.
TEST(Painting, HatchesAreas) {
    struct SCase {
        int style;
        int alongX, alongY; // a step along the lines, in pixels of a tenth of a millimetre
        double coverage;
    };
    for (const SCase& c : {SCase{kStyleHorizontal, 20, 0, 0.125},
                           {kStyleVertical, 0, 20, 0.125},
                           {kStyleBackwardDiagonal, 20, -20, 0.125},
                           {kStyleForwardDiagonal, 20, 20, 0.125},
                           {kStyleCross, 20, 20, 0.234},
                           {kStyleCrossDiagonal, 0, 0, 0.234}}) {
        const auto document = makeSheet();
        const auto rectangle = peru::make<CGraphicRectangle>();
        rectangle->SetSize(50, 30);
        rectangle->SetCenter(30, 20);
        rectangle->SetPen({{0, 0, 255, 255}, kStyleSolid, 1});
        rectangle->SetBrush({{0, 0, 0, 255}, c.style});
        document->Add(rectangle);
        const auto picture = RenderBitmap(*document, {254});
        double sum = 0;
        for (int y = 100; y < 300; ++y)
            for (int x = 100; x < 500; ++x) {
                const int alpha = static_cast<int>(getPixel(picture, x, y) >> 24);
                ASSERT_NEAR(alpha, getPixel(picture, x + c.alongX, y + c.alongY) >> 24, 12) << c.style;
                sum += alpha / 255.0;
            }
        EXPECT_NEAR(sum / (200 * 400), c.coverage, 0.01) << c.style;
        EXPECT_EQ(getPixel(picture, 300, 50), 0xff0000ffu) << c.style; // the outline
        EXPECT_EQ(getPixel(picture, 300, 40), 0u) << c.style;
    }
}

TEST(Painting, StretchesImages) {
    const auto document = makeSheet();
    const auto image = peru::make<CGraphicImage>();
    // A border of one red pixel around blue ones.
    std::vector<uint32_t> pixels(12 * 12, 0xffff0000u);
    for (size_t y = 1; y < 11; ++y)
        std::fill_n(pixels.begin() + static_cast<ptrdiff_t>(y * 12 + 1), 10, 0xff0000ffu);
    image->SetBitmap(peru::make<CBitmap>(12, 12, pixels));
    image->SetSize(60, 40);
    image->SetCenter(30, 20);
    document->Add(image);
    const auto at = [&](double x, double y) {
        return getPixel(RenderBitmap(*document, {254}), static_cast<int>(x * 10), static_cast<int>(y * 10));
    };
    EXPECT_EQ(at(1, 20), 0xffff0000u); // the border is 5 mm wide
    EXPECT_EQ(at(30, 20), 0xff0000ffu);
    const double pixel = 25.4 / 96;
    image->SetScaleMargins({pixel, pixel, pixel, pixel, 1, 1, 1, 1});
    EXPECT_EQ(at(1, 20), 0xff0000ffu);
    EXPECT_EQ(at(0.05, 20), 0xffff0000u);
    image->SetNoScale(true);
    EXPECT_EQ(at(1, 20), 0u);
    EXPECT_EQ(at(30, 20), 0xff0000ffu);
}

TEST(GraphicMirror, FadesToTheBottom) {
    const auto document = makeSheet();
    const auto mirror = peru::make<CGraphicMirror>();
    const auto inner = peru::make<CGraphicDocument>();
    const auto rectangle = peru::make<CGraphicRectangle>();
    rectangle->SetSize(60, 40);
    rectangle->SetCenter(30, 20);
    rectangle->SetPen({kTransparent});
    inner->Add(rectangle);
    mirror->SetDocument(inner);
    mirror->SetSize(60, 40);
    mirror->SetCenter(30, 20);
    document->Add(mirror);
    inner->Add(mirror); // reflections of reflections end
    const auto picture = RenderBitmap(*document, {25.4});
    const auto alpha = [&](int y) { return getPixel(picture, 30, y) >> 24; };
    EXPECT_NEAR(static_cast<int>(alpha(0)), 100, 1);
    EXPECT_NEAR(static_cast<int>(alpha(20)), 50, 2);
    EXPECT_EQ(alpha(picture->GetHeight() - 1), 0u);
    inner->Remove(mirror);
}

TEST(Painting, RefusesWhatItCannotPaint) {
    const auto document = peru::make<CGraphicDocument>();
    EXPECT_THROW(RenderPng(*document), peru::CError);
    document->SetContentBox(SRect{0, 0, 1000, 1000});
    EXPECT_THROW(RenderPng(*document, {1e5}), peru::CError);
    EXPECT_THROW(RenderPng(*document, {std::nan("")}), peru::CError);
    const auto paper = CreateElement(GraphicElementType::paper);
    paper->SetSize(1000, 1000);
    document->Add(paper);
    EXPECT_EQ(getPixel(RenderBitmap(*document, {10}), 10, 10), 0u);
    paper->SetCenter(500, 500);
    SRenderOptions options{10};
    EXPECT_EQ(getPixel(RenderBitmap(*document, options), 10, 10), 0u);
    options.outputKind = EOutputKind::screen;
    EXPECT_EQ(getPixel(RenderBitmap(*document, options), 100, 100), 0xfff0f0f0u);
}
