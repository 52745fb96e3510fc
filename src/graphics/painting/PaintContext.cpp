#include "graphics/painting/PaintContext.h"

namespace graphics {

CPaintContext::CPaintContext(IGraphicsContext& graphics, const CMatrix& matrix, EColourMode colourMode,
                             EOutputKind outputKind)
    : m_graphics(graphics), m_colourMode(colourMode), m_outputKind(outputKind),
      m_clipBox(graphics.GetClipBox()) {
    if (colourMode == EColourMode::grey && graphics.GetEffect() == EEffect::none)
        graphics.SetEffect(EEffect::grey);
    setMatrix(matrix);
}

bool CPaintContext::CanSee(const SRect& rect) const {
    const SRect box = m_matrix.getBounds(rect);
    return box.left <= m_clipBox.getRight() && box.getRight() >= m_clipBox.left &&
           box.top <= m_clipBox.getBottom() && box.getBottom() >= m_clipBox.top;
}

void CPaintContext::setMatrix(const CMatrix& matrix) {
    m_matrix = matrix;
    m_graphics.SetMatrix(matrix);
}

CPaintContext::CScope::CScope(CPaintContext& context, const CMatrix& first, bool isColoured)
    : m_context(context), m_oldMatrix(context.m_matrix), m_oldEffect(context.m_graphics.GetEffect()) {
    context.setMatrix(m_oldMatrix * first);
    if (!isColoured && m_oldEffect == EEffect::none) context.m_graphics.SetEffect(EEffect::grey);
}

CPaintContext::CScope::~CScope() {
    m_context.setMatrix(m_oldMatrix);
    m_context.m_graphics.SetEffect(m_oldEffect);
}

} // namespace graphics
