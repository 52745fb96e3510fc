// The layout of one rich text, kept for the next painting.
#pragma once

#include "graphics/elements/RichText.h"
#include "graphics/text/TextLayout.h"

namespace graphics {

class CLayoutCache {
public:
    // Computed again if an argument differs from that of the last call. Valid until the next one.
    const CTextLayout& Get(const P<CRichText>& text, double width, EEffect effect);

private:
    P<CRichText> m_text;
    double m_width = 0;
    EEffect m_effect = EEffect::none;
    std::unique_ptr<CTextLayout> m_layout;
};

} // namespace graphics
