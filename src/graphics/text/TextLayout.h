// Paragraphs broken into lines.
#pragma once

#include "graphics/painting/IGraphicsContext.h"
#include "graphics/text/RichTextParser.h"

#include <memory>

namespace graphics {

// Lines are broken in millimetres, with metrics that do not depend on any device, so they are the same on
// every screen and on paper. Text beyond the width of a word's line is not cut.
class GRAPHICS_API CTextLayout {
public:
    // `width` 0: one line for each paragraph. Colours pass through the effect.
    CTextLayout(const std::vector<SParagraph>& paragraphs, double width, EEffect effect = EEffect::none);
    ~CTextLayout();
    CTextLayout(const CTextLayout&) = delete;
    CTextLayout& operator=(const CTextLayout&) = delete;

    // Of the widest line, in millimetres.
    double GetWidth() const;
    double GetHeight() const;
    // From the top to the first line's baseline.
    double GetAscent() const;
    int GetLineCount() const;

    struct SImpl;
    const SImpl& GetImpl() const { return *m_impl; }

private:
    const std::unique_ptr<SImpl> m_impl;
};

} // namespace graphics
