#include "graphics/text/LayoutCache.h"

#include "graphics/text/RichTextParser.h"

namespace graphics {

const CTextLayout& CLayoutCache::Get(const P<CRichText>& text, double width, EEffect effect) {
    if (!m_layout || m_text != text || m_width != width || m_effect != effect) {
        m_layout = std::make_unique<CTextLayout>(parseRichText(*text), width, effect);
        m_text = text;
        m_width = width;
        m_effect = effect;
    }
    return *m_layout;
}

} // namespace graphics
