#include "graphics/elements/GraphicMirror.h"

#include "graphics/documents/GraphicDocument.h"
#include "graphics/elements/CloneAs.h"
#include "graphics/painting/OffScreen.h"
#include "graphics/painting/PaintContext.h"

#include <cmath>

namespace graphics {

CGraphicMirror::CGraphicMirror() = default;

CGraphicMirror::~CGraphicMirror() = default;

P<CGraphicElement> CGraphicMirror::Clone() const {
    return cloneAs(*this);
}

void CGraphicMirror::Assign(const CGraphicElement& other) {
    const auto* same = dynamic_cast<const CGraphicMirror*>(&other);
    if (same && same != this) m_document = same->m_document ? same->m_document->Clone() : nullptr;
    CGraphicElement::Assign(other);
}

void CGraphicMirror::SetDocument(const P<CGraphicDocument>& document) {
    m_document = document;
    DropHitMask();
}

namespace {

constexpr int kMaximalDepth = 4; // of reflections in reflections

// Limits the alpha of each row: 100 at the top, falling to 0 at the bottom.
void fade(COffScreen& picture) {
    const int height = picture.GetHeight();
    for (int y = 0; y < height; ++y) {
        const double fallen = 100.0 - y * (100.0 / height);
        const uint32_t level = y + 1 < height ? static_cast<uint32_t>(fallen) : 0;
        uint32_t* const row = picture.GetRow(y);
        for (int x = 0; x < picture.GetWidth(); ++x) {
            const uint32_t alpha = row[x] >> 24;
            if (alpha <= level) continue;
            uint32_t pixel = level << 24;
            for (const int shift : {0, 8, 16}) pixel |= ((row[x] >> shift & 255) * level / alpha) << shift;
            row[x] = pixel;
        }
    }
}

} // namespace

void CGraphicMirror::PaintContent(CPaintContext& context) const {
    const SRect box = GetLocalRect();
    if (!m_document || context.GetDepth() >= kMaximalDepth) return;
    if (!(box.width > 0 && box.height > 0)) return;
    // Enlarged far beyond what a device shows, the picture remains at a size that can be painted.
    constexpr double kMaximalSide = 4000;
    const double scale = std::min(context.GetMatrix().getMeanScale() * context.GetGraphics().GetResolution(),
                                  kMaximalSide / std::max(box.width, box.height));
    const double width = std::max(1.0, std::ceil(box.width * scale));
    const double height = std::max(1.0, std::ceil(box.height * scale));
    COffScreen picture(static_cast<int64_t>(width), static_cast<int64_t>(height));
    // The reflection is upside down.
    CPaintContext inner(picture.GetGraphics(), CMatrix(1, 0, 0, -1, 0, height), context.GetColourMode(),
                        context.GetOutputKind());
    inner.SetDepth(context.GetDepth() + 1);
    m_document->Paint(inner, {0, 0, width, height});
    fade(picture);
    context.GetGraphics().DrawBitmap(*picture.GetBitmap(), {0, 0, width, height}, box);
}

} // namespace graphics
