// Replaces colours on their way to a graphics context.
#pragma once

#include "graphics/painting/ColourEffect.h"
#include "graphics/painting/IGraphicsContext.h"

#include <optional>

namespace graphics {

// Adds the effects to a context that paints colours as they are.
template <class Context> class TEffectGraphicsContext : public Context {
public:
    using Context::Context;
    ~TEffectGraphicsContext() override = default;

    void SetEffect(EEffect effect) override { m_effect = effect; }
    EEffect GetEffect() const override { return m_effect; }

    void DrawPath(const CPath& path, const SFill* fill, const SPen* pen) override {
        if (m_effect == EEffect::none) return Context::DrawPath(path, fill, pen);
        std::optional<SFill> newFill;
        std::optional<SPen> newPen;
        // What is invisible without the effect remains so: the mask of a transparent colour is opaque black.
        if (fill && fill->gradient.isVisible()) {
            newFill = *fill;
            newFill->gradient = {applyEffect(fill->gradient.start, m_effect),
                                 applyEffect(fill->gradient.end, m_effect)};
        } else if (fill && fill->brush.isVisible()) {
            newFill = *fill;
            newFill->brush.colour = applyEffect(fill->brush.colour, m_effect);
        }
        if (pen && pen->isVisible()) {
            newPen = *pen;
            newPen->colour = applyEffect(pen->colour, m_effect);
        }
        Context::DrawPath(path, newFill ? &*newFill : nullptr, newPen ? &*newPen : nullptr);
    }
    void DrawBitmap(const CBitmap& bitmap, const SRect& source, const SRect& target) override {
        if (m_effect == EEffect::none) return Context::DrawBitmap(bitmap, source, target);
        // Elements may share a bitmap.
        if (m_original.get() != &bitmap || m_changedEffect != m_effect) {
            m_changed = applyEffect(bitmap, m_effect);
            m_original = peru::P<CBitmap>::share(const_cast<CBitmap*>(&bitmap));
            m_changedEffect = m_effect;
        }
        Context::DrawBitmap(*m_changed, source, target);
    }

private:
    EEffect m_effect = EEffect::none;
    peru::P<CBitmap> m_original; // the last bitmap with an effect; held, so that its address is not reused
    peru::P<CBitmap> m_changed;
    EEffect m_changedEffect = EEffect::none;
};

} // namespace graphics
