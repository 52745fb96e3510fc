#include "graphics/elements/GraphicImage.h"

#include "graphics/elements/CloneAs.h"
#include "graphics/painting/OffScreen.h"
#include "graphics/painting/PaintContext.h"

#include <cmath>

namespace graphics {

CGraphicImage::CGraphicImage() {
    SetFlags(GetFlags() | kFlagEditable);
}

P<CGraphicElement> CGraphicImage::Clone() const {
    return cloneAs(*this);
}

void CGraphicImage::Assign(const CGraphicElement& other) {
    if (const auto* same = dynamic_cast<const CGraphicImage*>(&other)) {
        m_bitmap = same->m_bitmap;
        m_fileName = same->m_fileName;
        m_scaleMargins = same->m_scaleMargins;
        m_isNoScale = same->m_isNoScale;
    }
    CGraphicElement::Assign(other);
}

void CGraphicImage::Reset() {
    SetBitmap(nullptr);
    m_fileName.clear();
}

void CGraphicImage::SetBitmap(const P<CBitmap>& bitmap) {
    m_bitmap.Set(bitmap);
    DropHitMask();
}

void CGraphicImage::SetRotation(double degrees) {
    m_bitmap.DropVersions();
    CGraphicElement::SetRotation(degrees);
}

void CGraphicImage::SetMirrored(EAxis axis, bool isMirrored) {
    m_bitmap.DropVersions();
    CGraphicElement::SetMirrored(axis, isMirrored);
}

void CGraphicImage::SetColoured(bool isColoured) {
    m_bitmap.DropVersions();
    CGraphicElement::SetColoured(isColoured);
}

void CGraphicImage::SetScaleMargins(const SScaleMargins& margins) {
    m_scaleMargins = margins;
    DropHitMask();
}

void CGraphicImage::SetNoScale(bool isNoScale) {
    m_isNoScale = isNoScale;
    DropHitMask();
}

namespace {

constexpr double kMillimetresPerPixel = 25.4 / 96; // of a bitmap at its own size

bool hasMargins(const SScaleMargins& margins) {
    return margins.left > 0 || margins.top > 0 || margins.right > 0 || margins.bottom > 0;
}

// The borders of three strips of one axis, in pixels of the bitmap and in millimetres of the target.
struct SStrips {
    double source[4];
    double target[4];
};

// The outer strips have the size of the margins times their factors; the inner one gets the rest. Margins
// that do not fit are reduced in proportion.
SStrips divide(int pixels, double length, double low, double high, double lowFactor, double highFactor) {
    const auto fit = [](double& first, double& second, double room) {
        first = std::max(0.0, first);
        second = std::max(0.0, second);
        const double sum = first + second;
        if (sum > room) {
            first *= room / sum;
            second *= room / sum;
        }
    };
    double lowPixels = low / kMillimetresPerPixel, highPixels = high / kMillimetresPerPixel;
    double lowTarget = low * lowFactor, highTarget = high * highFactor;
    fit(lowPixels, highPixels, pixels);
    lowPixels = std::round(lowPixels);
    highPixels = std::min(std::round(highPixels), pixels - lowPixels);
    fit(lowTarget, highTarget, length);
    return {{0, lowPixels, pixels - highPixels, static_cast<double>(pixels)},
            {0, lowTarget, length - highTarget, length}};
}

// The bitmap with its strips stretched to a box, with this many pixels per millimetre. The strips meet at
// whole pixels: if each of them were painted on the device, the background would shine through between them.
P<CBitmap> stretch(const CBitmap& bitmap, const SScaleMargins& margins, const SRect& box, SSize scale) {
    const double width = std::max(1.0, std::ceil(box.width * scale.width));
    const double height = std::max(1.0, std::ceil(box.height * scale.height));
    const SStrips x = divide(bitmap.GetWidth(), box.width, margins.left, margins.right, margins.leftFactor,
                             margins.rightFactor);
    const SStrips y = divide(bitmap.GetHeight(), box.height, margins.top, margins.bottom, margins.topFactor,
                             margins.bottomFactor);
    COffScreen picture(static_cast<int64_t>(width), static_cast<int64_t>(height));
    const auto toX = [&](int strip) { return std::round(x.target[strip] / box.width * width); };
    const auto toY = [&](int strip) { return std::round(y.target[strip] / box.height * height); };
    for (int row = 0; row < 3; ++row)
        for (int col = 0; col < 3; ++col)
            picture.GetGraphics().DrawBitmap(
                bitmap, SRect::fromEdges(x.source[col], y.source[row], x.source[col + 1], y.source[row + 1]),
                SRect::fromEdges(toX(col), toY(row), toX(col + 1), toY(row + 1)));
    return picture.GetBitmap();
}

} // namespace

P<CBitmap> CGraphicImage::getPaintedBitmap(const CPaintContext& context) const {
    const P<CBitmap>& bitmap = m_bitmap.Get();
    const CMatrix& matrix = context.GetMatrix();
    const SRect box = GetLocalRect();
    const SSize scale{std::hypot(matrix.xx, matrix.yx), std::hypot(matrix.xy, matrix.yy)};
    const double resolution = context.GetGraphics().GetResolution();
    if (m_isNoScale || !(box.width > 0 && box.height > 0)) return bitmap;
    if (hasMargins(m_scaleMargins)) {
        // Enlarged far beyond what a device shows, the picture remains at a size that can be painted.
        constexpr double kMaximalSide = 4000;
        return stretch(*bitmap, m_scaleMargins, box,
                       {std::min(scale.width * resolution, kMaximalSide / box.width),
                        std::min(scale.height * resolution, kMaximalSide / box.height)});
    }
    // A page of paper has no pixels.
    constexpr double kOnePixelPerUnit = 1;
    const double width = std::ceil(box.width * scale.width), height = std::ceil(box.height * scale.height);
    // Scaling a smaller bitmap each time it is painted costs little more than painting it.
    if (resolution != kOnePixelPerUnit ||
        !(width >= 1 && height >= 1 && 2 * width <= bitmap->GetWidth() && 2 * height <= bitmap->GetHeight()))
        return bitmap;
    return m_bitmap.Get({static_cast<int>(width), static_cast<int>(height)});
}

void CGraphicImage::PaintContent(CPaintContext& context) const {
    if (!m_bitmap.Get()) return;
    const P<CBitmap> bitmap = getPaintedBitmap(context);
    const SRect box = GetLocalRect();
    const double width = bitmap->GetWidth(), height = bitmap->GetHeight();
    IGraphicsContext& graphics = context.GetGraphics();
    if (!m_isNoScale) return graphics.DrawBitmap(*bitmap, {0, 0, width, height}, box);
    graphics.PushClip(box);
    graphics.DrawBitmap(*bitmap, {0, 0, width, height},
                        SRect::fromCenter({}, {width * kMillimetresPerPixel, height * kMillimetresPerPixel}));
    graphics.PopClip();
}

} // namespace graphics
