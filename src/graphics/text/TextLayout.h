// Paragraphs broken into lines.
#pragma once

#include "graphics/painting/IGraphicsContext.h"
#include "graphics/text/Paragraph.h"

#include <memory>

namespace graphics {

// One line, in millimetres from the layout's top left corner. Bullets are not part of it.
struct STextLine {
    double left;
    double top;
    double width;
    double height;
    std::string text; // with U+FFFC for each image
};

// Lines are broken in millimetres, with metrics that do not depend on any device, so they are the same on
// every screen and on paper. A word that is wider than the line is broken between characters.
// Only the first 10,000 lines and million bytes are laid out.
class GRAPHICS_API CTextLayout {
public:
    // `width` 0: one line for each paragraph, without its indents. Colours and images pass through the
    // effect.
    CTextLayout(const std::vector<SParagraph>& paragraphs, double width, EEffect effect = EEffect::none);
    ~CTextLayout();
    CTextLayout(const CTextLayout&) = delete;
    CTextLayout& operator=(const CTextLayout&) = delete;

    // Of the widest line, in millimetres.
    double GetWidth() const;
    double GetHeight() const;
    // From the top to the first line's baseline.
    double GetAscent() const;
    // Whether there is neither a character nor an image.
    bool IsEmpty() const;
    int GetLineCount() const;
    std::vector<STextLine> GetLines() const;

    struct SImpl;
    const SImpl& GetImpl() const { return *m_impl; }

private:
    const std::unique_ptr<SImpl> m_impl;
};

} // namespace graphics
