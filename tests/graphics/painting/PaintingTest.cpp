#include "graphics/Elements.h"
#include "graphics/elements/GraphicImage.h"
#include "graphics/elements/GraphicLines.h"
#include "graphics/elements/GraphicMirror.h"
#include "graphics/elements/GraphicShape.h"
#include "graphics/elements/GraphicText.h"
#include "graphics/painting/DocumentRenderer.h"
#include "graphics/painting/OffScreen.h"
#include "graphics/text/RichTextParser.h"
#include "peru/Errors.h"

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

uint32_t getPixel(const P<CBitmap>& bitmap, int x, int y) {
    return bitmap->GetPixels()[static_cast<size_t>(y * bitmap->GetWidth() + x)];
}

} // namespace

TEST(HitMask, AgreesWithThePaintedAlpha) {
    std::mt19937 random(3);
    std::set<GraphicElementType> painted;
    for (int i = 0; i < 200; ++i) {
        const auto shape = tests::makeElement(random, 0);
        if (!peru::tryCast<CGraphicFilled>(shape) && !peru::tryCast<CGraphicLine>(shape)) continue;
        shape->SetSize(tests::between(random, 2, 20), tests::between(random, 2, 20));
        shape->SetCenter(tests::between(random, 20, 40), tests::between(random, 15, 25));
        const CMatrix matrix =
            CMatrix::translation(120.3, 120.7) *
            CMatrix::scaling(tests::between(random, 1, 2.5), tests::between(random, 1, 2.5));
        shape->UpdateHitMask(matrix);
        COffScreen picture(360, 300);
        CPaintContext context(picture.GetGraphics(), matrix);
        shape->Paint(context);
        for (int y = 0; y < picture.GetHeight(); ++y)
            for (int x = 0; x < picture.GetWidth(); ++x) {
                const auto alpha = static_cast<uint8_t>(picture.GetRow(y)[x] >> 24);
                ASSERT_NEAR(shape->GetHitMask()->getAlpha(x, y), alpha, 2) << i << " " << x << " " << y;
                if (alpha != 0) painted.insert(shape->GetType());
            }
    }
    EXPECT_EQ(painted.size(), 6u);
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

TEST(Painting, StretchesImagesWithoutSeams) {
    const auto document = makeSheet();
    const auto image = peru::make<CGraphicImage>();
    image->SetBitmap(peru::make<CBitmap>(12, 12, std::vector<uint32_t>(144, 0xff204060u)));
    image->SetScaleMargins({0.7, 0.8, 0.9, 1, 1.1, 1.2, 1.3, 1.4});
    image->SetSize(kSheetWidth, kSheetHeight);
    image->SetCenter(kSheetWidth / 2, kSheetHeight / 2);
    document->Add(image);
    const auto picture = RenderBitmap(*document, {97});
    for (int y = 0; y + 1 < picture->GetHeight(); ++y)
        for (int x = 0; x + 1 < picture->GetWidth(); ++x)
            ASSERT_EQ(getPixel(picture, x, y), 0xff204060u) << x << "," << y;
}

TEST(Painting, ContinuesBehindAnImpossibleElement) {
    const auto document = makeSheet();
    const auto image = peru::make<CGraphicImage>();
    image->SetBitmap(peru::make<CBitmap>(1, 1, std::vector<uint32_t>{0xff000000u}));
    image->SetSize(-10, 20);
    image->SetCenter(30, 20);
    document->Add(image);
    const auto rectangle = peru::make<CGraphicRectangle>();
    rectangle->SetSize(20, 20);
    rectangle->SetCenter(30, 20);
    document->Add(rectangle);
    EXPECT_EQ(getPixel(RenderBitmap(*document, {25.4}), 30, 20), 0xffffffffu);
    // An error of the device is one of the picture.
    COffScreen picture(10, 10);
    picture.GetGraphics().PopClip(); // without PushClip()
    EXPECT_THROW(picture.GetPng(), peru::CError);
    EXPECT_THROW(picture.GetBitmap(), peru::CError);
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
