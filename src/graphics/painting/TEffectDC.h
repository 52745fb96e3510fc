// Replaces colours on their way to a device context of the toolkit.
#pragma once

#include "graphics/painting/ColourEffect.h"

#include <wx/dc.h>

namespace graphics {

// Adds the effects to a device context, for painting code of the toolkit that does not use an
// IGraphicsContext. The operations hide those of the context, so they must be called through this class. They
// affect pens, brushes and colours of texts, not bitmaps.
template <class Context> class TEffectDC : public Context {
public:
    using Context::Context;
    ~TEffectDC() override = default;

    // Applies to what is set from now on.
    void SetEffect(EEffect effect) { m_effect = effect; }
    EEffect GetEffect() const { return m_effect; }

    // What is invisible without the effect remains so.
    void SetPen(const wxPen& pen) {
        if (m_effect == EEffect::none || !pen.IsNonTransparent()) return Context::SetPen(pen);
        wxPen changed = pen;
        changed.SetColour(apply(pen.GetColour()));
        Context::SetPen(changed);
    }
    void SetBrush(const wxBrush& brush) {
        if (m_effect == EEffect::none || !brush.IsNonTransparent()) return Context::SetBrush(brush);
        wxBrush changed = brush;
        changed.SetColour(apply(brush.GetColour()));
        Context::SetBrush(changed);
    }
    void SetTextForeground(const wxColour& colour) { Context::SetTextForeground(apply(colour)); }
    void SetTextBackground(const wxColour& colour) { Context::SetTextBackground(apply(colour)); }

private:
    wxColour apply(const wxColour& colour) const {
        if (m_effect == EEffect::none || !colour.IsOk() || colour.Alpha() == 0) return colour;
        const SColour changed =
            applyEffect(SColour{colour.Red(), colour.Green(), colour.Blue(), colour.Alpha()}, m_effect);
        return {changed.red, changed.green, changed.blue, changed.alpha};
    }

    EEffect m_effect = EEffect::none;
};

} // namespace graphics
