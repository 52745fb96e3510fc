// Breaks plain text at a width.
#pragma once

#include "graphics/Api.h"

#include <functional>
#include <string>

namespace graphics {

class GRAPHICS_API CTextWrapper {
public:
    // Returns the width of a piece of text in pixels; UTF-8.
    using MeasureText = std::function<double(const std::string& piece)>;

    explicit CTextWrapper(MeasureText measure) : m_measure(std::move(measure)) {}

    // Inserts line breaks behind blanks and the characters , : - ? and . so that lines do not exceed the
    // width. A longer piece is not split: it begins a line of its own.
    std::string Wrap(const std::string& text, double maximalWidth) const;

private:
    const MeasureText m_measure;
};

} // namespace graphics
